#include <korvane/foundation/KVInfo.h>

#include <sched.h>
#include <unistd.h>

#include <atomic>

namespace {

std::atomic<bool> unitTesting{false};

} // namespace

int KVInfo_ProcessorCount() noexcept
{
    cpu_set_t set;
    if (::sched_getaffinity(0, sizeof set, &set) == 0 && CPU_COUNT(&set) > 0)
        return CPU_COUNT(&set);
    long const online = ::sysconf(_SC_NPROCESSORS_ONLN);
    return online > 0 ? static_cast<int>(online) : 1;
}

bool KVInfo_IsUnitTesting() noexcept
{
    return unitTesting;
}

void _KVInfo_SetUnitTesting(bool isUnitTesting) noexcept
{
    unitTesting = isUnitTesting;
}
