// The virtual ports that a refresh publishes, and what each failure of the library or the maps costs.

#include "classes/CIM_ComputerSystem.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_ResourcePool.h"
#include "classes/NVRHBA_VirtualFCPort.h"
#include "services/NVR_PortVirtualization.h"
#include "simulator/nvrsim.h"
#include "tests/agent/expect_rows.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

namespace {

constexpr char two_ports[] = R"(
[[adapter]]
name = "first"
[[adapter.port]]
[[adapter.port.vport]]
wwpn = "2B010000C9A000FF"
wwnn = "2C010000C9A000FF"
fc_id = 0x010203
name = "alpha"
[[adapter.port.vport]]
wwpn = "2B020000C9A000FF"
name = "beta"
[[adapter]]
name = "second"
[[adapter.port]]
[[adapter.port.vport]]
wwpn = "2B030000C9A000FF"
name = "gamma"
)";

class PortVirtualization : public SimulatedHost {
protected:
    PortVirtualization()
    {
        scenario(two_ports);
        EXPECT_EQ(load(), 0);
    }
    ~PortVirtualization() override
    {
        settle();
        unload();
    }

    std::vector<std::string> names(const Instance_Map& map, const char* property = "DeviceID")
    {
        std::vector<std::string> all;
        for (std::size_t i = 0; i < map.size(); i++)
            all.push_back(value(map[i], property));
        return all;
    }
    std::vector<std::string> vports() { return names(agent().m_NVRHBA_VirtualFCPort_map); }
    std::vector<std::string> pools() { return names(agent().m_NVRHBA_ResourcePool_map, "InstanceID"); }
    /// Builds once more, as a refresh does, and gives the words.
    std::vector<std::string> build()
    {
        words();
        EXPECT_EQ(NVR_PortVirtualization::CreatePortVirtualizationClasses(agent()), 0u);
        return words();
    }
};

constexpr const char* first_pool = "NVR:Resource Pool:10000000C9A00001";
constexpr const char* second_pool = "NVR:Resource Pool:10000000C9A00002";

} // namespace

TEST_F(PortVirtualization, PublishesEachVirtualPortInThePoolOfItsPort)
{
    refresh();
    const std::string host = value(agent().m_CIM_ComputerSystem_map[0], "Name");
    ASSERT_THAT(pools(), ElementsAre(first_pool, second_pool));
    expect_rows(agent().m_NVRHBA_ResourcePool_map[0], {
                                                          {"ElementName", first_pool},
                                                          {"PoolID", first_pool},
                                                          {"Primordial", "false"},
                                                          {"Capacity", "2"},
                                                          {"Reserved", "0"},
                                                          {"ResourceType", "10"},
                                                          {"Name", "null"},
                                                      });
    EXPECT_EQ(value(agent().m_NVRHBA_ResourcePool_map[1], "Capacity"), "1");
    ASSERT_THAT(vports(), ElementsAre("2B010000C9A000FF", "2B020000C9A000FF", "2B030000C9A000FF"));
    expect_rows(agent().m_NVRHBA_VirtualFCPort_map[0], {
                                                           {"SystemCreationClassName", "CIM_ComputerSystem"},
                                                           {"SystemName", host},
                                                           {"CreationClassName", "NVR_VirtualFCPort"},
                                                           {"Name", "2B010000C9A000FF"},
                                                           {"NodeWWN", "2C010000C9A000FF"},
                                                           {"PortFCId", "66051"},
                                                           {"VPortName", "alpha"},
                                                           {"ElementName", "null"},
                                                       });

    const auto& hosted = agent().m_NVRHBA_HostedResourcePool_map;
    ASSERT_EQ(hosted.size(), 2u);
    const Instance_Map& hosted_map = hosted;
    expect_rows(hosted_map[1], {});
    EXPECT_EQ(end(hosted_map[1], "GroupComponent", "Name"), host);
    EXPECT_EQ(end(hosted_map[1], "PartComponent", "InstanceID"), second_pool);
    const Instance_Map& dependency = agent().m_NVRHBA_VPortHostedDependency_map;
    const Instance_Map& allocated = agent().m_NVRHBA_ElementAllocatedFromPool_map;
    ASSERT_EQ(dependency.size(), 3u);
    ASSERT_EQ(allocated.size(), 3u);
    for (std::size_t i = 0; i < 3; i++) {
        expect_rows(dependency[i], {});
        expect_rows(allocated[i], {});
        EXPECT_EQ(end(dependency[i], "Antecedent", "DeviceID"), i < 2 ? "10000000C9A00001" : "10000000C9A00002");
        EXPECT_EQ(end(dependency[i], "Dependent", "DeviceID"), vports()[i]);
        EXPECT_EQ(end(allocated[i], "Antecedent", "InstanceID"), i < 2 ? first_pool : second_pool);
        EXPECT_EQ(end(allocated[i], "Dependent", "DeviceID"), vports()[i]);
    }
    EXPECT_THAT(words(),
                contains_in_order({"FC_CreateDumpClasses succesful", //
                                   "NVR_PortVirtualization::CreatePortVirtualizationClasses",
                                   "ClearPortVirtualizationMaps for FC invoked", //
                                   "Exiting ClearPortVirtualizationMaps ",
                                   "No of FC Ports: 2",
                                   "FC Port ID: 10000000C9A00001",
                                   "NVR_MethodWrapper::ListVPorts",
                                   "Entering NVR_MethodWrapper::Validatewwpn()",
                                   "RM_IsLocalHBA: status=0",
                                   "Exit the ListVPorts method",
                                   "No of vports:2 for 10000000C9A00001",
                                   "Creating Resource pool ",
                                   "Resource Pool created and inserted in map",
                                   "Creating HostedResource pool ",
                                   "HostedResource Pool created and inserted in map",
                                   "VPort Id :2B010000C9A000FF Node name: 2C010000C9A000FF",
                                   "NVR_MethodWrapper::ListVPortAttributes",
                                   "VPort details",
                                   "VPort Name alpha ",
                                   "Exit the ListVPortattributes method",
                                   "Created VirtualFCPort and inserted in map",
                                   "VPortHostedDependency created and inserted in map",
                                   "ElementAllocatedFromPool created and inserted in map",
                                   "Freeing VPList",
                                   "FC Port ID: 10000000C9A00002",
                                   "No of vports:1 for 10000000C9A00002",
                                   "Freeing VPList",
                                   "FC Port Virtualization classes are successfully created"}));
}

TEST_F(PortVirtualization, AsksOnceMoreWithTheRoomThatThePortNeeds)
{
    refresh();
    const unsigned long before = nvrsim_calls("RM_VPList");
    build();
    EXPECT_EQ(nvrsim_calls("RM_VPList") - before, 3u); // two virtual ports do not fit at first, one does
}

TEST_F(PortVirtualization, APortWithoutVirtualPortsGetsNoPool)
{
    scenario("[[adapter]]\nname = \"one\"\n[[adapter]]\nname = \"two\"\n[[adapter.port]]\n[[adapter.port.vport]]\n");
    refresh();
    EXPECT_THAT(pools(), ElementsAre(second_pool));
    EXPECT_THAT(words(), Contains("Need not create any resource pools since no vports exist for FCport: "
                                  "10000000C9A00001"));
}

TEST_F(PortVirtualization, ARefreshLeavesTheSameInstances)
{
    refresh();
    const auto before = vports();
    refresh();
    EXPECT_EQ(vports(), before);
    EXPECT_EQ(pools().size(), 2u);
}

TEST_F(PortVirtualization, AVirtualPortWithoutAttributesHasNoName)
{
    fault("call = \"RM_VPGetAttributes\", status = 9, times = 1");
    refresh();
    ASSERT_THAT(vports(), SizeIs(3));
    EXPECT_EQ(names(agent().m_NVRHBA_VirtualFCPort_map, "VPortName"),
              (std::vector<std::string>{"null", "beta", "gamma"}));
    EXPECT_THAT(words(),
                contains_in_order({"NVR_MethodWrapper::ListVPortAttributes", "Unable to list virtual ports!!",
                                   "NVRVCNA_PortVirtualization::Failure in listing vports information for port: "
                                   "2B010000C9A000FF, Rm Error: 1",
                                   "Created VirtualFCPort and inserted in map"}));
}

TEST_F(PortVirtualization, APortThatCannotBeListedCostsOnlyItself)
{
    fault("call = \"RM_VPList\", status = 2, times = 1");
    refresh();
    EXPECT_THAT(vports(), ElementsAre("2B030000C9A000FF"));
    EXPECT_THAT(pools(), ElementsAre(second_pool));
    const auto told = words();
    EXPECT_THAT(told, contains_in_order({"NVR_MethodWrapper::ListVPorts", "Unable to list virtual ports!!",
                                         "NVRVCNA_PortVirtualization::Failure in listing vports for port: "
                                         "10000000C9A00001, Rm Error: 1",
                                         "FC Port ID: 10000000C9A00002", "Freeing VPList"}));
    EXPECT_THAT(told, Contains(testing::StartsWith("Status: <2>")));
}

TEST_F(PortVirtualization, AHostThatKnowsNoneSaysSo)
{
    fault("call = \"RM_VPList\", status = 128");
    refresh();
    EXPECT_THAT(vports(), IsEmpty());
    const auto told = words();
    EXPECT_THAT(told, Contains("FMCMD does not support listing virtual ports on this host."));
    EXPECT_THAT(told, Not(Contains("Unable to list virtual ports!!")));
    EXPECT_THAT(told, Contains("FC Port Virtualization classes are successfully created"));
}

TEST_F(PortVirtualization, APortThatIsNotLocalIsNotListed)
{
    fault("call = \"RM_IsLocalHBA\", status = 1");
    refresh();
    EXPECT_THAT(vports(), IsEmpty());
    EXPECT_THAT(words(), contains_in_order({"NVR_MethodWrapper::ListVPorts", "HBA IS NOT LOCAL", "INVALID wwpn",
                                            "NVRVCNA_PortVirtualization::Failure in listing vports for port: "
                                            "10000000C9A00001, Rm Error: 1"}));
}

TEST_F(PortVirtualization, ACountBeyondTheListIsShownAndNotBelieved)
{
    // Success, and a count of four billion: only the room that was given is read.
    scenario("[[adapter]]\n[[adapter.port]]\n[[adapter.port.vport]]\nname = \"alone\"\n");
    fault("call = \"RM_VPList\", value = 4294967295");
    refresh();
    EXPECT_THAT(names(agent().m_NVRHBA_VirtualFCPort_map, "VPortName"), ElementsAre("alone"));
    EXPECT_EQ(value(agent().m_NVRHBA_ResourcePool_map[0], "Capacity"), "4294967295");
    EXPECT_THAT(words(), Contains("No of vports:-1 for 10000000C9A00001"));
}

TEST_F(PortVirtualization, ANeedOfFourBillionIsNotAllocated)
{
    fault("call = \"RM_VPList\", status = 7, value = 4294967295");
    refresh();
    EXPECT_THAT(vports(), IsEmpty());
    EXPECT_THAT(words(), Contains("FMCMD_ListVPorts: Unable to allocate buffer"));
}

TEST_F(PortVirtualization, ANeedOfNothingIsAskedForOnceMoreAndNoOftener)
{
    fault("call = \"RM_VPList\", status = 7, value = 0, port = 0");
    const unsigned long before = nvrsim_calls("RM_VPList");
    refresh();
    EXPECT_EQ(nvrsim_calls("RM_VPList") - before, 3u); // two for the first port
    EXPECT_THAT(pools(), ElementsAre(second_pool));
    EXPECT_THAT(words(), Contains("Unable to list virtual ports!!"));
}

TEST_F(PortVirtualization, TwoVirtualPortsOfOneNameEndTheBuild)
{
    scenario(R"(
allow_twins = true
[[adapter]]
name = "first"
[[adapter.port]]
[[adapter.port.vport]]
[[adapter.port.vport]]
wwpn = "10010000C9A00001"
[[adapter]]
name = "second"
[[adapter.port]]
[[adapter.port.vport]]
)");
    refresh();
    EXPECT_THAT(vports(), ElementsAre("10010000C9A00001"));
    EXPECT_THAT(pools(), ElementsAre(first_pool));
    const auto told = words();
    EXPECT_THAT(told, contains_in_order({"Insert Failed : m_NVRHBA_VirtualFCPort_map",
                                         "FC Port Virtualization classes are successfully created"}));
    EXPECT_THAT(told, Not(Contains("FC Port ID: 10000000C9A00002")));
    EXPECT_THAT(told, Not(Contains("Freeing VPList")));
}

TEST_F(PortVirtualization, WithoutPortsItLeavesTheMapsAlone)
{
    refresh();
    agent().m_NVRHBA_FCPort_map.clear();
    EXPECT_THAT(build(), ElementsAre("NVR_PortVirtualization::CreatePortVirtualizationClasses",
                                     "Unable to create the Port Virtualization classes, No Physical Port(FCoE) "
                                     "exists"));
    EXPECT_THAT(vports(), SizeIs(3));
}

TEST_F(PortVirtualization, APortWhoseNameIsNoneEndsTheBuild)
{
    refresh();
    agent().m_NVRHBA_FCPort_map[0]->DeviceID.value = "no name";
    const auto told = build();
    EXPECT_THAT(told, Contains("NVRVCNA_PortVirtualization::CreatePortVirtualizationClasses::str2HBAName failed"));
    EXPECT_THAT(told, Not(Contains("FC Port ID: 10000000C9A00002")));
    EXPECT_THAT(vports(), IsEmpty());
}

TEST_F(PortVirtualization, WithoutAHostThereIsNoHostedPool)
{
    refresh();
    agent().m_CIM_ComputerSystem_map.clear();
    const auto told = build();
    EXPECT_THAT(told, Contains("Failed to create HostedResourcePool"));
    EXPECT_THAT(pools(), ElementsAre(first_pool)); // where it stood
    EXPECT_THAT(vports(), IsEmpty());
}

TEST_F(PortVirtualization, ARebuildOfTheAdaptersEmptiesItsMaps)
{
    refresh();
    scenario("# no adapters\n");
    refresh();
    EXPECT_THAT(vports(), IsEmpty());
    EXPECT_THAT(pools(), IsEmpty());
    EXPECT_TRUE(agent().m_NVRHBA_HostedResourcePool_map.empty());
    EXPECT_TRUE(agent().m_NVRHBA_VPortHostedDependency_map.empty());
    EXPECT_TRUE(agent().m_NVRHBA_ElementAllocatedFromPool_map.empty());
}
