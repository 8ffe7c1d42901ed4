// What is published of the nine tests: every column of their table, what is offered where, and what a refused instance
// or a missing fact of the library costs.

#include "classes/NVRHBA_DiagnosticIdentity.h"
#include "classes/NVRHBA_FCHBADiagnosticTest.h"
#include "classes/NVRHBA_RegisteredProfile.h"
#include "simulator/nvrsim.h"
#include "tests/diagnostics/Diagnostics_Test.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::Not;
using testing::SizeIs;

namespace {

class Class_Feature : public Diagnostics {
protected:
    uint32 rebuild_but(Instance_Map& kept)
    {
        Array<Instance*> stays;
        for (std::size_t i = 0; i < kept.size(); i++)
            stays.append(clone(kept[i]));
        NVR_Diagnostics::ClearDiagnosticClassMaps(agent(), 0);
        for (Instance* instance : stays)
            kept.insert(instance);
        words();
        return NVR_Diagnostics::CreateFCHBADiagnosticClassFeature(agent());
    }
    std::string of_port(std::size_t test, const char* reference, const char* property)
    {
        return end(map("AvailableDiagnosticService")[test], reference, property);
    }
};

struct Expected_Test {
    const char* name;
    const char* type;
    const char* testTypes;
    const char* characteristics;
    const char* loopControl;
    const char* loopControlParameter;
    const char* supportedLoopControl;
    const char* supportedExecutionControls;
    const char* others;
    const char* modes;
    const char* description;
    bool hasPattern;
    bool hasTarget;
};

const Expected_Test table[] = {
    {beacon_name, "2", "{2}", "null", "{3}", "{5}", "{3,4}", "{32768}", "null", "{32768}",
     "Test causes a port's LEDs to flash on and off, allowing the port to be easily visually identified", false, false},
    {echo_name, "3", "{3,5}", "{4,10}", "{3}", "{100}", "{3}", "{1}",
     "{TargetDevice,EchoMechanism,LUN,BufferSize,BufferPattern}", "{4}",
     "Test verifies the data path from host to target", true, true},
    {external_name, "4", "{2,5}", "{4,10}", "{3}", "{100}", "{2,3}", "{1}", "{BufferSize,BufferPattern}", "{4}",
     "Test verifies that the entire data path through an FCHBA is working properly", true, false},
    {host_name, "5", "{2}", "{4}", "{3}", "{100}", "{2,3}", "{1}", "{BufferSize,BufferPattern}", "{4}",
     "Test verifies the FC HBA hostbus interface", true, false},
    {internal_name, "6", "{2}", "{4}", "{3}", "{100}", "{2,3}", "{1}", "{BufferSize,BufferPattern}", "{4}",
     "Test verifies the integrity of internal data paths in the FCHBA", true, false},
    {ping_name, "7", "{5}", "{4,10}", "{3}", "{100}", "{3}", "{1}",
     "{TargetDevice,PingMechanism,LUN,BufferSize,BufferPattern}", "{4}",
     "Test verifies the existence and accessibility of devices on the SAN", true, true},
    {status_name, "10", "{4}", "null", "null", "null", "{32768}", "{32768}", "null", "{32768}",
     "Test checks the health of the FCHBA, not including the FC optics", false, false},
    {reset_name, "8", "{2}", "{4}", "null", "null", "{32768}", "{32768}", "null", "{32768}",
     "Test causes the FCHBA to re-initialize itself", false, false},
    {self_name, "9", "{2}", "{4}", "null", "null", "{32768}", "{32768}", "null", "{32768}",
     "Test allows all components of the FCHBA to be tested", false, false},
};

} // namespace

TEST_F(Class_Feature, PublishesEveryColumnOfTheTable)
{
    const std::string system_name = value(static_cast<Instance_Map&>(agent().m_CIM_ComputerSystem_map)[0], "Name");
    for (std::size_t i = 0; i < std::size(table); i++) {
        const Expected_Test& row = table[i];
        SCOPED_TRACE(row.name);
        const std::string name = row.name;
        expect_rows(map("FCHBADiagnosticTest")[i], {{"Name", name},
                                                    {"ElementName", name},
                                                    {"CreationClassName", "NVRHBA_FCHBADiagnosticTest"},
                                                    {"SystemCreationClassName", "CIM_ComputerSystem"},
                                                    {"SystemName", system_name},
                                                    {"FCHBATestType", row.type},
                                                    {"TestTypes", row.testTypes},
                                                    {"Characteristics", row.characteristics}});
        expect_rows(map("FCHBADiagnosticSettingData")[i],
                    {{"InstanceID", name},
                     {"ElementName", name + " SettingData"},
                     {"OverridedSettingData", "0"},
                     {"HaltOnError", "false"},
                     {"ResultPersistence", "4294967295"},
                     {"LogOptions", "{2,6}"},
                     {"LogStorage", "{2}"},
                     {"LoopControl", row.loopControl},
                     {"LoopControlParameter", row.loopControlParameter},
                     {"BufferSizes", row.hasPattern ? "{8}" : "null"},
                     {"BufferPattern", row.hasPattern ? "{49,97,50,98,51,99,52,100}" : "null"},
                     {"TargetDevice", row.hasTarget ? "" : "null"},
                     {"TargetDeviceFormat", row.hasTarget ? "2" : "null"},
                     {"LUN", "0"}});
        expect_rows(map("FCHBADiagnosticServiceCapabilities")[i],
                    {{"InstanceID", name},
                     {"ElementName", name + " Capabilites"},
                     {"SupportedServiceModes", row.modes},
                     {"SupportedLogStorage", "{2}"},
                     {"SupportedLogOptions", "{2,6}"},
                     {"SupportedLoopControl", row.supportedLoopControl},
                     {"SupportedExecutionControls", row.supportedExecutionControls},
                     {"OtherSupportedExecutionControlsDescriptions", row.others}});
        expect_rows(map("HelpService")[i], {{"SystemCreationClassName", "CIM_ComputerSystem"},
                                            {"SystemName", system_name},
                                            {"CreationClassName", "NVRHBA_HelpService"},
                                            {"Name", name},
                                            {"ElementName", name + " HelpService"},
                                            {"DeliveryOptions", "{1}"},
                                            {"OtherDeliveryOptionDescription", "String"},
                                            {"DocumentFormat", "{1}"},
                                            {"OtherDocumentFormatDescription", "String"},
                                            {"DocumentsAvailable", "{" + name + "}"},
                                            {"DocumentDescriptions", "{" + std::string(row.description) + "}"}});
        expect_rows(map("DiagnosticsLog")[i],
                    {{"InstanceID", name},
                     {"ElementName", name + " DiagnosticLog"},
                     {"Description", "NVRHBA_DiagnosticsLog represents the logs for FCHBA CDM tests"}});
        expect_rows(map("DiagElementSettingData")[i], {{"IsDefault", "1"}});
        expect_rows(map("JobElementSettingData")[i], {{"IsDefault", "1"}});
        expect_rows(map("DiagnosticIdentity")[i], {{"InstanceID", name},
                                                   {"Name", name},
                                                   {"ElementName", name + " DiagnosticIdentity"},
                                                   {"Classifications", "{7}"},
                                                   {"ClassificationDescriptions", "{NVR: FCHBA Diagnostics}"},
                                                   {"MajorVersion", "1"},
                                                   {"MinorVersion", "3"},
                                                   {"RevisionNumber", "1"},
                                                   {"VersionString", "1.3.1"},
                                                   {"Manufacturer", "Norvane"},
                                                   {"IsEntity", "true"}});
        EXPECT_EQ(end(map("ServiceAvailableToElement")[i], "ServiceProvided", "Name"), name);
        EXPECT_EQ(end(map("ServiceAvailableToElement")[i], "UserOfService", "FCHBATestType"), row.type);
        const struct {
            const char* map;
            const char* first;
            const char* first_key;
            const char* second;
            const char* second_key;
        } ties[] = {{"DiagElementSettingData", "ManagedElement", "Name", "SettingData", "InstanceID"},
                    {"DiagElementCapabilities", "ManagedElement", "Name", "Capabilities", "InstanceID"},
                    {"DiagElementSoftwareIdentity", "Antecedent", "InstanceID", "Dependent", "Name"},
                    {"UseOfLog", "Antecedent", "InstanceID", "Dependent", "Name"}};
        for (const auto& tie : ties) {
            EXPECT_EQ(end(map(tie.map)[i], tie.first, tie.first_key), name) << tie.map;
            EXPECT_EQ(end(map(tie.map)[i], tie.second, tie.second_key), name) << tie.map;
        }
        EXPECT_EQ(end(map("JobElementSettingData")[i], "ManagedElement", "Name"), name);
        EXPECT_EQ(end(map("JobElementSettingData")[i], "SettingData", "InstanceID"), "NVR:FCHBA JobSettingData");
        EXPECT_EQ(end(map("ServiceAffectsElement")[i], "AffectedElement", "DeviceID"), first_wwpn);
        EXPECT_EQ(end(map("ServiceAffectsElement")[i], "AffectingElement", "Name"), name);
        EXPECT_EQ(end(map("DiagHostedService")[i], "Antecedent", "Name"), system_name);
        EXPECT_EQ(end(map("DiagServiceConformsToProfile")[i], "ConformantStandard", "RegisteredName"),
                  "FCHBA Diagnostics");
        EXPECT_EQ(end(map("DiagHostedService")[i], "Dependent", "Name"), name);
    }
    EXPECT_EQ(map("JobSettingData").size(), 1u);
    EXPECT_EQ(value(map("FCHBADiagnosticSettingData")[1], "EchoMechanism"), "2");
    EXPECT_EQ(value(map("FCHBADiagnosticSettingData")[5], "PingMechanism"), "2");
}

TEST_F(Class_Feature, SaysWhatItDoes)
{
    host("[[adapter]]\n[[adapter]]\n");
    NVR_Diagnostics::ClearDiagnosticClassMaps(agent(), 0);
    words();
    EXPECT_EQ(NVR_Diagnostics::CreateFCHBADiagnosticClassFeature(agent()), 0u);
    const Words said = words();
    EXPECT_THAT(said,
                contains_in_order({"NVR_Diagnostics::CreateFCHBADiagnosticClassFeature",
                                   "Number of FCHBA ManagedElement : 2", "NVR_Diagnostics::GetDiagnosticVersion",
                                   "_DiagVersion: [ 3 ]", "NVRHBA_DiagElementCapabilities instance (NIC) is created",
                                   "NVR_Diagnostics::ISDiagTestSupported"}));
    EXPECT_EQ(std::count(said.begin(), said.end(), "NVR_Diagnostics::GetDiagnosticVersion"), 1);
    EXPECT_EQ(std::count(said.begin(), said.end(), "NVRHBA_DiagElementCapabilities instance (NIC) is created"), 9);
    EXPECT_EQ(std::count(said.begin(), said.end(), "NVR_Diagnostics::ISDiagTestSupported"), 2);
    refresh();
    EXPECT_THAT(words(),
                contains_in_order({"FCHBA Diagnositcs classes created Successfully", "Create the Diagnostic classes"}));
}

TEST_F(Class_Feature, OffersTheTestsOnEachPortInTurn)
{
    host("[[adapter]]\n[[adapter]]\n[[adapter.port]]\nbeacon = \"unavailable\"\n[[adapter]]\n");
    // The second port cannot blink.
    EXPECT_EQ(map("AvailableDiagnosticService").size(), 2u + 8u * 3u);
    EXPECT_EQ(map("ServiceAffectsElement").size(), 2u + 8u * 3u);
    EXPECT_EQ(of_port(0, "UserOfService", "DeviceID"), "10000000C9A00001");
    EXPECT_EQ(of_port(1, "UserOfService", "DeviceID"), "10000000C9A00003");
    EXPECT_EQ(of_port(1, "ServiceProvided", "Name"), beacon_name);
    for (std::size_t port = 0; port < 3; port++) {
        EXPECT_EQ(of_port(2 + port, "UserOfService", "DeviceID"), "10000000C9A0000" + std::to_string(port + 1));
        EXPECT_EQ(of_port(2 + port, "ServiceProvided", "Name"), echo_name);
    }
    EXPECT_EQ(value(map("AvailableDiagnosticService")[0], "EstimatedDurationOfService"), "0");
}

TEST_F(Class_Feature, NeedsAPortController)
{
    scenario("# no adapters\n");
    refresh();
    EXPECT_THAT(words(), contains_in_order({"NVR_Diagnostics::CreateFCHBADiagnosticClassFeature",
                                            "Unable to create the FCHBA Diagnostic feature, No managed element exist",
                                            "FCHBA Diagnositcss either Not Supported/Failed to Create the feature",
                                            "PERF: updateAdapterMaps: cleanExit"}));
    EXPECT_EQ(map("FCHBADiagnosticTest").size(), 0u);
    EXPECT_EQ(NVR_Diagnostics::CreateFCHBADiagnosticClassFeature(agent()), 33068u);
}

TEST_F(Class_Feature, NeedsAVersionOfOneAdapter)
{
    // The first adapter that tells one speaks for all.
    host("[[adapter]]\n[[adapter.port]]\nattributes = { 544 = false }\n"
         "[[adapter]]\n[[adapter.port]]\nattributes = { 544 = 7 }\n"
         "[[adapter]]\n[[adapter.port]]\nattributes = { 544 = 9 }\n");
    for (std::size_t i = 0; i < 9; i++)
        expect_rows(map("DiagnosticIdentity")[i], {{"MinorVersion", "7"}, {"VersionString", "1.7.1"}});
    scenario("[[adapter]]\n[[adapter.port]]\nattributes = { 544 = false }\n[[adapter]]\n[[adapter.port]]\nattributes = "
             "{ 544 = false }\n");
    refresh();
    EXPECT_THAT(words(),
                contains_in_order({"Number of FCHBA ManagedElement : 2", "NVR_Diagnostics::GetDiagnosticVersion",
                                   "NVR_Diagnostics::GetDiagnosticVersion",
                                   "FCHBA Diagnostics are not supported in any of the managed element",
                                   "FCHBA Diagnositcss either Not Supported/Failed to Create the feature"}));
    EXPECT_EQ(map("FCHBADiagnosticTest").size(), 0u);
    EXPECT_EQ(NVR_Diagnostics::CreateFCHBADiagnosticClassFeature(agent()), 40002u);
}

TEST_F(Class_Feature, NeedsAHost)
{
    const Ref<Instance> host(clone(static_cast<Instance_Map&>(agent().m_CIM_ComputerSystem_map)[0]));
    agent().m_CIM_ComputerSystem_map.clear();
    NVR_Diagnostics::ClearDiagnosticClassMaps(agent(), 0);
    EXPECT_EQ(NVR_Diagnostics::CreateFCHBADiagnosticClassFeature(agent()), 40002u);
    EXPECT_EQ(words().back(), "FCHBA Diagnostics are not supported in any of the managed element");
}

TEST_F(Class_Feature, ReadsTheVersionOfAPort)
{
    uint32 version = 77;
    words();
    EXPECT_EQ(NVR_Diagnostics::GetDiagnosticVersion(first_wwpn, nullptr), 32768u);
    EXPECT_THAT(words(), ElementsAre("NVR_Diagnostics::GetDiagnosticVersion", "Invalid Argument"));
    EXPECT_EQ(NVR_Diagnostics::GetDiagnosticVersion(nullptr, &version), 32768u);
    EXPECT_EQ(words().back(), "NVRHBA_DiagTestFunc::Id2HBAName failed");
    EXPECT_EQ(NVR_Diagnostics::GetDiagnosticVersion("none", &version), 32768u);
    EXPECT_EQ(words().back(), "NVRHBA_DiagTestFunc::Id2HBAName failed");
    EXPECT_EQ(NVR_Diagnostics::GetDiagnosticVersion("10000000C9FFFFFF", &version), 32768u);
    EXPECT_EQ(version, 77u);
    EXPECT_EQ(NVR_Diagnostics::GetDiagnosticVersion(first_wwpn, &version), 0u);
    EXPECT_EQ(version, 3u);
    fault("call = \"RM_GetHBAAttributes\", status = 1");
    EXPECT_EQ(NVR_Diagnostics::GetDiagnosticVersion(first_wwpn, &version), 32768u);
}

TEST_F(Class_Feature, ARefusedInstanceTakesItsTestBackAndLeavesTheOthers)
{
    const struct {
        const char* map;
        const char* words;
    } rows[] = {{"FCHBADiagnosticTest", "Insert Failed : NVRHBA_FCHBADiagnosticTest_map"},
                {"HelpService", "Insert Failed : NVRHBA_HelpService_map"},
                {"ServiceAvailableToElement", "Insert Failed : NVRHBA_ServiceAvailableToElement_map"},
                {"DiagnosticIdentity", "Insert Failed : NVRHBA_DiagnosticIdentity_map"},
                {"DiagElementSoftwareIdentity", "Insert Failed : NVRHBA_DiagElementSoftwareIdentity_map"},
                {"FCHBADiagnosticSettingData", "Insert Failed : NVRHBA_FCHBADiagnosticSettingData_map"},
                {"DiagElementSettingData", "Insert Failed : NVRHBA_DiagElementSettingData"},
                {"FCHBADiagnosticServiceCapabilities", "Insert Failed : NVRHBA_FCHBADiagnosticServiceCapabilities_map"},
                {"DiagElementCapabilities", "Insert Failed : NVRHBA_FCHBAElementCapabilities_map"},
                {"JobElementSettingData", "Insert Failed : NVRHBA_JobElementSettingData"},
                {"DiagnosticsLog", "Insert Failed : DiagnosticsLog_map"},
                {"UseOfLog", "Insert Failed : UseOfLog_map"}};
    const Ref<Instance> whole(nullptr);
    for (const auto& row : rows) {
        SCOPED_TRACE(row.map);
        refresh();
        // Of the fifth test one instance is there already.
        Instance_Map& kept = map(row.map);
        const Ref<Instance> fifth(clone(kept[4]));
        kept.clear();
        ASSERT_EQ(kept.insert(clone(fifth.get())), 0);
        EXPECT_EQ(rebuild_but(kept), 0u);
        const Words said = words();
        EXPECT_THAT(said, contains_in_order(
                              {row.words, std::string("Failed to insert the Diag Instances into map for DiagTest ") +
                                              internal_name}));
        EXPECT_EQ(std::count(said.begin(), said.end(), row.words), 1);
        for (const auto& other : rows)
            EXPECT_EQ(map(other.map).size(), std::string(other.map) == row.map ? 9u : 8u) << other.map;
        EXPECT_EQ(map("AvailableDiagnosticService").size(), 8u) << "nothing is offered of it";
        EXPECT_EQ(map("DiagHostedService").size(), 8u);
        EXPECT_EQ(map("JobSettingData").size(), 1u);
    }
}

TEST_F(Class_Feature, TheSharedSettingComesWithTheFirstTestThatStays)
{
    // The first test fails behind the shared setting, and takes it back.
    Instance_Map& logs = map("DiagnosticsLog");
    const Ref<Instance> first_log(clone(logs[0]));
    logs.clear();
    ASSERT_EQ(logs.insert(clone(first_log.get())), 0);
    EXPECT_EQ(rebuild_but(logs), 0u);
    EXPECT_EQ(map("FCHBADiagnosticTest").size(), 8u);
    ASSERT_EQ(map("JobSettingData").size(), 1u);
    expect_rows(first("JobSettingData"), {{"InstanceID", "NVR:FCHBA JobSettingData"},
                                          {"ElementName", "NVR:FCHBA JobSettingData"},
                                          {"DeleteOnCompletion", "false"}});
    EXPECT_EQ(end(first("JobElementSettingData"), "ManagedElement", "Name"), echo_name);
}

TEST_F(Class_Feature, TwinsOfThePortsAreRefusedOneByOne)
{
    const struct {
        const char* map;
        const char* words;
    } rows[] = {{"AvailableDiagnosticService", "Insert Failed : NVRHBA_AvailableDiagnosticService_map"},
                {"ServiceAffectsElement", "Insert Failed : NVRHBA_ServiceAffectsElement_map"},
                {"DiagServiceConformsToProfile", "Insert failed : NVRHBA_ServiceConformsToProfile_map"},
                {"DiagHostedService", "Insert failed : NVRHBA_DiagHostedService_map"}};
    for (const auto& row : rows) {
        refresh();
        EXPECT_EQ(rebuild_but(map(row.map)), 0u);
        const Words said = words();
        EXPECT_EQ(std::count(said.begin(), said.end(), row.words), 9) << row.map;
        EXPECT_EQ(map("FCHBADiagnosticTest").size(), 9u);
        EXPECT_EQ(map(row.map).size(), 9u);
    }
}

TEST_F(Class_Feature, WithoutItsProfileATestIsPublishedAllTheSame)
{
    agent().m_NVRHBA_RegisteredProfile_map.clear();
    NVR_Diagnostics::ClearDiagnosticClassMaps(agent(), 0);
    EXPECT_EQ(NVR_Diagnostics::CreateFCHBADiagnosticClassFeature(agent()), 0u);
    EXPECT_EQ(map("FCHBADiagnosticTest").size(), 9u);
    EXPECT_EQ(map("DiagServiceConformsToProfile").size(), 0u);
    EXPECT_EQ(map("DiagHostedService").size(), 9u);
}

TEST_F(Class_Feature, KindZeroAloneEmptiesTheMaps)
{
    setting(internal_name).OverridedSettingData.set(1);
    run(internal_name);
    const char* const maps[] = {"FCHBADiagnosticTest",
                                "HelpService",
                                "ServiceAvailableToElement",
                                "DiagnosticIdentity",
                                "DiagElementSoftwareIdentity",
                                "FCHBADiagnosticSettingData",
                                "DiagElementSettingData",
                                "FCHBADiagnosticServiceCapabilities",
                                "DiagElementCapabilities",
                                "JobSettingData",
                                "JobElementSettingData",
                                "DiagnosticsLog",
                                "UseOfLog",
                                "AvailableDiagnosticService",
                                "ServiceAffectsElement",
                                "DiagServiceConformsToProfile",
                                "DiagHostedService",
                                "ConcreteJob",
                                "OwningJobElement",
                                "AffectedJobElement",
                                "DiagnosticServiceRecord",
                                "DiagnosticCompletionRecord",
                                "DiagnosticSettingDataRecord",
                                "LogManagesRecord",
                                "CorrespondingSettingDataRecord",
                                "RecordAppliesToElement"};
    for (const int kind : {1, 2, -1}) {
        NVR_Diagnostics::ClearDiagnosticClassMaps(agent(), kind);
        for (const char* name : maps)
            EXPECT_GT(map(name).size(), 0u) << name;
    }
    NVR_Diagnostics::ClearDiagnosticClassMaps(agent(), 0);
    for (const char* name : maps)
        EXPECT_EQ(map(name).size(), 0u) << name;
}

TEST_F(Class_Feature, ARebuildForgetsRunsAndOverrides)
{
    setting(internal_name).OverridedSettingData.set(1);
    setting(internal_name).LoopControlParameter.set(Array<String>{"7"});
    job_setting().DeleteOnCompletion.set(true);
    run(internal_name);
    refresh();
    expect_rows(&setting(internal_name), {{"OverridedSettingData", "0"}, {"LoopControlParameter", "{100}"}});
    expect_rows(&job_setting(), {{"DeleteOnCompletion", "false"}});
    EXPECT_EQ(map("DiagnosticServiceRecord").size(), 0u);
    EXPECT_EQ(map("DiagnosticSettingDataRecord").size(), 0u);
}
