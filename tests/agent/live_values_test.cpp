#include "classes/NVRHBA_DriverParamGlobal.h"
#include "classes/NVRHBA_DriverParams.h"
#include "foundation/NVR_Common.h"
#include "foundation/management_binding.h"
#include "simulator/nvrsim.h"
#include "tests/agent/Simulated_Host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::Not;
using testing::SizeIs;

namespace {

class LiveValues : public SimulatedHost {
protected:
    LiveValues()
    {
        scenario("[[adapter]]\nports = 2\n");
        EXPECT_EQ(load(), 0);
        plain(agent().m_NVRHBA_FCPort_map);
        words();
    }
    ~LiveValues() override { unload(); }

    Instances statistics()
    {
        Instances all;
        enumerateActive<&ProviderAgent::GetFCPortStats>(agent(), agent().m_NVRHBA_FCPortStatistics_map,
                                                        {collect, &all});
        return all;
    }
    Instances ports()
    {
        Instances all;
        enumerateActive<&ProviderAgent::UpdateFCPortStatus>(agent(), agent().m_NVRHBA_FCPort_map, {collect, &all});
        return all;
    }
    /// The current value of the first parameter that a refresh shows with this InstanceID.
    template <void (ProviderAgent::*refresh)()>
    std::string current(const Instance_Map& map, const char* id)
    {
        Instances all;
        enumerateActive<refresh>(agent(), map, {collect, &all});
        for (const auto& instance : all)
            if (value(instance.get(), "InstanceID") == id) return value(instance.get(), "current");
        return "missing";
    }
    std::string local()
    {
        return current<&ProviderAgent::UpdateDriverParams>(agent().m_NVRHBA_DriverParams_map,
                                                           "10000000C9A00001:lun-queue-depth");
    }
    std::string global()
    {
        return current<&ProviderAgent::UpdateDriverParamGlobal>(agent().m_NVRHBA_DriverParamGlobal_map,
                                                                "lun-queue-depth");
    }
    static void change(const char* assignment, uint32 code)
    {
        HBA_WWN port = {};
        ASSERT_EQ(string2HBAName(&port, first_wwpn), 1);
        ASSERT_EQ(RM_SetDriverParam(port, assignment, code), 0u);
    }
};

} // namespace

TEST_F(LiveValues, CountersAreReadAtEachEnumeration)
{
    nvrsim_set("0", "statistic:1036", 7);
    EXPECT_EQ(value(statistics()[0].get(), "LIPCount"), "7");
    nvrsim_set("0", "statistic:1036", 8);
    const Instances all = statistics();
    ASSERT_THAT(all, SizeIs(2));
    const struct {
        const char* property;
        const char* value;
    } rows[] = {{"LIPCount", "8"},
                {"PacketsTransmitted", "5000"},
                {"PacketsReceived", "6000"},
                {"BytesTransmitted", "28000"},
                {"BytesReceived", "32000"},
                {"NOSCount", "1"},
                {"ErrorFrames", "2"},
                {"DumpedFrames", "3"},
                {"LinkFailures", "4"},
                {"LossOfSyncCounter", "5"},
                {"LossOfSignalCounter", "6"},
                {"PrimitiveSeqProtocolErrCount", "7"},
                {"InvalidTransmissionWords", "8"},
                {"CRCErrors", "9"},
                {"TxSequences", "3000"},
                {"RxSequences", "4000"},
                {"ExCountOrig", "1000"},
                {"ExCountResp", "2000"},
                {"ActiveXRIs", "23000"},
                {"ActiveRPIs", "22000"},
                {"ElasticBufOverruns", "33000"},
                {"LinkTransitions", "21000"},
                {"PrimitiveSeqTimesouts", "32000"},
                {"ArbitrationTimeouts", "34000"},
                {"FramesTooShort", "null"}};
    for (const auto& row : rows)
        EXPECT_EQ(value(all[0].get(), row.property), row.value) << row.property;
    EXPECT_NE(value(all[0].get(), "StatisticTime"), "null");
}

TEST_F(LiveValues, ACounterThatIsNotReportedLeavesTwoOfThemAsTheyWere)
{
    nvrsim_set("0", "statistic:1037", 0xFFFFFFFF);
    nvrsim_set("0", "statistic:1039", 0xFFFFFFFF);
    const Instances all = statistics();
    EXPECT_EQ(value(all[0].get(), "NOSCount"), "null");
    EXPECT_EQ(value(all[0].get(), "DumpedFrames"), "null");
    nvrsim_set("0", "statistic:1037", 12);
    EXPECT_EQ(value(statistics()[0].get(), "NOSCount"), "12");
    nvrsim_set("0", "statistic:1037", 0xFFFFFFFF);
    EXPECT_EQ(value(statistics()[0].get(), "NOSCount"), "12");
}

TEST_F(LiveValues, AFailingPortKeepsItsCountersAndTheOthersGoOn)
{
    statistics();
    fault("call = \"RM_GetPortStatistics\", port = 0, status = 1");
    nvrsim_set("0", "statistic:1036", 70);
    nvrsim_set("1", "statistic:1036", 71);
    words();
    const Instances all = statistics();
    EXPECT_EQ(value(all[0].get(), "LIPCount"), "0");
    EXPECT_EQ(value(all[1].get(), "LIPCount"), "71");
    EXPECT_THAT(words(), contains_in_order({"PERF: GetFCPortStats: Entry",
                                            "Error occurred while retrieving FCPort Statistics...",
                                            "PERF: GetFCPortStats: cleanExit"}));
}

TEST_F(LiveValues, APortsStatusIsReadAtMostOnceInTenSeconds)
{
    ports();
    nvrsim_set("0", "state", 6);
    advance_clock(9999999);
    EXPECT_EQ(value(ports()[0].get(), "OperationalStatus"), "{2}");
    EXPECT_THAT(words(), contains_in_order({"PERF: UpdateFCPortStatus: Entry", "Checking driver TimeOut...",
                                            "PERF: Refresh Not yet required"}));
    advance_clock(1);
    const Instances all = ports();
    EXPECT_EQ(value(all[0].get(), "OperationalStatus"), "{1}");
    EXPECT_EQ(value(all[0].get(), "StatusDescriptions"), "{Other}");
    EXPECT_EQ(value(all[1].get(), "StatusDescriptions"), "{OK}");
    EXPECT_THAT(words(), Contains("PERF: update driver map"));
}

TEST_F(LiveValues, ANewAgentReadsTheStatusAtOnce)
{
    ports();
    unload();
    listenAgain();
    ASSERT_EQ(load(), 0);
    ports();
    nvrsim_set("0", "state", 6);
    EXPECT_EQ(value(ports()[0].get(), "OperationalStatus"), "{2}") << "within ten seconds of its first look";
    unload();
    listenAgain();
    ASSERT_EQ(load(), 0);
    plain(agent().m_NVRHBA_FCPort_map);
    nvrsim_set("0", "state", 2);
    EXPECT_EQ(value(ports()[0].get(), "OperationalStatus"), "{2}") << "no time of the agent before counts";
}

TEST_F(LiveValues, TheLibrarysOwnStatesShowTheirWords)
{
    const struct {
        uint64 state;
        const char* status;
        const char* text;
    } rows[] = {{20, "{32788}", "{Operational. Need RESET}"},
                {21, "{32789}", "{Link down. Need RESET}"},
                {22, "{32790}", "{Disable}"},
                {8, "{32776}", "{InService}"},
                {99, "{0}", "{Unknown}"}};
    for (const auto& row : rows) {
        nvrsim_set("0", "state", row.state);
        advance_clock(10 * second);
        const Instances all = ports();
        EXPECT_EQ(value(all[0].get(), "OperationalStatus"), row.status);
        EXPECT_EQ(value(all[0].get(), "StatusDescriptions"), row.text);
    }
}

TEST_F(LiveValues, OneBadPortEndsTheWalkOverTheStatus)
{
    fault("call = \"RM_GetPortAttributes\", port = 0, status = 1");
    nvrsim_set("0", "state", 7);
    nvrsim_set("1", "state", 7);
    advance_clock(10 * second);
    const Instances all = ports();
    EXPECT_EQ(value(all[0].get(), "StatusDescriptions"), "{OK}");
    EXPECT_EQ(value(all[1].get(), "StatusDescriptions"), "{OK}");
    EXPECT_THAT(words(),
                contains_in_order({"Error while retrieving fcPortAttributes", "Error while updating FC Port map"}));
}

TEST_F(LiveValues, APortThatIsGoneKeepsItsLastCounters)
{
    nvrsim_set("0", "statistic:1036", 5);
    statistics();
    nvrsim_set("0", "present", 0);
    EXPECT_EQ(value(statistics()[0].get(), "LIPCount"), "5");
}

TEST_F(LiveValues, DriverParametersAreReadAtMostOnceInFiveSeconds)
{
    EXPECT_EQ(local(), "30");
    EXPECT_EQ(global(), "30");
    change("lun-queue-depth=40", 0);
    advance_clock(5 * second - 1);
    EXPECT_EQ(local(), "30");
    EXPECT_EQ(global(), "30");
    advance_clock(1);
    words();
    EXPECT_EQ(local(), "40");
    change("lun-queue-depth=50", RM_PARAM_GLOBAL);
    EXPECT_EQ(global(), "50");
    EXPECT_THAT(words(), contains_in_order({"Checking driver TimeOut...", "PERF: update driver map",
                                            "RM_GetDriverParams: status=0", "RM_GetDriverParams: status=0",
                                            "RM_GetDriverParamsGlobal: status=0"}));
}

TEST_F(LiveValues, AFailingParameterListLeavesTheValuesAndSaysSo)
{
    fault("call = \"RM_GetDriverParams\", status = 2");
    fault("call = \"RM_GetDriverParamsGlobal\", status = 2");
    EXPECT_EQ(local(), "30");
    EXPECT_EQ(global(), "30");
    EXPECT_THAT(words(), contains_in_order(
                             {"RM_GetDriverParams: status=2", "RM_GetDriverParams:failed",
                              "ERROR: nvrcimGetDriverParamsGlobal: RM_GetDriverParamsGlobal call failed (b) (2)"}));
}

TEST_F(LiveValues, ANeedOfAllMemoryIsNotAskedFor)
{
    fault("call = \"RM_GetDriverParamsGlobal\", status = 191, value = 4294967295");
    const uint64 before = nvrsim_calls("RM_GetDriverParamsGlobal");
    EXPECT_EQ(global(), "30");
    EXPECT_EQ(nvrsim_calls("RM_GetDriverParamsGlobal") - before, 1u);
    EXPECT_THAT(words(), Contains("ERROR: nvrcimGetDriverParamsGlobal: Unable to allocate buffer"));
}

TEST_F(LiveValues, AListThatIsNeverLongEnoughIsAskedForTwice)
{
    fault("call = \"RM_GetDriverParamsGlobal\", status = 191, value = 60");
    const uint64 before = nvrsim_calls("RM_GetDriverParamsGlobal");
    EXPECT_EQ(global(), "30");
    EXPECT_EQ(nvrsim_calls("RM_GetDriverParamsGlobal") - before, 2u);
    EXPECT_THAT(words(),
                Contains("ERROR: nvrcimGetDriverParamsGlobal: RM_GetDriverParamsGlobal call failed (a) (191)"));
}
