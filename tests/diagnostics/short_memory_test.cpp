// Memory that runs out at any place: what fails says so, nothing is thrown where words are told, and what was there
// before stays.
#include "tests/support/short_memory.h"

#include <algorithm>
#include <set>

#include "classes/NVRHBA_DiagnosticsLog.h"
#include "diagnostics/NVRHBA_DiagnosticsLog_Provider.h"
#include "tests/diagnostics/Diagnostics_Test.h"

using namespace cimple;
using namespace nvrtest;

namespace {

class Short_Memory : public Diagnostics {
protected:
    /// Whether one of the words was said.
    static bool said_one_of(const Words& said, const Words& wanted)
    {
        return std::any_of(said.begin(), said.end(), [&](const std::string& word) {
            return std::find(wanted.begin(), wanted.end(), word) != wanted.end();
        });
    }
    static std::string all(const Words& said)
    {
        std::string text;
        for (const std::string& word : said)
            text += "\n" + word;
        return text;
    }
    std::size_t size(const char* class_name) { return map(class_name).size(); }

    const String name = internal_name;
};

} // namespace

TEST_F(Short_Memory, AJobIsMadeOrNotAndItsTiesAreToldOf)
{
    const NVRHBA_ConcreteJob* job = nullptr;
    const auto act = [&] {
        job = NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking(agent(), {name, false, 7, 1, controller()});
    };
    std::size_t jobs = 0;
    words();
    const long refused = refuse_each_allocation(act, [&](bool has_thrown) {
        EXPECT_FALSE(has_thrown);
        const Words said = words();
        if (job)
            EXPECT_TRUE(said_one_of(
                said, {"Unable to create NVRHBA_OwningJobElement", "Insert Failed: NVRHBA_OwningJobElement",
                       "Unable to create NVRHBA_AffectedJobElement", "Insert Failed: NVRHBA_AffectedJobElement"}))
                << all(said);
        else
            EXPECT_TRUE(said_one_of(said, {"Unable to create NVRHBA_ConcreteJob", "Insert Failed: NVRHBA_ConcreteJob"}))
                << all(said);
        jobs += job != nullptr;
        EXPECT_EQ(size("ConcreteJob"), jobs);
    });
    EXPECT_GT(refused, 10);
    ASSERT_TRUE(job);
}

TEST_F(Short_Memory, RecordsAreMadeOrNotAndTheirTiesAreToldOf)
{
    const Words service_words = {"Failed to create DiagnosticServiceRecord",
                                 "Insert Failed, DiagnosticServiceRecord",
                                 "Failed to create NVRHBA_LogManagesRecord",
                                 "Insert Failed : NVRHBA_LogManagesRecord",
                                 "Failed to create NVRHBA_DiagnosticSettingDataRecord",
                                 "Insert in NVRHBA_DiagnosticSettingDataRecord Failed",
                                 "Failed to create NVRHBA_CorrespondingSettingDataRecord",
                                 "Insert Failed : RecordAppliesToElement",
                                 "Failed to create NVRHBA_RecordAppliesToElement"};
    const Words completion_words = {"Failed to create NVRHBA_DiagnosticCompletionRecord",
                                    "Insert in DiagnosticCompletionRecord Failed",
                                    "Failed to create NVRHBA_LogManagesRecord",
                                    "Insert Failed : NVRHBA_LogManagesRecord",
                                    "Failed to create NVRHBA_CorrespondingSettingDataRecord",
                                    "Insert Failed : NVRHBA_CorrespondingSettingDataRecord",
                                    "Failed to create NVRHBA_RecordAppliesToElement",
                                    "Insert Failed : RecordAppliesToElement"};
    int number = 0;
    String id;
    const auto record = [&] {
        return NVR_Diagnostics::Record_Arguments{name, "a text", id, nullptr, RECORD_PASSED, controller(), true};
    };
    const auto expect_words = [&](const Words& wanted) {
        return [&](bool has_thrown) {
            EXPECT_FALSE(has_thrown);
            const Words said = words();
            EXPECT_TRUE(said_one_of(said, wanted)) << all(said);
            id = ("job " + std::to_string(++number)).c_str();
        };
    };
    id = "job";
    words();
    EXPECT_GT(refuse_each_allocation([&] { NVR_Diagnostics::CreateDiagnosticServiceRecord(agent(), record()); },
                                     expect_words(service_words)),
              20);
    EXPECT_GT(refuse_each_allocation([&] { NVR_Diagnostics::CreateDiagnosticCompletionRecord(agent(), record()); },
                                     expect_words(completion_words)),
              10);
    EXPECT_GT(size("DiagnosticServiceRecord"), size("DiagnosticSettingDataRecord"));
}

TEST_F(Short_Memory, AClearedLogCostsNoRecordOfAnotherTest)
{
    for (const char* test : {internal_name, status_name, internal_name, self_name})
        run(test);
    NVRHBA_DiagnosticsLog_Provider provider;
    const Ref<NVRHBA_DiagnosticsLog> log(create_as<NVRHBA_DiagnosticsLog>());
    log->InstanceID.set(internal_name);
    Property<uint32> answer = {0, 1};
    const auto act = [&] {
        answer = {77, 1};
        provider.ClearLog(log.get(), answer);
    };
    const auto expect_others = [&] {
        std::size_t records = 0;
        for (std::size_t i = 0; i < size("DiagnosticCompletionRecord"); i++)
            records += value(map("DiagnosticCompletionRecord")[i], "ServiceName") != internal_name;
        EXPECT_EQ(records, 2u);
        for (const char* tie : {"LogManagesRecord", "RecordAppliesToElement"})
            EXPECT_GE(size(tie), 4u) << tie;
        EXPECT_GE(size("DiagnosticServiceRecord"), 2u);
    };
    const long refused = refuse_each_allocation(act, [&](bool has_thrown) {
        EXPECT_EQ(answer.value, has_thrown ? 77u : 4u);
        expect_others();
    });
    EXPECT_GT(refused, 5);
    EXPECT_EQ(answer.value, 0u);
    expect_others();
    EXPECT_EQ(size("LogManagesRecord"), 4u);
    EXPECT_EQ(size("DiagnosticServiceRecord"), 2u);
}

TEST_F(Short_Memory, ATestIsPublishedWholeOrNotAtAll)
{
    const char* const maps[] = {"HelpService",
                                "ServiceAvailableToElement",
                                "DiagnosticIdentity",
                                "DiagElementSoftwareIdentity",
                                "FCHBADiagnosticSettingData",
                                "DiagElementSettingData",
                                "FCHBADiagnosticServiceCapabilities",
                                "DiagElementCapabilities",
                                "JobElementSettingData",
                                "DiagnosticsLog",
                                "UseOfLog"};
    const char* const refusals[] = {"Insert Failed : NVRHBA_FCHBADiagnosticTest_map",
                                    "Insert Failed : NVRHBA_HelpService_map",
                                    "Insert Failed : NVRHBA_ServiceAvailableToElement_map",
                                    "Insert Failed : NVRHBA_DiagnosticIdentity_map",
                                    "Insert Failed : NVRHBA_DiagElementSoftwareIdentity_map",
                                    "Insert Failed : NVRHBA_FCHBADiagnosticSettingData_map",
                                    "Insert Failed : NVRHBA_DiagElementSettingData",
                                    "Insert Failed : NVRHBA_FCHBADiagnosticServiceCapabilities_map",
                                    "Insert Failed : NVRHBA_FCHBAElementCapabilities_map",
                                    "Insert Failed : NVRHBA_JobSettingData_map",
                                    "Insert Failed : NVRHBA_JobElementSettingData",
                                    "Insert Failed : DiagnosticsLog_map",
                                    "Insert Failed : UseOfLog_map"};
    std::set<std::string> refused;
    constexpr long of_the_first_tests = 700;
    int given_up = 0, taken_back = 0, untied = 0;
    for (long number = 1; number <= of_the_first_tests; number++) {
        NVR_Diagnostics::ClearDiagnosticClassMaps(agent(), 0);
        words();
        bool has_thrown = false;
        refuse_allocation(number);
        try {
            NVR_Diagnostics::CreateFCHBADiagnosticClassFeature(agent());
        } catch (const std::bad_alloc&) {
            has_thrown = true;
        }
        ASSERT_TRUE(forget_refusal()) << number;
        const Words said = words();
        const std::size_t tests = size("FCHBADiagnosticTest");
        if (has_thrown) {
            EXPECT_EQ(tests, 0u) << number << all(said);
            continue;
        }
        for (const char* each : maps)
            EXPECT_EQ(size(each), tests) << number << ' ' << each;
        if (tests == 9) {
            untied +=
                size("ServiceAffectsElement") + size("AvailableDiagnosticService") + size("DiagHostedService") < 27;
            continue;
        }
        if (tests == 0) continue; // no version could be read
        for (const char* words : refusals)
            if (said_one_of(said, {words})) refused.insert(words);
        EXPECT_EQ(tests, 8u) << number;
        for (const Diagnostic_Test& test : diagnostic_tests) {
            given_up += said_one_of(
                said, {"Failed to create the maps for " + std::string(test.name) + " ,Check the memory availablity"});
            taken_back += said_one_of(
                said, {"Failed to insert the Diag Instances into map for DiagTest " + std::string(test.name)});
        }
    }
    EXPECT_GT(given_up, 100);
    EXPECT_GT(taken_back, 20);
    EXPECT_GT(untied, 20);
    for (const char* words : refusals)
        EXPECT_EQ(refused.count(words), 1u) << words;
}
