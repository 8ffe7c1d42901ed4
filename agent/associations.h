/// The associations of the adapter side: one shape, and a table of what each class ties and says.
///
/// An association owns clones of its two ends, so that freeing or clearing them leaves it whole. All run under the
/// agent's data mutex.
#pragma once

#include "agent/ProviderAgent.h"

namespace cimple {

/// The rows of the table, in its order; named after their classes, without the prefix.
enum class Link {
    // Profiles.
    ComputerSystemConformsToProfile,
    RecordLogConformsToProfile,
    InstallServiceConformsToProfile,
    SoftwareConformsToProfile,
    PortControllerConformsToProfile,
    FCPortConformsToProfile,
    PCIElementConformsToProfile,
    ReferencedProfile,
    BaseServerReferencedProfile,
    // Adapters and ports.
    SystemPackaging,
    HostedCollection,
    SystemDevice,
    ElementVPD,
    TransceiverComponent,
    FCPortSystemDevice,
    MemberOfCollection,
    ElementStatisticalData,
    ProtocolControllerForPort,
    SCSIProtocolControllerSystemDevice,
    ProductElementComponent,
    ProductPhysicalComponent,
    ControlledBy,
    Realizes,
    PortControllerSystemDevice,
    DeviceSAPImplementation,
    LocalHostedInitiatorAccessPoint,
    // Software.
    InstalledSoftwareIdentity,
    ProviderSoftwareIdentity,
    ElementSoftwareIdentity,
    FCTagElementSoftwareIdentity,
    ElementFlashImageSoftwareIdentity,
    // Services: their host, and what they affect.
    HostedInstallationService,
    InstallServiceAffectsSystem,
    InstallServiceAffectsFCPort,
    ElementCapabilities,
    HostedFCHBAWWNService,
    FCHBAWWNServiceAffectsSystem,
    FCHBAWWNServiceAffectsFCPort,
    HostedFCTagService,
    FCTagServiceAffectsPort,
    HostedBootBIOSService,
    BootBIOSServiceAffectsSystem,
    BootBIOSServiceAffectsFCPort,
    HostedFCHBADriverParamService,
    FCHBADriverParamServiceAffectsSystem,
    FCHBADriverParamServiceAffectsFCPort,
    FCDriverServiceAffectsDriver,
    GlobalDriverServiceElementSettingData,
    DriverServiceElementSettingData,
    DriverParameterAffectsFCPort,
    HostedDumpService,
    DumpServiceAffectsElement,
    ElementDumpData,
    // Virtual ports.
    HostedResourcePool,
    VPortHostedDependency,
    ElementAllocatedFromPool,
    // Logs and access points.
    RecordLogCapabilities,
    ProviderUseOfLog,
    RemoteHostedAccessPoint,
    SAPAvailableForElement,
    // Diagnostics: what is fixed, and what each run adds.
    ServiceAvailableToElement,
    DiagElementSoftwareIdentity,
    DiagElementSettingData,
    DiagElementCapabilities,
    JobElementSettingData,
    UseOfLog,
    AvailableDiagnosticService,
    ServiceAffectsElement,
    DiagServiceConformsToProfile,
    DiagHostedService,
    OwningJobElement,
    AffectedJobElement,
    LogManagesRecord,
    CorrespondingSettingDataRecord,
    RecordAppliesToElement,
    count
};

struct Link_Row {
    Link link;
    Instance_Map& (*map)(ProviderAgent& agent);
    const char* first; // names of the references
    const char* second;
    const char* trace;      // logged before, with the caller's text; null: nothing
    const char* failure;    // logged for a known key; null: "Insert Failed : m_<Class>_map"
    const char* missing;    // logged for a null end, and without memory; null: the common words
    const char* name_space; // null: none
};

const Link_Row& link_row(Link link);

/// Logs the row's trace, makes the association of clones of both ends, and inserts it. Result the association, the
/// map's own; or null, logged, for a null end, known keys, or no memory.
Instance* associate(ProviderAgent& agent, Link link, const Instance* first, const Instance* second,
                    const char* text = "");
/// The same without the insert: the caller's own.
Ref<Instance> makeAssociationOrLog(ProviderAgent& agent, Link link, const Instance* first, const Instance* second,
                                   const char* text = "");
/// The same for ends that are there; std::bad_alloc passes through.
Ref<Instance> makeAssociation(ProviderAgent& agent, Link link, const Instance* first, const Instance* second,
                              const char* text = "");

/// Does nothing but say so if the host is not of our own making.
Instance* createComputerSystemConformsToProfile(ProviderAgent& agent, const Instance* profile);

/// Ties a profile to the one that it references, and to the host's Base Server profile if there is one.
Instance* createReferencedProfile(ProviderAgent& agent, const char* text, const Instance* profile,
                                  const Instance* referenced);

/// Link::ElementSoftwareIdentity or ProviderSoftwareIdentity with their upgrade condition and three status numbers.
Instance* createSoftwareIdentityLink(ProviderAgent& agent, Link link, const char* text, const Instance* identity,
                                     const Instance* element, uint16 s1, uint16 s2, uint16 s3);

/// The installation service's two ties to its host; without the first there is no second.
void createAssocInstallationService(ProviderAgent& agent, const char* text, const Instance* host,
                                    const Instance* service);

} // namespace cimple
