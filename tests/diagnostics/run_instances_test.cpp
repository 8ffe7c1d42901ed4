// Jobs and records: their properties, what they are tied to, and what each refused insert costs.

#include <unistd.h>

#include "classes/NVRHBA_AffectedJobElement.h"
#include "classes/NVRHBA_OwningJobElement.h"
#include "tests/diagnostics/Diagnostics_Test.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::MatchesRegex;
using testing::SizeIs;

namespace {

class Run_Instances : public Diagnostics {
protected:
    NVRHBA_ConcreteJob* make_job(uint32 code = JOB_COMPLETED)
    {
        return NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking(agent(), {name, false, code, 7, controller()});
    }
    NVR_Diagnostics::Record_Arguments record(bool overridden = false)
    {
        return {name, "a text", id, nullptr, RECORD_PASSED, controller(), overridden};
    }
    const String name = internal_name;
    const String id = "some job";
};

} // namespace

TEST_F(Run_Instances, AJobTellsItsTestAndItsState)
{
    const NVRHBA_ConcreteJob* job = make_job();
    ASSERT_TRUE(job);
    expect_rows(job, {{"InstanceID", std::string(internal_name) + ":1:7"},
                      {"ElementName", "NVRHBA_ConcreteJob"},
                      {"Name", internal_name},
                      {"DeleteOnCompletion", "false"},
                      {"JobState", "7"},
                      {"PercentComplete", "100"},
                      {"diagHandle", "null"},
                      {"wwpn", "null"}});
    EXPECT_THAT(value(job, "TimeSubmitted"), MatchesRegex("2023111[45][0-9]*\\.[0-9]{6}[+-][0-9]{3}"));
    for (const uint32 code : {JOB_FAILED, 0u, 6u, 8u}) {
        const NVRHBA_ConcreteJob* failed = make_job(code);
        expect_rows(failed, {{"JobState", "10"}, {"PercentComplete", "0"}});
    }
    EXPECT_EQ(map("ConcreteJob").size(), 5u);
    for (std::size_t i = 0; i < 5; i++)
        EXPECT_EQ(value(map("ConcreteJob")[i], "InstanceID"),
                  std::string(internal_name) + ':' + std::to_string(i + 1) + ":7");
    EXPECT_EQ(end(first("OwningJobElement"), "OwningElement", "Name"), internal_name);
    EXPECT_EQ(end(first("OwningJobElement"), "OwnedElement", "InstanceID"), std::string(internal_name) + ":1:7");
    EXPECT_EQ(end(first("AffectedJobElement"), "AffectedElement", "DeviceID"), first_wwpn);
    EXPECT_EQ(end(first("AffectedJobElement"), "AffectingElement", "InstanceID"), std::string(internal_name) + ":1:7");
    EXPECT_STREQ(first("OwningJobElement")->__name_space.c_str(), "root/norvane");
}

TEST_F(Run_Instances, TwoRunsGiveTwoJobsAndAllTheirRecords)
{
    run(status_name);
    run(status_name);
    ASSERT_EQ(map("ConcreteJob").size(), 2u);
    const std::string first_id = std::string(status_name) + ":1:65535";
    const std::string second_id = std::string(status_name) + ":2:65535";
    EXPECT_EQ(value(map("ConcreteJob")[0], "InstanceID"), first_id);
    EXPECT_EQ(value(map("ConcreteJob")[1], "InstanceID"), second_id);
    expect_rows(map("DiagnosticServiceRecord")[1],
                {{"InstanceID", second_id + ":Service Record"},
                 {"Description", "This class holds the results(service) of the test"},
                 {"ElementName", std::string(status_name) + " Service Record"},
                 {"RecordType", "2"},
                 {"ServiceName", status_name},
                 {"ManagedElementName", controller()->ElementName.value.c_str()},
                 {"RecordData", std::string(status_name) + " Resulted with Success"}});
    expect_rows(map("DiagnosticCompletionRecord")[1],
                {{"InstanceID", second_id},
                 {"Description", "This class holds the result of the test"},
                 {"ElementName", std::string(status_name) + " Completion Record"},
                 {"CompletionState", "2"},
                 {"RecordType", "2"},
                 {"ServiceName", status_name},
                 {"ManagedElementName", controller()->ElementName.value.c_str()},
                 {"RecordData", std::string(status_name) + " Resulted with Success"}});
    EXPECT_NE(value(map("DiagnosticServiceRecord")[0], "CreationTimeStamp"), "null");
    ASSERT_EQ(map("LogManagesRecord").size(), 4u);
    EXPECT_EQ(end(map("LogManagesRecord")[2], "Log", "InstanceID"), status_name);
    EXPECT_EQ(end(map("LogManagesRecord")[2], "Record", "InstanceID"), second_id + ":Service Record");
    EXPECT_EQ(end(map("LogManagesRecord")[3], "Record", "InstanceID"), second_id);
    ASSERT_EQ(map("RecordAppliesToElement").size(), 4u);
    EXPECT_EQ(end(map("RecordAppliesToElement")[3], "Antecedent", "InstanceID"), second_id);
    EXPECT_EQ(end(map("RecordAppliesToElement")[3], "Dependent", "DeviceID"), first_wwpn);
    EXPECT_EQ(map("DiagnosticSettingDataRecord").size(), 0u);
    EXPECT_EQ(map("CorrespondingSettingDataRecord").size(), 0u);
}

TEST_F(Run_Instances, ARunWithOverridesLeavesItsSettingsToo)
{
    setting(internal_name).OverridedSettingData.set(1);
    const Ran ran = run(internal_name);
    ASSERT_TRUE(ran.job);
    const std::string job = value(ran.job.get(), "InstanceID");
    ASSERT_EQ(map("DiagnosticSettingDataRecord").size(), 1u);
    expect_rows(first("DiagnosticSettingDataRecord"),
                {{"InstanceID", job + ":SettingData Record"},
                 {"Caption", job},
                 {"Description", "This class holds the overrided setting data of the test"},
                 {"ElementName", std::string(internal_name) + " SettingData Record"},
                 {"ServiceName", internal_name},
                 {"ManagedElementName", controller()->ElementName.value.c_str()},
                 {"RecordType", "null"}});
    ASSERT_EQ(map("CorrespondingSettingDataRecord").size(), 2u);
    EXPECT_EQ(end(map("CorrespondingSettingDataRecord")[0], "DataRecord", "InstanceID"), job + ":Service Record");
    EXPECT_EQ(end(map("CorrespondingSettingDataRecord")[1], "DataRecord", "InstanceID"), job);
    for (std::size_t i = 0; i < 2; i++)
        EXPECT_EQ(end(map("CorrespondingSettingDataRecord")[i], "SettingsRecord", "InstanceID"),
                  job + ":SettingData Record");
    ASSERT_EQ(map("LogManagesRecord").size(), 3u);
    EXPECT_EQ(end(map("LogManagesRecord")[1], "Record", "InstanceID"), job + ":SettingData Record");
    EXPECT_EQ(map("RecordAppliesToElement").size(), 2u);
    // Any other number than 1 is none.
    setting(internal_name).OverridedSettingData.set(2);
    run(internal_name);
    EXPECT_EQ(map("DiagnosticSettingDataRecord").size(), 1u);
}

TEST_F(Run_Instances, WithoutAPortControllerRecordsNameTheAdapter)
{
    const Ran ran = run(status_name, nullptr);
    EXPECT_EQ(ran.status, 0u);
    ASSERT_TRUE(ran.job);
    EXPECT_THAT(ran.words,
                contains_in_order({"NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking()",
                                   "Unable to create NVRHBA_AffectedJobElement",
                                   "NVR_Diagnostics::CreateDiagnosticServiceRecord", "Invalid managed element",
                                   "NVR_Diagnostics::CreateDiagnosticCompletionRecord", "Invalid managed element"}));
    for (const char* record : {"DiagnosticServiceRecord", "DiagnosticCompletionRecord"})
        EXPECT_EQ(value(first(record), "ManagedElementName"), "NVRHBA_Adapter");
    EXPECT_EQ(map("RecordAppliesToElement").size(), 0u);
    EXPECT_EQ(map("AffectedJobElement").size(), 0u);
    EXPECT_EQ(map("OwningJobElement").size(), 1u);
}

TEST_F(Run_Instances, CountersBelongToPolledTestsAlone)
{
    RM_DIAGRESULT result = {};
    result.cyclesCompleted = 10;
    result.loopsFailed = 3;
    result.executionTime = 4;
    for (const Diagnostic_Test& test : diagnostic_tests) {
        const String test_name = test.name;
        const String job_id = std::string("job of " + std::string(test.name)).c_str();
        NVR_Diagnostics::CreateDiagnosticServiceRecord(
            agent(), {test_name, "", job_id, &result, RECORD_PASSED, controller(), false});
        const bool counts = test_name != beacon_name && test_name != status_name && test_name != reset_name;
        const Instance_Map& records = map("DiagnosticServiceRecord");
        expect_rows(records[records.size() - 1], {{"LoopsFailed", counts ? "3" : "null"},
                                                  {"LoopsPassed", counts ? "7" : "null"},
                                                  {"CompletedCycles", counts ? "10" : "null"},
                                                  {"TimeToExecute", counts ? "4" : "null"}});
    }
}

TEST_F(Run_Instances, ARefusedJobLeavesNothing)
{
    ASSERT_TRUE(make_job());
    // The counter is the process's: the next job is the second, and a twin of it stands there already.
    auto twin = clone_as(static_cast<const NVRHBA_ConcreteJob*>(first("ConcreteJob")));
    twin->InstanceID.set((std::string(internal_name) + ":2:7").c_str());
    ASSERT_EQ(map("ConcreteJob").insert(twin), 1);
    words();
    EXPECT_EQ(make_job(), nullptr);
    EXPECT_THAT(words(), ElementsAre("NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking()",
                                     "Insert Failed: NVRHBA_ConcreteJob"));
    EXPECT_EQ(map("ConcreteJob").size(), 2u);
    EXPECT_EQ(map("OwningJobElement").size(), 1u);
}

TEST_F(Run_Instances, ARefusedJobEndsTheRunWithoutRecords)
{
    // The first job of this process will be this one.
    Ref<NVRHBA_ConcreteJob> twin(create_as<NVRHBA_ConcreteJob>());
    twin->InstanceID.set((std::string(status_name) + ":1:65535").c_str());
    ASSERT_EQ(map("ConcreteJob").insert(twin.release()), 0);
    const Ran ran = run(status_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_FALSE(ran.job);
    EXPECT_EQ(map("DiagnosticServiceRecord").size(), 0u);
    EXPECT_EQ(map("DiagnosticCompletionRecord").size(), 0u);
    EXPECT_EQ(ran.words.back(), std::string(status_name) + " Succesful");
}

TEST_F(Run_Instances, AJobOfNoTestIsTiedToNothing)
{
    const String nobody = "nobody's test";
    words();
    EXPECT_TRUE(NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking(agent(), {nobody, false, 7, 1, controller()}));
    EXPECT_THAT(words(), ElementsAre("NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking()",
                                     "Unable to create NVRHBA_OwningJobElement"));
    EXPECT_EQ(map("OwningJobElement").size(), 0u);
    EXPECT_EQ(map("AffectedJobElement").size(), 0u);
}

TEST_F(Run_Instances, RefusedTiesOfAJobAreToldAndPassedOver)
{
    const NVRHBA_ConcreteJob* job = make_job();
    ASSERT_TRUE(job);
    // Twins of the next job's ties.
    const auto twin_of = [](const Instance* tie, auto* typed, auto end) {
        auto* copy = static_cast<decltype(typed)>(clone(tie));
        (copy->*end)->InstanceID.set((std::string(internal_name) + ":2:7").c_str());
        return copy;
    };
    ASSERT_EQ(map("OwningJobElement")
                  .insert(twin_of(first("OwningJobElement"), (NVRHBA_OwningJobElement*)nullptr,
                                  &NVRHBA_OwningJobElement::OwnedElement)),
              1);
    ASSERT_EQ(map("AffectedJobElement")
                  .insert(twin_of(first("AffectedJobElement"), (NVRHBA_AffectedJobElement*)nullptr,
                                  &NVRHBA_AffectedJobElement::AffectingElement)),
              1);
    words();
    EXPECT_TRUE(make_job());
    EXPECT_THAT(words(),
                ElementsAre("NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking()",
                            "Insert Failed: NVRHBA_OwningJobElement", "Insert Failed: NVRHBA_AffectedJobElement"));
}

TEST_F(Run_Instances, ARefusedRecordEndsItsBuilder)
{
    NVR_Diagnostics::CreateDiagnosticServiceRecord(agent(), record());
    NVR_Diagnostics::CreateDiagnosticCompletionRecord(agent(), record());
    words();
    NVR_Diagnostics::CreateDiagnosticServiceRecord(agent(), record(true));
    EXPECT_THAT(words(), ElementsAre("NVR_Diagnostics::CreateDiagnosticServiceRecord",
                                     "Insert Failed, DiagnosticServiceRecord"));
    NVR_Diagnostics::CreateDiagnosticCompletionRecord(agent(), record(true));
    EXPECT_THAT(words(), ElementsAre("NVR_Diagnostics::CreateDiagnosticCompletionRecord",
                                     "Insert in DiagnosticCompletionRecord Failed"));
    EXPECT_EQ(map("LogManagesRecord").size(), 2u);
    EXPECT_EQ(map("DiagnosticSettingDataRecord").size(), 0u);
}

TEST_F(Run_Instances, RefusedTiesOfRecordsAreToldAndPassedOver)
{
    NVR_Diagnostics::CreateDiagnosticServiceRecord(agent(), record(true));
    NVR_Diagnostics::CreateDiagnosticCompletionRecord(agent(), record(true));
    // The records go, their ties stay: the next ones find twins.
    map("DiagnosticServiceRecord").clear();
    map("DiagnosticCompletionRecord").clear();
    words();
    NVR_Diagnostics::CreateDiagnosticServiceRecord(agent(), record(true));
    EXPECT_THAT(words(),
                ElementsAre("NVR_Diagnostics::CreateDiagnosticServiceRecord", "Insert Failed : NVRHBA_LogManagesRecord",
                            "Insert in NVRHBA_DiagnosticSettingDataRecord Failed",
                            std::string("PortController : ") + first_wwpn, "Insert Failed : RecordAppliesToElement"));
    NVR_Diagnostics::CreateDiagnosticCompletionRecord(agent(), record(true));
    EXPECT_THAT(words(),
                ElementsAre("NVR_Diagnostics::CreateDiagnosticCompletionRecord",
                            "Insert Failed : NVRHBA_LogManagesRecord",
                            "Insert Failed : NVRHBA_CorrespondingSettingDataRecord",
                            std::string("PortController : ") + first_wwpn, "Insert Failed : RecordAppliesToElement"));
    // The correspondence of the service record has the words of another association.
    map("DiagnosticServiceRecord").clear();
    map("DiagnosticSettingDataRecord").clear();
    NVR_Diagnostics::CreateDiagnosticServiceRecord(agent(), record(true));
    EXPECT_THAT(words(),
                ElementsAre("NVR_Diagnostics::CreateDiagnosticServiceRecord", "Insert Failed : NVRHBA_LogManagesRecord",
                            "Insert Failed : RecordAppliesToElement", "Insert Failed : NVRHBA_LogManagesRecord",
                            std::string("PortController : ") + first_wwpn, "Insert Failed : RecordAppliesToElement"));
}

TEST_F(Run_Instances, WithoutALogOrSettingsTheTiesAreNotMade)
{
    map("DiagnosticsLog").clear();
    words();
    NVR_Diagnostics::CreateDiagnosticCompletionRecord(agent(), record(true));
    EXPECT_THAT(words(), ElementsAre("NVR_Diagnostics::CreateDiagnosticCompletionRecord",
                                     "Failed to create NVRHBA_LogManagesRecord",
                                     "Failed to create NVRHBA_CorrespondingSettingDataRecord",
                                     std::string("PortController : ") + first_wwpn));
}

TEST_F(Run_Instances, ADeletedJobTakesItsTiesAndNothingElse)
{
    NVRHBA_ConcreteJob* job = nullptr;
    for (int i = 0; i < 3; i++) {
        NVRHBA_ConcreteJob* made = make_job();
        if (i == 1) job = made;
    }
    NVR_Diagnostics::CreateDiagnosticCompletionRecord(agent(), record());
    words();
    NVR_Diagnostics::DeleteConcreteJob(agent(), nullptr);
    EXPECT_THAT(words(), ElementsAre("NVRHBA_DiagTestFunc::DeleteConcreteJob()", "Invalid Job ID"));
    NVR_Diagnostics::DeleteConcreteJob(agent(), job);
    EXPECT_THAT(words(), ElementsAre("NVRHBA_DiagTestFunc::DeleteConcreteJob()"));
    for (const char* name : {"ConcreteJob", "OwningJobElement", "AffectedJobElement"})
        EXPECT_EQ(map(name).size(), 2u) << name;
    EXPECT_EQ(value(map("ConcreteJob")[1], "InstanceID"), std::string(internal_name) + ":3:7");
    EXPECT_EQ(end(map("OwningJobElement")[1], "OwnedElement", "InstanceID"), std::string(internal_name) + ":3:7");
    EXPECT_EQ(end(map("AffectedJobElement")[1], "AffectingElement", "InstanceID"), std::string(internal_name) + ":3:7");
    EXPECT_EQ(map("DiagnosticCompletionRecord").size(), 1u);
}
