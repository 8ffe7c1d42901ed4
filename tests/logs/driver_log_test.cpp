// The driver's record log as instances: beside the provider's own, in the same maps.
#include <map>

#include "classes/CIM_ComputerSystem.h"
#include "classes/NVRHBA_FCDriverLogEntry.h"
#include "inventory/NVR_Data.h"
#include "logs/NVRHBA_DriverLogProfile.h"
#include "tests/agent/Other_Adapter.h"
#include "tests/agent/expect_rows.h"
#include "tests/support/short_memory.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::Not;

namespace {

class DriverLog : public SimulatedHost {
protected:
    DriverLog() { EXPECT_EQ(load(), 0); }
    ~DriverLog() override
    {
        settle();
        unload();
    }

    std::string log_id() { return "NVR: FC Driver Record Log:" + value(agent().m_CIM_ComputerSystem_map[0], "Name"); }
    const Instance_Map& logs() { return agent().m_NVRHBA_RecordLog_map; }
    const Instance_Map& capabilities() { return agent().m_NVRHBA_EnabledRecordLogCapabilities_map; }
    const Instance_Map& uses() { return agent().m_NVRHBA_ProviderUseOfLog_map; }
    uint32 create()
    {
        words();
        return NVRHBA_DriverLogProfile::CreateFCDriverLogClasses(agent());
    }
};

} // namespace

TEST_F(DriverLog, StandsBehindTheProvidersOwn)
{
    refresh();
    ASSERT_EQ(logs().size(), 2u);
    expect_rows(logs()[1], {
                               {"InstanceID", log_id()},
                               {"ElementName", log_id()},
                               {"MaxNumberOfRecords", "200"},
                               {"CurrentNumberOfRecords", "0"},
                               {"LogState", "4"},
                               {"OverwritePolicy", "2"},
                               {"OperationalStatus", "{2}"},
                               {"RequestedState", "2"},
                               {"EnabledState", "3"},
                               {"HealthState", "5"},
                               {"Name", "Driver logs for Norvane FC Provider"},
                               {"LogLevel", "null"},
                               {"TracePath", "null"},
                           });
    ASSERT_EQ(capabilities().size(), 2u);
    expect_rows(capabilities()[1], {
                                       {"InstanceID", "NVR:FC Driver Record Log Capabilities"},
                                       {"RequestedStatesSupported", "{2,3,11}"},
                                       {"ElementNameEditSupported", "false"},
                                       {"MaxElementNameLen", "0"},
                                       {"LogParamsSupported", "null"},
                                   });
    ASSERT_EQ(uses().size(), 2u);
    expect_rows(uses()[1], {});
    EXPECT_EQ(end(uses()[1], "Antecedent", "InstanceID"), log_id());
    EXPECT_THAT(end(uses()[1], "Dependent", "InstanceID"), testing::StartsWith("NVR FC HBA: Driver "));
    EXPECT_EQ(agent().m_NVRHBA_RecordLogCapabilities_map.size(), 1u); // the provider's alone
    EXPECT_THAT(words(),
                contains_in_order({"Calling FC_CreateDumpClasses", "Enter CreateFCDriverLogClasses",
                                   "Exit CreateFCDriverLogClasses", "FC Driver Log classes are successfully created",
                                   "Entered FC_CreateDumpClasses"}));
}

TEST_F(DriverLog, OfASilentProviderIsStopped)
{
    refresh();
    agent().m_NVRHBA_RecordLog_map.clear();
    agent().m_NVRHBA_EnabledRecordLogCapabilities_map.clear();
    CLogger::instance()->disable();
    EXPECT_EQ(create(), 0u);
    CLogger::instance()->enable();
    EXPECT_EQ(value(logs()[0], "OperationalStatus"), "{10}");
}

TEST_F(DriverLog, ARefreshMakesItAnew)
{
    refresh();
    refresh();
    EXPECT_EQ(logs().size(), 2u);
    EXPECT_EQ(capabilities().size(), 2u);
    EXPECT_EQ(uses().size(), 2u);
}

TEST_F(DriverLog, ARefusedLogEndsTheBuild)
{
    refresh();
    EXPECT_EQ(create(), 32769u);
    EXPECT_THAT(words(), ElementsAre("Enter CreateFCDriverLogClasses", "Insert Failed : m_NVRHBA_RecordLog_map"));
    EXPECT_EQ(logs().size(), 2u);
}

TEST_F(DriverLog, RefusedCapabilitiesEndTheBuild)
{
    refresh();
    agent().m_NVRHBA_RecordLog_map.clear();
    EXPECT_EQ(create(), 32769u);
    EXPECT_THAT(words(), ElementsAre("Enter CreateFCDriverLogClasses",
                                     "Insert Failed : m_NVRHBA_EnabledRecordLogCapabilities_map"));
    EXPECT_EQ(logs().size(), 1u);
}

TEST_F(DriverLog, WithoutTheDriversIdentityItIsNobodys)
{
    refresh();
    agent().m_NVRHBA_RecordLog_map.clear();
    agent().m_NVRHBA_EnabledRecordLogCapabilities_map.clear();
    agent().m_NVRHBA_ProviderUseOfLog_map.clear();
    agent().m_NVRHBA_SoftwareIdentity_map.clear();
    EXPECT_EQ(create(), 32769u);
    EXPECT_THAT(words(), ElementsAre("Enter CreateFCDriverLogClasses", "Missing Provider Software Identity"));
    EXPECT_EQ(logs().size(), 1u);
    EXPECT_TRUE(uses().empty());
}

TEST_F(DriverLog, WithoutMemoryItIsToldAndEndsTheBuild)
{
    refresh();
    ProviderAgent& the_agent = agent();
    const auto clear = [&] {
        the_agent.m_NVRHBA_RecordLog_map.clear();
        the_agent.m_NVRHBA_EnabledRecordLogCapabilities_map.clear();
        the_agent.m_NVRHBA_ProviderUseOfLog_map.clear();
        words();
    };
    clear();
    std::map<std::string, int> said;
    uint32 status = 77;
    refuse_each_allocation([&] { status = NVRHBA_DriverLogProfile::CreateFCDriverLogClasses(the_agent); },
                           [&](bool has_thrown) {
                               EXPECT_FALSE(has_thrown);
                               const std::string last = words().back();
                               said[last]++;
                               // The use of the log is one of the ties that a refresh can do without.
                               EXPECT_EQ(status, last == "Exit CreateFCDriverLogClasses" ? 0u : 32769u) << last;
                               clear();
                           });
    EXPECT_EQ(status, 0u);
    EXPECT_GT(said["Failed to allocate memory to create NVRHBA_RecordLog"], 3);
    EXPECT_GT(said["Failed to allocate memory to create NVRHBA_EnabledRecordLogCapabilities"], 3);
    EXPECT_GT(said["Insert Failed : m_NVRHBA_RecordLog_map"], 1);
    EXPECT_GT(said["Insert Failed : m_NVRHBA_EnabledRecordLogCapabilities_map"], 1);
    EXPECT_EQ(logs().size(), 1u);
    EXPECT_EQ(uses().size(), 1u);
}

TEST_F(DriverLog, AHostWithoutAdaptersHasNone)
{
    scenario("# no adapters\n");
    refresh();
    EXPECT_EQ(create(), 0u);
    EXPECT_THAT(words(), ElementsAre("Enter CreateFCDriverLogClasses", "Exit CreateFCDriverLogClasses"));
    EXPECT_TRUE(logs().empty());
}

TEST_F(DriverLog, AdaptersOfOtherKindsHaveNone)
{
    scenario("# no adapters\n");
    refresh();
    auto& adapters = const_cast<std::vector<Adapter*>&>(agent().m_pData->getAdapters());
    adapters.push_back(new Other_Adapter);
    EXPECT_EQ(create(), 0u);
    EXPECT_THAT(words(), ElementsAre("Enter CreateFCDriverLogClasses",
                                     "Skippping Adapter [Other-0] since it is not an FC Adapter",
                                     "Exit CreateFCDriverLogClasses"));
    EXPECT_TRUE(logs().empty());
}

TEST_F(DriverLog, ClearingItsClassesLeavesTheSharedMaps)
{
    refresh();
    ASSERT_EQ(agent().m_NVRHBA_FCDriverLogEntry_map.insert(create_as<NVRHBA_FCDriverLogEntry>(true)), 0);
    NVRHBA_DriverLogProfile::ClearFCDriverLogClasses(agent());
    EXPECT_TRUE(agent().m_NVRHBA_FCDriverLogEntry_map.empty());
    EXPECT_EQ(logs().size(), 2u);
}
