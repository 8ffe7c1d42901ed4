#include "agent/associations.h"

#include <cstddef>
#include <iterator>

#include "agent/instance_table.h"
#include "foundation/CLogger.h"
#include "runtime/Meta_Class.h"

namespace cimple {

namespace {

template <auto member>
Instance_Map& map_of(ProviderAgent& agent)
{
    return agent.*member;
}

constexpr const char* norvane = norvane_name_space;
constexpr const char* interop = interop_name_space;

// One row an association class: its ends in the order of the arguments, its trace line, its words for a refused insert
// and for a missing end, its namespace.
#define MAP(Class) &map_of<&ProviderAgent::m_NVRHBA_##Class##_map>
// clang-format off
constexpr Link_Row rows[] = {
    {Link::ComputerSystemConformsToProfile, MAP(ComputerSystemConformsToProfile), "ConformantStandard", "ManagedElement", "inside createComputerSystemConformsToProfile", nullptr, nullptr, norvane},
    {Link::RecordLogConformsToProfile, MAP(RecordLogConformsToProfile), "ConformantStandard", "ManagedElement", "Generating NVRHBA_RecordLogConformsToProfile (%s)", nullptr, nullptr, norvane},
    {Link::InstallServiceConformsToProfile, MAP(InstallServiceConformsToProfile), "ConformantStandard", "ManagedElement", nullptr, "Insert Failed", nullptr, norvane},
    {Link::SoftwareConformsToProfile, MAP(SoftwareConformsToProfile), "ConformantStandard", "ManagedElement", "Generating NVRHBA_SoftwareConformsToProfile (%s)", nullptr, nullptr, norvane},
    {Link::PortControllerConformsToProfile, MAP(PortControllerConformsToProfile), "ConformantStandard", "ManagedElement", "Generating NVRHBA_PortControllerConformsToProfile (%s)", nullptr, nullptr, norvane},
    {Link::FCPortConformsToProfile, MAP(FCPortConformsToProfile), "ConformantStandard", "ManagedElement", "Generating NVRHBA_FCPortConformsToProfile (%s)", nullptr, nullptr, norvane},
    {Link::PCIElementConformsToProfile, MAP(PCIElementConformsToProfile), "ConformantStandard", "ManagedElement", nullptr, nullptr, "Failed to create NVRHBA_PCIElementConformsToProfile", norvane},
    {Link::ReferencedProfile, MAP(ReferencedProfile), "Antecedent", "Dependent", nullptr, nullptr, nullptr, interop},
    {Link::BaseServerReferencedProfile, MAP(BaseServerReferencedProfile), "Antecedent", "Dependent", nullptr, nullptr, nullptr, interop},
    {Link::SystemPackaging, MAP(SystemPackaging), "Antecedent", "Dependent", nullptr, nullptr, nullptr, norvane},
    {Link::HostedCollection, MAP(HostedCollection), "Antecedent", "Dependent", nullptr, nullptr, nullptr, norvane},
    {Link::SystemDevice, MAP(SystemDevice), "GroupComponent", "PartComponent", nullptr, nullptr, "Failed to create NVRHBA_SystemDevice", norvane},
    {Link::ElementVPD, MAP(ElementVPD), "ManagedElement", "SettingData", nullptr, nullptr, nullptr, norvane},
    {Link::TransceiverComponent, MAP(TransceiverComponent), "GroupComponent", "PartComponent", nullptr, "Insert Failed : m_Component_map", nullptr, norvane},
    {Link::FCPortSystemDevice, MAP(FCPortSystemDevice), "GroupComponent", "PartComponent", nullptr, nullptr, nullptr, norvane},
    {Link::MemberOfCollection, MAP(MemberOfCollection), "Collection", "Member", nullptr, nullptr, nullptr, norvane},
    {Link::ElementStatisticalData, MAP(ElementStatisticalData), "ManagedElement", "Stats", nullptr, nullptr, nullptr, norvane},
    {Link::ProtocolControllerForPort, MAP(ProtocolControllerForPort), "Antecedent", "Dependent", nullptr, nullptr, nullptr, norvane},
    {Link::SCSIProtocolControllerSystemDevice, MAP(SCSIProtocolControllerSystemDevice), "GroupComponent", "PartComponent", nullptr, nullptr, nullptr, norvane},
    {Link::ProductElementComponent, MAP(ProductElementComponent), "GroupComponent", "PartComponent", nullptr, nullptr, nullptr, norvane},
    {Link::ProductPhysicalComponent, MAP(ProductPhysicalComponent), "GroupComponent", "PartComponent", nullptr, nullptr, nullptr, norvane},
    {Link::ControlledBy, MAP(ControlledBy), "Antecedent", "Dependent", nullptr, nullptr, nullptr, norvane},
    {Link::Realizes, MAP(Realizes), "Antecedent", "Dependent", nullptr, nullptr, nullptr, norvane},
    {Link::PortControllerSystemDevice, MAP(PortControllerSystemDevice), "GroupComponent", "PartComponent", nullptr, nullptr, nullptr, norvane},
    {Link::DeviceSAPImplementation, MAP(DeviceSAPImplementation), "Antecedent", "Dependent", nullptr, nullptr, nullptr, norvane},
    {Link::LocalHostedInitiatorAccessPoint, MAP(LocalHostedInitiatorAccessPoint), "Antecedent", "Dependent", nullptr, nullptr, nullptr, norvane},
    {Link::InstalledSoftwareIdentity, MAP(InstalledSoftwareIdentity), "System", "InstalledSoftware", "Generating NVRHBA_InstalledSoftwareIdentity (%s)", nullptr, nullptr, norvane},
    {Link::ProviderSoftwareIdentity, MAP(ProviderSoftwareIdentity), "Antecedent", "Dependent", "Generating NVRHBA_ProviderSoftwareIdentity (%s)", nullptr, nullptr, nullptr},
    {Link::ElementSoftwareIdentity, MAP(ElementSoftwareIdentity), "Antecedent", "Dependent", "Generating NVRHBA_ElementSoftwareIdentity (%s)", "Insert Failed : m_NVRHBA_FCPortSoftwareIdentity_map", nullptr, norvane},
    {Link::FCTagElementSoftwareIdentity, MAP(FCTagElementSoftwareIdentity), "Antecedent", "Dependent", nullptr, "Insert Failed (CNA): m_NVRHBA_FCTagElementSoftwareIdentity_map", nullptr, norvane},
    {Link::ElementFlashImageSoftwareIdentity, MAP(ElementFlashImageSoftwareIdentity), "Antecedent", "Dependent", nullptr, "Insert Failed : m_NVRHBA_ElementFlashImageSoftwareIdentityInst_map ", "Failed to create ElementFlashImageSoftwareIdentityInst", norvane},
    {Link::HostedInstallationService, MAP(HostedInstallationService), "Antecedent", "Dependent", "Hosted Service, Norvane Firmware Installation Service: %s", "Insert Failed", nullptr, norvane},
    {Link::InstallServiceAffectsSystem, MAP(InstallServiceAffectsSystem), "AffectedElement", "AffectingElement", "Install Service Affects System: %s", "Insert Failed", nullptr, norvane},
    {Link::InstallServiceAffectsFCPort, MAP(InstallServiceAffectsFCPort), "AffectedElement", "AffectingElement", nullptr, "Insert Failed", nullptr, norvane},
    {Link::ElementCapabilities, MAP(ElementCapabilities), "ManagedElement", "Capabilities", nullptr, "Insert Failed", nullptr, norvane},
    {Link::HostedFCHBAWWNService, MAP(HostedFCHBAWWNService), "Antecedent", "Dependent", "ProviderAgent::createAssociationAntDep_ComputerSystem_FCHBAWWNService_HostedFCHBAWWNService", "Insert Failed", nullptr, norvane},
    {Link::FCHBAWWNServiceAffectsSystem, MAP(FCHBAWWNServiceAffectsSystem), "AffectedElement", "AffectingElement", "createAssociationsAffectedAffectingElem_FCHBAWWNService_ComputerSystem_FCHBAWWNServiceAffectsSystem", "Insert Failed", nullptr, norvane},
    {Link::FCHBAWWNServiceAffectsFCPort, MAP(FCHBAWWNServiceAffectsFCPort), "AffectedElement", "AffectingElement", "createAssociationsAffectedAffectingElem_FCHBAWWNService_FCPort_FCHBAWWNServiceAffectsFCPort", "Insert Failed", nullptr, norvane},
    {Link::HostedFCTagService, MAP(HostedFCTagService), "Antecedent", "Dependent", nullptr, nullptr, nullptr, norvane},
    {Link::FCTagServiceAffectsPort, MAP(FCTagServiceAffectsPort), "AffectedElement", "AffectingElement", "createAssoc_FCTagService_FCPort: Creating NVRHBA_FCTagServiceAffectsPort ", "Insert into m_NVRHBA_FCTagServiceAffectsPort_map Failed", nullptr, norvane},
    {Link::HostedBootBIOSService, MAP(HostedBootBIOSService), "Antecedent", "Dependent", nullptr, "Insert Failed", nullptr, norvane},
    {Link::BootBIOSServiceAffectsSystem, MAP(BootBIOSServiceAffectsSystem), "AffectedElement", "AffectingElement", nullptr, "Insert Failed", nullptr, norvane},
    {Link::BootBIOSServiceAffectsFCPort, MAP(BootBIOSServiceAffectsFCPort), "AffectedElement", "AffectingElement", nullptr, "Insert Failed", nullptr, norvane},
    {Link::HostedFCHBADriverParamService, MAP(HostedFCHBADriverParamService), "Antecedent", "Dependent", "Generating HostedFCHBADriverParamService (%s)", nullptr, "Unable to create instance of NVRHBA_HostedFCHBADriverParamService", norvane},
    {Link::FCHBADriverParamServiceAffectsSystem, MAP(FCHBADriverParamServiceAffectsSystem), "AffectedElement", "AffectingElement", "Generating FCHBASDriverParamServiceAffectsSystem (%s)", nullptr, "Unable to create instance of NVRHBA_FCHBADriverParamServiceAffectsSystem", norvane},
    {Link::FCHBADriverParamServiceAffectsFCPort, MAP(FCHBADriverParamServiceAffectsFCPort), "AffectedElement", "AffectingElement", "Generating FCHBASetDriverParamServiceAffectsFCPort (%s)", nullptr, "Unable to create instance of NVRHBA_FCHBADriverParamServiceAffectsFCPort", norvane},
    {Link::FCDriverServiceAffectsDriver, MAP(FCDriverServiceAffectsDriver), "AffectedElement", "AffectingElement", nullptr, nullptr, nullptr, norvane},
    {Link::GlobalDriverServiceElementSettingData, MAP(GlobalDriverServiceElementSettingData), "ManagedElement", "SettingData", nullptr, nullptr, nullptr, norvane},
    {Link::DriverServiceElementSettingData, MAP(DriverServiceElementSettingData), "ManagedElement", "SettingData", nullptr, nullptr, nullptr, norvane},
    {Link::DriverParameterAffectsFCPort, MAP(DriverParameterAffectsFCPort), "Antecedent", "Dependent", nullptr, nullptr, nullptr, norvane},
    {Link::HostedDumpService, MAP(HostedDumpService), "Antecedent", "Dependent", nullptr, nullptr, "Failed to create NVRHBA_HostedDumpService", norvane},
    {Link::DumpServiceAffectsElement, MAP(DumpServiceAffectsElement), "AffectedElement", "AffectingElement", nullptr, nullptr, "Failed to create NVRHBA_DumpServiceAffectsElement", norvane},
    {Link::ElementDumpData, MAP(ElementDumpData), "ManagedElement", "SettingData", nullptr, nullptr, "Failed to create NVRHBA_ElementDumpData for fc port", norvane},
    {Link::HostedResourcePool, MAP(HostedResourcePool), "GroupComponent", "PartComponent", nullptr, nullptr, "Failed to create HostedResourcePool", norvane},
    {Link::VPortHostedDependency, MAP(VPortHostedDependency), "Antecedent", "Dependent", nullptr, nullptr, "Failed to create VPortHostedDependency", norvane},
    {Link::ElementAllocatedFromPool, MAP(ElementAllocatedFromPool), "Antecedent", "Dependent", nullptr, nullptr, "Failed to create ElementAllocatedFromPool", norvane},
    {Link::RecordLogCapabilities, MAP(RecordLogCapabilities), "ManagedElement", "Capabilities", nullptr, "Insert Failed", nullptr, norvane},
    {Link::ProviderUseOfLog, MAP(ProviderUseOfLog), "Antecedent", "Dependent", nullptr, "Insert Failed", nullptr, norvane},
    {Link::RemoteHostedAccessPoint, MAP(RemoteHostedAccessPoint), "Antecedent", "Dependent", nullptr, nullptr, nullptr, norvane},
    {Link::SAPAvailableForElement, MAP(SAPAvailableForElement), "AvailableSAP", "ManagedElement", nullptr, nullptr, nullptr, norvane},
    {Link::ServiceAvailableToElement, MAP(ServiceAvailableToElement), "ServiceProvided", "UserOfService", nullptr, "Insert Failed : NVRHBA_ServiceAvailableToElement_map", nullptr, norvane},
    {Link::DiagElementSoftwareIdentity, MAP(DiagElementSoftwareIdentity), "Antecedent", "Dependent", nullptr, "Insert Failed : NVRHBA_DiagElementSoftwareIdentity_map", nullptr, norvane},
    {Link::DiagElementSettingData, MAP(DiagElementSettingData), "ManagedElement", "SettingData", nullptr, "Insert Failed : NVRHBA_DiagElementSettingData", nullptr, norvane},
    {Link::DiagElementCapabilities, MAP(DiagElementCapabilities), "ManagedElement", "Capabilities", "NVRHBA_DiagElementCapabilities instance (NIC) is created", "Insert Failed : NVRHBA_FCHBAElementCapabilities_map", nullptr, norvane},
    {Link::JobElementSettingData, MAP(JobElementSettingData), "ManagedElement", "SettingData", nullptr, "Insert Failed : NVRHBA_JobElementSettingData", nullptr, norvane},
    {Link::UseOfLog, MAP(UseOfLog), "Antecedent", "Dependent", nullptr, "Insert Failed : UseOfLog_map", nullptr, norvane},
    {Link::AvailableDiagnosticService, MAP(AvailableDiagnosticService), "ServiceProvided", "UserOfService", nullptr, "Insert Failed : NVRHBA_AvailableDiagnosticService_map", nullptr, norvane},
    {Link::ServiceAffectsElement, MAP(ServiceAffectsElement), "AffectedElement", "AffectingElement", nullptr, "Insert Failed : NVRHBA_ServiceAffectsElement_map", nullptr, norvane},
    {Link::DiagServiceConformsToProfile, MAP(DiagServiceConformsToProfile), "ConformantStandard", "ManagedElement", nullptr, "Insert failed : NVRHBA_ServiceConformsToProfile_map", nullptr, norvane},
    {Link::DiagHostedService, MAP(DiagHostedService), "Antecedent", "Dependent", nullptr, "Insert failed : NVRHBA_DiagHostedService_map", nullptr, norvane},
    {Link::OwningJobElement, MAP(OwningJobElement), "OwningElement", "OwnedElement", nullptr, "Insert Failed: NVRHBA_OwningJobElement", "Unable to create NVRHBA_OwningJobElement", norvane},
    {Link::AffectedJobElement, MAP(AffectedJobElement), "AffectedElement", "AffectingElement", nullptr, "Insert Failed: NVRHBA_AffectedJobElement", "Unable to create NVRHBA_AffectedJobElement", norvane},
    {Link::LogManagesRecord, MAP(LogManagesRecord), "Log", "Record", nullptr, "Insert Failed : NVRHBA_LogManagesRecord", "Failed to create NVRHBA_LogManagesRecord", norvane},
    {Link::CorrespondingSettingDataRecord, MAP(CorrespondingSettingDataRecord), "DataRecord", "SettingsRecord", nullptr, "Insert Failed : NVRHBA_CorrespondingSettingDataRecord", "Failed to create NVRHBA_CorrespondingSettingDataRecord", norvane},
    {Link::RecordAppliesToElement, MAP(RecordAppliesToElement), "Antecedent", "Dependent", nullptr, "Insert Failed : RecordAppliesToElement", "Failed to create NVRHBA_RecordAppliesToElement", norvane},
};
// clang-format on
#undef MAP

constexpr bool in_order()
{
    for (std::size_t i = 0; i < std::size(rows); i++)
        if (rows[i].link != static_cast<Link>(i)) return false;
    return std::size(rows) == static_cast<std::size_t>(Link::count);
}
static_assert(in_order(), "a row stands at its own number");

void set_end(Instance* association, const char* name, const Instance* end)
{
    const Meta_Feature* feature = find_feature(association->meta_class, name, META_FLAG_REFERENCE);
    reference_of(association, as_reference(feature)) = clone(end);
}

/// Property `name` of an association, which its class is known to have.
template <class T>
Property<T>& property_of(Instance* association, const char* name)
{
    const Meta_Feature* feature = find_feature(association->meta_class, name, META_FLAG_PROPERTY);
    return *static_cast<Property<T>*>(feature_at(association, as_property(feature)->offset));
}

} // namespace

const Link_Row& link_row(Link link)
{
    return rows[static_cast<std::size_t>(link)];
}

Ref<Instance> makeAssociation(ProviderAgent& agent, Link link, const Instance* first, const Instance* second,
                              const char* text)
{
    const Link_Row& row = link_row(link);
    if (row.trace) NVR_LOG(row.trace, text);
    Ref<Instance> association(create(row.map(agent).meta_class(), true));
    if (row.name_space) association->__name_space = row.name_space;
    set_end(association.get(), row.first, first);
    set_end(association.get(), row.second, second);
    return association;
}

Ref<Instance> makeAssociationOrLog(ProviderAgent& agent, Link link, const Instance* first, const Instance* second,
                                   const char* text)
{
    const Link_Row& row = link_row(link);
    const char* missing = row.missing ? row.missing : "Could not create the instance of the Association class";
    if (first && second) return madeOrLog(missing, [&] { return makeAssociation(agent, link, first, second, text); });
    if (row.trace) NVR_LOG(row.trace, text);
    logCreationFailed(missing);
    return Ref<Instance>();
}

Instance* associate(ProviderAgent& agent, Link link, const Instance* first, const Instance* second, const char* text)
{
    const Link_Row& row = link_row(link);
    Ref<Instance> association = makeAssociationOrLog(agent, link, first, second, text);
    return association ? insertOrLog(row.map(agent), std::move(association), row.failure) : nullptr;
}

Instance* createComputerSystemConformsToProfile(ProviderAgent& agent, const Instance* profile)
{
    if (!agent.m_bOwnComputerSystem) {
        NVR_LOG("This is IBM/VMWare comp Sys - do nothing");
        return nullptr;
    }
    const Instance_Map& hosts = agent.m_CIM_ComputerSystem_map;
    return associate(agent, Link::ComputerSystemConformsToProfile, profile, hosts.empty() ? nullptr : hosts[0]);
}

Instance* createReferencedProfile(ProviderAgent& agent, const char* text, const Instance* profile,
                                  const Instance* referenced)
{
    NVR_LOG("Generating NVRHBA_ReferencedProfile (%s)", text);
    if (!profile || !referenced) {
        NVR_LOG("Generating NVRVCNA_ReferencedProfile failed (%s)", text);
        return nullptr;
    }
    Instance* association = associate(agent, Link::ReferencedProfile, referenced, profile);
    if (association && agent.m_pBaseServerProfile)
        associate(agent, Link::BaseServerReferencedProfile, agent.m_pBaseServerProfile.get(), profile);
    return association;
}

Instance* createSoftwareIdentityLink(ProviderAgent& agent, Link link, const char* text, const Instance* identity,
                                     const Instance* element, uint16 s1, uint16 s2, uint16 s3)
{
    Instance* association = associate(agent, link, identity, element, text);
    if (!association) return nullptr;
    set(property_of<uint16>(association, "UpgradeCondition"), 3);
    set(property_of<Array<uint16>>(association, "ElementSoftwareStatus"), {s1, s2, s3});
    return association;
}

void createAssocInstallationService(ProviderAgent& agent, const char* text, const Instance* host,
                                    const Instance* service)
{
    if (!associate(agent, Link::HostedInstallationService, host, service, text)) return;
    associate(agent, Link::InstallServiceAffectsSystem, host, service, string_property(host, "Name").c_str());
}

} // namespace cimple
