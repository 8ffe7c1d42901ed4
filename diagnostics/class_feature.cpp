// What is published of the tests, for as long as the adapters stay as they are.
#include "diagnostics/NVR_Diagnostics.h"

#include <initializer_list>
#include <vector>

#include "agent/ProviderAgent.h"
#include "agent/associations.h"
#include "agent/instance_table.h"
#include "agent/library_name.h"
#include "classes/NVRHBA_AvailableDiagnosticService.h"
#include "classes/NVRHBA_DiagElementSettingData.h"
#include "classes/NVRHBA_DiagnosticIdentity.h"
#include "classes/NVRHBA_DiagnosticsLog.h"
#include "classes/NVRHBA_FCHBADiagnosticServiceCapabilities.h"
#include "classes/NVRHBA_FCHBADiagnosticSettingData.h"
#include "classes/NVRHBA_FCHBADiagnosticTest.h"
#include "classes/NVRHBA_HelpService.h"
#include "classes/NVRHBA_JobElementSettingData.h"
#include "classes/NVRHBA_JobSettingData.h"
#include "classes/NVRHBA_PortController.h"
#include "classes/NVRHBA_RegisteredProfile.h"
#include "diagnostics/NVR_DiagTestFunc.h"
#include "diagnostics/diagnostic_tests.h"
#include "foundation/AttributeBlock.h"
#include "foundation/CLogger.h"

namespace cimple {

namespace {

constexpr uint32 status_no_element = 33068;
constexpr uint32 status_not_supported = 40002;
constexpr uint32 status_no_version = 32768;
constexpr uint32 attributes_size = 4096;
constexpr uint16 major_version = 1;
constexpr uint16 revision = 1;
constexpr uint16 supports_halt_on_error = 4;
constexpr uint16 supports_no_mode = 32768;
constexpr const char* profile_name = "FCHBA Diagnostics";

/// What all tests share.
struct Shared {
    const Instance* host;
    String hostClass;
    String hostName;
    const Instance* profile; // null: the host has none
    uint16 version;
    Ref<NVRHBA_JobSettingData> jobSetting; // lives as long as the loop; the map gets a copy
};

template <class T, class V, std::size_t capacity>
void setFew(Property<Array<T>>& property, const Few<V, capacity>& row)
{
    if (row.size() == 0) return;
    property.null = 0;
    for (std::size_t i = 0; i < row.size(); i++)
        property.value.append(row.values[i]);
}

template <class T>
void setKeys(T& instance, const Shared& shared, const Diagnostic_Test& row, const char* className)
{
    set(instance.SystemCreationClassName, shared.hostClass);
    set(instance.SystemName, shared.hostName);
    set(instance.CreationClassName, className);
    set(instance.Name, row.name);
}

Ref<NVRHBA_FCHBADiagnosticTest> makeTest(const Shared& shared, const Diagnostic_Test& row)
{
    auto test = make<NVRHBA_FCHBADiagnosticTest>();
    setKeys(*test, shared, row, "NVRHBA_FCHBADiagnosticTest");
    set(test->ElementName, row.name);
    set(test->FCHBATestType, row.type);
    setFew(test->TestTypes, row.testTypes);
    setFew(test->Characteristics, row.characteristics);
    return test;
}

Ref<NVRHBA_HelpService> makeHelp(const Shared& shared, const Diagnostic_Test& row)
{
    auto help = make<NVRHBA_HelpService>();
    setKeys(*help, shared, row, "NVRHBA_HelpService");
    set(help->ElementName, text("%s HelpService", row.name));
    set(help->DeliveryOptions, {1});
    set(help->OtherDeliveryOptionDescription, "String");
    set(help->DocumentFormat, {1});
    set(help->OtherDocumentFormatDescription, "String");
    set(help->DocumentsAvailable, {row.name});
    set(help->DocumentDescriptions, {row.description});
    return help;
}

Ref<NVRHBA_DiagnosticIdentity> makeIdentity(const Shared& shared, const Diagnostic_Test& row)
{
    auto identity = make<NVRHBA_DiagnosticIdentity>();
    set(identity->InstanceID, row.name);
    set(identity->Name, row.name);
    set(identity->ElementName, text("%s DiagnosticIdentity", row.name));
    set(identity->MajorVersion, major_version);
    set(identity->MinorVersion, shared.version);
    set(identity->RevisionNumber, revision);
    set(identity->VersionString, text("%d.%d.%d", major_version, shared.version, revision));
    set(identity->Manufacturer, "Norvane");
    set(identity->Classifications, {7});
    set(identity->ClassificationDescriptions, {"NVR: FCHBA Diagnostics"});
    set(identity->IsEntity, true);
    return identity;
}

Ref<NVRHBA_FCHBADiagnosticSettingData> makeSetting(const Diagnostic_Test& row)
{
    auto setting = make<NVRHBA_FCHBADiagnosticSettingData>();
    set(setting->InstanceID, row.name);
    set(setting->ElementName, text("%s SettingData", row.name));
    set(setting->OverridedSettingData, 0);
    if (row.haltOnError < 2) set(setting->HaltOnError, row.haltOnError);
    set(setting->ResultPersistence, 4294967295u);
    set(setting->LogOptions, {2, 6});
    set(setting->LogStorage, {2});
    setFew(setting->LoopControl, row.loopControl);
    setFew(setting->LoopControlParameter, row.loopControlParameter);
    if (row.takesPattern()) {
        set(setting->BufferSizes, {8});
        set(setting->BufferPattern, {'1', 'a', '2', 'b', '3', 'c', '4', 'd'});
    }
    if (row.takesTarget()) {
        set(setting->LUN, 0);
        set(setting->TargetDevice, "");
        set(setting->TargetDeviceFormat, "2");
    }
    if (row.id == Test_Id::echo) set(setting->EchoMechanism, 2);
    if (row.id == Test_Id::ping) set(setting->PingMechanism, 2);
    return setting;
}

Ref<NVRHBA_FCHBADiagnosticServiceCapabilities> makeCapabilities(const Diagnostic_Test& row)
{
    auto capabilities = make<NVRHBA_FCHBADiagnosticServiceCapabilities>();
    set(capabilities->InstanceID, row.name);
    set(capabilities->ElementName, text("%s Capabilites", row.name));
    set(capabilities->SupportedServiceModes, {row.takesPattern() ? supports_halt_on_error : supports_no_mode});
    set(capabilities->SupportedLogStorage, {2});
    set(capabilities->SupportedLogOptions, {2, 6});
    setFew(capabilities->SupportedLoopControl, row.supportedLoopControl);
    setFew(capabilities->SupportedExecutionControls, row.supportedExecutionControls);
    setFew(capabilities->OtherSupportedExecutionControlsDescriptions, row.otherExecutionControls);
    return capabilities;
}

Ref<NVRHBA_JobSettingData> makeJobSetting()
{
    auto setting = make<NVRHBA_JobSettingData>();
    set(setting->InstanceID, "NVR:FCHBA JobSettingData");
    set(setting->ElementName, "NVR:FCHBA JobSettingData");
    set(setting->DeleteOnCompletion, false);
    return setting;
}

Ref<NVRHBA_DiagnosticsLog> makeLog(const Diagnostic_Test& row)
{
    auto log = make<NVRHBA_DiagnosticsLog>();
    set(log->InstanceID, row.name);
    set(log->ElementName, text("%s DiagnosticLog", row.name));
    set(log->Description, "NVRHBA_DiagnosticsLog represents the logs for FCHBA CDM tests");
    return log;
}

/// The instances of one test on their way into their maps: all or none of them.
class Insertions {
public:
    explicit Insertions(ProviderAgent& agent) : m_agent(agent) {}

    /// The instance stays good for ties until the insert.
    template <class T>
    const T* add(Map<T>& map, Ref<T> instance, const char* failure)
    {
        const T* added = instance.get();
        m_list.push_back({map, Ref<Instance>(instance.release()), failure});
        return added;
    }

    Instance* tie(Link link, const Instance* first, const Instance* second)
    {
        Ref<Instance> association = makeAssociation(m_agent, link, first, second);
        Instance* tied = association.get();
        m_list.push_back({link_row(link).map(m_agent), std::move(association), link_row(link).failure});
        return tied;
    }

    /// False if one is refused: none of them is in its map then.
    bool insertAll()
    {
        std::size_t done = 0;
        while (done < m_list.size() && insertNext(m_list[done]))
            done++;
        if (done == m_list.size()) return true;
        takeOut(done);
        return false;
    }

private:
    struct Insertion {
        Instance_Map& map;
        Ref<Instance> instance;
        const char* failure;
    };

    static bool insertNext(Insertion& next) { return insertOrLog(next.map, std::move(next.instance), next.failure); }

    /// Each map gives up its last instance, which is the one that was put in.
    void takeOut(std::size_t done)
    {
        while (done-- > 0) {
            Instance_Map& map = m_list[done].map;
            const Ref<Instance> last(map[map.size() - 1]);
            map.remove_at(map.size() - 1);
        }
    }

    ProviderAgent& m_agent;
    std::vector<Insertion> m_list;
};

/// Makes the instances of a test, in the order of their insertion.
Insertions makeInstances(ProviderAgent& agent, Shared& shared, const Diagnostic_Test& row)
{
    Insertions made(agent);
    const auto* test = made.add(agent.m_NVRHBA_FCHBADiagnosticTest_map, makeTest(shared, row),
                                "Insert Failed : NVRHBA_FCHBADiagnosticTest_map");
    const auto* help =
        made.add(agent.m_NVRHBA_HelpService_map, makeHelp(shared, row), "Insert Failed : NVRHBA_HelpService_map");
    made.tie(Link::ServiceAvailableToElement, help, test);
    const auto* identity = made.add(agent.m_NVRHBA_DiagnosticIdentity_map, makeIdentity(shared, row),
                                    "Insert Failed : NVRHBA_DiagnosticIdentity_map");
    made.tie(Link::DiagElementSoftwareIdentity, identity, test);
    const auto* setting = made.add(agent.m_NVRHBA_FCHBADiagnosticSettingData_map, makeSetting(row),
                                   "Insert Failed : NVRHBA_FCHBADiagnosticSettingData_map");
    Instance* default_setting = made.tie(Link::DiagElementSettingData, test, setting);
    set(static_cast<NVRHBA_DiagElementSettingData*>(default_setting)->IsDefault, 1);
    const auto* capabilities = made.add(agent.m_NVRHBA_FCHBADiagnosticServiceCapabilities_map, makeCapabilities(row),
                                        "Insert Failed : NVRHBA_FCHBADiagnosticServiceCapabilities_map");
    made.tie(Link::DiagElementCapabilities, test, capabilities);
    if (!shared.jobSetting) shared.jobSetting = makeJobSetting();
    if (agent.m_NVRHBA_JobSettingData_map.empty())
        made.add(agent.m_NVRHBA_JobSettingData_map, Ref<NVRHBA_JobSettingData>(clone_as(shared.jobSetting.get())),
                 "Insert Failed : NVRHBA_JobSettingData_map");
    Instance* job_setting = made.tie(Link::JobElementSettingData, test, shared.jobSetting.get());
    set(static_cast<NVRHBA_JobElementSettingData*>(job_setting)->IsDefault, 1);
    const auto* log = made.add(agent.m_NVRHBA_DiagnosticsLog_map, makeLog(row), "Insert Failed : DiagnosticsLog_map");
    made.tie(Link::UseOfLog, log, test);
    return made;
}

/// Offers the test on each port that can run it.
void tieToPorts(ProviderAgent& agent, const Diagnostic_Test& row, const Instance* test)
{
    const auto& controllers = agent.m_NVRHBA_PortController_map;
    for (std::size_t i = 0; i < controllers.size(); i++) {
        const NVRHBA_PortController* controller = controllers[i];
        if (row.id == Test_Id::beacon &&
            NVR_DiagTestFunc::ISDiagTestSupported(controller->DeviceID.value.c_str(), 0) != 0)
            continue;
        if (Instance* available = associate(agent, Link::AvailableDiagnosticService, test, controller))
            set(static_cast<NVRHBA_AvailableDiagnosticService*>(available)->EstimatedDurationOfService, 0);
        associate(agent, Link::ServiceAffectsElement, controller, test);
    }
}

void buildTest(ProviderAgent& agent, Shared& shared, const Diagnostic_Test& row)
{
    try {
        if (!makeInstances(agent, shared, row).insertAll()) {
            NVR_LOG("Failed to insert the Diag Instances into map for DiagTest %s", row.name);
            return;
        }
    } catch (const std::bad_alloc&) {
        NVR_LOG("Failed to create the maps for %s ,Check the memory availablity", row.name);
        return;
    }
    const Instance_Map& tests = agent.m_NVRHBA_FCHBADiagnosticTest_map;
    const Instance* test = tests[tests.size() - 1];
    tieToPorts(agent, row, test);
    associate(agent, Link::DiagServiceConformsToProfile, shared.profile, test);
    associate(agent, Link::DiagHostedService, shared.host, test);
}

/// The version that the first adapter tells, which stands for all.
bool findVersion(const ProviderAgent& agent, uint32& version)
{
    const auto& controllers = agent.m_NVRHBA_PortController_map;
    for (std::size_t i = 0; i < controllers.size(); i++)
        if (NVR_Diagnostics::GetDiagnosticVersion(controllers[i]->DeviceID.value.c_str(), &version) == 0) return true;
    return false;
}

const Instance* findProfile(const ProviderAgent& agent)
{
    const auto& profiles = agent.m_NVRHBA_RegisteredProfile_map;
    for (std::size_t i = 0; i < profiles.size(); i++)
        if (profiles[i]->RegisteredName.value == profile_name) return profiles[i];
    return nullptr;
}

void clear(std::initializer_list<Instance_Map*> maps)
{
    for (Instance_Map* map : maps)
        map->clear();
}

} // namespace

uint32 NVR_Diagnostics::CreateFCHBADiagnosticClassFeature(ProviderAgent& agent)
{
    NVR_LOG("NVR_Diagnostics::CreateFCHBADiagnosticClassFeature");
    const auto& controllers = agent.m_NVRHBA_PortController_map;
    if (controllers.empty()) {
        NVR_LOG("Unable to create the FCHBA Diagnostic feature, No managed element exist");
        return status_no_element;
    }
    NVR_LOG("Number of FCHBA ManagedElement : %d", static_cast<int>(controllers.size()));
    const Instance_Map& hosts = agent.m_CIM_ComputerSystem_map;
    uint32 version = 0;
    if (!findVersion(agent, version) || hosts.empty()) {
        NVR_LOG("FCHBA Diagnostics are not supported in any of the managed element");
        return status_not_supported;
    }
    const Instance* host = hosts[0];
    Shared shared = {host,
                     string_property(host, "CreationClassName"),
                     string_property(host, "Name"),
                     findProfile(agent),
                     static_cast<uint16>(version),
                     {}};
    for (const Diagnostic_Test& row : diagnostic_tests)
        buildTest(agent, shared, row);
    return 0;
}

void NVR_Diagnostics::ClearDiagnosticClassMaps(ProviderAgent& agent, int kind)
{
    if (kind != 0) return;
    // What is published of the tests.
    clear({
        &agent.m_NVRHBA_FCHBADiagnosticTest_map,
        &agent.m_NVRHBA_HelpService_map,
        &agent.m_NVRHBA_ServiceAvailableToElement_map,
        &agent.m_NVRHBA_DiagnosticIdentity_map,
        &agent.m_NVRHBA_DiagElementSoftwareIdentity_map,
        &agent.m_NVRHBA_FCHBADiagnosticSettingData_map,
        &agent.m_NVRHBA_DiagElementSettingData_map,
        &agent.m_NVRHBA_FCHBADiagnosticServiceCapabilities_map,
        &agent.m_NVRHBA_DiagElementCapabilities_map,
        &agent.m_NVRHBA_JobSettingData_map,
        &agent.m_NVRHBA_JobElementSettingData_map,
        &agent.m_NVRHBA_DiagnosticsLog_map,
        &agent.m_NVRHBA_UseOfLog_map,
        &agent.m_NVRHBA_AvailableDiagnosticService_map,
        &agent.m_NVRHBA_ServiceAffectsElement_map,
        &agent.m_NVRHBA_DiagServiceConformsToProfile_map,
        &agent.m_NVRHBA_DiagHostedService_map,
    });
    // What runs have left.
    clear({
        &agent.m_NVRHBA_ConcreteJob_map,
        &agent.m_NVRHBA_OwningJobElement_map,
        &agent.m_NVRHBA_AffectedJobElement_map,
        &agent.m_NVRHBA_DiagnosticServiceRecord_map,
        &agent.m_NVRHBA_DiagnosticCompletionRecord_map,
        &agent.m_NVRHBA_DiagnosticSettingDataRecord_map,
        &agent.m_NVRHBA_LogManagesRecord_map,
        &agent.m_NVRHBA_CorrespondingSettingDataRecord_map,
        &agent.m_NVRHBA_RecordAppliesToElement_map,
    });
}

uint32 NVR_Diagnostics::GetDiagnosticVersion(const char* deviceId, uint32* version)
{
    NVR_LOG("NVR_Diagnostics::GetDiagnosticVersion");
    if (!version) {
        NVR_LOG("Invalid Argument");
        return status_no_version;
    }
    HBA_WWN port = {};
    constexpr const char* words = "NVRHBA_DiagTestFunc::Id2HBAName failed";
    if (!library_name(port, deviceId, words, words)) return status_no_version;
    Local_Attribute_Block<attributes_size> attributes;
    if (attributes.fill(RM_GetHBAAttributes, port) != RM_STATUS_OK) return status_no_version;
    return attributes.number(RM_ATTR_DIAG_VERSION, "_DiagVersion", *version) ? 0 : status_no_version;
}

} // namespace cimple
