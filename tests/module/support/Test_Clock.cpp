#include "tests/module/support/Test_Clock.h"

#include <atomic>
#include <ctime>
#include <sys/time.h>

namespace nvrtest {

static std::atomic<long long> ahead{0}; // seconds

void advance_clock(std::chrono::seconds by)
{
    ahead += by.count();
}

} // namespace nvrtest

extern "C" __attribute__((visibility("default"))) int gettimeofday(timeval* time, void* zone) noexcept
{
    timespec now;
    clock_gettime(CLOCK_REALTIME, &now);
    time->tv_sec = now.tv_sec + nvrtest::ahead.load();
    time->tv_usec = now.tv_nsec / 1000;
    if (zone) *static_cast<struct timezone*>(zone) = {0, 0};
    return 0;
}
