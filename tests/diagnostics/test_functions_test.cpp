// The six functions that carry the tests out: what they ask of the library, every way that they end, and their words.

#include "foundation/NVR_Common.h"
#include "simulator/nvrsim.h"
#include "tests/diagnostics/Diagnostics_Test.h"

using namespace cimple;
using namespace nvrtest;
using testing::AllOf;
using testing::Contains;
using testing::Each;
using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::HasSubstr;
using testing::Not;
using testing::SizeIs;

namespace {

class Polled_Test : public Diagnostics {
protected:
    /// How often the library was asked since the scenario began.
    static uint64 calls(const char* operation) { return nvrsim_calls(operation); }
    void target(const char* test, const char* wwpn = target_wwpn) { setting(test).TargetDevice.set(wwpn); }
};

class Direct_Test : public Diagnostics {};
class Beacon : public Diagnostics {};

const std::string poll = "Polling for the results.. ";

Words loopback_opening(const char* name)
{
    return {"NVR_Diagnostics::LoopBackTest", name, "Number of test cycles set to run : 100 ", "HaltOnError value : 0 ",
            "The Input pattern used for testing 1a2b3c4d"};
}

Words self_polls(int count)
{
    Words words;
    for (int i = 0; i < count; i++)
        words.push_back(poll + std::to_string(121 - i));
    return words;
}

} // namespace

// ------------------------------------------------------------------------------------------------------- texts

TEST(DiagnosticTexts, NameEveryResult)
{
    const char* const texts[] = {
        "Success",
        "General Error",
        "Link Down",
        "I/O Error",
        "Timeout",
        "Transmit Error",
        "Receive Error",
        "Mailbox Error",
        "Error: Echo test not supported",
        "Error: Echo Failed",
        "Error: Target Unreachable",
        "Error: HBA temperature exceeded operational range. Adapter stopped.\n\nPlease see the product documentation",
        "Error: Failed to allocate resource",
        "Error: Another diagnostic test is running. Please try again",
        "Error: Sequence Timeout",
        "Error: Bus reset received during test",
        "Error: Read-Write test is running",
        "Error: Driver busy. Please try again",
        "Error: Mailbox not ready",
        "Error: Port not ready"};
    for (uint32 code = 0; code < std::size(texts); code++)
        EXPECT_STREQ(NVR_DiagTestFunc::MapDiagResultStatus(code), texts[code]);
    for (const uint32 code : {20u, 21u, 0x80000000u, 0xFFFFFFFFu})
        EXPECT_STREQ(NVR_DiagTestFunc::MapDiagResultStatus(code), "Unknown");
}

TEST(DiagnosticTexts, NameEveryStatus)
{
    for (uint32 status = 0; status < 300; status++) {
        const char* expected = status == 0    ? "Successful"
                               : status == 1  ? "An unspecified error occurred"
                               : status == 62 ? "There are too many pending/running requests in diag. results table"
                               : status == 63 ? "Diagnostics not available/Port not supported"
                               : status == 64 ? "Adapter Busy: Another critical application may be running"
                                              : "Unknown";
        EXPECT_STREQ(NVR_DiagTestFunc::MapDiagStatus(status), expected) << status;
    }
}

// ------------------------------------------------------------------------------------------------ polled tests

TEST_F(Polled_Test, SelfTestCountsItsPollsAndLeavesAJob)
{
    port("diagnostics = { polls = 2, seconds = 9 }");
    const Ran ran = run(self_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_THAT(ran.words, ElementsAreArray(joined({{"NVR_DiagTestFunc::SelfTest"}, self_polls(3), records_left()})));
    EXPECT_EQ(ran.seconds, 3u);
    ASSERT_TRUE(ran.job);
    expect_rows(ran.job.get(), {{"Name", self_name},
                                {"InstanceID", std::string(self_name) + ":1:1"},
                                {"JobState", "7"},
                                {"PercentComplete", "100"}});
    EXPECT_EQ(newest_test(), "post cycles=1 halt=0 pattern=none");
    expect_rows(first("DiagnosticCompletionRecord"), {{"RecordData", std::string(self_name) + " Resulted with Success"},
                                                      {"CompletionState", "2"},
                                                      {"TimeToExecute", "9"},
                                                      {"CompletedCycles", "1"}});
}

TEST_F(Polled_Test, LoopbacksAskForTheirKindWithTheirSettings)
{
    const struct {
        const char* name;
        const char* asked;
    } rows[] = {{internal_name, "loopback cycles=100 halt=0 pattern=1a2b3c4d"},
                {host_name, "pci_loopback cycles=100 halt=0 pattern=1a2b3c4d"}};
    for (const auto& row : rows) {
        const Ran ran = run(row.name);
        EXPECT_EQ(ran.status, 0u);
        EXPECT_EQ(newest_test(), row.asked);
        EXPECT_THAT(ran.words, ElementsAreArray(joined({loopback_opening(row.name), {poll, poll}, records_left()})));
        EXPECT_EQ(ran.seconds, 2u);
        ASSERT_TRUE(ran.job);
        EXPECT_EQ(value(ran.job.get(), "JobState"), "7");
    }
    port("loopback_plug = true");
    const Ran ran = run(external_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_EQ(newest_test(), "external_loopback cycles=100 halt=0 pattern=1a2b3c4d");
    EXPECT_THAT(ran.words, ElementsAreArray(joined({loopback_opening(external_name), {poll, poll}, records_left()})));
    EXPECT_EQ(ran.seconds, 3u) << "one before the port is looked at again";
}

TEST_F(Polled_Test, SettingsReachTheAdapterAsTheyAreSet)
{
    auto& set = setting(internal_name);
    set.LoopControlParameter.set(Array<String>{"7"});
    set.HaltOnError.set(true);
    set.BufferPattern.set(Array<uint8>{'f', 'F', '0'});
    run(internal_name);
    EXPECT_EQ(newest_test(), "loopback cycles=7 halt=1 pattern=fF0");
    set.LoopControlParameter.set(Array<String>());
    set.BufferPattern.value.clear();
    run(internal_name);
    EXPECT_EQ(newest_test(), "loopback cycles=0 halt=1 pattern=");
    set.LoopControlParameter.null = set.HaltOnError.null = set.BufferPattern.null = 1;
    run(internal_name);
    EXPECT_EQ(newest_test(), "loopback cycles=0 halt=0 pattern=");
}

TEST_F(Polled_Test, PatternsAreCutToTheirBuffers)
{
    Array<uint8> pattern;
    for (int i = 0; i < 10000; i++)
        pattern.append(static_cast<uint8>('0' + i % 10));
    setting(internal_name).BufferPattern.set(pattern);
    run(internal_name);
    EXPECT_EQ(newest_test(), "loopback cycles=100 halt=0 pattern=0123456789012345678");
    setting(echo_name).BufferPattern.set(pattern);
    target(echo_name);
    run(echo_name);
    EXPECT_EQ(newest_test(),
              "echo cycles=100 halt=0 pattern=0123456789012345678901234567890123456789012345678 target=" +
                  std::string(target_wwpn));
}

TEST_F(Polled_Test, EchoAndPingGoToTheirTarget)
{
    for (const char* name : {echo_name, ping_name}) {
        target(name);
        const Ran ran = run(name);
        EXPECT_EQ(ran.status, 0u);
        EXPECT_EQ(newest_test(), std::string("echo cycles=100 halt=0 pattern=1a2b3c4d target=") + target_wwpn);
        EXPECT_THAT(ran.words,
                    contains_in_order({"NVR_Diagnostics::EchoTest/Ping", std::string("Diagnostics Name : ") + name,
                                       "Number of test cycles set to run : 100 ", "HaltOnError value : 0 ",
                                       "Pattern used for testing 1a2b3c4d",
                                       std::string("TargetDevice WWPN to check : ") + target_wwpn, poll, poll,
                                       "NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking()"}));
        EXPECT_TRUE(ran.job);
    }
}

TEST_F(Polled_Test, ATargetThatIsNoNameIsRefused)
{
    for (const char* wwpn : {"", "50060E8005A1000", "5006 E8005A10000", "50060E8005A1000G"}) {
        target(echo_name, wwpn);
        const uint64 before = calls("RM_DiagEchoTestV2");
        const Ran ran = run(echo_name);
        EXPECT_EQ(ran.status, 1u) << wwpn;
        EXPECT_EQ(ran.words.back(), "NVR_Diagnostics::EchoTest::str2HBAName failed") << wwpn;
        EXPECT_FALSE(ran.job);
        EXPECT_EQ(calls("RM_DiagEchoTestV2"), before);
    }
}

TEST_F(Polled_Test, EveryFailureOfTheAdapterIsARecordAndNoFailureOfTheRun)
{
    for (const uint32 code : {1u, 2u, 10u, 19u, 20u, 0xFFFFFFFFu}) {
        const std::string number = std::to_string(code);
        port("diagnostics = { post = " + number + ", loopback = " + number + ", pci_loopback = " + number +
             ", echo = " + number + " }");
        target(echo_name);
        for (const char* name : {self_name, internal_name, host_name, echo_name}) {
            map("DiagnosticCompletionRecord").clear();
            const Ran ran = run(name);
            EXPECT_EQ(ran.status, 0u);
            ASSERT_TRUE(ran.job);
            const bool isLoopback = name == internal_name || name == host_name;
            EXPECT_EQ(value(ran.job.get(), "JobState"), isLoopback ? "10" : "7") << name;
            EXPECT_EQ(value(ran.job.get(), "PercentComplete"), isLoopback ? "0" : "100") << name;
            expect_rows(
                first("DiagnosticCompletionRecord"),
                {{"RecordData", std::string(name) + " Resulted with Failure, Result - " +
                                    NVR_DiagTestFunc::MapDiagResultStatus(code) + (name == echo_name ? " " : "")},
                 {"CompletionState", "5"},
                 {"LoopsFailed", "1"}});
        }
    }
}

TEST_F(Polled_Test, ADisabledPortEndsWithoutAJobAndWithoutAFailure)
{
    port("enabled = false");
    for (const char* name : {internal_name, host_name, external_name, self_name, echo_name, ping_name}) {
        const Ran ran = run(name);
        EXPECT_EQ(ran.status, 0u);
        EXPECT_FALSE(ran.job);
        EXPECT_EQ(ran.words.back(),
                  std::string("Source HBA port is disabled. Unable to start ") + name + (name == self_name ? "" : " "));
        EXPECT_THAT(ran.words, SizeIs(2));
        EXPECT_EQ(newest_test(), "none");
    }
}

TEST_F(Polled_Test, AMissingConditionIsNotDisabled)
{
    fault("call = \"RM_GetAttributeValue\", number = 0x306, status = 1");
    EXPECT_TRUE(run(self_name).job);
}

TEST_F(Polled_Test, APortThatCannotBeReadEndsTheTestWithItsStatus)
{
    for (const uint32 status : {1u, 7u, 63u, 64u, 255u}) {
        nvrsim_clear_faults();
        fault("call = \"RM_GetPortAttributes\", status = " + std::to_string(status));
        for (const char* name : {internal_name, host_name, external_name, self_name, echo_name, ping_name}) {
            const Ran ran = run(name);
            EXPECT_EQ(ran.status, status);
            EXPECT_FALSE(ran.job);
            EXPECT_EQ(ran.words.back(),
                      "RM_GetPortAttributes command failed. Exited with error code : " + std::to_string(status));
            EXPECT_THAT(ran.words, SizeIs(2));
        }
    }
}

TEST_F(Polled_Test, AStartThatFailsIsTold)
{
    port("loopback_plug = true");
    target(echo_name);
    const struct {
        const char* name;
        const char* call;
    } rows[] = {{self_name, "RM_DiagRunPOST"},
                {internal_name, "RM_DiagLoopBackTestV3"},
                {external_name, "RM_DiagLoopBackTestV3"},
                {host_name, "RM_DiagPciLoopBackTestV2"},
                {echo_name, "RM_DiagEchoTestV2"}};
    for (const auto& row : rows)
        for (const uint32 status : {1u, 62u, 63u, 64u, 77u}) {
            nvrsim_clear_faults();
            fault(std::string("call = \"") + row.call + "\", status = " + std::to_string(status));
            const Ran ran = run(row.name);
            EXPECT_EQ(ran.status, status);
            EXPECT_FALSE(ran.job);
            EXPECT_EQ(ran.words.back(), std::string(NVR_DiagTestFunc::MapDiagStatus(status)) +
                                            " , Exited with error code : " + std::to_string(status));
            EXPECT_EQ(calls("RM_DiagGetResults"), 0u);
        }
}

TEST_F(Polled_Test, AnAdapterWithoutDiagnosticsRefusesEachStart)
{
    port("loopback_plug = true\ndiagnostics = { available = false }");
    target(echo_name);
    target(ping_name);
    for (const char* name : {self_name, internal_name, external_name, host_name, echo_name, ping_name}) {
        const Ran ran = run(name);
        EXPECT_EQ(ran.status, 63u) << name;
        EXPECT_FALSE(ran.job);
        EXPECT_EQ(ran.words.back(), "Diagnostics not available/Port not supported , Exited with error code : 63");
    }
}

TEST_F(Polled_Test, TheNumberOfATestIsTheLibrarysWord)
{
    // One that it never wrote is 0, and any other is asked for as it came.
    for (const char* damage : {"damage = \"null\"", "value = 4294967295"}) {
        nvrsim_clear_faults();
        fault(std::string("call = \"RM_DiagRunPOST\", ") + damage);
        const Ran ran = run(self_name);
        EXPECT_EQ(ran.status, 4u) << "there is no such test";
        EXPECT_FALSE(ran.job);
        EXPECT_EQ(ran.words.back(), "Unknown , Exited with error code : 4");
    }
}

TEST_F(Polled_Test, AWrongTypeOfLoopbackIsRefusedBeforeAnythingIsAsked)
{
    Diagnostic_Run work = {agent(), {}, setting(internal_name), job_setting(), controller(), {}};
    for (const uint32 type : {0u, 1u, 4u, 7u, 10u, 12u, 0xFFFFFFFFu}) {
        words();
        EXPECT_EQ(NVR_DiagTestFunc::LoopBackTest(work, type), 4u);
        EXPECT_THAT(words(), ElementsAre("NVR_Diagnostics::LoopBackTest", "Error: Wrong Test type passed"));
        EXPECT_FALSE(work.job);
    }
}

// ---------------------------------------------------------------------------------------------- external loopback

TEST_F(Polled_Test, WithoutAPlugThereIsNoExternalLoopback)
{
    const std::string told = "Loopback plug is not detected. Unabled to run test. Install loopback plug and make sure "
                             "HBA Port is Up/Ready.. ";
    const std::string plugged = "loopback_plug = true\n";
    const std::string no_fabric = "fabric_name = \"0000000000000000\"\n";
    const struct {
        std::string keys;
        const char* fault;
        bool runs;
    } rows[] = {
        {"", nullptr, false},                                             // a switch, and a target
        {"port_attributes = { 0x305 = 20 }", nullptr, false},             // a switch
        {no_fabric + "port_attributes = { 0x305 = 20 }", nullptr, false}, // a target
        {plugged + "port_attributes = { 0x305 = 19 }", nullptr, false},
        {plugged + "port_attributes = { 0x305 = 20 }", nullptr, true},
        {plugged + "port_attributes = { 0x305 = 21 }", nullptr, true},
        {plugged + "port_attributes = { 0x305 = 22 }", nullptr, false},
        {plugged + "port_attributes = { 0x305 = false }", nullptr, false},
        {plugged + "port_attributes = { 0x30F = false }", nullptr, false},
        {plugged + "port_attributes = { 0x30F = { hex = \"00000000\" } }", nullptr, false}, // too short
        {plugged + "port_attributes = { 0x30F = { hex = \"0000000000000001\" } }", nullptr, false},
        {plugged, "call = \"RM_GetFcpTargetMapping\", value = 1", false},
        // A port that cannot be asked is given the benefit of the doubt.
        {plugged, "call = \"RM_GetPortAttributes\", from = 2, status = 1", true},
        {plugged, "call = \"RM_GetFcpTargetMapping\", status = 1", true},
        {plugged, "call = \"RM_GetFcpTargetMapping\", status = 7, value = 5", true},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.keys + (row.fault ? row.fault : ""));
        nvrsim_clear_faults();
        port(row.keys);
        if (row.fault) fault(row.fault);
        const Ran ran = run(external_name);
        EXPECT_EQ(ran.status, row.runs ? 0u : 1u);
        EXPECT_EQ(static_cast<bool>(ran.job), row.runs);
        if (row.runs)
            EXPECT_THAT(ran.words, Not(Contains(told)));
        else
            EXPECT_EQ(ran.words.back(), told);
    }
}

TEST_F(Polled_Test, WithoutMemoryForTheTargetsThereIsNoPlug)
{
    port("loopback_plug = true");
    no_more_buffers = true;
    const Ran ran = run(external_name);
    no_more_buffers = false;
    EXPECT_EQ(ran.status, 1u);
    EXPECT_EQ(calls("RM_GetFcpTargetMapping"), 0u);
    EXPECT_EQ(ran.words.back(), "Loopback plug is not detected. Unabled to run test. Install loopback plug and make "
                                "sure HBA Port is Up/Ready.. ");
}

// -------------------------------------------------------------------------------------------------------- polling

TEST_F(Polled_Test, ATestThatNeverEndsIsCancelledAtThe121stPoll)
{
    for (const char* running : {"1", "2"})
        for (const char* status : {"0", "60"}) {
            port(std::string("diagnostics = { polls = 100000, running_state = ") + running +
                 ", running_status = " + status + " }");
            const Ran ran = run(internal_name);
            EXPECT_EQ(ran.status, static_cast<uint32>(std::stoul(status))) << "that of the last poll";
            EXPECT_FALSE(ran.job);
            const std::string end =
                std::string(NVR_DiagTestFunc::MapDiagStatus(ran.status)) + " , Exited with error code : " + status;
            EXPECT_THAT(ran.words, ElementsAreArray(joined({loopback_opening(internal_name),
                                                            repeated(121, {poll}),
                                                            {"Polling for the Cancel status .. ", poll,
                                                             std::string("Canceled the ") + internal_name, end}})));
            EXPECT_EQ(ran.seconds, 122u);
            EXPECT_EQ(calls("RM_DiagCancelDiagnostic"), 1u);
        }
}

TEST_F(Polled_Test, SelfTestTellsTheCounterDownToItsCancel)
{
    port("diagnostics = { polls = 100000 }");
    const Ran ran = run(self_name);
    EXPECT_THAT(ran.words, ElementsAreArray(joined(
                               {{"NVR_DiagTestFunc::SelfTest"},
                                self_polls(121),
                                {"Polling for the Cancel status .. ", poll, std::string("Canceled the ") + self_name,
                                 "Unknown , Exited with error code : 60"}})));
}

TEST_F(Polled_Test, ATestWithoutAStateIsNeverCancelled)
{
    port("diagnostics = { polls = 100000, running_state = 0 }");
    const Ran ran = run(internal_name);
    EXPECT_EQ(ran.status, 60u);
    EXPECT_THAT(ran.words, ElementsAreArray(joined({loopback_opening(internal_name),
                                                    repeated(122, {poll}),
                                                    {"Unknown , Exited with error code : 60"}})));
    EXPECT_EQ(calls("RM_DiagCancelDiagnostic"), 0u);
}

TEST_F(Polled_Test, ACancelThatFailsIsTriedFor122SecondsAndFollowedByOnePoll)
{
    port("diagnostics = { polls = 100000, can_cancel = false }");
    const Ran ran = run(internal_name);
    EXPECT_EQ(ran.status, 60u);
    EXPECT_FALSE(ran.job);
    EXPECT_THAT(ran.words,
                ElementsAreArray(
                    joined({loopback_opening(internal_name),
                            repeated(121, {poll}),
                            repeated(122, {"Polling for the Cancel status .. ",
                                           "Unknown error, Unable to cancel the test, Exited with the error code : 1"}),
                            {poll, "Unknown , Exited with error code : 60"}})));
    EXPECT_EQ(ran.seconds, 121u + 122u + 1u);
}

TEST_F(Polled_Test, ATestThatEndsWhileItCannotBeCancelledLeavesItsResult)
{
    port("diagnostics = { polls = 121, can_cancel = false }");
    const Ran ran = run(internal_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_TRUE(ran.job);
    EXPECT_EQ(calls("RM_DiagCancelDiagnostic"), 122u);
}

TEST_F(Polled_Test, ACancelThatTakesItsTimeIsWaitedFor)
{
    port("diagnostics = { polls = 100000, cancel_polls = 5 }");
    const Ran ran = run(internal_name);
    EXPECT_EQ(ran.status, 60u);
    EXPECT_EQ(calls("RM_DiagCancelDiagnostic"), 6u);
    EXPECT_EQ(ran.words[ran.words.size() - 2], std::string("Canceled the ") + internal_name);
    EXPECT_EQ(ran.seconds, 121u + 6u);
}

TEST_F(Polled_Test, ACancelThatTimesOutGivesItsLastStatus)
{
    // The test goes on all the same, and tells so with status 60: that is no cancel.
    port("diagnostics = { polls = 100000, cancel_polls = 100000 }");
    Ran ran = run(internal_name);
    EXPECT_EQ(ran.status, 60u);
    EXPECT_EQ(calls("RM_DiagCancelDiagnostic"), 122u);
    EXPECT_EQ(calls("RM_DiagGetResults"), 121u + 122u + 1u);
    // With status 0 it counts as one that worked: no poll follows.
    port("diagnostics = { polls = 100000, running_status = 0, cancel_polls = 100000 }");
    ran = run(internal_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_FALSE(ran.job);
    EXPECT_EQ(calls("RM_DiagCancelDiagnostic"), 122u);
    EXPECT_EQ(calls("RM_DiagGetResults"), 121u + 122u);
    EXPECT_THAT(ran.words, Not(Contains(HasSubstr("Canceled the "))));
}

TEST_F(Polled_Test, CancelNeedsATestAndAName)
{
    HBA_WWN name = {};
    ASSERT_EQ(string2HBAName(&name, first_wwpn), 1);
    const uint32 test = 1;
    words();
    EXPECT_EQ(NVR_DiagTestFunc::CancelTest(name, nullptr, "test"), 1u);
    EXPECT_EQ(NVR_DiagTestFunc::CancelTest(name, &test, nullptr), 1u);
    EXPECT_THAT(words(), ElementsAre("Invalid Parameter", "Invalid Parameter"));
    EXPECT_EQ(calls("RM_DiagCancelDiagnostic"), 0u);
    // A test that nobody knows: the status is that of the last cancel.
    EXPECT_EQ(NVR_DiagTestFunc::CancelTest(name, &test, "test"), 4u);
}

TEST_F(Polled_Test, OtherStatusesOfAPollEndTheTest)
{
    for (const uint32 status : {1u, 2u, 62u, 63u, 64u, 255u}) {
        nvrsim_clear_faults();
        fault("call = \"RM_DiagGetResults\", from = 2, status = " + std::to_string(status));
        const Ran ran = run(internal_name);
        EXPECT_EQ(ran.status, status);
        EXPECT_FALSE(ran.job);
        EXPECT_EQ(ran.words.back(), std::string(NVR_DiagTestFunc::MapDiagStatus(status)) +
                                        " , Exited with error code : " + std::to_string(status));
        EXPECT_EQ(ran.seconds, 2u);
    }
    EXPECT_EQ(calls("RM_DiagCancelDiagnostic"), 0u);
}

TEST_F(Polled_Test, StatesThatNobodyKnowsEndTheTestWithoutAFailure)
{
    for (const char* state : {"0", "3", "4", "5", "7", "4294967295"}) {
        port(std::string("diagnostics = { polls = 0, state = ") + state + " }");
        const Ran ran = run(internal_name);
        EXPECT_EQ(ran.status, 0u);
        EXPECT_FALSE(ran.job);
        EXPECT_EQ(ran.words.back(), "Successful , Exited with error code : 0");
        EXPECT_EQ(ran.seconds, 1u);
    }
}

TEST_F(Polled_Test, ARecordThatIsNeverWrittenIsNoResult)
{
    fault("call = \"RM_DiagGetResults\", damage = \"null\", status = 0");
    Ran ran = run(internal_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_FALSE(ran.job);
    nvrsim_clear_faults();
    fault("call = \"RM_DiagGetResults\", damage = \"null\", status = 60");
    ran = run(internal_name);
    EXPECT_EQ(ran.status, 60u);
    EXPECT_EQ(ran.seconds, 122u);
    nvrsim_clear_faults();
    fault("call = \"RM_DiagGetResults\", damage = \"ones\", status = 0");
    ran = run(internal_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_FALSE(ran.job);
}

TEST_F(Polled_Test, TheCountersOfTheAdapterAreTakenAsTheyAre)
{
    port("diagnostics = { cycles = 5, loops_failed = 7, seconds = 4294967295 }");
    run(internal_name);
    for (const char* record : {"DiagnosticServiceRecord", "DiagnosticCompletionRecord"})
        expect_rows(first(record), {{"LoopsFailed", "7"},
                                    {"LoopsPassed", "4294967294"},
                                    {"CompletedCycles", "5"},
                                    {"TimeToExecute", "4294967295"}});
}

TEST_F(Polled_Test, ALongResultIsCutToItsBuffer)
{
    const std::string name(1000, 'n');
    const Ref<NVRHBA_FCHBADiagnosticSettingData> longer(clone_as(&setting(internal_name)));
    longer->InstanceID.set(name.c_str());
    Diagnostic_Run work = {agent(), {}, *longer, job_setting(), controller(), {}};
    ASSERT_EQ(string2HBAName(&work.port, first_wwpn), 1);
    EXPECT_EQ(NVR_DiagTestFunc::LoopBackTest(work, LOOPBACK_INTERNAL), 0u);
    EXPECT_EQ(value(first("DiagnosticCompletionRecord"), "RecordData"), name.substr(0, 511));
    EXPECT_EQ(value(first("DiagnosticCompletionRecord"), "ServiceName"), name);
}

TEST_F(Polled_Test, AJobThatIsToGoIsNotHandedOut)
{
    job_setting().DeleteOnCompletion.set(true);
    const Ran ran = run(internal_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_FALSE(ran.job);
    EXPECT_EQ(ran.words.back(), "NVRHBA_DiagTestFunc::DeleteConcreteJob()");
    EXPECT_EQ(map("ConcreteJob").size(), 0u);
    EXPECT_EQ(map("OwningJobElement").size(), 0u);
    EXPECT_EQ(map("AffectedJobElement").size(), 0u);
    EXPECT_EQ(map("DiagnosticServiceRecord").size(), 1u);
    EXPECT_EQ(map("DiagnosticCompletionRecord").size(), 1u);
}

// --------------------------------------------------------------------------------------------- status and reset

TEST_F(Direct_Test, StatusTestReadsThePortOnce)
{
    const Ran ran = run(status_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_THAT(ran.words,
                ElementsAreArray(joined({{"NVR_DiagTestFunc::StatusTest", "Entering NVR_MethodWrapper::Validatewwpn()",
                                          "RM_IsLocalHBA: status=0", "RM_GetPortAttributes call result : 0"},
                                         records_left(),
                                         {std::string(status_name) + " Succesful"}})));
    ASSERT_TRUE(ran.job);
    EXPECT_THAT(value(ran.job.get(), "InstanceID"), HasSubstr(":65535"));
    EXPECT_EQ(value(ran.job.get(), "JobState"), "7");
    expect_rows(first("DiagnosticCompletionRecord"),
                {{"RecordData", std::string(status_name) + " Resulted with Success"},
                 {"CompletionState", "2"},
                 {"LoopsFailed", "null"},
                 {"LoopsPassed", "null"},
                 {"CompletedCycles", "null"},
                 {"TimeToExecute", "null"}});
    EXPECT_EQ(ran.seconds, 0u);
}

TEST_F(Direct_Test, StatusTestNeedsABuffer)
{
    no_more_buffers = true;
    const Ran ran = run(status_name);
    no_more_buffers = false;
    EXPECT_EQ(ran.status, 8u);
    EXPECT_FALSE(ran.job);
    EXPECT_EQ(ran.words.back(), "ERROR: GetPHYPortAttributeValues: Unable to allocate buffer");
    // The others have theirs already.
    no_more_buffers = true;
    for (const char* name : {self_name, internal_name, host_name, reset_name, beacon_name})
        EXPECT_TRUE(run(name).job) << name;
    no_more_buffers = false;
}

TEST_F(Direct_Test, ResetTestResetsTheAdapter)
{
    const Ran ran = run(reset_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_THAT(ran.words, ElementsAreArray(
                               joined({{"NVR_DiagTestFunc::FCHBAResetTest",
                                        "Entering NVR_MethodWrapper::Validatewwpn()", "RM_IsLocalHBA: status=0",
                                        "NVR_MethodWrapper::nvrcimReset", "Entering NVR_MethodWrapper::Validatewwpn()",
                                        "RM_IsLocalHBA: status=0", "WWN 10:00:00:00:C9:A0:00:01 is reset"},
                                       records_left(),
                                       {std::string(reset_name) + " Succesful"}})));
    ASSERT_TRUE(ran.job);
    expect_rows(first("DiagnosticCompletionRecord"),
                {{"RecordData", std::string(reset_name) + " Success"}, {"CompletionState", "2"}});
    char resets[8] = {};
    nvrsim_get("0", "resets", resets, sizeof resets);
    EXPECT_STREQ(resets, "1");
    EXPECT_FALSE(agent().m_bAdapterRefreshPending) << "a rebuild would take the job away";
}

TEST_F(Direct_Test, APortThatIsNotLocalIsRefused)
{
    nvrsim_set("0", "local", 0);
    for (const char* name : {status_name, reset_name, beacon_name}) {
        const Ran ran = run(name);
        EXPECT_EQ(ran.status, name == beacon_name ? 1u : 5u);
        EXPECT_EQ(ran.words.back(), "INVALID wwpn/Mac Address");
        EXPECT_FALSE(ran.job);
    }
}

TEST_F(Direct_Test, ABusyAdapterIsTried122TimesWithoutAPause)
{
    const struct {
        const char* name;
        const char* call;
    } rows[] = {{status_name, "RM_GetPortAttributes"}, {reset_name, "RM_ResetHBA"}};
    for (const auto& row : rows) {
        nvrsim_clear_faults();
        const uint64 before = nvrsim_calls(row.call);
        fault(std::string("call = \"") + row.call + "\", status = 64");
        const Ran ran = run(row.name);
        EXPECT_EQ(ran.status, 64u);
        EXPECT_FALSE(ran.job);
        EXPECT_EQ(nvrsim_calls(row.call), before + 122);
        EXPECT_EQ(ran.seconds, 0u);
        EXPECT_EQ(ran.words.back(),
                  "Adapter Busy: Another critical application may be running , Exited with error code : 64");
        // And one that is busy for a while.
        nvrsim_clear_faults();
        fault(std::string("call = \"") + row.call + "\", status = 64, times = 121");
        EXPECT_TRUE(run(row.name).job);
    }
}

TEST_F(Direct_Test, RefusalsAreRecordedAtTheFirstAttemptAlone)
{
    const struct {
        const char* name;
        const char* call;
    } rows[] = {{status_name, "RM_GetPortAttributes"}, {reset_name, "RM_ResetHBA"}};
    for (const auto& row : rows)
        for (const uint32 status : {1u, 2u, 5u, 63u, 77u, 190u, 255u}) {
            nvrsim_clear_faults();
            map("DiagnosticCompletionRecord").clear();
            fault(std::string("call = \"") + row.call + "\", status = " + std::to_string(status));
            Ran ran = run(row.name);
            EXPECT_EQ(ran.status, status);
            const bool is_recorded = status != 2 && status != 63 && status != 190;
            ASSERT_EQ(static_cast<bool>(ran.job), is_recorded) << status;
            const std::string end = std::string(NVR_DiagTestFunc::MapDiagStatus(status)) +
                                    " , Exited with error code : " + std::to_string(status);
            if (is_recorded) {
                EXPECT_EQ(value(ran.job.get(), "JobState"), "10");
                expect_rows(first("DiagnosticCompletionRecord"),
                            {{"RecordData", std::string(row.name) + " Resulted with Failure, Exited with error code " +
                                                std::to_string(status)},
                             {"CompletionState", "5"}});
                EXPECT_EQ(ran.words.back(), std::string(row.name) + " Succesful");
            } else {
                EXPECT_EQ(ran.words.back(), end);
            }
            // Later it is the end without a record.
            nvrsim_clear_faults();
            fault(std::string("call = \"") + row.call + "\", status = 64, times = 1");
            fault(std::string("call = \"") + row.call + "\", from = 2, status = " + std::to_string(status));
            ran = run(row.name);
            EXPECT_EQ(ran.status, status);
            EXPECT_FALSE(ran.job);
            EXPECT_EQ(ran.words.back(), end);
        }
}

// ------------------------------------------------------------------------------------------------------- beacon

TEST_F(Beacon, BlinksTwentyTimesAndPutsItBack)
{
    for (const char* before : {"off", "on"}) {
        port(std::string("beacon = \"") + before + "\"");
        const Ran ran = run(beacon_name);
        EXPECT_EQ(ran.status, 0u);
        EXPECT_EQ(ran.seconds, 40u);
        EXPECT_EQ(nvrsim_calls("RM_DiagBeacon"), 41u);
        const std::string name = beacon_name;
        EXPECT_THAT(ran.words,
                    ElementsAreArray(joined({{"NVR_DiagTestFunc::BeaconTest",
                                              "Entering NVR_MethodWrapper::Validatewwpn()", "RM_IsLocalHBA: status=0"},
                                             repeated(40, {name + " Resulted with Success"}),
                                             records_left(),
                                             {name + " Succesful"}})));
        ASSERT_TRUE(ran.job);
        EXPECT_EQ(value(ran.job.get(), "JobState"), "7");
        expect_rows(first("DiagnosticCompletionRecord"),
                    {{"RecordData", name + " Resulted with Success"}, {"CompletionState", "2"}});
        char beacon[8] = {};
        nvrsim_get("0", "beacon", beacon, sizeof beacon);
        EXPECT_STREQ(beacon, std::string(before) == "on" ? "3" : "2");
    }
}

TEST_F(Beacon, OneThatIsNotAvailableIsNoFailureAndNoJob)
{
    nvrsim_set("0", "beacon", 1);
    const Ran ran = run(beacon_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_FALSE(ran.job);
    EXPECT_THAT(ran.words, ElementsAre("NVR_DiagTestFunc::BeaconTest", "Entering NVR_MethodWrapper::Validatewwpn()",
                                       "RM_IsLocalHBA: status=0", "Beacon state Not Available. Beaconing not set",
                                       std::string(beacon_name) + " Resulted with Failure, Exited with error code 0",
                                       "Successful , Exited with error code : 0"));
    EXPECT_EQ(nvrsim_calls("RM_DiagBeacon"), 0u);
}

TEST_F(Beacon, OneThatCannotBeReadLeavesAJobBesideItsStatus)
{
    fault("call = \"RM_DiagBeaconState\", status = 63");
    const Ran ran = run(beacon_name);
    EXPECT_EQ(ran.status, 63u);
    ASSERT_TRUE(ran.job);
    EXPECT_EQ(value(ran.job.get(), "JobState"), "10");
    expect_rows(first("DiagnosticCompletionRecord"), {{"RecordData", ""}, {"CompletionState", "5"}});
    EXPECT_THAT(ran.words,
                ElementsAreArray(joined({{"NVR_DiagTestFunc::BeaconTest", "Entering NVR_MethodWrapper::Validatewwpn()",
                                          "RM_IsLocalHBA: status=0"},
                                         records_left()})));
}

TEST_F(Beacon, ABlinkThatFailsEndsTheTestWithItsStatus)
{
    const std::string name = beacon_name;
    for (const int failing : {1, 2, 40}) {
        nvrsim_clear_faults();
        fault("call = \"RM_DiagBeacon\", from = " + std::to_string(failing) + ", times = 1, status = 64");
        const Ran ran = run(beacon_name);
        EXPECT_EQ(ran.status, 64u);
        EXPECT_FALSE(ran.job);
        EXPECT_EQ(ran.seconds, static_cast<uint64>(failing - 1));
        EXPECT_THAT(
            ran.words,
            ElementsAreArray(
                joined({{"NVR_DiagTestFunc::BeaconTest", "Entering NVR_MethodWrapper::Validatewwpn()",
                         "RM_IsLocalHBA: status=0"},
                        repeated(failing - 1, {name + " Resulted with Success"}),
                        {name + " Resulted with Failure, Exited with error code 64",
                         "Adapter Busy: Another critical application may be running , Exited with error code : 64"}})));
    }
}

TEST_F(Beacon, ARestoreThatFailsOnlyLogs)
{
    fault("call = \"RM_DiagBeacon\", from = 41, status = 1");
    Ran ran = run(beacon_name);
    EXPECT_EQ(ran.status, 0u);
    EXPECT_TRUE(ran.job);
    EXPECT_THAT(ran.words, Contains("Unable to set the previous beacon state"));
    nvrsim_clear_faults();
    fault("call = \"RM_DiagBeacon\", status = 63, times = 1");
    fault("call = \"RM_DiagBeacon\", from = 2, status = 1");
    ran = run(beacon_name);
    EXPECT_EQ(ran.status, 63u) << "that of the blink, not of the restore";
    EXPECT_EQ(ran.words.back(), "Diagnostics not available/Port not supported , Exited with error code : 63");
}

TEST_F(Beacon, IsOfferedWhereItCanBeReadAndIsAvailable)
{
    const std::string status = std::string("Beacon Status for port ") + first_wwpn + " returned value is : ";
    const Words asked = {"NVR_Diagnostics::ISDiagTestSupported",
                         "Entering NVR_MethodWrapper::Id2HBAName",
                         std::string("DeviceID is:: ") + first_wwpn,
                         "HBA Name is:: 10:00:00:00:C9:A0:00:01",
                         "Entering NVR_MethodWrapper::str2HBAName",
                         "wwpn:( 10:00:00:00:C9:A0:00:01 ) ",
                         "After tokenizing wwpn:( 10  0  0  0 c9 a0  0  1 )"};
    words();
    EXPECT_EQ(NVR_DiagTestFunc::ISDiagTestSupported(first_wwpn, 0), 0u);
    EXPECT_THAT(words(), ElementsAreArray(joined({asked, {status + "0"}})));
    EXPECT_EQ(NVR_DiagTestFunc::ISDiagTestSupported(first_wwpn, 1), 32768u);
    EXPECT_THAT(words(), ElementsAreArray(asked)) << "another mode is no question about the beacon";
    EXPECT_EQ(NVR_DiagTestFunc::ISDiagTestSupported("none", 0), 32768u);
    EXPECT_EQ(words().back(), "NVR_Diagnostics::str2HBAName failed");
    EXPECT_EQ(NVR_DiagTestFunc::ISDiagTestSupported(nullptr, 0), 32768u);
    EXPECT_EQ(words().back(), "NVR_Diagnostics::Id2HBAName failed");
    nvrsim_set("0", "beacon", 1);
    EXPECT_EQ(NVR_DiagTestFunc::ISDiagTestSupported(first_wwpn, 0), 32768u);
    EXPECT_THAT(words(), ElementsAreArray(joined(
                             {asked, {status + "0", std::string("Beacon not avaialble for port : ") + first_wwpn}})));
    nvrsim_set("0", "beacon", 77);
    EXPECT_EQ(NVR_DiagTestFunc::ISDiagTestSupported(first_wwpn, 0), 0u);
    words();
    fault("call = \"RM_DiagBeaconState\", status = 2");
    EXPECT_EQ(NVR_DiagTestFunc::ISDiagTestSupported(first_wwpn, 0), 32768u);
    EXPECT_THAT(words(), ElementsAreArray(joined({asked, {status + "2"}})));
}
