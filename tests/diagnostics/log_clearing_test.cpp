// What clients cannot reach through the factories: a run of a test that the table does not know, and maps that refuse
// their own elements.

#include "classes/CIM_DiagnosticRecord.h"
#include "classes/CIM_RecordForLog.h"
#include "classes/NVRHBA_DiagnosticCompletionRecord.h"
#include "classes/NVRHBA_DiagnosticServiceRecord.h"
#include "classes/NVRHBA_DiagnosticsLog.h"
#include "classes/NVRHBA_FCHBADiagnosticTest.h"
#include "classes/NVRHBA_LogManagesRecord.h"
#include "classes/NVRHBA_RecordAppliesToElement.h"
#include "diagnostics/NVRHBA_DiagnosticsLog_Provider.h"
#include "diagnostics/NVRHBA_FCHBADiagnosticTest_Provider.h"
#include "tests/diagnostics/Diagnostics_Test.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;

namespace {

class Log_Clearing : public Diagnostics {
protected:
    Log_Clearing()
    {
        for (const char* name : {status_name, internal_name, status_name, self_name})
            run(name);
    }
    uint32 clear_log(const Instance* log)
    {
        words();
        Property<uint32> answer = {77, 1};
        EXPECT_EQ(provider.ClearLog(static_cast<const NVRHBA_DiagnosticsLog*>(log), answer), INVOKE_METHOD_OK);
        EXPECT_FALSE(answer.null);
        return answer.value;
    }
    const Instance* log_of(const char* name)
    {
        for (std::size_t i = 0; i < map("DiagnosticsLog").size(); i++)
            if (value(map("DiagnosticsLog")[i], "InstanceID") == name) return map("DiagnosticsLog")[i];
        return nullptr;
    }
    Words ids(const char* class_name)
    {
        Words all;
        for (std::size_t i = 0; i < map(class_name).size(); i++)
            all.push_back(value(map(class_name)[i], "InstanceID"));
        return all;
    }
    NVRHBA_DiagnosticsLog_Provider provider;
};

} // namespace

TEST_F(Log_Clearing, TakesOneTestsRecordsAndKeepsTheOrderOfTheOthers)
{
    const std::string loopback = std::string(internal_name) + ":2:1";
    const std::string self = std::string(self_name) + ":4:2";
    EXPECT_EQ(clear_log(log_of(status_name)), 0u);
    EXPECT_EQ(words().back(), "Exiting NVRHBA_DiagnosticsLog_Provider::ClearLog");
    EXPECT_THAT(ids("DiagnosticCompletionRecord"), ElementsAre(loopback, self));
    EXPECT_THAT(ids("DiagnosticServiceRecord"), ElementsAre(loopback + ":Service Record", self + ":Service Record"));
    EXPECT_EQ(map("LogManagesRecord").size(), 4u);
    EXPECT_EQ(map("RecordAppliesToElement").size(), 4u);
    EXPECT_EQ(end(map("LogManagesRecord")[3], "Record", "InstanceID"), self);
    EXPECT_EQ(map("ConcreteJob").size(), 4u) << "jobs stay";
    // What was built anew is found by its keys.
    const Ref<Instance> key(clone(map("DiagnosticCompletionRecord")[1]));
    EXPECT_EQ(map("DiagnosticCompletionRecord").find(key.get()), 1);
}

TEST_F(Log_Clearing, OfALogThatIsNoTestsDoesNothing)
{
    Ref<NVRHBA_DiagnosticsLog> other(create_as<NVRHBA_DiagnosticsLog>());
    other->InstanceID.set("another log");
    EXPECT_EQ(clear_log(other.get()), 5u);
    EXPECT_EQ(words().back(), "Invalid instance of Diagnostic Log");
    map("DiagnosticsLog").insert(clone(other.get()));
    EXPECT_EQ(clear_log(other.get()), 0u);
    EXPECT_EQ(words().back(), "Exiting the NVRHBA CDM Clear log");
    EXPECT_EQ(map("DiagnosticCompletionRecord").size(), 4u);
}

TEST_F(Log_Clearing, KeepsTiesWithoutEnds)
{
    auto* tie = static_cast<NVRHBA_LogManagesRecord*>(map("LogManagesRecord")[0]);
    unref(tie->Log);
    tie->Log = nullptr;
    auto* other = static_cast<NVRHBA_RecordAppliesToElement*>(map("RecordAppliesToElement")[0]);
    unref(other->Antecedent);
    other->Antecedent = nullptr;
    EXPECT_EQ(clear_log(log_of(status_name)), 0u);
    EXPECT_EQ(map("LogManagesRecord").size(), 5u);
    EXPECT_EQ(map("RecordAppliesToElement").size(), 5u);
    EXPECT_EQ(map("DiagnosticCompletionRecord").size(), 2u);
}

TEST_F(Log_Clearing, EndsAtAMapThatRefusesItsOwnElements)
{
    const struct {
        const char* map;
        const char* words;
    } rows[] = {{"DiagnosticServiceRecord", "Insert Failed : temp_NVRHBA_DiagnosticServiceRecord_map"},
                {"DiagnosticCompletionRecord", "Insert Failed : temp_NVRHBA_DiagnosticCompletionRecord_map"}};
    for (const auto& row : rows) {
        NVR_Diagnostics::ClearDiagnosticClassMaps(agent(), 0);
        NVR_Diagnostics::CreateFCHBADiagnosticClassFeature(agent());
        for (const char* name : {status_name, internal_name, self_name})
            run(name);
        // Two of another test with one key: no insert would have made them.
        const std::string twin = value(map(row.map)[1], "InstanceID");
        if (std::string(row.map) == "DiagnosticServiceRecord")
            static_cast<NVRHBA_DiagnosticServiceRecord*>(map(row.map)[2])->InstanceID.set(twin.c_str());
        else
            static_cast<NVRHBA_DiagnosticCompletionRecord*>(map(row.map)[2])->InstanceID.set(twin.c_str());
        EXPECT_EQ(clear_log(log_of(status_name)), 4u);
        EXPECT_EQ(words().back(), row.words);
        EXPECT_EQ(map(row.map).size(), 3u) << "the rest stays as it stands";
        EXPECT_EQ(map("LogManagesRecord").size(), 4u) << "what was done before is done";
    }
}

TEST_F(Log_Clearing, EndsAtTiesThatAreRefused)
{
    // Of the last two ties, both of another test, one gets the end of the other.
    const auto twin = [](auto& ties, auto* typed, auto end) {
        auto* first = static_cast<decltype(typed)>(ties[ties.size() - 2]);
        auto* second = static_cast<decltype(typed)>(ties[ties.size() - 1]);
        ref(first->*end);
        unref(std::exchange(second->*end, first->*end));
    };
    twin(map("RecordAppliesToElement"), (NVRHBA_RecordAppliesToElement*)nullptr,
         &NVRHBA_RecordAppliesToElement::Antecedent);
    EXPECT_EQ(clear_log(log_of(status_name)), 4u);
    EXPECT_EQ(words().back(), "Insert Failed : NVRHBA_RecordAppliesToElement_map");
    EXPECT_EQ(map("LogManagesRecord").size(), 4u) << "what was done before is done";
    EXPECT_EQ(map("RecordAppliesToElement").size(), 8u) << "the rest stays as it stands";
    EXPECT_EQ(map("DiagnosticCompletionRecord").size(), 4u);

    twin(map("LogManagesRecord"), (NVRHBA_LogManagesRecord*)nullptr, &NVRHBA_LogManagesRecord::Record);
    EXPECT_EQ(clear_log(log_of(internal_name)), 4u);
    EXPECT_EQ(words().back(), "Insert Failed : temp_NVRHBA_LogManagesRecord_map");
    EXPECT_EQ(map("LogManagesRecord").size(), 4u);
    EXPECT_EQ(map("DiagnosticServiceRecord").size(), 4u);
}

TEST_F(Log_Clearing, IsForLogsAlone)
{
    EXPECT_EQ(clear_log(nullptr), 5u);
    EXPECT_EQ(clear_log(first("ConcreteJob")), 5u);
    EXPECT_EQ(words().back(), "Invalid instance of Diagnostic Log");
    EXPECT_EQ(map("DiagnosticCompletionRecord").size(), 4u);
}

TEST_F(Log_Clearing, ATestThatTheTableDoesNotKnowIsNotRun)
{
    // A test and its settings that no build makes.
    const char* const name = "NVR:FCHBA Unknown Test";
    Ref<NVRHBA_FCHBADiagnosticTest> test(static_cast<NVRHBA_FCHBADiagnosticTest*>(clone(first("FCHBADiagnosticTest"))));
    test->Name.set(name);
    map("FCHBADiagnosticTest").insert(clone(test.get()));
    Ref<Instance> unknown(clone(&setting(status_name)));
    static_cast<NVRHBA_FCHBADiagnosticSettingData*>(unknown.get())->InstanceID.set(name);
    map("FCHBADiagnosticSettingData").insert(unknown.release());

    NVRHBA_FCHBADiagnosticTest_Provider tests;
    const Ref<Instance> port(clone(controller()));
    auto* element = static_cast<CIM_ManagedElement*>(port.get());
    CIM_DiagnosticSettingData* settings = nullptr;
    CIM_JobSettingData* jobs = nullptr;
    CIM_ConcreteJob* job = nullptr;
    Property<uint32> answer = {77, 1};
    words();
    EXPECT_EQ(tests.RunDiagnosticService(test.get(), element, settings, jobs, job, answer), INVOKE_METHOD_OK);
    EXPECT_EQ(answer.value, 1u);
    EXPECT_EQ(job, nullptr);
    EXPECT_EQ(words().back(), "Invalid Test Name");
    EXPECT_EQ(map("ConcreteJob").size(), 4u);
}
