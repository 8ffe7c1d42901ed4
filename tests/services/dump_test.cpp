// The dump service's instances, and what each failure of the library or the maps costs.

#include "classes/CIM_ComputerSystem.h"
#include "classes/NVRHBA_DumpData.h"
#include "classes/NVRHBA_FCPort.h"
#include "services/NVR_Dump.h"
#include "tests/agent/expect_rows.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::Not;
using testing::StartsWith;

namespace {

class Dump : public SimulatedHost {
protected:
    Dump()
    {
        scenario("[[adapter]]\nname = \"one\"\n[[adapter.port]]\ndump_directory = \"/var/dumps\"\nretention = 7\n"
                 "[[adapter]]\nname = \"two\"\n");
        EXPECT_EQ(load(), 0);
    }
    ~Dump() override
    {
        settle();
        unload();
    }

    const Instance* data(std::size_t index)
    {
        return static_cast<const Instance_Map&>(agent().m_NVRHBA_DumpData_map)[index];
    }
    /// Sizes of the maps in the order in which they are emptied.
    std::vector<std::size_t> sizes()
    {
        return {agent().m_NVRHBA_DumpService_map.size(), agent().m_NVRHBA_HostedDumpService_map.size(),
                agent().m_NVRHBA_DumpServiceAffectsElement_map.size(), agent().m_NVRHBA_DumpData_map.size(),
                agent().m_NVRHBA_ElementDumpData_map.size()};
    }
    /// Empties all maps but `kept` and builds again.
    uint32 rebuild_but(Instance_Map& kept)
    {
        for (Instance_Map* map : std::initializer_list<Instance_Map*>{
                 &agent().m_NVRHBA_DumpService_map, &agent().m_NVRHBA_HostedDumpService_map,
                 &agent().m_NVRHBA_DumpServiceAffectsElement_map, &agent().m_NVRHBA_DumpData_map,
                 &agent().m_NVRHBA_ElementDumpData_map})
            if (map != &kept) map->clear();
        words();
        return NVR_Dump::FC_CreateDumpClasses(agent());
    }
};

} // namespace

TEST_F(Dump, HasOneServiceAndTheSettingsOfEachPort)
{
    refresh();
    const std::string host = value(agent().m_CIM_ComputerSystem_map[0], "Name");
    ASSERT_THAT(sizes(), ElementsAre(1, 1, 2, 2, 2));
    const Instance_Map& services = agent().m_NVRHBA_DumpService_map;
    expect_rows(services[0], {
                                 {"SystemCreationClassName", "CIM_ComputerSystem"},
                                 {"SystemName", host},
                                 {"Name", "NVRHBA_DumpService"},
                                 {"CreationClassName", "NVRHBA_DumpService"},
                                 {"ElementName", "null"},
                             });
    expect_rows(data(0), {
                             {"InstanceID", "NVRHBA_DumpData::10000000C9A00001"},
                             {"ElementName", "10000000C9A00001"},
                             {"RetentionCount", "7"},
                             {"DumpDirectory", "/var/dumps"},
                             {"ConfigurationName", "null"},
                             {"ChangeableType", "null"},
                         });
    expect_rows(data(1), {{"InstanceID", "NVRHBA_DumpData::10000000C9A00002"}, {"RetentionCount", "5"}});

    const Instance_Map& hosted = agent().m_NVRHBA_HostedDumpService_map;
    expect_rows(hosted[0], {});
    EXPECT_EQ(end(hosted[0], "Antecedent", "Name"), host);
    EXPECT_EQ(end(hosted[0], "Dependent", "Name"), "NVRHBA_DumpService");
    const Instance_Map& affects = agent().m_NVRHBA_DumpServiceAffectsElement_map;
    expect_rows(affects[1], {{"ElementEffects", "null"}});
    EXPECT_EQ(end(affects[1], "AffectedElement", "CreationClassName"), "NVRHBA_PortController");
    EXPECT_EQ(end(affects[1], "AffectedElement", "DeviceID"), "10000000C9A00002");
    EXPECT_EQ(end(affects[1], "AffectingElement", "Name"), "NVRHBA_DumpService");
    const Instance_Map& elements = agent().m_NVRHBA_ElementDumpData_map;
    expect_rows(elements[1], {{"IsDefault", "1"}});
    EXPECT_EQ(end(elements[1], "ManagedElement", "Name"), "NVRHBA_DumpService");
    EXPECT_EQ(end(elements[1], "SettingData", "InstanceID"), "NVRHBA_DumpData::10000000C9A00002");

    EXPECT_THAT(words(),
                contains_in_order(
                    {"Calling FC_CreateDumpClasses", "Entered FC_CreateDumpClasses",
                     "NVR_MethodWrapper::nvrcimGetRetentionCount", "Entering NVR_MethodWrapper::Validatewwpn()",
                     "NVR_Dump::nvrcimGetDumpDirectory Succesful", "Calling NVR_Dump::nvrcimGetRetentionCount",
                     "NVR_MethodWrapper::nvrcimGetRetentionCount", "returned nvrcimGetRetentionCount call from wrapper",
                     "NVR_Dump::nvrcimGetRetentionCount Succesful", "NVR_Dump::nvrcimGetDumpDirectory Succesful",
                     "FC_CreateDumpClasses succesful"}));
}

TEST_F(Dump, AnUnreadableDirectoryStaysEmpty)
{
    fault("call = \"RM_GetDumpDirectoryA\", status = 160, times = 1");
    refresh();
    expect_rows(data(0), {{"DumpDirectory", ""}, {"RetentionCount", "7"}});
    EXPECT_NE(value(data(1), "DumpDirectory"), "");
    const auto told = words();
    EXPECT_THAT(told, contains_in_order({"Failed to get the Dump directory, returned with error code 160",
                                         "NVR_Dump::nvrcimGetDumpDirectory failed",
                                         "Calling NVR_Dump::nvrcimGetRetentionCount"}));
    EXPECT_THAT(told, Contains(StartsWith("Status: <160>")));
}

TEST_F(Dump, AnUnreadableCountStaysZero)
{
    fault("call = \"RM_GetDumpRetentionCount\", status = 1, value = 99, times = 1");
    refresh();
    expect_rows(data(0), {{"DumpDirectory", "/var/dumps"}, {"RetentionCount", "0"}});
    EXPECT_EQ(value(data(1), "RetentionCount"), "5");
    EXPECT_THAT(words(), contains_in_order({"Failed to get the retention count, returned with error code 1",
                                            "returned nvrcimGetRetentionCount call from wrapper",
                                            "NVR_Dump::nvrcimGetRetentionCount failed"}));
}

TEST_F(Dump, APortThatIsNotLocalHasEmptySettings)
{
    fault("call = \"RM_IsLocalHBA\", status = 1");
    refresh();
    ASSERT_THAT(sizes(), ElementsAre(1, 1, 2, 2, 2));
    expect_rows(data(0), {{"DumpDirectory", ""}, {"RetentionCount", "0"}});
    EXPECT_THAT(words(), contains_in_order({"NVR_MethodWrapper::nvrcimGetRetentionCount", "HBA IS NOT LOCAL",
                                            "INVALID wwpn", "NVR_Dump::nvrcimGetDumpDirectory failed",
                                            "NVR_Dump::nvrcimGetRetentionCount failed"}));
}

TEST_F(Dump, ADirectoryWithoutAnEndIsCutAtItsField)
{
    fault("call = \"RM_GetDumpDirectoryA\", damage = \"unterminated\"");
    refresh();
    EXPECT_LE(value(data(0), "DumpDirectory").size(), 256u);
    EXPECT_THAT(value(data(0), "DumpDirectory"), StartsWith("/var/dumps"));
}

TEST_F(Dump, WithoutPortsThereIsOnlyTheService)
{
    refresh();
    agent().m_NVRHBA_FCPort_map.clear();
    EXPECT_EQ(NVR_Dump::FC_ClearDumpClasses(agent()), 0u);
    EXPECT_EQ(NVR_Dump::FC_CreateDumpClasses(agent()), 0u);
    EXPECT_THAT(sizes(), ElementsAre(1, 1, 0, 0, 0));
}

TEST_F(Dump, APortWithoutAControllerEndsTheBuild)
{
    refresh();
    agent().m_NVRHBA_PortController_map.clear();
    NVR_Dump::FC_ClearDumpClasses(agent());
    words();
    EXPECT_EQ(NVR_Dump::FC_CreateDumpClasses(agent()), 40008u);
    EXPECT_THAT(sizes(), ElementsAre(1, 1, 0, 0, 0));
    EXPECT_THAT(words(), ElementsAre("Entered FC_CreateDumpClasses", //
                                     "Failed to create NVRHBA_DumpServiceAffectsElement"));
}

TEST_F(Dump, WithoutAHostTheServiceIsNotHosted)
{
    refresh();
    agent().m_CIM_ComputerSystem_map.clear();
    NVR_Dump::FC_ClearDumpClasses(agent());
    EXPECT_EQ(NVR_Dump::FC_CreateDumpClasses(agent()), 40008u);
    EXPECT_THAT(sizes(), ElementsAre(1, 0, 0, 0, 0));
    EXPECT_THAT(words(), Contains("Failed to create NVRHBA_HostedDumpService"));
}

TEST_F(Dump, APortWhoseNameIsNoneEndsTheBuild)
{
    refresh();
    // The controller goes by the same wrong name, so that the service can affect it.
    agent().m_NVRHBA_FCPort_map.clear();
    Ref<NVRHBA_FCPort> port(create_as<NVRHBA_FCPort>(true));
    const Instance_Map& controllers = agent().m_NVRHBA_PortController_map;
    port->SystemCreationClassName.set(value(controllers[0], "SystemCreationClassName").c_str());
    port->SystemName.set(value(controllers[0], "SystemName").c_str());
    port->DeviceID.set("no name");
    Ref<Instance> controller(clone(controllers[0]));
    const Meta_Feature* id = find_feature(controller->meta_class, "DeviceID", META_FLAG_PROPERTY);
    *static_cast<String*>(feature_at(controller.get(), as_property(id)->offset)) = "no name";
    ASSERT_GE(agent().m_NVRHBA_PortController_map.insert(controller.release()), 0);
    ASSERT_GE(agent().m_NVRHBA_FCPort_map.insert(port.release()), 0);
    NVR_Dump::FC_ClearDumpClasses(agent());
    EXPECT_EQ(NVR_Dump::FC_CreateDumpClasses(agent()), 32769u);
    EXPECT_THAT(sizes(), ElementsAre(1, 1, 1, 0, 0));
    EXPECT_THAT(words(), Contains("NVR_Dump::str2HBAName failed"));
}

TEST_F(Dump, EachRefusedInstanceEndsTheBuildWithItsWords)
{
    refresh();
    const auto refused = [&](Instance_Map& kept, const char* words_of_it, std::vector<std::size_t> left) {
        EXPECT_EQ(rebuild_but(kept), 32769u) << words_of_it;
        EXPECT_THAT(words(), Contains(words_of_it));
        EXPECT_EQ(sizes(), left) << words_of_it;
        NVR_Dump::FC_ClearDumpClasses(agent());
        EXPECT_EQ(NVR_Dump::FC_CreateDumpClasses(agent()), 0u);
    };
    refused(agent().m_NVRHBA_DumpService_map, "Insert Failed : m_NVRHBA_DumpService_map", {1, 0, 0, 0, 0});
    refused(agent().m_NVRHBA_HostedDumpService_map, "Insert Failed : m_NVRHBA_HostedDumpService_map", {1, 1, 0, 0, 0});
    refused(agent().m_NVRHBA_DumpServiceAffectsElement_map, "Insert Failed : m_NVRHBA_DumpServiceAffectsElement_map",
            {1, 1, 2, 0, 0});
    refused(agent().m_NVRHBA_DumpData_map, "Insert Failed : m_NVRHBA_DumpData_map", {1, 1, 1, 2, 0});
    refused(agent().m_NVRHBA_ElementDumpData_map, "Insert Failed : m_NVRHBA_ElementDumpData_map", {1, 1, 1, 1, 2});
}

TEST_F(Dump, ClearingEmptiesAllFiveMaps)
{
    refresh();
    words();
    EXPECT_EQ(NVR_Dump::FC_ClearDumpClasses(agent()), 0u);
    EXPECT_THAT(sizes(), ElementsAre(0, 0, 0, 0, 0));
    EXPECT_THAT(words(), ElementsAre("Entered FC_ClearDumpClasses"));
}
