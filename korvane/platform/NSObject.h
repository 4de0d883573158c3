#pragma once

#include <korvane/foundation/KVExport.h>

#include <atomic>
#include <cstddef>

class KVString;

/// Root of all objects that are shared by reference: the CF kinds (`__CFString`,
/// `__CFData`, ...) and the object kinds (`NSError`, captions, boxed matrices).
///
/// An object is born with one reference, which belongs to whoever made it, and
/// is deleted when its last reference is released. Raw pointers do not own: keep
/// objects in a KVCFRef or KVNSRef.
///
///     auto matrix = KVMakeRef<KVMatrix44Double>();   // one reference, owned by `matrix`
///
/// An object may also live on the stack or inside another one, as long as nobody
/// releases a reference that was not retained. The count may be used from any
/// thread; all else is up to the derived class, where an immutable object may be
/// read by any number of threads and one that can be changed belongs to one.
class KV_EXPORT NSObject {
public:
    NSObject() noexcept = default;
    /// A copy is an object of its own, with a count of its own.
    NSObject(NSObject const&) noexcept {}
    NSObject& operator=(NSObject const&) noexcept { return *this; }
    virtual ~NSObject();

    void retain() const noexcept { references_.fetch_add(1, std::memory_order_relaxed); }
    void release() const noexcept
    {
        if (references_.fetch_sub(1, std::memory_order_acq_rel) == 1)
            delete this;
    }
    /// How many references there are just now. For tests and for debugging.
    unsigned int retainCount() const noexcept
    {
        return references_.load(std::memory_order_relaxed);
    }

    /// Whether the two stand for the same value; by default, whether they are one object.
    /// A null argument is never equal.
    virtual bool isEqual(NSObject const* other) const;
    /// Equal objects have equal hashes; by default made from the address.
    virtual std::size_t hash() const;
    /// The object as text for a person to read; by default "<NSObject: 0x...>". Include
    /// `korvane/foundation/KVString.h` to call it.
    virtual KVString description() const;

    /// A copy, which the caller owns (one reference). Immutable objects answer themselves,
    /// retained: that is the default. Derived classes offer `copy()` as the typed, owning form of
    /// this.
    virtual NSObject* newCopy() const;

private:
    mutable std::atomic<unsigned int> references_{1};
};
