// The clear functions: which maps they empty, in which order, and with which words.
#include <initializer_list>
#include <strings.h>

#include "agent/Agent_Builders.h"
#include "agent/ProviderAgent.h"
#include "classes/NVRHBA_FCPort.h"
#include "foundation/CLogger.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

void clear(std::initializer_list<Instance_Map*> maps)
{
    for (Instance_Map* map : maps)
        map->clear();
}

int findPort(const Map<NVRHBA_FCPort>& ports, const char* wwpn)
{
    if (!wwpn) return 0;
    for (std::size_t i = 0; i < ports.size(); i++)
        if (ports[i] && strcasecmp(ports[i]->DeviceID.value.c_str(), wwpn) == 0) return 1;
    return 0;
}

} // namespace

void ProviderAgent::clearSANMaps()
{
    NVR_LOG("PERF: Entered clearSANMaps()");
    const bool done = guarded([&] {
        clear({
            &m_NVRHBA_SCSIProtocolEndpoint_map,
            &m_NVRHBA_LogicalDisk_map,
            &m_NVRHBA_StorageVolume_map,
            &m_NVRHBA_TapeDrive_map,
            &m_NVRHBA_StorageExtent_map,
            &m_NVRHBA_SCSIArbitraryLogicalUnit_map,
            &m_NVRHBA_LocalHostedAccessPoint_map,
            &m_NVRHBA_LogicalDiskSystemDevice_map,
            &m_NVRHBA_StorageVolumeSystemDevice_map,
            &m_NVRHBA_TapeDriveSystemDevice_map,
            &m_NVRHBA_StorageExtentSystemDevice_map,
            &m_NVRHBA_SCSIArbitraryLogicalUnitSystemDevice_map,
            &m_NVRHBA_SCSIInitiatorTargetLogicalDiskPath_map,
            &m_NVRHBA_SCSIInitiatorTargetStorageVolumePath_map,
            &m_NVRHBA_SCSIInitiatorTargetTapeDrivePath_map,
            &m_NVRHBA_SCSIInitiatorTargetStorageExtentPath_map,
            &m_NVRHBA_SCSIInitiatorTargetArbitraryLogicalUnitPath_map,
        });
    });
    if (!done) NVR_LOG("Error in clearSANMaps()");
    NVR_LOG("Exiting clearSANMaps()");
}

void ProviderAgent::clearAdapterMaps()
{
    NVR_LOG("PERF: Entered clearAdapterMaps()");
    clear({
        &m_CIM_ComputerSystem_map,
        &m_NVRHBA_FCPort_map,
        &m_NVRHBA_FCPortStatistics_map,
        &m_NVRHBA_LogicalPortGroup_map,
        &m_NVRHBA_PhysicalPackage_map,
        &m_NVRHBA_Transceiver_map,
        &m_NVRHBA_PortController_map,
        &m_NVRHBA_Product_map,
        &m_NVRHBA_RegisteredProfile_map,
        &m_NVRHBA_RegisteredProfile_map,
        &m_NVRHBA_RemoteServiceAccessPoint_map,
        &m_NVRHBA_SCSIProtocolController_map,
        &m_NVRHBA_SoftwareIdentity_map,
        &m_NVRHBA_ProviderConfigSetting_map,
        &m_NVRHBA_PCIDevice_map,
        &m_NVRHBA_PCIElementConformsToProfile_map,
        &m_NVRHBA_SystemDevice_map,
        &m_NVRHBA_DumpService_map,
        &m_NVRHBA_HostedDumpService_map,
        &m_NVRHBA_DumpServiceAffectsElement_map,
        &m_NVRHBA_DumpData_map,
        &m_NVRHBA_ElementDumpData_map,
        &m_NVRHBA_VitalProductData_map,
        &m_NVRHBA_ElementVPD_map,
        &m_NVRHBA_FCTagService_map,
        &m_NVRHBA_FCTagServiceAffectsPort_map,
        &m_NVRHBA_HostedFCTagService_map,
        &m_NVRHBA_FCTagElementSoftwareIdentity_map,
    });
    if (agent_builders.clearDriverLogClasses) agent_builders.clearDriverLogClasses(*this);
    if (agent_builders.clearPortVirtualizationClasses) agent_builders.clearPortVirtualizationClasses(*this);

    NVR_LOG("Clearing Record Log maps");
    clear({
        &m_NVRHBA_RecordLog_map,
        &m_NVRHBA_EnabledRecordLogCapabilities_map,
        &m_NVRHBA_RecordLogCapabilities_map,
        &m_NVRHBA_ProviderUseOfLog_map,
        &m_NVRHBA_RecordLogConformsToProfile_map,
        &m_NVRHBA_SCSIProtocolInitiatorEndpoint_map,
        &m_NVRHBA_LocalHostedInitiatorAccessPoint_map,
    });

    NVR_LOG("Clearing SoftwareUpdate maps");
    clear({
        &m_NVRHBA_SoftwareInstallationService_map,
        &m_NVRHBA_SoftwareInstallationServiceCapabilities_map,
        &m_NVRHBA_FCHBAWWNService_map,
        &m_NVRHBA_BootBIOSService_map,
        &m_NVRHBA_FCHBADriverParamService_map,
        &m_NVRHBA_DriverParamGlobal_map,
        &m_NVRHBA_DriverParams_map,
        &m_NVRHBA_DriverParameterAffectsFCPort_map,
        &m_NVRHBA_GlobalDriverServiceElementSettingData_map,
        &m_NVRHBA_DriverServiceElementSettingData_map,
        &m_NVRHBA_FCDriverServiceAffectsDriver_map,
        &m_NVRHBA_ComputerSystemConformsToProfile_map,
        &m_NVRHBA_FCPortConformsToProfile_map,
        &m_NVRHBA_PortControllerConformsToProfile_map,
        &m_NVRHBA_SoftwareConformsToProfile_map,
        &m_NVRHBA_ComputerSystemConformsToProfile_map,
        &m_NVRHBA_ControlledBy_map,
        &m_NVRHBA_DeviceSAPImplementation_map,
        &m_NVRHBA_ElementStatisticalData_map,
        &m_NVRHBA_ElementSoftwareIdentity_map,
        &m_NVRHBA_FCPortSystemDevice_map,
        &m_NVRHBA_HostedCollection_map,
        &m_NVRHBA_InstalledSoftwareIdentity_map,
        &m_NVRHBA_MemberOfCollection_map,
        &m_NVRHBA_PortControllerSystemDevice_map,
        &m_NVRHBA_ProductElementComponent_map,
        &m_NVRHBA_ProductPhysicalComponent_map,
        &m_NVRHBA_TransceiverComponent_map,
        &m_NVRHBA_ProtocolControllerForPort_map,
        &m_NVRHBA_ProviderSoftwareIdentity_map,
        &m_NVRHBA_ElementFlashImageSoftwareIdentity_map,
        &m_NVRHBA_Realizes_map,
        &m_NVRHBA_ReferencedProfile_map,
        &m_NVRHBA_BaseServerReferencedProfile_map,
        &m_NVRHBA_RemoteHostedAccessPoint_map,
        &m_NVRHBA_SAPAvailableForElement_map,
        &m_NVRHBA_SCSIProtocolControllerSystemDevice_map,
        &m_NVRHBA_SoftwareConformsToProfile_map,
        &m_NVRHBA_SystemPackaging_map,
        &m_NVRHBA_FlashImageSoftwareIdentity_map,
    });

    NVR_LOG("Clearing Software Update maps");
    clear({
        &m_NVRHBA_ElementCapabilities_map,
        &m_NVRHBA_InstallServiceAffectsFCPort_map,
        &m_NVRHBA_InstallServiceAffectsSystem_map,
        &m_NVRHBA_HostedInstallationService_map,
        &m_NVRHBA_InstallServiceConformsToProfile_map,
        &m_NVRHBA_HostedBootBIOSService_map,
        &m_NVRHBA_BootBIOSServiceAffectsSystem_map,
        &m_NVRHBA_BootBIOSServiceAffectsFCPort_map,
        &m_NVRHBA_HostedFCHBAWWNService_map,
        &m_NVRHBA_FCHBAWWNServiceAffectsSystem_map,
        &m_NVRHBA_FCHBAWWNServiceAffectsFCPort_map,
        &m_NVRHBA_HostedFCHBADriverParamService_map,
        &m_NVRHBA_FCHBADriverParamServiceAffectsFCPort_map,
        &m_NVRHBA_FCHBADriverParamServiceAffectsSystem_map,
    });

    NVR_LOG("Clearing NVR CDM maps");
    if (agent_builders.clearDiagnosticsClasses) agent_builders.clearDiagnosticsClasses(*this, 0);
    NVR_LOG("Done with Clearing CDM maps");
    NVR_LOG("Exiting clearAdapterMaps()");
}

void ProviderAgent::clearDriverMaps()
{
    NVR_LOG("PERF: Entered clearDriverMaps: Entry");
    NVR_LOG("PERF: Entered clearDriverMaps: cleanExit");
}

void ProviderAgent::ClearMaps()
{
    NVR_LOG("Entered ClearMaps()");
    {
        Auto_Mutex lock(m_AdapterMapsReadyMutex);
        clearAdapterMaps();
        clearDriverMaps();
    }
    {
        Auto_Mutex lock(m_SANMapsReadyMutex);
        clearSANMaps();
    }
    NVR_LOG("Exiting ClearMaps()");
}

int ProviderAgent::checkFCPort(const char* wwpn)
{
    NVR_LOG("Checking the FCPort");
    const int found = findPort(m_NVRHBA_FCPort_map, wwpn);
    if (found)
        NVR_LOG("Valid FCPort WWPN Passed");
    else
        NVR_LOG("Could not find the passed FCPort in the map");
    return found;
}

int ProviderAgent::checkLogicalPort(const char* wwpn)
{
    NVR_LOG("Checking the FCPort");
    const int found = findPort(m_NVRHBA_FCPort_map, wwpn);
    if (found)
        NVR_LOG("Valid WWPN Passed");
    else
        NVR_LOG("Could not find the passed LogicalPort in the provider resource map");
    return found;
}

} // namespace cimple
