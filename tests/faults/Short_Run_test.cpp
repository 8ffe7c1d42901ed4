// A run in which memory is refused is held against what the module does otherwise: no difference may pass.
#include <algorithm>
#include <chrono>
#include <string>

#include <gmock/gmock.h>

#include "tests/faults/Short_Run.h"
#include "tests/module/support/Rig.h"

using namespace nvrtest;
using testing::HasSubstr;

namespace {

constexpr std::chrono::seconds patience{60};

std::string failure_of(const Surveys& surveys, const Surveyed_Site& place)
{
    return do_run(short_run(surveys, {place}, patience)).failure;
}

} // namespace

TEST(ShortRun, FailsWhereItLeavesABlockOrPublishesSomethingElse)
{
    module_registrations();
    watch_memory_of(NVR_MODULE, 8);
    Surveys surveys = hold_surveys(1, patience);
    const auto& sites = surveys.at("").sites;
    const auto is_of_alerts = [](const Surveyed_Site& site) { return site.part == "alerts"; };
    const auto at = std::find_if(sites.begin(), sites.end(), is_of_alerts);
    ASSERT_NE(at, sites.end());
    const Surveyed_Site place = *at;
    const std::uintptr_t frame = place.site.stack.front();
    Survey& expected = surveys.at(place.part);
    const Survey sound = expected;
    const Run_Result result = do_run(short_run(surveys, {place}, patience));
    EXPECT_EQ(result.failure, "");
    EXPECT_EQ(outcome_of(result).refused, 1u);

    // It holds a block more after each unload.
    expected.first[frame]--;
    expected.second[frame]--;
    EXPECT_THAT(failure_of(surveys, place),
                HasSubstr("it leaves more blocks than without a refusal:\n1 of @" + hex(frame)));
    // One that only the first load makes is not missed from the second.
    expected.second = sound.second;
    EXPECT_EQ(failure_of(surveys, place), "");

    expected = sound;
    expected.published += "NVRHBA_FCPort[9] string DeviceID = nobody\n";
    EXPECT_THAT(failure_of(surveys, place), HasSubstr("it publishes something else:\n- NVRHBA_FCPort[9]"));
}
