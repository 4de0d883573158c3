#pragma once

#include <korvane/foundation/KVExport.h>

#include <vector>

class KVMutex;

/// Base of process-wide objects that are released together, in order, when the host ends.
///
///     class FontTable : public KVSingleton { public: FontTable() : KVSingleton(20) {} ... };
///     new FontTable;                       // registered
///     KVSingleton::deleteSingletons();     // at teardown, by the host, once
class KV_EXPORT KVSingleton {
public:
    /// One registered object and its order.
    struct Info {
        KVSingleton* object;
        unsigned int order;
    };

    /// Lower orders are deleted first.
    explicit KVSingleton(unsigned int order);
    KVSingleton(KVSingleton const&) = delete;
    KVSingleton& operator=(KVSingleton const&) = delete;
    /// Takes the object out of the registry, so one may be deleted early.
    virtual ~KVSingleton();

    /// Deletes all registered objects, lowest order first, equal orders in any order. No lock is
    /// held meanwhile: a destructor may make or delete singletons; what it makes goes in a further
    /// pass. After six passes that leave some behind, it says so on standard output and gives up.
    static void deleteSingletons();

    /// Puts the higher order first.
    static bool Compare(Info const& a, Info const& b) noexcept { return a.order > b.order; }

private:
    static std::vector<Info>& getSingletons();
    static KVMutex& getLock();
};
