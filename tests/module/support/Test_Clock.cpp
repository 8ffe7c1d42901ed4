#include "tests/module/support/Test_Clock.h"

#include <atomic>
#include <ctime>
#include <sys/select.h>
#include <sys/syscall.h>
#include <sys/time.h>
#include <unistd.h>

namespace nvrtest {

static std::atomic<long long> ahead{0};      // seconds
static std::atomic<long long> asleep{0};     // microseconds
static std::atomic<long long> stopped_at{0}; // microseconds; 0: it goes

static long long machine_time()
{
    timespec now;
    clock_gettime(CLOCK_REALTIME, &now);
    return now.tv_sec * 1000000LL + now.tv_nsec / 1000;
}

void advance_clock(std::chrono::seconds by)
{
    ahead += by.count();
}

void stop_clock()
{
    stopped_at = machine_time();
}

std::chrono::microseconds slept()
{
    return std::chrono::microseconds(asleep.load());
}

} // namespace nvrtest

extern "C" __attribute__((visibility("default"))) int gettimeofday(timeval* time, void* zone) noexcept
{
    const long long stopped = nvrtest::stopped_at, now = stopped ? stopped : nvrtest::machine_time();
    time->tv_sec = now / 1000000 + nvrtest::ahead.load();
    time->tv_usec = now % 1000000;
    if (zone) *static_cast<struct timezone*>(zone) = {0, 0};
    return 0;
}

// A select that watches nothing is a sleep.
extern "C" __attribute__((visibility("default"))) int select(int count, fd_set* reads, fd_set* writes, fd_set* faults,
                                                             timeval* time)
{
    if (count == 0 && !reads && !writes && !faults && time) {
        nvrtest::asleep += time->tv_sec * 1000000LL + time->tv_usec;
        return 0;
    }
    timespec limit = {};
    if (time) limit = {time->tv_sec, time->tv_usec * 1000};
    return static_cast<int>(::syscall(SYS_pselect6, count, reads, writes, faults, time ? &limit : nullptr, nullptr));
}
