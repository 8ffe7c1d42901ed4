/// The one object behind all providers of the module: the inventory, the loggers, the settings, and one map of ready
/// instances per CIM class.
///
/// Lives from the first provider's load to the last one's unload. Providers copy instances out of the maps and never
/// ask the hardware; a background thread, started by the first call that finds the cache out of date, rebuilds them.
///
/// Lock order: m_AdapterDataReadyMutex, m_AdapterMapsReadyMutex, m_SANMapsReadyMutex, m_DataMutex, and then the local
/// mutex of an active enumeration. m_DataFetchMutex is innermost: nothing but the logger is taken under it. The
/// lifetime mutex is taken before any of them, and never on the fetch thread. The members are open to the floors above,
/// which read and write them under these locks: m_DataMutex guards the inventory and the content of the maps, each
/// ready mutex its flag. The flags are atomic words, since the refresh gate looks at them without their mutex.
#pragma once

#include <atomic>
#include <memory>
#include <vector>

#include "agent/Driver_Log_Store.h"
#include "agent/Map.h"
#include "agent/Pending.h"
#include "foundation/NVR_CIMLogger.h"
#include "foundation/NVR_FileLogger.h"
#include "foundation/NVR_SysLogger.h"
#include "foundation/NvrConfigFile.h"
#include "foundation/management_api.h"
#include "runtime/Blocks.h"
#include "runtime/Mutex.h"
#include "runtime/Thread.h"

namespace cimple {

class NVR_Data;
class Management_Session;

/// The module's version, as "v%d.%d.%d-%d" prints it.
constexpr int agent_major = 2;
constexpr int agent_minor = 5;
constexpr int agent_revision = 19;
constexpr int agent_build = 1;

class ProviderAgent {
public:
    // ------------------------------------------------------------------------------------------------ life (lifetime)

    /// The agent, built by the first call. Never null: one that failed to load has m_bLoaded false. The pointer is good
    /// while the caller's provider is loaded. Not to be called from what the constructor or destructor reaches.
    static ProviderAgent* GetInstance();

    /// What a provider's load does: gets the agent and counts. 0; or 30 if the agent failed to load, which is counted
    /// apart.
    static int load();
    /// What a provider's unload does: gives back what its load took. 0.
    static int unload();

    /// Counts up and down. The release that leaves no count of either kind waits for a running fetch thread, without
    /// holding the lifetime mutex, and then destroys the agent if it is still unused. A release on the fetch thread
    /// itself (by an up-call that comes back) cannot wait: the agent then stays until the next last release.
    static void addRef();
    static void releaseRef();

    // --------------------------------------------------------------------------------------------- refresh (refresh)

    /// The refresh gate, at the start of every operation that reads the maps: starts the fetch thread if the cache is
    /// out of date or a refresh is pending. Never waits for the refresh. Result 0.
    int BuildCimpleInfo();
    /// 1 if the cache is out of date, else 0. Under m_DataFetchMutex.
    int checkTimeOut();
    /// The fetch thread's procedure; `agent` is the ProviderAgent. Returns null.
    static void* DataFetch_Handler(void* agent);
    /// For a caller that holds m_SANMapsReadyMutex and has found the SAN maps not ready: waits once until they are,
    /// having made sure that a fetch thread serves it.
    void waitForSANMaps();

    // ---------------------------------------------------------------------- live values (under the locks of
    // Agent_Wait)

    /// Copies the counters of every port into the statistics instances.
    void GetFCPortStats();
    /// Reads the state of every port anew, at most once in 10 seconds.
    void UpdateFCPortStatus();
    /// Read the drivers' current parameter values anew, each at most once in 5 seconds.
    void UpdateDriverParams();
    void UpdateDriverParamGlobal();

    // --------------------------------------------------------------- maps (under m_DataMutex and their side's mutex)

    /// Empties all adapter-side maps and builds them from the inventory. Result 0, or 32769 if it ended early.
    uint32 updateAdapterMaps();
    /// The same for the SAN side.
    uint32 updateSANMaps();
    /// Creates the driver parameter instances: at most once in 5 seconds, unless there are none.
    void FetchDriverParams();

    void clearAdapterMaps();
    void clearSANMaps();
    /// Only logs: clearAdapterMaps empties the driver parameter maps.
    void clearDriverMaps();
    /// All of these, each under its ready mutex.
    void ClearMaps();

    /// 1 if the FC port map has a port of that WWPN, whatever the case of its letters; else 0. The two differ in their
    /// log words. Null is no port.
    int checkFCPort(const char* wwpn);
    int checkLogicalPort(const char* wwpn);

    // ------------------------------------------------------------------------------------------------------- members

    Pending m_bAdapterRefreshPending{true}; // a refresh is asked for, whatever the time
    std::atomic<bool> m_bRefreshAdapterData{false};
    Pending m_bSANRefreshPending{false};
    std::atomic<bool> m_bRefreshSANData{true};
    std::atomic<uint32> m_cacheTimeout{10}; // minutes
    std::atomic<bool> m_bLoaded{false};     // the constructor finished and the destructor has not begun
    std::unique_ptr<NVR_Data> m_pData;
    std::unique_ptr<Management_Session> m_pSession;
    NVR_FileLogger m_fileLogger;
    NVR_CIMLogger m_cimLogger;
    NVR_SysLogger m_sysLogger;
    NvrConfigFile m_config;

    Mutex m_DataMutex{false, "m_DataMutex", Lock_Place::data};
    std::atomic<bool> m_bIsAdapterDataReady{false};
    Mutex m_AdapterDataReadyMutex{false, "m_AdapterDataReadyMutex", Lock_Place::adapter_data_ready};
    Cond m_AdapterDataReadyCond;
    std::atomic<bool> m_bIsAdapterMapsReady{false};
    Mutex m_AdapterMapsReadyMutex{false, "m_AdapterMapsReadyMutex", Lock_Place::adapter_maps_ready};
    Cond m_AdapterMapsReadyCond;
    std::atomic<bool> m_bIsSANMapsReady{false};
    Mutex m_SANMapsReadyMutex{false, "m_SANMapsReadyMutex", Lock_Place::san_maps_ready};
    Cond m_SANMapsReadyCond;

    String m_osName;
    String m_osExtendedInfo;
    String m_hostName;
    String m_ipAddress;

    // Host, adapters and ports.
    Map<struct CIM_ComputerSystem> m_CIM_ComputerSystem_map;
    Map<struct NVRHBA_FCPort> m_NVRHBA_FCPort_map;
    Map<struct NVRHBA_FCPortStatistics> m_NVRHBA_FCPortStatistics_map;
    Map<struct NVRHBA_LogicalPortGroup> m_NVRHBA_LogicalPortGroup_map;
    Map<struct NVRHBA_PhysicalPackage> m_NVRHBA_PhysicalPackage_map;
    Map<struct NVRHBA_Transceiver> m_NVRHBA_Transceiver_map;
    Map<struct NVRHBA_PortController> m_NVRHBA_PortController_map;
    Map<struct NVRHBA_Product> m_NVRHBA_Product_map;
    Map<struct NVRHBA_RegisteredProfile> m_NVRHBA_RegisteredProfile_map;
    Map<struct NVRHBA_RemoteServiceAccessPoint> m_NVRHBA_RemoteServiceAccessPoint_map;
    Map<struct NVRHBA_SCSIProtocolController> m_NVRHBA_SCSIProtocolController_map;
    Map<struct NVRHBA_SoftwareIdentity> m_NVRHBA_SoftwareIdentity_map;
    Map<struct NVRHBA_ProviderConfigSetting> m_NVRHBA_ProviderConfigSetting_map;
    Map<struct NVRHBA_PCIDevice> m_NVRHBA_PCIDevice_map;
    Map<struct NVRHBA_PCIElementConformsToProfile> m_NVRHBA_PCIElementConformsToProfile_map;
    Map<struct NVRHBA_SystemDevice> m_NVRHBA_SystemDevice_map;
    Map<struct NVRHBA_DumpService> m_NVRHBA_DumpService_map;
    Map<struct NVRHBA_HostedDumpService> m_NVRHBA_HostedDumpService_map;
    Map<struct NVRHBA_DumpServiceAffectsElement> m_NVRHBA_DumpServiceAffectsElement_map;
    Map<struct NVRHBA_DumpData> m_NVRHBA_DumpData_map;
    Map<struct NVRHBA_ElementDumpData> m_NVRHBA_ElementDumpData_map;
    Map<struct NVRHBA_VitalProductData> m_NVRHBA_VitalProductData_map;
    Map<struct NVRHBA_ElementVPD> m_NVRHBA_ElementVPD_map;
    Map<struct NVRHBA_FCTagService> m_NVRHBA_FCTagService_map;
    Map<struct NVRHBA_FCTagServiceAffectsPort> m_NVRHBA_FCTagServiceAffectsPort_map;
    Map<struct NVRHBA_HostedFCTagService> m_NVRHBA_HostedFCTagService_map;
    Map<struct NVRHBA_FCTagElementSoftwareIdentity> m_NVRHBA_FCTagElementSoftwareIdentity_map;
    // Local endpoints.
    Map<struct NVRHBA_SCSIProtocolInitiatorEndpoint> m_NVRHBA_SCSIProtocolInitiatorEndpoint_map;
    Map<struct NVRHBA_LocalHostedInitiatorAccessPoint> m_NVRHBA_LocalHostedInitiatorAccessPoint_map;
    Map<struct NVRHBA_ChassisContainsCard> m_NVRHBA_ChassisContainsCard_map;
    // Targets and logical units: filled by the SAN phase.
    Map<struct NVRHBA_SCSIProtocolEndpoint> m_NVRHBA_SCSIProtocolEndpoint_map;
    Map<struct NVRHBA_LogicalDisk> m_NVRHBA_LogicalDisk_map;
    Map<struct NVRHBA_StorageVolume> m_NVRHBA_StorageVolume_map;
    Map<struct NVRHBA_TapeDrive> m_NVRHBA_TapeDrive_map;
    Map<struct NVRHBA_StorageExtent> m_NVRHBA_StorageExtent_map;
    Map<struct NVRHBA_SCSIArbitraryLogicalUnit> m_NVRHBA_SCSIArbitraryLogicalUnit_map;
    Map<struct NVRHBA_LocalHostedAccessPoint> m_NVRHBA_LocalHostedAccessPoint_map;
    Map<struct NVRHBA_LogicalDiskSystemDevice> m_NVRHBA_LogicalDiskSystemDevice_map;
    Map<struct NVRHBA_StorageVolumeSystemDevice> m_NVRHBA_StorageVolumeSystemDevice_map;
    Map<struct NVRHBA_TapeDriveSystemDevice> m_NVRHBA_TapeDriveSystemDevice_map;
    Map<struct NVRHBA_StorageExtentSystemDevice> m_NVRHBA_StorageExtentSystemDevice_map;
    Map<struct NVRHBA_SCSIArbitraryLogicalUnitSystemDevice> m_NVRHBA_SCSIArbitraryLogicalUnitSystemDevice_map;
    Map<struct NVRHBA_SCSIInitiatorTargetLogicalDiskPath> m_NVRHBA_SCSIInitiatorTargetLogicalDiskPath_map;
    Map<struct NVRHBA_SCSIInitiatorTargetStorageVolumePath> m_NVRHBA_SCSIInitiatorTargetStorageVolumePath_map;
    Map<struct NVRHBA_SCSIInitiatorTargetTapeDrivePath> m_NVRHBA_SCSIInitiatorTargetTapeDrivePath_map;
    Map<struct NVRHBA_SCSIInitiatorTargetStorageExtentPath> m_NVRHBA_SCSIInitiatorTargetStorageExtentPath_map;
    Map<struct NVRHBA_SCSIInitiatorTargetArbitraryLogicalUnitPath>
        m_NVRHBA_SCSIInitiatorTargetArbitraryLogicalUnitPath_map;
    // Where these lie. Most questions are about one kind, and then read that one from end to end.
    Blocks m_SANEndpointBlocks;
    Blocks m_SANUnitBlocks;
    Blocks m_SANLinkBlocks;
    // Virtual ports.
    Map<struct NVRHBA_ResourcePool> m_NVRHBA_ResourcePool_map;
    Map<struct NVRHBA_ElementAllocatedFromPool> m_NVRHBA_ElementAllocatedFromPool_map;
    Map<struct NVRHBA_HostedResourcePool> m_NVRHBA_HostedResourcePool_map;
    Map<struct NVRHBA_VirtualFCPort> m_NVRHBA_VirtualFCPort_map;
    Map<struct NVRHBA_VMSystemDevice> m_NVRHBA_VMSystemDevice_map;
    Map<struct NVRHBA_VPortHostedDependency> m_NVRHBA_VPortHostedDependency_map;
    // Record logs, of the provider and of the driver.
    Map<struct NVRHBA_RecordLog> m_NVRHBA_RecordLog_map;
    Map<struct NVRHBA_EnabledRecordLogCapabilities> m_NVRHBA_EnabledRecordLogCapabilities_map;
    Map<struct NVRHBA_RecordLogCapabilities> m_NVRHBA_RecordLogCapabilities_map;
    Map<struct NVRHBA_ProviderUseOfLog> m_NVRHBA_ProviderUseOfLog_map;
    Map<struct NVRHBA_RecordLogConformsToProfile> m_NVRHBA_RecordLogConformsToProfile_map;
    Map<struct NVRHBA_FCDriverLogEntry> m_NVRHBA_FCDriverLogEntry_map;

    Driver_Log_Store m_driverLogStore;

    uint32 m_indicationSequence = 0; // number of the next link alert

    // Management services and driver parameters.
    Map<struct NVRHBA_SoftwareInstallationService> m_NVRHBA_SoftwareInstallationService_map;
    Map<struct NVRHBA_SoftwareInstallationServiceCapabilities> m_NVRHBA_SoftwareInstallationServiceCapabilities_map;
    Map<struct NVRHBA_FCHBAWWNService> m_NVRHBA_FCHBAWWNService_map;
    Map<struct NVRHBA_BootBIOSService> m_NVRHBA_BootBIOSService_map;
    Map<struct NVRHBA_FCHBADriverParamService> m_NVRHBA_FCHBADriverParamService_map;
    Map<struct NVRHBA_DriverParamGlobal> m_NVRHBA_DriverParamGlobal_map;
    Map<struct NVRHBA_DriverParams> m_NVRHBA_DriverParams_map;
    Map<struct NVRHBA_DriverParameterAffectsFCPort> m_NVRHBA_DriverParameterAffectsFCPort_map;
    Map<struct NVRHBA_GlobalDriverServiceElementSettingData> m_NVRHBA_GlobalDriverServiceElementSettingData_map;
    Map<struct NVRHBA_DriverServiceElementSettingData> m_NVRHBA_DriverServiceElementSettingData_map;
    Map<struct NVRHBA_FCDriverServiceAffectsDriver> m_NVRHBA_FCDriverServiceAffectsDriver_map;
    // Associations of adapters, ports, software and profiles.
    Map<struct NVRHBA_ComputerSystemConformsToProfile> m_NVRHBA_ComputerSystemConformsToProfile_map;
    Map<struct NVRHBA_FCPortConformsToProfile> m_NVRHBA_FCPortConformsToProfile_map;
    Map<struct NVRHBA_PortControllerConformsToProfile> m_NVRHBA_PortControllerConformsToProfile_map;
    Map<struct NVRHBA_SoftwareConformsToProfile> m_NVRHBA_SoftwareConformsToProfile_map;
    Map<struct NVRHBA_ControlledBy> m_NVRHBA_ControlledBy_map;
    Map<struct NVRHBA_DeviceSAPImplementation> m_NVRHBA_DeviceSAPImplementation_map;
    Map<struct NVRHBA_ElementStatisticalData> m_NVRHBA_ElementStatisticalData_map;
    Map<struct NVRHBA_ElementSoftwareIdentity> m_NVRHBA_ElementSoftwareIdentity_map;
    Map<struct NVRHBA_FCPortSystemDevice> m_NVRHBA_FCPortSystemDevice_map;
    Map<struct NVRHBA_HostedCollection> m_NVRHBA_HostedCollection_map;
    Map<struct NVRHBA_InstalledSoftwareIdentity> m_NVRHBA_InstalledSoftwareIdentity_map;
    Map<struct NVRHBA_MemberOfCollection> m_NVRHBA_MemberOfCollection_map;
    Map<struct NVRHBA_PortControllerSystemDevice> m_NVRHBA_PortControllerSystemDevice_map;
    Map<struct NVRHBA_ProductElementComponent> m_NVRHBA_ProductElementComponent_map;
    Map<struct NVRHBA_ProductPhysicalComponent> m_NVRHBA_ProductPhysicalComponent_map;
    Map<struct NVRHBA_TransceiverComponent> m_NVRHBA_TransceiverComponent_map;
    Map<struct NVRHBA_ProtocolControllerForPort> m_NVRHBA_ProtocolControllerForPort_map;
    Map<struct NVRHBA_ProviderSoftwareIdentity> m_NVRHBA_ProviderSoftwareIdentity_map;
    Map<struct NVRHBA_ElementFlashImageSoftwareIdentity> m_NVRHBA_ElementFlashImageSoftwareIdentity_map;
    Map<struct NVRHBA_Realizes> m_NVRHBA_Realizes_map;
    Map<struct NVRHBA_ReferencedProfile> m_NVRHBA_ReferencedProfile_map;
    Map<struct NVRHBA_BaseServerReferencedProfile> m_NVRHBA_BaseServerReferencedProfile_map;
    Map<struct NVRHBA_RemoteHostedAccessPoint> m_NVRHBA_RemoteHostedAccessPoint_map;
    Map<struct NVRHBA_SAPAvailableForElement> m_NVRHBA_SAPAvailableForElement_map;
    Map<struct NVRHBA_SCSIProtocolControllerSystemDevice> m_NVRHBA_SCSIProtocolControllerSystemDevice_map;
    Map<struct NVRHBA_SystemPackaging> m_NVRHBA_SystemPackaging_map;
    Map<struct NVRHBA_FlashImageSoftwareIdentity> m_NVRHBA_FlashImageSoftwareIdentity_map;
    // Associations of the services.
    Map<struct NVRHBA_ElementCapabilities> m_NVRHBA_ElementCapabilities_map;
    Map<struct NVRHBA_InstallServiceAffectsFCPort> m_NVRHBA_InstallServiceAffectsFCPort_map;
    Map<struct NVRHBA_InstallServiceAffectsSystem> m_NVRHBA_InstallServiceAffectsSystem_map;
    Map<struct NVRHBA_HostedInstallationService> m_NVRHBA_HostedInstallationService_map;
    Map<struct NVRHBA_InstallServiceConformsToProfile> m_NVRHBA_InstallServiceConformsToProfile_map;
    Map<struct NVRHBA_HostedBootBIOSService> m_NVRHBA_HostedBootBIOSService_map;
    Map<struct NVRHBA_BootBIOSServiceAffectsSystem> m_NVRHBA_BootBIOSServiceAffectsSystem_map;
    Map<struct NVRHBA_BootBIOSServiceAffectsFCPort> m_NVRHBA_BootBIOSServiceAffectsFCPort_map;
    Map<struct NVRHBA_HostedFCHBAWWNService> m_NVRHBA_HostedFCHBAWWNService_map;
    Map<struct NVRHBA_FCHBAWWNServiceAffectsSystem> m_NVRHBA_FCHBAWWNServiceAffectsSystem_map;
    Map<struct NVRHBA_FCHBAWWNServiceAffectsFCPort> m_NVRHBA_FCHBAWWNServiceAffectsFCPort_map;
    Map<struct NVRHBA_HostedFCHBADriverParamService> m_NVRHBA_HostedFCHBADriverParamService_map;
    Map<struct NVRHBA_FCHBADriverParamServiceAffectsFCPort> m_NVRHBA_FCHBADriverParamServiceAffectsFCPort_map;
    Map<struct NVRHBA_FCHBADriverParamServiceAffectsSystem> m_NVRHBA_FCHBADriverParamServiceAffectsSystem_map;
    // Diagnostics.
    Map<struct NVRHBA_FCHBADiagnosticTest> m_NVRHBA_FCHBADiagnosticTest_map;
    Map<struct NVRHBA_AvailableDiagnosticService> m_NVRHBA_AvailableDiagnosticService_map;
    Map<struct NVRHBA_FCHBADiagnosticServiceCapabilities> m_NVRHBA_FCHBADiagnosticServiceCapabilities_map;
    Map<struct NVRHBA_ConcreteJob> m_NVRHBA_ConcreteJob_map;
    Map<struct NVRHBA_DiagnosticsLog> m_NVRHBA_DiagnosticsLog_map;
    Map<struct NVRHBA_HelpService> m_NVRHBA_HelpService_map;
    Map<struct NVRHBA_ServiceAffectsElement> m_NVRHBA_ServiceAffectsElement_map;
    Map<struct NVRHBA_ServiceAvailableToElement> m_NVRHBA_ServiceAvailableToElement_map;
    Map<struct NVRHBA_OwningJobElement> m_NVRHBA_OwningJobElement_map;
    Map<struct NVRHBA_AffectedJobElement> m_NVRHBA_AffectedJobElement_map;
    Map<struct NVRHBA_JobSettingData> m_NVRHBA_JobSettingData_map;
    Map<struct NVRHBA_UseOfLog> m_NVRHBA_UseOfLog_map;
    Map<struct NVRHBA_DiagnosticServiceRecord> m_NVRHBA_DiagnosticServiceRecord_map;
    Map<struct NVRHBA_LogManagesRecord> m_NVRHBA_LogManagesRecord_map;
    Map<struct NVRHBA_RecordAppliesToElement> m_NVRHBA_RecordAppliesToElement_map;
    Map<struct NVRHBA_DiagElementSettingData> m_NVRHBA_DiagElementSettingData_map;
    Map<struct NVRHBA_HostedService> m_NVRHBA_HostedService_map;
    Map<struct NVRHBA_DiagHostedService> m_NVRHBA_DiagHostedService_map;
    Map<struct NVRHBA_DiagnosticCompletionRecord> m_NVRHBA_DiagnosticCompletionRecord_map;
    Map<struct NVRHBA_FCHBADiagnosticSettingData> m_NVRHBA_FCHBADiagnosticSettingData_map;
    Map<struct NVRHBA_DiagnosticSettingDataRecord> m_NVRHBA_DiagnosticSettingDataRecord_map;
    Map<struct NVRHBA_CorrespondingSettingDataRecord> m_NVRHBA_CorrespondingSettingDataRecord_map;
    Map<struct NVRHBA_DiagServiceConformsToProfile> m_NVRHBA_DiagServiceConformsToProfile_map;
    Map<struct NVRHBA_DiagElementSoftwareIdentity> m_NVRHBA_DiagElementSoftwareIdentity_map;
    Map<struct NVRHBA_DiagnosticIdentity> m_NVRHBA_DiagnosticIdentity_map;
    Map<struct NVRHBA_DiagElementCapabilities> m_NVRHBA_DiagElementCapabilities_map;
    Map<struct NVRHBA_JobElementSettingData> m_NVRHBA_JobElementSettingData_map;

    Datetime m_loadedTime;    // when the last refresh ended
    Thread m_dataFetchThread; // empty: none was started, or it was joined
    Mutex m_DataFetchMutex{false, "m_DataFetchMutex", Lock_Place::innermost};
    std::atomic<bool> m_bDataFetchRunning{false};
    std::atomic<uint32> m_SANWaiters{0}; // SAN enumerations that wait for their maps
    Ref<Instance> m_pBaseServerProfile;
    bool m_bOwnComputerSystem = false; // the host instance was generated here; never cleared

    // When the rate-limited refreshes last ran.
    Datetime m_portStatusTime;
    Datetime m_driverParamsTime;
    Datetime m_driverParamGlobalTime;
    Datetime m_fetchDriverParamsTime;

    ProviderAgent(const ProviderAgent&) = delete;
    ProviderAgent& operator=(const ProviderAgent&) = delete;

private:
    /// `errno_found`: errno as the module's caller left it; the look-up of the settings file tests it.
    explicit ProviderAgent(int errno_found);
    ~ProviderAgent();
    void construct(int errno_found);
    void destruct();
    void forgetBaseServerProfile();

    static ProviderAgent* lockedInstance();
    static void markFetchThread();

    bool startFetchThread();
    void raiseAdapterFlags();
    bool hasFetchThread();
    void joinFetchThread(); // holds no lock while it waits
    void fetchData();
    void abandonFetch();
    bool SANMapsMissed() const;
    bool nothingLeftToFetch();
    void runAdapterPhase();
    void runSANPhase();
    static bool rateLimitPassed(Datetime& last, uint32 interval);
};

} // namespace cimple
