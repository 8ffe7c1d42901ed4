#include "tests/support/Watch.h"

#include <future>
#include <string>

#include <gmock/gmock.h>

using nvrtest::Watch;

TEST(Watch, TellsOfARequestThatTakesTooLong)
{
    std::promise<std::string> told;
    Watch watch(std::chrono::milliseconds(20), [&](const std::string& what) { told.set_value(what); });
    {
        const Watch::Turn quick(watch, "an answered one");
    }
    const Watch::Turn slow(watch, "one that hangs");
    EXPECT_EQ(told.get_future().get(), "one that hangs");
}

TEST(Watch, AllowsForWhatTheLibraryIsMadeToDelay)
{
    std::promise<std::string> told;
    Watch watch(std::chrono::milliseconds(20), [&](const std::string& what) { told.set_value(what); });
    const Watch::Turn delayed(watch, "a delayed one");
    watch.allow(std::chrono::hours(1));
    const Watch::Turn later(watch, "a later one");
    EXPECT_EQ(told.get_future().get(), "a later one");
}
