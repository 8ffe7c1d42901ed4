// What is installed and what can be asked of it: services, their capabilities, software identities, log, access point.

#include <unistd.h>

#include "tests/agent/expect_rows.h"
#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::Not;
using testing::SizeIs;

namespace {

class Software : public SimulatedHost {
protected:
    Software() { write_file(library_folder() + "/libcurl.so", "no library"); }
    ~Software() override
    {
        settle();
        unload();
    }

    Ref<Instance> only(const Instance_Map& map)
    {
        const Instances all = plain(map);
        EXPECT_EQ(all.size(), 1u);
        return all.size() == 1 ? all[0] : Ref<Instance>(create(map.meta_class(), true));
    }
    std::string host() { return value(static_cast<const Instance_Map&>(agent().m_CIM_ComputerSystem_map)[0], "Name"); }
    /// The identity of that InstanceID, or null.
    const Instance* identity(const std::string& id)
    {
        const Instance_Map& map = agent().m_NVRHBA_SoftwareIdentity_map;
        for (std::size_t i = 0; i < map.size(); i++)
            if (value(map[i], "InstanceID") == id) return map[i];
        return nullptr;
    }
    void refresh() { plain(agent().m_NVRHBA_FCPort_map); }
};

struct Service_Row {
    const Instance_Map& map;
    const char* class_name;
    const char* name;
    const char* description;
    const char* start_mode;
    const char* status;
    const char* descriptions;
};

} // namespace

TEST_F(Software, EachServiceShowsItselfStarted)
{
    ASSERT_EQ(load(), 0);
    refresh();
    ProviderAgent& a = agent();
    const Service_Row rows[] = {
        {a.m_NVRHBA_SoftwareInstallationService_map, "NVRHBA_SoftwareInstallationService",
         "NVRHBA_FCSoftwareInstallationService", "Norvane FC HBA Software Installation Service", "Automatic", "ok",
         "{ok}"},
        {a.m_NVRHBA_FCHBAWWNService_map, "NVRHBA_FCHBAWWNService", "NVRHBA_FCHBAWWNService",
         "Norvane FC HBA WWN Management Service", "Automatic", "Ok", "{ok}"},
        {a.m_NVRHBA_FCTagService_map, "NVRHBA_FCTagService", "NVRHBA_FCTagService", "Norvane FC HBA Tagging Service",
         "null", "null", "{ok}"},
        {a.m_NVRHBA_BootBIOSService_map, "NVRHBA_BootBIOSService", "NVRHBA_BootBIOSService",
         "Norvane FC HBA Boot BIOS Service", "Automatic", "Ok", "{ok}"},
        {a.m_NVRHBA_FCHBADriverParamService_map, "NVRHBA_FCHBADriverParamService", "NVRHBA_FCHBADriverParamService",
         "Norvane FC HBA Set Driver Parameters Service", "Automatic", "OK", "{OK}"},
    };
    for (const Service_Row& row : rows) {
        SCOPED_TRACE(row.class_name);
        expect_rows(only(row.map).get(), {
                                             {"SystemCreationClassName", "CIM_ComputerSystem"},
                                             {"SystemName", host()},
                                             {"CreationClassName", row.class_name},
                                             {"Name", row.name},
                                             {"Description", row.description},
                                             {"ElementName", row.description},
                                             {"StartMode", row.start_mode},
                                             {"Started", "true"},
                                             {"EnabledState", "2"},
                                             {"RequestedState", "2"},
                                             {"EnabledDefault", "2"},
                                             {"TimeOfLastStateChange", "00000000000000.000000:000"},
                                             {"OperationalStatus", "{2}"},
                                             {"HealthState", "5"},
                                             {"Status", row.status},
                                             {"StatusDescriptions", row.descriptions},
                                         });
    }
}

TEST_F(Software, WithoutCurlOnlyFilesCanBeInstalled)
{
    ASSERT_EQ(load(), 0);
    expect_rows(only(agent().m_NVRHBA_SoftwareInstallationServiceCapabilities_map).get(),
                {
                    {"InstanceID", "NVR:HBASoftwareInstallationServiceCapabilities"},
                    {"Description", "Norvane Software Installation Service Capabilities"},
                    {"ElementName", "Norvane Software Installation Service Capabilities"},
                    {"SupportedURISchemes", "{3}"},
                    {"SupportedTargetTypes", "{FC HBA}"},
                    {"SupportedAsynchronousActions", "{2}"},
                    {"SupportedSynchronousActions", "{4,5}"},
                    {"SupportedExtendedResourceTypes", "{2}"},
                    {"CanAddToCollection", "false"},
                    {"SupportedInstallOptions", "{2,3,4,5,6,7,11}"},
                    {"OtherSupportedExtendedResourceTypeDescriptions", "{Norvane FC firmware files}"},
                    {"SupportedExtendedResourceTypesMajorVersions", "{0}"},
                    {"SupportedExtendedResourceTypesMinorVersions", "{0}"},
                    {"SupportedExtendedResourceTypesRevisionNumbers", "{0}"},
                    {"SupportedExtendedResourceTypesBuildNumbers", "{0}"},
                });
    EXPECT_THAT(words(),
                contains_in_order({"Starting the SoftwareInstallationService", "Searching for /lib Curl on the machine",
                                   "Searching for /usr/lib/ Curl on the machine",
                                   "Checking with libcurl.so system location for libcurl",
                                   "Checking with curl.dll windows system location for libcurl",
                                   "libcurl is not present. only file type URIScheme will be supported"}));
}

TEST_F(Software, WithCurlMoreCanBeFetched)
{
    nvrtest::remove(library_folder() + "/libcurl.so");
    nvrtest::make_link(NVRSIM_BUILD "/lib/libHBAAPI.so", library_folder() + "/libcurl.so");
    ASSERT_EQ(load(), 0);
    EXPECT_EQ(value(only(agent().m_NVRHBA_SoftwareInstallationServiceCapabilities_map).get(), "SupportedURISchemes"),
              "{3,4,5,6,8}");
    EXPECT_THAT(words(), Not(Contains("libcurl is not present. only file type URIScheme will be supported")));
}

TEST_F(Software, ServicesAreTiedToTheHostAndThePort)
{
    ASSERT_EQ(load(), 0);
    refresh();
    ProviderAgent& a = agent();
    const struct {
        const Instance_Map& map;
        const char *host, *service;
    } rows[] = {
        {a.m_NVRHBA_HostedInstallationService_map, "Antecedent", "Dependent"},
        {a.m_NVRHBA_InstallServiceAffectsSystem_map, "AffectedElement", "AffectingElement"},
        {a.m_NVRHBA_HostedFCHBAWWNService_map, "Antecedent", "Dependent"},
        {a.m_NVRHBA_FCHBAWWNServiceAffectsSystem_map, "AffectedElement", "AffectingElement"},
        {a.m_NVRHBA_HostedFCTagService_map, "Antecedent", "Dependent"},
        {a.m_NVRHBA_HostedBootBIOSService_map, "Antecedent", "Dependent"},
        {a.m_NVRHBA_BootBIOSServiceAffectsSystem_map, "AffectedElement", "AffectingElement"},
        {a.m_NVRHBA_HostedFCHBADriverParamService_map, "Antecedent", "Dependent"},
        {a.m_NVRHBA_FCHBADriverParamServiceAffectsSystem_map, "AffectedElement", "AffectingElement"},
    };
    for (const auto& row : rows) {
        SCOPED_TRACE(row.map.meta_class()->name);
        const Ref<Instance> link = only(row.map);
        EXPECT_EQ(end(link.get(), row.host, "Name"), host());
        EXPECT_THAT(end(link.get(), row.service, "Name"), testing::EndsWith("Service"));
    }
    for (const Instance_Map* map : std::initializer_list<const Instance_Map*>{
             &a.m_NVRHBA_InstallServiceAffectsFCPort_map, &a.m_NVRHBA_BootBIOSServiceAffectsFCPort_map,
             &a.m_NVRHBA_FCHBAWWNServiceAffectsFCPort_map, &a.m_NVRHBA_FCHBADriverParamServiceAffectsFCPort_map,
             &a.m_NVRHBA_FCTagServiceAffectsPort_map}) {
        SCOPED_TRACE(map->meta_class()->name);
        const Ref<Instance> link = only(*map);
        EXPECT_EQ(end(link.get(), "AffectedElement", "DeviceID"), first_wwpn);
        EXPECT_THAT(end(link.get(), "AffectingElement", "Name"), testing::EndsWith("Service"));
    }
    EXPECT_EQ(end(only(a.m_NVRHBA_ElementCapabilities_map).get(), "Capabilities", "InstanceID"),
              "NVR:HBASoftwareInstallationServiceCapabilities");
    EXPECT_EQ(end(only(a.m_NVRHBA_InstallServiceConformsToProfile_map).get(), "ConformantStandard", "InstanceID"),
              "NVR:Software Update");
    EXPECT_EQ(end(only(a.m_NVRHBA_FCTagElementSoftwareIdentity_map).get(), "Antecedent", "InstanceID"),
              "FC HBA TAG v0 0 0");
}

TEST_F(Software, IdentitiesOfTheProviderTheDriverAndItsTools)
{
    ASSERT_EQ(load(), 0);
    refresh();
    const std::string provider = "Norvane CMPI HBA Provider v2.5.19-1";
    expect_rows(identity(provider), {{"ElementName", provider},
                                     {"Name", provider},
                                     {"Description", "Norvane CMPI HBA Provider"},
                                     {"VersionString", "2.5.19-1"},
                                     {"Manufacturer", "Norvane Corporation"},
                                     {"Classifications", "{4}"},
                                     {"ClassificationDescriptions", "{CMPI HBA CIM Provider}"},
                                     {"IsEntity", "true"},
                                     {"MajorVersion", "2"},
                                     {"MinorVersion", "5"},
                                     {"RevisionNumber", "19"},
                                     {"BuildNumber", "1"}});
    const std::string tag = "FC HBA TAG v0 0 0";
    expect_rows(identity(tag), {{"ElementName", tag},
                                {"Name", tag},
                                {"Description", "Norvane FC TAG Software"},
                                {"VersionString", "0"},
                                {"Manufacturer", "Norvane Corporation"},
                                {"Classifications", "{3}"},
                                {"ClassificationDescriptions", "{FC Frames Tagging Software}"},
                                {"IsEntity", "true"}});
    expect_rows(identity("NVR FC HBA: Driver nvrfc v8.3.7.18"),
                {{"ElementName", "nvrfc v8.3.7.18"},
                 {"Name", "nvrfc v8.3.7.18"},
                 {"Description", "Norvane HBA Driver"},
                 {"VersionString", "8.3.7.18"},
                 {"Manufacturer", "Norvane Corporation"},
                 {"Classifications", "{2}"},
                 {"ClassificationDescriptions", "{FC HBA Driver}"},
                 {"IsEntity", "true"},
                 {"IdentityInfoValue", "{nvrfc,8.3.7.18,1}"},
                 {"IdentityInfoType", "{NORVANE:DRIVER_NAME,NORVANE:DRIVER_VERSION,NORVANE:TSFC_DRIVER_TYPE}"}});
    const std::string diagnostics = "NVRHBA: Diagnostics v3";
    expect_rows(identity(diagnostics), {{"ElementName", diagnostics},
                                        {"Name", diagnostics},
                                        {"Description", "NVRHBA: Diagnostics"},
                                        {"VersionString", "3"},
                                        {"Manufacturer", "null"},
                                        {"Classifications", "{7}"},
                                        {"ClassificationDescriptions", "{NVRHBA Diagnostics}"},
                                        {"IsEntity", "true"},
                                        {"IdentityInfoValue", "{NVRHBA: Diagnostics,3}"},
                                        {"IdentityInfoType", "null"}});
    EXPECT_THAT(words(),
                Contains("driverName: nvrfc, driverVersion: 8.3.7.18, driverManufacturer: Norvane Corporation"));
}

TEST_F(Software, IdentitiesOfAPortsFirmware)
{
    ASSERT_EQ(load(), 0);
    refresh();
    const std::string of = " FC2162 10000000C9A00001";
    expect_rows(identity("NVR FC HBA:Firmware:v2.01a4" + of), {{"ElementName", "FC HBA Firmware v2.01a4" + of},
                                                               {"Name", "FC HBA Firmware v2.01a4" + of},
                                                               {"Description", "Norvane FC HBA Firmware"},
                                                               {"VersionString", "2.01a4"},
                                                               {"Manufacturer", "Norvane Corporation"},
                                                               {"Classifications", "{10}"},
                                                               {"ClassificationDescriptions", "{FC HBA Firmware}"},
                                                               {"IsEntity", "true"},
                                                               {"OperationalFirmware", "SLI-3 Overlay"},
                                                               {"ULPFirmwareVersion", "2.01a4"},
                                                               {"ULPFirmwareName", "FC2D2.01a4"},
                                                               {"SPFirmwareVersion", "2.01a4"},
                                                               {"SPFirmwareName", "SP"},
                                                               {"MajorVersion", "2"},
                                                               {"MinorVersion", "0"},
                                                               {"RevisionNumber", "1"},
                                                               {"BuildNumber", "4"},
                                                               {"ReleaseType", "a"},
                                                               {"TestReleaseVersion", ""}});
    const std::string kernel = "Firmware Kernel v1.40a3" + of;
    expect_rows(identity(kernel), {{"ElementName", kernel},
                                   {"Name", "null"},
                                   {"Description", "Norvane FC HBA Firmware Kernel"},
                                   {"VersionString", "1.40a3"},
                                   {"Manufacturer", "Norvane Corporation"},
                                   {"Classifications", "{1}"},
                                   {"ClassificationDescriptions", "{Firmware Kernel}"},
                                   {"IsEntity", "true"},
                                   {"BuildNumber", "3"}});
    const std::string boot = "Boot Code - Expansion ROM v2.12a2" + of;
    expect_rows(identity(boot), {{"ElementName", boot},
                                 {"Name", "null"},
                                 {"Description", "Norvane FC HBA Boot Code"},
                                 {"VersionString", "2.12a2"},
                                 {"Manufacturer", "Norvane Corporation"},
                                 {"Classifications", "{11}"},
                                 {"ClassificationDescriptions", "{BIOS/FCode}"},
                                 {"FCUniversalVersion", "2.12A2"},
                                 {"FC_X86_BIOSVersion", "2.12a2"},
                                 {"FC_EFIVersion", "4.30a0"},
                                 {"FC_FCODEVersion", "3.10a1"},
                                 {"IsEntity", "true"}});
    const std::string stub = "Functional Firmware stub v1.20a8" + of;
    expect_rows(identity(stub), {{"ElementName", stub},
                                 {"Name", "null"},
                                 {"Description", "Norvane Functional Firmware"},
                                 {"VersionString", "1.20a8"},
                                 {"Manufacturer", "Norvane Corporation"},
                                 {"Classifications", "{1}"},
                                 {"ClassificationDescriptions", "{Functional Firmware Stub}"},
                                 {"IsEntity", "true"}});
    EXPECT_THAT(
        words(),
        contains_in_order(
            {"Firmware- Parsing VersionString", "Firmware- Parsing Success", "Firmware- Parsing Done",
             "Generating NVRHBA_ElementSoftwareIdentity (Software Identity (Firmware) FC2162:10000000C9A00001)",
             "Generating NVRHBA_SoftwareConformsToProfile (Firmware FC2162:10000000C9A00001, Software Inventory)",
             "FirmwareKernel- Parsing VersionString",
             "Generating NVRHBA_ElementSoftwareIdentity (Software Identity (Firmware Kernel) FC2162:10000000C9A00001)",
             "BootCodeExpansionROM- Parsing VersionString",
             "Generating NVRHBA_ElementSoftwareIdentity (Software Identity (Boot Code - Expansion ROM) "
             "FC2162:10000000C9A00001)",
             "FunctionalFirmware- Parsing VersionString",
             "Generating NVRHBA_ElementSoftwareIdentity (Software Identity (Functional Firmware stub) "
             "FC2162:10000000C9A00001)",
             "Generating NVRHBA_ElementSoftwareIdentity (Software Identity (Driver) FC2162:10000000C9A00001)"}));
}

TEST_F(Software, IdentitiesOfAPortAreTiedWithTheirStatus)
{
    ASSERT_EQ(load(), 0);
    const Instances links = plain(agent().m_NVRHBA_ElementSoftwareIdentity_map);
    ASSERT_THAT(links, SizeIs(5));
    for (std::size_t i = 0; i < 5; i++) {
        expect_rows(links[i].get(),
                    {{"UpgradeCondition", "3"}, {"ElementSoftwareStatus", i == 4 ? "{2,3,9}" : "{2,3,6}"}});
        EXPECT_EQ(end(links[i].get(), "Dependent", "DeviceID"), first_wwpn);
    }
    EXPECT_EQ(end(links[4].get(), "Antecedent", "InstanceID"), "NVR FC HBA: Driver nvrfc v8.3.7.18");
    const Ref<Instance> provider = only(agent().m_NVRHBA_ProviderSoftwareIdentity_map);
    EXPECT_STREQ(provider->__name_space.c_str(), "") << "it alone has none";
    EXPECT_EQ(value(provider.get(), "ElementSoftwareStatus"), "{2,3,6}");
    EXPECT_EQ(value(provider.get(), "UpgradeCondition"), "3");
}

TEST_F(Software, AVersionOfAnotherShapeHasNoNumbers)
{
    scenario("[[adapter]]\nfirmware_version = \"12.1 beta\"\n");
    ASSERT_EQ(load(), 0);
    refresh();
    expect_rows(identity("NVR FC HBA:Firmware:v12.1 beta FC2162 10000000C9A00001"), {{"VersionString", "12.1 beta"},
                                                                                     {"MajorVersion", "null"},
                                                                                     {"MinorVersion", "null"},
                                                                                     {"RevisionNumber", "null"},
                                                                                     {"BuildNumber", "null"},
                                                                                     {"ReleaseType", "null"}});
    EXPECT_THAT(words(), contains_in_order({"Firmware- Parsing VersionString", "Firmware- Parsing Done",
                                            "FirmwareKernel- Parsing Success"}));
}

TEST_F(Software, PortsOfOneAdapterHaveIdentitiesOfTheirOwn)
{
    scenario("[[adapter]]\nports = 2\n");
    ASSERT_EQ(load(), 0);
    refresh();
    EXPECT_NE(identity("NVR FC HBA:Firmware:v2.01a4 FC2162 10000000C9A00001"), nullptr);
    EXPECT_NE(identity("NVR FC HBA:Firmware:v2.01a4 FC2162 10000000C9A00002"), nullptr);
    EXPECT_EQ(agent().m_NVRHBA_SoftwareIdentity_map.size(), 4u + 2 * 4) << "the provider's and the driver's once";
}

TEST_F(Software, TheProvidersLogShowsTheLoggersState)
{
    ASSERT_EQ(load(), 0);
    refresh();
    const Instance_Map& logs = agent().m_NVRHBA_RecordLog_map;
    ASSERT_GE(logs.size(), 1u);
    expect_rows(logs[0], {{"InstanceID", "NVRHBA:ProviderLog:" + host()},
                          {"MaxNumberOfRecords", "1024"},
                          {"LogState", "4"},
                          {"OverwritePolicy", "2"},
                          {"EnabledState", "2"},
                          {"RequestedState", "2"},
                          {"OperationalStatus", "{2}"},
                          {"HealthState", "5"},
                          {"Name", "Record logs for Norvane CIM Provider"},
                          {"ElementName", "Record logs for Norvane CIM Provider"},
                          {"LogLevel", std::to_string(CLogger::instance()->getLevel())},
                          {"LogMode", std::to_string(CLogger::instance()->getMode())}});
    expect_rows(only(agent().m_NVRHBA_EnabledRecordLogCapabilities_map).get(),
                {{"InstanceID", "NVRHBA provider log capabilities"},
                 {"RequestedStatesSupported", "{2,3}"},
                 {"LogParamsSupported", "{2,3}"},
                 {"ElementNameEditSupported", "false"}});
    EXPECT_EQ(end(only(agent().m_NVRHBA_RecordLogCapabilities_map).get(), "ManagedElement", "InstanceID"),
              "NVRHBA:ProviderLog:" + host());
    const Ref<Instance> use = only(agent().m_NVRHBA_ProviderUseOfLog_map);
    EXPECT_EQ(end(use.get(), "Antecedent", "InstanceID"), "NVRHBA:ProviderLog:" + host());
    EXPECT_EQ(end(use.get(), "Dependent", "InstanceID"), "Norvane CMPI HBA Provider v2.5.19-1");
    EXPECT_EQ(end(only(agent().m_NVRHBA_RecordLogConformsToProfile_map).get(), "ConformantStandard", "InstanceID"),
              "NVR:Record Log");
}

TEST_F(Software, ADisabledLogReadsDisabled)
{
    ASSERT_EQ(load(), 0);
    CLogger::instance()->disable();
    refresh();
    const Instance_Map& logs = agent().m_NVRHBA_RecordLog_map;
    ASSERT_GE(logs.size(), 1u);
    expect_rows(logs[0], {{"EnabledState", "3"}, {"RequestedState", "5"}});
}

TEST_F(Software, ALauncherInTheSettingsIsAnAccessPoint)
{
    write_file("/etc/nvr_smis.conf", "# the launcher\n\n  https://host:8443/launch\n");
    ASSERT_EQ(load(), 0);
    refresh();
    expect_rows(only(agent().m_NVRHBA_RemoteServiceAccessPoint_map).get(),
                {{"Description", "Fabrimon WebLaunch URL"},
                 {"Name", "Fabrimon"},
                 {"ElementName", "NVR FC HBA:Fabrimon Management Interface"},
                 {"SystemCreationClassName", "CIM_ComputerSystem"},
                 {"SystemName", host()},
                 {"CreationClassName", "NVRHBA_RemoteServiceAccessPoint"},
                 {"AccessInfo", "https://host:8443/launch"},
                 {"InfoFormat", "200"}});
    EXPECT_EQ(end(only(agent().m_NVRHBA_RemoteHostedAccessPoint_map).get(), "Dependent", "Name"), "Fabrimon");
    const Ref<Instance> available = only(agent().m_NVRHBA_SAPAvailableForElement_map);
    EXPECT_EQ(end(available.get(), "AvailableSAP", "Name"), "Fabrimon");
    EXPECT_EQ(end(available.get(), "ManagedElement", "DeviceID"), first_wwpn);
    EXPECT_THAT(words(), Contains("Remote Hosted Service Access Point"));
}

TEST_F(Software, WithoutALauncherThereIsNoAccessPoint)
{
    nvrtest::remove("/etc/nvr_smis.conf");
    ASSERT_EQ(load(), 0);
    EXPECT_THAT(plain(agent().m_NVRHBA_RemoteServiceAccessPoint_map), SizeIs(0));
    EXPECT_EQ(agent().m_NVRHBA_RemoteHostedAccessPoint_map.size(), 0u);
    EXPECT_EQ(agent().m_NVRHBA_SAPAvailableForElement_map.size(), 0u);
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
}
