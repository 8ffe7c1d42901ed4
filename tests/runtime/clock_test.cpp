#include <csignal>
#include <sys/time.h>

#include <gtest/gtest.h>

#include "runtime/Datetime.h"
#include "runtime/Time.h"
#include "tests/runtime/System_Faults.h"

using namespace cimple;

TEST(DatetimeValue, NowIsTheZeroIntervalIfTheClockFails)
{
    const System_Fault fault(System_Fault::clock, -1);
    EXPECT_TRUE(Datetime::now() == Datetime());
}

TEST(Sleep, IsNotCutShortByASignal)
{
    struct sigaction action = {};
    action.sa_handler = [](int) {};
    sigaction(SIGALRM, &action, nullptr);
    itimerval every_millisecond = {{0, 1000}, {0, 1000}};
    setitimer(ITIMER_REAL, &every_millisecond, nullptr);
    const uint64 start = Time::now();
    Time::sleep(30000);
    EXPECT_GE(Time::now() - start, 30000u);
    every_millisecond = {};
    setitimer(ITIMER_REAL, &every_millisecond, nullptr);
}
