#include "runtime/Time.h"

#include <cerrno>
#include <sys/select.h>
#include <sys/time.h>

namespace cimple {

namespace {

constexpr uint64 second = 1000000;

}

uint64 Time::now()
{
    timeval now{};
    gettimeofday(&now, nullptr);
    return static_cast<uint64>(now.tv_sec) * second + static_cast<uint64>(now.tv_usec);
}

void Time::sleep(uint64 usec)
{
    timeval time;
    time.tv_sec = static_cast<time_t>(usec / second);
    time.tv_usec = static_cast<suseconds_t>(usec % second);
    // Linux leaves in the time-out what a signal cut off.
    while (select(0, nullptr, nullptr, nullptr, &time) == -1 && errno == EINTR) {
    }
}

} // namespace cimple
