#include <cerrno>
#include <cstdio>

#include "agent/Adapter_Update.h"
#include "agent/Agent_Wait.h"
#include "inventory/NVR_Data.h"
#include "simulator/nvrsim.h"
#include "tests/agent/Other_Adapter.h"
#include "tests/agent/expect_rows.h"
#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::HasSubstr;
using testing::Not;
using testing::SizeIs;

namespace {

using AdapterUpdate = LoadedHost;

std::string host_name()
{
    char name[256] = {};
    gethostname(name, sizeof name - 1);
    return name;
}

} // namespace

TEST_F(AdapterUpdate, AnFCPortShowsAllThatTheLibrariesTell)
{
    const Ref<Instance> port = only(agent().m_NVRHBA_FCPort_map);
    expect_rows(port.get(),
                {
                    {"PortNumber", "0"},
                    {"Description", "Norvane FC2162 16Gb Fibre Channel Host Bus Adapter"},
                    {"SystemCreationClassName", "CIM_ComputerSystem"},
                    {"CreationClassName", "NVRHBA_FCPort"},
                    {"Name", first_wwpn},
                    {"DeviceID", first_wwpn},
                    {"PermanentAddress", first_wwpn},
                    {"NetworkAddresses", "{10000000C9A00001}"},
                    {"OtherIdentifyingInfo",
                     "{Norvane FC2162 16Gb 2-Port PCIe Fibre Channel Adapter,FC2162-M8,NV216200001,A-5681,"
                     "4E56,FC2162,Norvane FC2162 16Gb 2-Port PCIe Fibre Channel Adapter,FC2162-M8,0,"
                     "slot 1,/sys/class/fc_host/host0,00:00:c9:a0:00:01}"},
                    {"IdentifyingDescriptions", "{VPD:PRODUCT_NAME,VPD:PART_NUMBER,VPD:SERIAL_NUMBER,VPD:EC_LEVEL,"
                                                "VPD:MANUFACTURER_ID,VPD:V0,VPD:V1,VPD:V2,VPD:V4,VPD:YA,OS Device Name,"
                                                "NORVANE:IEEE_ADDRESS}"},
                    {"LocationIndicator", "3"},
                    {"ElementName", "Norvane FC2162 FV2.01a4 DV8.3.7.18 HBA0"},
                    {"UsageRestriction", "4"},
                    {"FCID", "65792"},
                    {"NumberOfDiscoveredPorts", "1"},
                    {"OperationalFirmware", "SLI-3 Overlay:v2.01a4"},
                    {"FabricName", "1000000533A00001"},
                    {"AdapterName", "Norvane-FC2162-0"},
                    {"LinkTechnology", "4"},
                    {"SupportedMaximumTransmissionUnit", "2048"},
                    {"ActiveMaximumTransmissionUnit", "2048"},
                    {"OperationalStatus", "{2}"},
                    {"StatusDescriptions", "{OK}"},
                    {"SupportedCOS", "{3}"},
                    {"ActiveCOS", "{3}"},
                    {"SupportedFC4Types", "{8,32}"},
                    {"ActiveFC4Types", "{8}"},
                    {"Speed", "16000000000"},
                    {"MaxSpeed", "16000000000"},
                    {"OtherPortType", "null"},
                    {"EnabledState", "5"}, // the schema's default
                });
}

TEST_F(AdapterUpdate, TheClassesOfAnAdapterStandOnItsAttributes)
{
    const Ref<Instance> package = only(agent().m_NVRHBA_PhysicalPackage_map);
    expect_rows(package.get(), {
                                   {"Name", "FC2162"},
                                   {"Model", "FC2162"},
                                   {"PartNumber", "FC2162"},
                                   {"Manufacturer", "Norvane Corporation"},
                                   {"Tag", "20000000C9A00001"},
                                   {"CreationClassName", "NVRHBA_PhysicalPackage"},
                                   {"Description", "Norvane FC2162 16Gb Fibre Channel Host Bus Adapter"},
                                   {"ElementName", "Norvane FC2162 FV2.01a4 DV8.3.7.18 HBA0"},
                                   {"SerialNumber", "NV216200001"},
                                   {"Version", "31004549"},
                                   {"SLIMode", "4"},
                                   {"BoardTemperature", "45"},
                                   {"ThresholdCriticalTemp", "100"},
                                   {"ThresholdWarningTemp", "85"},
                                   {"TemperatureUnit", "Celsius"},
                                   {"VendorSpecID", "1314320738"},
                                   {"DeviceID", "61794"},
                                   {"ModelID", "8546"},
                                   {"PackageType", "9"},
                               });
    const Ref<Instance> product = only(agent().m_NVRHBA_Product_map);
    expect_rows(product.get(), {{"Name", "FC2162"},
                                {"IdentifyingNumber", "20000000C9A00001"},
                                {"Vendor", "Norvane Corporation"},
                                {"Version", "31004549"},
                                {"ElementName", "Norvane FC2162 FV2.01a4 DV8.3.7.18 HBA0"}});
    const Ref<Instance> group = only(agent().m_NVRHBA_LogicalPortGroup_map);
    expect_rows(group.get(), {{"Description", "The Fibre Channel ports of the HBA."},
                              {"Name", "20000000C9A00001"},
                              {"InstanceID", "NVR FC HBA:20000000C9A00001"},
                              {"NameFormat", "WWN"},
                              {"ElementName", "FC2162:20000000C9A00001"}});
}

TEST_F(AdapterUpdate, ThePCIDeviceShowsTheHeaderInItsOrder)
{
    // Each byte is its own number, from 1.
    char header[2 * 64 + 1];
    for (int i = 0; i < 64; i++)
        std::snprintf(header + 2 * i, 3, "%02X", i + 1);
    scenario("[[adapter]]\n[[adapter.port]]\npci = { raw = \"" + std::string(header) + "\" }\n");
    refresh();
    const Ref<Instance> device = only(agent().m_NVRHBA_PCIDevice_map);
    expect_rows(device.get(), {
                                  {"CreationClassName", "NVRHBA_PCIDevice"},
                                  {"DeviceID", "10000000C9A00001:0x0403"},
                                  {"ElementName", "Norvane:FCAdapter0"},
                                  {"EnabledState", "5"},
                                  {"RequestedState", "5"},
                                  {"PrimaryStatus", "5"},
                                  {"HealthState", "5"},
                                  {"FunctionNumber", "0"},
                                  {"BusNumber", "4"},
                                  {"VendorID", "513"},
                                  {"Command", "1541"},
                                  {"PCIStatus", "2055"},
                                  {"RevisionID", "9"},
                                  {"ProgIf", "10"},
                                  {"SubClass", "11"},
                                  {"BaseClass", "12"},
                                  {"CacheLineSize", "13"},
                                  {"LatencyTimer", "14"},
                                  {"HeaderType", "15"},
                                  {"BuiltInSelfTest", "16"},
                                  {"BaseAddresses0", "336794129"},
                                  {"BaseAddresses1", "404166165"},
                                  {"BaseAddresses2", "471538201"},
                                  {"BaseAddresses3", "538910237"},
                                  {"BaseAddresses4", "606282273"},
                                  {"BaseAddresses5", "673654309"},
                                  {"CIS", "741026345"},
                                  {"SubVendorID", "11821"},
                                  {"SubsystemID", "12335"},
                                  {"ExpansionROMBaseAddress", "875770417"},
                                  {"CapabilitiesPtr", "53"},
                                  {"InterruptLine", "61"},
                                  {"InterruptPin", "62"},
                                  {"MinimumGrant", "63"},
                                  {"MaximumLatency", "64"},
                              });
}

TEST_F(AdapterUpdate, UnreadablePCIRegistersReadAsZero)
{
    fault("call = \"RM_DiagReadPCIRegistersV2\", status = 1");
    const Ref<Instance> device = only(agent().m_NVRHBA_PCIDevice_map);
    EXPECT_EQ(value(device.get(), "DeviceID"), "10000000C9A00001:0x0000");
    EXPECT_EQ(value(device.get(), "VendorID"), "0");
    EXPECT_EQ(value(device.get(), "MaximumLatency"), "0");
    EXPECT_THAT(words(), contains_in_order({"RM_DiagReadPCIRegistersV2 status = 1 ",
                                            "RM_DiagReadPCIRegistersV2 call failed", "Creating NVRHBA_PCIDevice"}));
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
}

TEST_F(AdapterUpdate, ABoardTemperatureOfZeroLeavesAllThreeNull)
{
    scenario("[[adapter]]\n[[adapter.port]]\nattributes = { 551 = 0 }\n");
    refresh();
    const Ref<Instance> package = only(agent().m_NVRHBA_PhysicalPackage_map);
    for (const char* name : {"BoardTemperature", "ThresholdCriticalTemp", "ThresholdWarningTemp"})
        EXPECT_EQ(value(package.get(), name), "null") << name;
    EXPECT_EQ(value(package.get(), "TemperatureUnit"), "Celsius");
}

TEST_F(AdapterUpdate, ControllersAndStatisticsOfAPort)
{
    const Ref<Instance> protocol = only(agent().m_NVRHBA_SCSIProtocolController_map);
    expect_rows(protocol.get(), {{"Name", first_wwpn},
                                 {"DeviceID", first_wwpn},
                                 {"OperationalStatus", "{2}"},
                                 {"StatusDescriptions", "{OK}"},
                                 {"NameFormat", "2"},
                                 {"MaxUnitsControlled", "1"}});
    const Ref<Instance> controller = only(agent().m_NVRHBA_PortController_map);
    expect_rows(controller.get(), {{"DeviceID", first_wwpn},
                                   {"Name", "Norvane FC2162 FV2.01a4 DV8.3.7.18 HBA0"},
                                   {"ControllerType", "4"},
                                   {"ProtocolSupported", "10"},
                                   {"MaxNumberControlled", "1"},
                                   {"ProtocolDescription", "SCSI Fibre Channel Protocol"},
                                   {"Availability", "3"},
                                   {"EnabledState", "5"},
                                   {"RequestedState", "5"},
                                   {"EnabledDefault", "2"},
                                   {"OperationalStatus", "{2}"}});
    const Ref<Instance> statistics = only(agent().m_NVRHBA_FCPortStatistics_map);
    expect_rows(statistics.get(), {{"InstanceID", "NVR FC HBA:HBA Statistics:10000000C9A00001"},
                                   {"ElementName", first_wwpn},
                                   {"Description", "Statistics for the FC port."},
                                   {"BytesTransmitted", "null"}});
}

TEST_F(AdapterUpdate, TheAssociationsOfAPortLeadToBothEnds)
{
    plain(agent().m_NVRHBA_FCPort_map);
    const struct {
        Instance_Map& map;
        const char* reference;
        const char* property;
        const char* value;
    } rows[] = {
        {agent().m_NVRHBA_SystemPackaging_map, "Antecedent", "Tag", "20000000C9A00001"},
        {agent().m_NVRHBA_HostedCollection_map, "Dependent", "Name", "20000000C9A00001"},
        {agent().m_NVRHBA_SystemDevice_map, "PartComponent", "CreationClassName", "NVRHBA_PCIDevice"},
        {agent().m_NVRHBA_PCIElementConformsToProfile_map, "ConformantStandard", "RegisteredName", "PCI Device"},
        {agent().m_NVRHBA_FCPortSystemDevice_map, "PartComponent", "DeviceID", first_wwpn},
        {agent().m_NVRHBA_MemberOfCollection_map, "Member", "DeviceID", first_wwpn},
        {agent().m_NVRHBA_MemberOfCollection_map, "Collection", "Name", "20000000C9A00001"},
        {agent().m_NVRHBA_ElementStatisticalData_map, "Stats", "ElementName", first_wwpn},
        {agent().m_NVRHBA_ProtocolControllerForPort_map, "Antecedent", "CreationClassName",
         "NVRHBA_SCSIProtocolController"},
        {agent().m_NVRHBA_SCSIProtocolControllerSystemDevice_map, "PartComponent", "DeviceID", first_wwpn},
        {agent().m_NVRHBA_ProductElementComponent_map, "PartComponent", "CreationClassName", "NVRHBA_PortController"},
        {agent().m_NVRHBA_ProductPhysicalComponent_map, "PartComponent", "Tag", "20000000C9A00001"},
        {agent().m_NVRHBA_ControlledBy_map, "Dependent", "DeviceID", first_wwpn},
        {agent().m_NVRHBA_Realizes_map, "Dependent", "CreationClassName", "NVRHBA_PortController"},
        {agent().m_NVRHBA_PortControllerSystemDevice_map, "PartComponent", "CreationClassName",
         "NVRHBA_PortController"},
    };
    for (const auto& row : rows) {
        const Ref<Instance> association = only(row.map);
        EXPECT_EQ(end(association.get(), row.reference, row.property), row.value) << row.map.meta_class()->name;
        EXPECT_STREQ(association->__name_space.c_str(), "root/norvane");
    }
    EXPECT_EQ(value(only(agent().m_NVRHBA_ControlledBy_map).get(), "AccessState"), "1");
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPortConformsToProfile_map), SizeIs(4));
    EXPECT_THAT(plain(agent().m_NVRHBA_PortControllerConformsToProfile_map), SizeIs(2));
}

TEST_F(AdapterUpdate, TheHostIsGeneratedWhereNobodyPublishesOne)
{
    plain(agent().m_NVRHBA_FCPort_map);
    EXPECT_TRUE(agent().m_bOwnComputerSystem);
    const Ref<Instance> host = only(agent().m_CIM_ComputerSystem_map);
    expect_rows(host.get(),
                {{"CreationClassName", "CIM_ComputerSystem"},
                 {"EnabledState", "0"},
                 {"RequestedState", "12"},
                 {"EnabledDefault", "2"},
                 {"TransitioningToState", "12"},
                 {"Dedicated", "{0}"},
                 {"NameFormat", "Other"},
                 {"ResetCapability", "2"},
                 {"PowerManagementCapabilities", "{0}"},
                 {"OperationalStatus", "{2}"},
                 {"IdentifyingDescriptions", "{NORVANE:IP_ADDRESS,NORVANE:OS_NAME,NORVANE:OS_EXTENDED_INFO}"}});
    EXPECT_EQ(value(host.get(), "Name"), agent().m_hostName.c_str());
    EXPECT_THAT(value(host.get(), "Description"), HasSubstr("with Norvane CMPI HBA Provider v2.5.19-1"));
    EXPECT_THAT(words(), contains_in_order({"up-call to enumerate CIM_ComputerSystem started",
                                            "up-call to enumerate CIM_ComputerSystem created--calling now",
                                            "up-call to enumerate CIM_RegisteredProfile started",
                                            "up-call to enumerate CIM_ComputerSystem created--calling now",
                                            "up-call method failed", "Host Name : " + host_name(),
                                            "Generating an norvane specific m_CIM_ComputerSystem_map[0]",
                                            "All clear -created nvrhba computer system instance"}));
}

TEST_F(AdapterUpdate, TheHostBearsItsOfficialNameAndItsFirstAddress)
{
    write_file("/etc/hosts", "192.0.2.7 storage7.example " + host_name() + "\n");
    write_file("/etc/nsswitch.conf", "hosts: files\n");
    const Ref<Instance> host = only(agent().m_CIM_ComputerSystem_map);
    const std::string system = agent().m_osName.c_str();
    const std::string version = agent().m_osExtendedInfo.c_str();
    EXPECT_EQ(value(host.get(), "Name"), "storage7.example");
    EXPECT_EQ(value(host.get(), "ElementName"), "storage7.example");
    EXPECT_EQ(value(host.get(), "OtherIdentifyingInfo"), "{192.0.2.7," + system + "," + version + "}");
    EXPECT_EQ(value(host.get(), "Description"), system + " with Norvane CMPI HBA Provider v2.5.19-1");
    EXPECT_THAT(words(), contains_in_order({"Host Name : " + host_name(), "Host ipAddress : 192.0.2.7"}));
}

TEST_F(AdapterUpdate, AHostThatDoesNotTellItsNameIsUnknown)
{
    no_host_name = true;
    const Ref<Instance> host = only(agent().m_CIM_ComputerSystem_map);
    EXPECT_EQ(value(host.get(), "Name"), "unknown");
    EXPECT_THAT(value(host.get(), "OtherIdentifyingInfo"), testing::StartsWith("{unknown,"));
    EXPECT_EQ(value(plain(agent().m_NVRHBA_FCPort_map)[0].get(), "SystemName"), "unknown");
    EXPECT_THAT(words(), Contains("Error! gethostname() failed err : " + std::to_string(ENAMETOOLONG) +
                                  " , using 'unknown' for hostname and IP address"));
}

TEST_F(AdapterUpdate, AnUnknownHostNameHasAnUnknownAddress)
{
    write_file("/etc/hosts", "");
    write_file("/etc/nsswitch.conf", "hosts: files\n");
    const Ref<Instance> host = only(agent().m_CIM_ComputerSystem_map);
    EXPECT_EQ(value(host.get(), "Name"), host_name());
    EXPECT_THAT(value(host.get(), "OtherIdentifyingInfo"), testing::StartsWith("{unknown,"));
    EXPECT_THAT(words(), Contains("Error! gethostbyname() failed, using 'unknown' for IP address."));
}

TEST_F(AdapterUpdate, ProfilesAreTiedToTheHostAndToProfileRegistration)
{
    EXPECT_THAT(plain(agent().m_NVRHBA_RegisteredProfile_map), SizeIs(13));
    EXPECT_THAT(plain(agent().m_NVRHBA_ComputerSystemConformsToProfile_map), SizeIs(13));
    const Instances tied = plain(agent().m_NVRHBA_ReferencedProfile_map);
    ASSERT_THAT(tied, SizeIs(11));
    EXPECT_EQ(end(tied[0].get(), "Antecedent", "RegisteredName"), "Profile Registration");
    EXPECT_EQ(end(tied[0].get(), "Dependent", "RegisteredName"), "Software Inventory");
    EXPECT_EQ(end(tied[6].get(), "Antecedent", "RegisteredName"), "FC Initiator Ports");
    EXPECT_EQ(end(tied[6].get(), "Dependent", "RegisteredName"), "FC HBA");
    for (const auto& association : tied)
        EXPECT_STREQ(association->__name_space.c_str(), "root/pg_interop");
    EXPECT_TRUE(plain(agent().m_NVRHBA_BaseServerReferencedProfile_map).empty());
}

TEST_F(AdapterUpdate, AProfileThatIsThereIsTakenAgain)
{
    refresh();
    const std::size_t profiles = agent().m_NVRHBA_RegisteredProfile_map.size();
    words();
    ProviderAgent& held = agent();
    {
        Agent_Wait wait(held);
        Adapter_Update(held).buildProfiles();
    }
    EXPECT_EQ(agent().m_NVRHBA_RegisteredProfile_map.size(), profiles);
    EXPECT_THAT(words(), contains_in_order({"Generating NVRHBA_RegisteredProfile (Profile Registration)",
                                            "Got NVRHBA_RegisteredProfile in the map (Profile Registration)",
                                            "inside createComputerSystemConformsToProfile",
                                            "Insert Failed : m_NVRHBA_ComputerSystemConformsToProfile_map",
                                            "Got NVRHBA_RegisteredProfile in the map (FCHBA Diagnostics)"}));
}

TEST_F(AdapterUpdate, ADualPortCardHasItsAdapterClassesOnceAndThePortsTwice)
{
    scenario("[[adapter]]\nports = 2\n");
    refresh();
    const Instances ports = plain(agent().m_NVRHBA_FCPort_map);
    ASSERT_THAT(ports, SizeIs(2));
    EXPECT_EQ(value(ports[0].get(), "DeviceID"), "10000000C9A00001");
    EXPECT_EQ(value(ports[1].get(), "DeviceID"), "10000000C9A00002");
    EXPECT_THAT(plain(agent().m_NVRHBA_PhysicalPackage_map), SizeIs(1));
    EXPECT_THAT(plain(agent().m_NVRHBA_ProductPhysicalComponent_map), SizeIs(1));
    EXPECT_THAT(plain(agent().m_NVRHBA_PortControllerSystemDevice_map), SizeIs(2));
    EXPECT_EQ(value(plain(agent().m_NVRHBA_PortController_map)[0].get(), "MaxNumberControlled"), "2");
    for (const std::string& word : words())
        EXPECT_THAT(word, Not(HasSubstr("Insert Failed")));
}

TEST_F(AdapterUpdate, TwoPortsOfOneNameAreOneAndTheUpdateEndsThere)
{
    scenario("allow_twins = true\n[[adapter]]\n[[adapter.port]]\nwwpn = \"10000000C9A00001\"\n"
             "[[adapter]]\n[[adapter.port]]\nwwpn = \"10000000C9A00001\"\nwwnn = \"20000000C9A00009\"\n");
    refresh();
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
    const auto said = words();
    EXPECT_THAT(said, Contains("Insert Failed : m_NVRHBA_PCIDevice_map"));
    EXPECT_THAT(said, Not(Contains("Done with the Driver Parameter fetching")));
    EXPECT_TRUE(agent().m_bIsAdapterMapsReady);
    EXPECT_TRUE(agent().m_bIsSANMapsReady);
    ProviderAgent& held = agent();
    Agent_Wait wait(held);
    EXPECT_EQ(held.updateAdapterMaps(), 32769u);
}

TEST_F(AdapterUpdate, AHostWithOtherAdaptersAlonePublishesItsServices)
{
    plain(agent().m_NVRHBA_FCPort_map);
    ProviderAgent& held = agent();
    Agent_Wait wait(held);
    auto& adapters = const_cast<std::vector<Adapter*>&>(held.m_pData->getAdapters());
    Adapter* real = adapters[0];
    Other_Adapter other;
    adapters[0] = &other;
    words();
    EXPECT_EQ(held.updateAdapterMaps(), 0u);
    adapters[0] = real;
    const std::string skipped = "Skippping Adapter [Other-0] since it is not an FC Adapter";
    EXPECT_THAT(words(), contains_in_order({"Starting the SoftwareInstallationService", skipped,
                                            "driverName: , driverVersion: , driverManufacturer: ", skipped,
                                            "Done with the Driver Parameter fetching"}));
    EXPECT_EQ(held.m_NVRHBA_RegisteredProfile_map.size(), 13u);
    EXPECT_EQ(held.m_NVRHBA_SoftwareInstallationService_map.size(), 1u);
    EXPECT_EQ(held.m_NVRHBA_SoftwareIdentity_map.size(), 4u); // provider, tagging, driver, diagnostics
    EXPECT_EQ(held.m_NVRHBA_PhysicalPackage_map.size(), 0u);
    EXPECT_EQ(held.m_NVRHBA_FCPort_map.size(), 0u);
}

TEST_F(AdapterUpdate, AnAdapterOfAnotherKindCountsInTheNumbers)
{
    plain(agent().m_NVRHBA_FCPort_map);
    ProviderAgent& held = agent();
    Agent_Wait wait(held);
    auto& adapters = const_cast<std::vector<Adapter*>&>(held.m_pData->getAdapters());
    Other_Adapter other;
    adapters.insert(adapters.begin(), &other);
    EXPECT_EQ(held.updateAdapterMaps(), 0u);
    adapters.erase(adapters.begin());
    const Instance_Map& devices = held.m_NVRHBA_PCIDevice_map;
    ASSERT_EQ(devices.size(), 1u);
    EXPECT_EQ(value(devices[0], "ElementName"), "Norvane:FCAdapter1");
}

TEST_F(AdapterUpdate, AHostWithoutAdaptersPublishesItsProfilesAlone)
{
    scenario("");
    refresh();
    EXPECT_TRUE(plain(agent().m_NVRHBA_FCPort_map).empty());
    EXPECT_THAT(plain(agent().m_NVRHBA_RegisteredProfile_map), SizeIs(11));
    EXPECT_TRUE(plain(agent().m_NVRHBA_SoftwareIdentity_map).empty());
    EXPECT_THAT(words(), contains_in_order({"FC Adapter Not present !!!!, throw error !!!", "No FC card found",
                                            "Create the Diagnostic classes", "PERF: updateAdapterMaps: cleanExit"}));
}

TEST_F(AdapterUpdate, ASecondRefreshLeavesTheSameInstances)
{
    std::vector<std::size_t> before;
    const auto sizes = [&] {
        return std::vector<std::size_t>{
            agent().m_NVRHBA_FCPort_map.size(),           agent().m_NVRHBA_RegisteredProfile_map.size(),
            agent().m_NVRHBA_DriverParams_map.size(),     agent().m_NVRHBA_DriverParamGlobal_map.size(),
            agent().m_NVRHBA_SoftwareIdentity_map.size(), agent().m_NVRHBA_ComputerSystemConformsToProfile_map.size()};
    };
    plain(agent().m_NVRHBA_FCPort_map);
    before = sizes();
    refresh();
    plain(agent().m_NVRHBA_FCPort_map);
    EXPECT_EQ(sizes(), before);
    EXPECT_EQ(before[2], 12u); // within five seconds of the first
}

TEST_F(AdapterUpdate, AFailingBeaconOrVPDLeavesThePortPublished)
{
    fault("call = \"RM_DiagBeaconState\", status = 2");
    fault("call = \"RM_GetVPD\", status = 1");
    const Ref<Instance> port = only(agent().m_NVRHBA_FCPort_map);
    EXPECT_EQ(value(port.get(), "LocationIndicator"), "4");
    EXPECT_EQ(value(port.get(), "IdentifyingDescriptions"), "{OS Device Name,NORVANE:IEEE_ADDRESS}");
    EXPECT_THAT(words(), contains_in_order({"ERROR: RM_GetVPD call failed, Returned with error code : 1",
                                            "Beaconing not supported on host or adapter"}));
}

TEST_F(AdapterUpdate, AFailingPortOfADualPortCardCostsOnlyItself)
{
    scenario("[[adapter]]\nports = 2\n");
    fault("call = \"RM_GetPortAttributes\", port = 1, status = 1");
    refresh();
    const Instances ports = plain(agent().m_NVRHBA_FCPort_map);
    ASSERT_THAT(ports, SizeIs(1));
    EXPECT_EQ(value(ports[0].get(), "DeviceID"), first_wwpn);
}

TEST_F(AdapterUpdate, ConfigSettingsStandInTheirOrderWithTheValuesInForce)
{
    agent().m_config.setCacheTimeout(12);
    const Instances settings = plain(agent().m_NVRHBA_ProviderConfigSetting_map);
    ASSERT_THAT(settings, SizeIs(3));
    const char* rows[3][6] = {{"Norvane HBA Provider:cachetimeout", "cachetimeout", "5", "30", "10", "12"},
                              {"Norvane HBA Provider:adapterrefresh", "adapterrefresh", "0", "1", "0", "0"},
                              {"Norvane HBA Provider:sanrefresh", "sanrefresh", "0", "1", "1", "1"}};
    const char* names[6] = {"InstanceID", "paramname", "lowRange", "highRange", "def", "current"};
    for (int i = 0; i < 3; i++)
        for (int n = 0; n < 6; n++)
            EXPECT_EQ(value(settings[i].get(), names[n]), rows[i][n]);
}

TEST_F(AdapterUpdate, APortIsFoundByItsNameInAnyCase)
{
    EXPECT_EQ(agent().checkFCPort(first_wwpn), 0); // nothing is there yet
    plain(agent().m_NVRHBA_FCPort_map);
    words();
    EXPECT_EQ(agent().checkFCPort("10000000c9a00001"), 1);
    EXPECT_EQ(agent().checkFCPort("10000000C9A0000"), 0);
    EXPECT_EQ(agent().checkFCPort(nullptr), 0);
    EXPECT_EQ(words(),
              (std::vector<std::string>{"Checking the FCPort", "Valid FCPort WWPN Passed", "Checking the FCPort",
                                        "Could not find the passed FCPort in the map", "Checking the FCPort",
                                        "Could not find the passed FCPort in the map"}));
    EXPECT_EQ(agent().checkLogicalPort(first_wwpn), 1);
    EXPECT_EQ(agent().checkLogicalPort("x"), 0);
}
