#include <gtest/gtest.h>

#include "runtime/Datetime.h"
#include "tests/runtime/System_Faults.h"

using namespace cimple;

TEST(DatetimeValue, NowIsTheZeroIntervalIfTheClockFails)
{
    const System_Fault fault(System_Fault::clock, -1);
    EXPECT_TRUE(Datetime::now() == Datetime());
}
