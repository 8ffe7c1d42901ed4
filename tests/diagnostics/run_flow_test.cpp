// The methods of the test and help services where the maps are as no client can make them.
#include <utility>

#include "classes/NVRHBA_FCHBADiagnosticTest.h"
#include "classes/NVRHBA_HelpService.h"
#include "diagnostics/NVRHBA_FCHBADiagnosticTest_Provider.h"
#include "diagnostics/NVRHBA_HelpService_Provider.h"
#include "tests/diagnostics/Diagnostics_Test.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::Not;

namespace {

const std::string not_able = "Unable to get the Job/Diagnostic SettingData, Not able to continue";

class Run_Flow : public Diagnostics {
protected:
    struct Called {
        uint32 value;
        Ref<NVRHBA_ConcreteJob> job;
        Words words;
    };
    const Instance* test_of(const char* name)
    {
        for (std::size_t i = 0; i < map("FCHBADiagnosticTest").size(); i++)
            if (value(map("FCHBADiagnosticTest")[i], "Name") == name) return map("FCHBADiagnosticTest")[i];
        return nullptr;
    }
    Called call(const char* name, const Instance* element, Instance* setting = nullptr, Instance* job_setting = nullptr)
    {
        const Ref<Instance> test(clone(test_of(name)));
        const Ref<Instance> port(clone(element));
        auto* managed = static_cast<CIM_ManagedElement*>(port.get());
        auto* settings = static_cast<CIM_DiagnosticSettingData*>(setting);
        auto* jobs = static_cast<CIM_JobSettingData*>(job_setting);
        CIM_ConcreteJob* job = nullptr;
        Property<uint32> answer = {77, 1};
        words();
        EXPECT_EQ(tests.RunDiagnosticService(static_cast<NVRHBA_FCHBADiagnosticTest*>(test.get()), managed, settings,
                                             jobs, job, answer),
                  INVOKE_METHOD_OK);
        Called called = {answer.value, {}, words()};
        called.job.reset(static_cast<NVRHBA_ConcreteJob*>(static_cast<Instance*>(job)));
        return called;
    }
    NVRHBA_FCHBADiagnosticTest_Provider tests;
};

} // namespace

TEST_F(Run_Flow, APortWhoseNameIsNoneIsRefused)
{
    for (const char* id : {"", "none", "10000000C9A0000", "10000000C9A0000X"}) {
        Ref<NVRHBA_PortController> odd(clone_as(controller()));
        odd->DeviceID.set(id);
        const Ref<Instance> asked(clone(odd.get()));
        ASSERT_GT(agent().m_NVRHBA_PortController_map.insert(odd.release()), 0) << id;
        const Called called = call(status_name, asked.get());
        EXPECT_EQ(called.value, 5u) << id;
        EXPECT_FALSE(called.job);
        EXPECT_EQ(called.words.back(), "NVRHBA_FCHBADiagnosticTest_Provider::str2HBAName failed") << id;
        EXPECT_THAT(called.words, Contains(std::string("Device ID ") + id + " and the status 0"));
    }
}

TEST_F(Run_Flow, NeedsTheSettingsOfTheJobs)
{
    map("JobSettingData").clear();
    const Called called = call(status_name, controller());
    EXPECT_EQ(called.value, 5u);
    EXPECT_THAT(called.words, Not(Contains("Using the default NVRHBA_JobSettingData Instance")));
    EXPECT_EQ(called.words.back(), not_able);
}

TEST_F(Run_Flow, NeedsTheSettingsOfTheTest)
{
    map("FCHBADiagnosticSettingData").clear();
    const Called called = call(status_name, controller());
    EXPECT_EQ(called.value, 5u);
    EXPECT_THAT(called.words, contains_in_order({"Using the default NVRHBA_JobSettingData Instance",
                                                 "Could not find the default setting data", not_able}));
}

// Both are read before either is held against the client: good settings last also where the job's were refused.
TEST_F(Run_Flow, SettingsLastThoughTheJobsWereRefused)
{
    const Ref<NVRHBA_FCHBADiagnosticSettingData> given(clone_as(&setting(internal_name)));
    given->LoopControlParameter.set(Array<String>{"7"});
    const Ref<NVRHBA_JobSettingData> others(clone_as(&job_setting()));
    others->InstanceID.set("another");
    others->DeleteOnCompletion.set(true);
    const Called called = call(internal_name, controller(), given.get(), others.get());
    EXPECT_EQ(called.value, 5u);
    EXPECT_FALSE(called.job);
    EXPECT_THAT(called.words, contains_in_order({"Invalid input instance: NVRHBA_JobSettingData",
                                                 "Entered embedded instance", "Input LoopControlParam : 7", not_able}));
    EXPECT_EQ(newest_test(), "none");
    expect_rows(&setting(internal_name), {{"LoopControlParameter", "{7}"}, {"OverridedSettingData", "1"}});
    expect_rows(&job_setting(), {{"DeleteOnCompletion", "false"}});
    call(internal_name, controller());
    EXPECT_EQ(newest_test(), "loopback cycles=7 halt=0 pattern=1a2b3c4d");
}

TEST_F(Run_Flow, HelpWithoutItsArraysIsNoDocumentOrAnEmptyOne)
{
    NVRHBA_HelpService_Provider help;
    auto* service = static_cast<NVRHBA_HelpService*>(map("HelpService")[0]);
    const Ref<NVRHBA_HelpService> self(clone_as(service));
    const auto ask = [&](Property<String>& info) {
        Property<String> document;
        document.set(beacon_name);
        Property<uint16> format, delivery;
        format.set(uint16{1});
        delivery.set(uint16{1});
        info = {};
        info.null = 1;
        Property<uint32> answer = {77, 1};
        EXPECT_EQ(help.GetHelp(self.get(), document, format, delivery, info, answer), INVOKE_METHOD_OK);
        return answer.value;
    };
    Property<String> info;
    service->DocumentDescriptions.set(Array<String>());
    EXPECT_EQ(ask(info), 0u);
    EXPECT_FALSE(info.null);
    EXPECT_STREQ(info.value.c_str(), "");
    service->DocumentDescriptions.null = 1;
    EXPECT_EQ(ask(info), 0u);
    EXPECT_STREQ(info.value.c_str(), "");
    service->DocumentsAvailable.set(Array<String>());
    EXPECT_EQ(ask(info), 4u);
    EXPECT_TRUE(info.null);
    service->DocumentsAvailable.set(Array<String>{beacon_name});
    service->DocumentsAvailable.null = 1;
    EXPECT_EQ(ask(info), 4u);
    EXPECT_TRUE(info.null);
}
