// Calls of the libraries that fail, lie or hand out rubbish: the module answers, says what happened, and the next
// refresh leaves the instances of a sound host.
#include <chrono>
#include <set>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Rig.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/Cases.h"
#include "tests/support/simulator.h"
#include "tests/support/trace.h"

using namespace nvrtest;
using testing::Contains;
using testing::IsEmpty;

namespace {

// Four ports on four adapters.
constexpr char sound_host[] = "typical";

// Small enough to be read again and again.
constexpr char small_host[] = R"(
[[adapter]]
[[adapter]]
[[adapter.port]]
[[adapter.port.vport]]
[[target]]
luns = 2
)";

// All that clients read. Counters and states change by asking, so that the clock moves on first.
std::string whole_host(Rig& rig)
{
    std::string text;
    advance_clock(std::chrono::seconds(11));
    for (const std::string& name : rig.classes()) {
        if (name == "NVRHBA_AlertIndication") continue;
        const host::Answer answer = rig.enumerate(name);
        EXPECT_THAT(answer, succeeded()) << name;
        text += to_lines(name, answer.instances);
    }
    return text;
}

// What a call can do wrong, beside what all tests let it do.
const char* const more_faults[] = {
    "status = 2",
    "status = 63",
    "status = 97",
    "status = 255",
    "status = -1",
    "damage = \"zeros\"",
    "damage = \"truncated\", keep = 0",
    "damage = \"truncated\", keep = 3",
    "damage = \"truncated\", keep = 40",
    "value = 1",
    "damage = \"garbage\", status = 7",
    "value = 4294967295, status = 191",
    "absent = true",
    // The second call and the others after it: an adapter that changes between two looks at it.
    "from = 2, status = 1",
    "from = 2, damage = \"garbage\"",
    "times = 1, status = 8",
    "from = 2, throws = true",
};

const char* const faulty_calls[] = {
    "HBA_GetNumberOfAdapters",
    "HBA_GetAdapterName",
    "HBA_OpenAdapter",
    "HBA_GetAdapterAttributes",
    "HBA_GetAdapterPortAttributes",
    "HBA_GetFcpTargetMapping",
    "HBA_SendScsiInquiry",
    "HBA_SendReadCapacity",
    "RM_GetHBAAttributes",
    "RM_GetPortAttributes",
    "RM_GetAttributeValue",
    "RM_GetDriverType",
    "RM_GetPortStatistics",
    "RM_DiagReadPCIRegistersV2",
    "RM_GetVPD",
    "RM_GetNextVpdEntry",
    "RM_DiagBeaconState",
    "RM_GetDriverParams",
    "RM_GetDriverParamsGlobal",
    "RM_GetSffData",
    "RM_DiagGetLoadListParams",
    "RM_IsLocalHBA",
    "RM_VPList",
    "RM_VPGetAttributes",
    "RM_GetDumpDirectoryA",
    "RM_GetDumpRetentionCount",
};

// `sample`: under a sanitizer each call gets some of the faults, others than the call before it, since there each of
// these some 1,200 readings of a whole host takes a second.
std::vector<std::string> faults_of_one_call(std::size_t sample)
{
    std::vector<std::string> faults;
    for (const Library_Failure& failure : library_failures())
        faults.push_back(failure.fault);
    faults.insert(faults.end(), std::begin(more_faults), std::end(more_faults));
    const std::size_t each = each_of_cases(6, 15);
    std::vector<std::string> some;
    for (std::size_t i = sample % each; i < faults.size(); i += each)
        some.push_back(faults[i]);
    return some;
}

} // namespace

// --- Every call in turn
// --------------------------------------------------------------------------------------------------

class Faulty_Call : public testing::TestWithParam<std::size_t> {}; // an index of faulty_calls

TEST_P(Faulty_Call, IsOutlivedWhateverItDoes)
{
    const std::string call = faulty_calls[GetParam()];
    // A handle that the library itself gives a wrong name cannot be given back.
    const bool may_lose_handles = call == "HBA_OpenAdapter";
    Rig rig({host::Manner::strict(), small_host, refreshing_settings});
    const std::string sound = whole_host(rig);
    std::uint64_t hits = 0;
    for (const std::string& fault : faults_of_one_call(GetParam())) {
        SCOPED_TRACE("call = \"" + call + "\", " + fault);
        add_fault("call = \"" + call + "\", " + fault);
        rig.refresh();
        (void)whole_host(rig);
        hits += fault_hits();
        clear_faults();
        rig.refresh();
        ASSERT_EQ(difference(sound, whole_host(rig)), "");
        EXPECT_TRUE(may_lose_handles || nvrsim_open_handles() == 0);
    }
    EXPECT_GT(hits, 0u) << "no fault was met: the module does not make this call";
    rig.stop();
    EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
}

INSTANTIATE_TEST_SUITE_P(Of, Faulty_Call, testing::Range(std::size_t(0), std::size(faulty_calls)),
                         [](const auto& info) { return std::string(faulty_calls[info.param]); });

TEST(FaultyCalls, AreAllThatReadingAHostMakes)
{
    // What opens and ends a session can fail too, but not in a refresh; a close has no answer.
    std::set<std::string> known = {"RM_InitLib", "CPQFC_LoadLibrary", "HBA_LoadLibrary", "HBA_CloseAdapter"};
    known.insert(std::begin(faulty_calls), std::end(faulty_calls));
    Rig rig({host::Manner::strict(), small_host});
    (void)whole_host(rig);
    for (const std::string& name : called_operations())
        EXPECT_TRUE(known.count(name)) << name;
}

TEST(FaultyCalls, AllOfThemAtOnceAreOutlived)
{
    Rig rig({host::Manner::strict(), small_host, refreshing_settings});
    const std::string sound = whole_host(rig);
    for (const char* fault : {"status = 1", "damage = \"garbage\"", "damage = \"ones\"", "damage = \"null\""}) {
        for (const char* family : {"HBA_*", "RM_*"})
            add_fault("call = \"" + std::string(family) + "\", " + fault);
        rig.refresh();
        (void)whole_host(rig);
        clear_faults();
        rig.refresh();
        ASSERT_EQ(difference(sound, whole_host(rig)), "") << fault;
    }
}

// --- What each failure leaves and says
// -----------------------------------------------------------------------------------

namespace {

struct Failure {
    const char* label;
    const char* fault;
    std::size_t packages; // instances left, of four
    std::size_t ports;
    std::vector<std::string> words; // in order

    friend void PrintTo(const Failure& failure, std::ostream* os) { *os << failure.fault; }
};

const Failure failures[] = {
    {"NoAdapterAtAll",
     R"(call = "HBA_GetNumberOfAdapters", value = 0)",
     0,
     0,
     {"Number of Adapters detected = 0", "HBAAPI reports that there are NO HBAs in the system.",
      "FC Adapter Not present !!!!, throw error !!!", "No FC card found"}},
    {"AnAdapterWithoutAName",
     R"(call = "HBA_GetAdapterName", port = 1, status = 1)",
     3,
     3,
     {"Error hbaStatus=1, Skipping Adapter# 1"}},
    {"AnAdapterThatDoesNotOpen",
     R"(call = "HBA_OpenAdapter", port = 2, damage = "null")",
     3,
     3,
     {"HBA_OpenAdapter failed, skipping Adapter Norvane-FC2162-2",
      "Catch ALL error during creating adapter..., Skipping Adapter# 2"}},
    {"AttributesThatAreStaleOnce", R"(call = "HBA_GetAdapterAttributes", port = 0, status = 8, times = 1)", 4, 4, {}},
    {"AttributesThatStayStale",
     R"(call = "HBA_GetAdapterAttributes", port = 0, status = 8)",
     4,
     3,
     {"Error hbaStatus=8, skipping Adapter Norvane-FC2162-0"}},
    {"PortAttributesThatAreStaleOnce",
     R"(call = "HBA_GetAdapterPortAttributes", port = 0, status = 8, times = 1)",
     4,
     4,
     {}},
    {"PortAttributesThatFail",
     R"(call = "HBA_GetAdapterPortAttributes", port = 3, status = 5)",
     3,
     3,
     {"(portIndex=0) failed with hbaStatus 5", "Catch ALL error during creating adapter..., Skipping Adapter# 3"}},
    {"PortAttributesThatFailTheSecondTime",
     R"(call = "HBA_GetAdapterPortAttributes", port = 3, status = 5, from = 2)",
     4,
     3,
     {"(portIndex=0) failed with hbaStatus 5",
      "Failed to fetch information for port: [0] on adapter: [Norvane-FC2162-3]"}},
    {"AdapterBlockThatFails",
     R"(call = "RM_GetHBAAttributes", port = 0, status = 191)",
     3,
     3,
     {"ERROR: RM_GetHBAAttributes call failed (191)",
      "Catch ALL error during creating adapter..., Skipping Adapter# 0"}},
    {"PortBlockThatFails",
     R"(call = "RM_GetPortAttributes", port = 1, status = 9)",
     4,
     3,
     {"RM_GetPortAttributes call failed (9)\n",
      "Failed to fetch information for port: [0] on adapter: [Norvane-FC2162-1]"}},
    {"DriverTypeThatFails",
     R"(call = "RM_GetDriverType", port = 1, status = 7)",
     4,
     4,
     {"ERROR: RM_GetDriverType call failed (7)"}},
    {"ANumberThatIsMissing",
     R"(call = "RM_GetAttributeValue", number = 526, status = 5)",
     4,
     4,
     {"ERROR: RM_GetHBAAttributeValue HA__DeviceID call failed (5)"}},
    {"PCIRegistersThatFail",
     R"(call = "RM_DiagReadPCIRegistersV2", status = 63)",
     4,
     4,
     {"RM_DiagReadPCIRegistersV2 status = 63 ", "RM_DiagReadPCIRegistersV2 call failed", "Creating NVRHBA_PCIDevice"}},
    {"ProductDataThatFails",
     R"(call = "RM_GetVPD", status = 8)",
     4,
     4,
     {"ERROR: RM_GetVPD call failed, Returned with error code : 8"}},
    {"BeaconThatIsNotSupported",
     R"(call = "RM_DiagBeaconState", status = 2)",
     4,
     4,
     {"Beaconing not supported on host or adapter"}},
    {"BeaconWithoutDiagnostics", R"(call = "RM_DiagBeaconState", status = 63)", 4, 4, {"Diagnostics not available"}},
    {"BeaconThatFails", R"(call = "RM_DiagBeaconState", status = 1)", 4, 4, {"Unable to get the beacon state"}},
    {"MappingThatFails",
     R"(call = "HBA_GetFcpTargetMapping", status = 1)",
     4,
     4,
     {"FCPort::rescanTargets", "Error hbaStatus=1"}},
    {"MappingThatIsNeverLargeEnough",
     R"(call = "HBA_GetFcpTargetMapping", status = 7, value = 300)",
     4,
     4,
     {"Increasing the buffer to = 300", "Increasing the buffer to = 300", "Increasing the buffer to = 300",
      "Successful target info fetched"}},
    {"MappingThatIsAlwaysStale",
     R"(call = "HBA_GetFcpTargetMapping", status = 8)",
     4,
     4,
     {"Refresh and retry ... ", "Refresh and retry ... ", "Refresh and retry ... ", "Successful target info fetched"}},
    {"InquiriesThatFail",
     R"(call = "HBA_SendScsiInquiry", status = 9)",
     4,
     4,
     {"SCSI Inquiry with 0, 0", "HBA_SendScsiInquiry_t(0x80) returns 9."}},
    {"CapacitiesThatFail",
     R"(call = "HBA_SendReadCapacity", status = 1)",
     4,
     4,
     {"Send Read Capacity", "HBA_SendScsiInquiry_t(0x80) returns 1."}},
};

} // namespace

class Failing_Call : public testing::TestWithParam<Failure> {};

TEST_P(Failing_Call, LeavesWhatItMustAndSaysWhatHappened)
{
    const Failure& failure = GetParam();
    Rig rig({host::Manner::strict(), sound_host, refreshing_settings});
    add_fault(failure.fault);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), failure.ports);
    EXPECT_EQ(rig.enumerate("NVRHBA_PhysicalPackage").instances.size(), failure.packages);
    rig.wait_for_refreshes(1);
    EXPECT_THAT(rig.words(), contains_in_order(failure.words));
    EXPECT_GT(fault_hits(), 0u);
    clear_faults();
    rig.refresh();
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
}

INSTANTIATE_TEST_SUITE_P(Says, Failing_Call, testing::ValuesIn(failures),
                         [](const auto& info) { return std::string(info.param.label); });

TEST(FailingCalls, StaleAdaptersAreRefreshedOnceBeforeTheRetry)
{
    Rig rig({host::Manner::strict(), "small"});
    add_fault("call = \"HBA_GetAdapterAttributes\", status = 8, times = 1");
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
    EXPECT_EQ(calls("HBA_RefreshInformation"), 1u);
    EXPECT_EQ(calls("HBA_GetAdapterAttributes"), 2u);
}

TEST(FailingCalls, AnInquiryIsTriedThreeTimesAndNoMore)
{
    Rig rig({host::Manner::strict(), "[[adapter]]\n[[target]]\nluns = 1\n"});
    add_fault("call = \"HBA_SendScsiInquiry\", status = 9");
    add_fault("call = \"HBA_SendReadCapacity\", status = 9");
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    rig.wait_for_refreshes(1);
    EXPECT_EQ(calls("HBA_SendScsiInquiry"), 9u);
    EXPECT_EQ(calls("HBA_SendReadCapacity"), 3u);
}

TEST(FailingCalls, ABeaconStateDecidesWhatThePortShows)
{
    const struct {
        const char* fault;
        const char* shown;
    } rows[] = {
        {"status = 2", "4"}, {"status = 63", "4"}, {"status = 1", "0"}, {"value = 2", "3"}, {"value = 3", "2"},
    };
    for (const auto& row : rows) {
        Rig rig({host::Manner::strict(), "small"});
        add_fault(std::string("call = \"RM_DiagBeaconState\", ") + row.fault);
        const host::Answer ports = rig.enumerate("NVRHBA_FCPort");
        ASSERT_EQ(ports.instances.size(), 1u);
        EXPECT_EQ(ports.instances[0].get("LocationIndicator").to_text(), row.shown) << row.fault;
    }
}

TEST(FailingCalls, TextsOfTheLibraryEndWithTheirField)
{
    Rig rig({host::Manner::strict(), "small"});
    add_fault("call = \"HBA_GetAdapterAttributes\", damage = \"unterminated\"");
    add_fault("call = \"HBA_GetAdapterPortAttributes\", damage = \"unterminated\"");
    const host::Answer packages = rig.enumerate("NVRHBA_PhysicalPackage");
    ASSERT_EQ(packages.instances.size(), 1u);
    EXPECT_EQ(packages.instances[0].get("Manufacturer").as_text().size(), 64u);
    EXPECT_EQ(packages.instances[0].get("SerialNumber").as_text().size(), 64u);
    EXPECT_EQ(packages.instances[0].get("Model").as_text().size(), 256u);
    EXPECT_EQ(packages.instances[0].get("Description").as_text().size(), 256u);
}

TEST(FailingCalls, AHugeCountOfAdaptersIsWalkedToItsEndAndNoFurther)
{
    Rig rig({host::Manner::strict(), "small"});
    add_fault("call = \"HBA_GetNumberOfAdapters\", value = 4294967295");
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
    EXPECT_LE(calls("HBA_GetAdapterName"), 4096u);
}

TEST(FailingCalls, AHugeCountOfPortsIsWalkedToItsEndAndNoFurther)
{
    Rig rig({host::Manner::strict(), "[[adapter]]\nnumber_of_ports = 4294967295\n"});
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u);
    EXPECT_LE(calls("HBA_GetAdapterPortAttributes"), 4096u + 2u);
}

TEST(FailingCalls, ASlowLibraryStopsNobodyFromAskingForProfiles)
{
    Rig rig;
    add_fault("call = \"HBA_OpenAdapter\", delay_ms = 40");
    std::thread slow([&] { EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u); });
    while (calls("HBA_OpenAdapter") == 0)
        std::this_thread::yield();
    EXPECT_EQ(rig.enumerate("NVRHBA_RegisteredProfile").instances.size(), 13u);
    EXPECT_EQ(rig.refreshes(), 0u);
    slow.join();
}

// The module is loaded, asked and unloaded by such a library, and afterwards by a sound one.
TEST(FailingCalls, ALibraryThatThrowsAtItsStartOrEndIsOutlived)
{
    Rig rig({host::Manner::strict(), "small"});
    for (const char* call : {"RM_InitLib", "HBA_LoadLibrary", "HBA_FreeLibrary", "CPQFC_*", "*"}) {
        add_fault("call = \"" + std::string(call) + "\", throws = true");
        rig.enumerate("NVRHBA_FCPort"); // answered, with what or why not
        rig.restart();
        clear_faults();
        EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 1u) << call;
        rig.restart();
    }
    EXPECT_EQ(nvrsim_open_handles(), 0u);
}
