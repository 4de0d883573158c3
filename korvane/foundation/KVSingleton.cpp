#include <korvane/foundation/KVSingleton.h>

#include <korvane/foundation/KVMutex.h>

#include <algorithm>
#include <cstdio>
#include <mutex>

namespace {

/// The list that a pass is deleting, or null; under the registry's lock.
std::vector<KVSingleton::Info>* listInFlight = nullptr;

} // namespace

std::vector<KVSingleton::Info>& KVSingleton::getSingletons()
{
    // Never released: singletons may live and die on either side of main.
    static auto& singletons = *new std::vector<Info>;
    return singletons;
}

KVMutex& KVSingleton::getLock()
{
    static auto& lock = *new KVMutex;
    return lock;
}

KVSingleton::KVSingleton(unsigned int order)
{
    std::scoped_lock const lock(getLock());
    getSingletons().push_back({this, order});
}

KVSingleton::~KVSingleton()
{
    std::scoped_lock const lock(getLock());
    std::erase_if(getSingletons(), [this](Info const& info) { return info.object == this; });
    // Deleted by the destructor of another one, in the middle of a pass.
    if (listInFlight)
        for (Info& info : *listInFlight)
            if (info.object == this)
                info.object = nullptr;
}

void KVSingleton::deleteSingletons()
{
    std::vector<Info> pass;
    for (int counter = 0;; ++counter) {
        {
            std::scoped_lock const lock(getLock());
            pass.swap(getSingletons());
            std::sort(pass.begin(), pass.end(), Compare);
            listInFlight = &pass;
        }
        for (auto info = pass.rbegin(); info != pass.rend(); ++info) {
            KVSingleton* object;
            {
                std::scoped_lock const lock(getLock());
                object = info->object;
            }
            delete object;
        }
        bool done;
        {
            std::scoped_lock const lock(getLock());
            listInFlight = nullptr;
            pass.clear();
            done = getSingletons().empty();
        }
        if (done)
            return;
        if (counter > 4)
            break;
    }
    // The words and the number are what hosts look for in their logs.
    std::printf("Korvane: KVSingleton could not successfully release all singletons in %dtries.\n"
                "This is caused by singletons being created during the application teardown "
                "process.\n",
                5);
    std::fflush(stdout);
}
