// The management services, the provider's record log and the remote access point, with what ties them to the host.
#include "agent/Adapter_Update.h"
#include "classes/NVRHBA_BootBIOSService.h"
#include "classes/NVRHBA_EnabledRecordLogCapabilities.h"
#include "classes/NVRHBA_FCHBADriverParamService.h"
#include "classes/NVRHBA_FCHBAWWNService.h"
#include "classes/NVRHBA_FCTagService.h"
#include "classes/NVRHBA_ProviderConfigSetting.h"
#include "classes/NVRHBA_RecordLog.h"
#include "classes/NVRHBA_RemoteServiceAccessPoint.h"
#include "classes/NVRHBA_SoftwareInstallationService.h"
#include "classes/NVRHBA_SoftwareInstallationServiceCapabilities.h"
#include "foundation/CLogger.h"
#include "foundation/curl_places.h"
#include "foundation/library_closing.h"

namespace cimple {

namespace {

/// Can firmware be fetched by more than a file's path?
bool hasCurl()
{
    if (void* library = openCurl()) {
        if (closeLibrary(library) != 0) NVR_LOG("ERROR: UNABLE TO CLOSE DYNAMIC LIB");
        return true;
    }
    NVR_LOG("libcurl is not present. only file type URIScheme will be supported");
    return false;
}

/// What all services show, but for their host.
template <class T>
void setService(T& service, const char* class_name, const char* name, const char* description)
{
    set(service.CreationClassName, class_name);
    set(service.Name, name);
    set(service.Description, description);
    set(service.ElementName, description);
    set(service.Started, true);
    set(service.EnabledState, 2);
    set(service.RequestedState, 2);
    set(service.EnabledDefault, 2);
    set(service.TimeOfLastStateChange, Datetime());
    set(service.OperationalStatus, {2});
    set(service.HealthState, 5);
}

Ref<NVRHBA_SoftwareInstallationServiceCapabilities> makeInstallationCapabilities()
{
    auto made = make<NVRHBA_SoftwareInstallationServiceCapabilities>();
    set(made->InstanceID, "NVR:HBASoftwareInstallationServiceCapabilities");
    set(made->Description, "Norvane Software Installation Service Capabilities");
    set(made->ElementName, "Norvane Software Installation Service Capabilities");
    if (hasCurl())
        set(made->SupportedURISchemes, {3, 4, 5, 6, 8});
    else
        set(made->SupportedURISchemes, {3});
    set(made->SupportedTargetTypes, {"FC HBA"});
    set(made->SupportedAsynchronousActions, {2});
    set(made->SupportedSynchronousActions, {4, 5});
    set(made->SupportedExtendedResourceTypes, {2});
    set(made->CanAddToCollection, false);
    set(made->SupportedInstallOptions, {2, 3, 4, 5, 6, 7, 11});
    set(made->OtherSupportedExtendedResourceTypeDescriptions, {"Norvane FC firmware files"});
    set(made->SupportedExtendedResourceTypesMajorVersions, {0});
    set(made->SupportedExtendedResourceTypesMinorVersions, {0});
    set(made->SupportedExtendedResourceTypesRevisionNumbers, {0});
    set(made->SupportedExtendedResourceTypesBuildNumbers, {0});
    return made;
}

struct Setting_Row {
    const char* name;
    const char* description;
    uint32 low;
    uint32 high;
    uint32 def;
};

constexpr Setting_Row settings[] = {
    {"cachetimeout", "This setting defines the timeout value of Norvane CIM Provider's internal cache", 5, 30, 10},
    {"adapterrefresh",
     "This setting represents the Adapter data refresh setting value of Norvane CIM Provider's internal cache", 0, 1,
     0},
    {"sanrefresh",
     "This setting represents the SAN data refresh setting value of Norvane CIM Provider's internal cache", 0, 1, 1},
};

} // namespace

// In the order that gives each its index, by which a client's change is told.
void Adapter_Update::buildConfigSettings()
{
    const NvrConfigFile& config = m_agent.m_config;
    const uint32 current[] = {config.getCacheTimeout(), config.getRefreshAdapterData(), config.getRefreshSANData()};
    for (std::size_t i = 0; i < 3; i++) {
        const Setting_Row& row = settings[i];
        auto setting = make<NVRHBA_ProviderConfigSetting>();
        set(setting->InstanceID, text("Norvane HBA Provider:%s", row.name));
        set(setting->paramname, row.name);
        set(setting->Description, row.description);
        set(setting->lowRange, row.low);
        set(setting->highRange, row.high);
        set(setting->def, row.def);
        set(setting->current, current[i]);
        insert(m_agent.m_NVRHBA_ProviderConfigSetting_map, setting);
    }
}

void Adapter_Update::buildServices()
{
    buildInstallationService();
    buildWWNService();
    buildTagService();
    buildBootBIOSService();
    buildDriverParamService();
}

void Adapter_Update::buildInstallationService()
{
    NVR_LOG("Starting the SoftwareInstallationService");
    const Instance* profile = createProfile("Software Update");
    auto service = make<NVRHBA_SoftwareInstallationService>();
    setHost(*service);
    setService(*service, "NVRHBA_SoftwareInstallationService", "NVRHBA_FCSoftwareInstallationService",
               "Norvane FC HBA Software Installation Service");
    set(service->StartMode, "Automatic");
    set(service->Status, "ok");
    set(service->StatusDescriptions, {"ok"});
    m_installationService = insert(m_agent.m_NVRHBA_SoftwareInstallationService_map, service);
    const Instance* capabilities =
        insert(m_agent.m_NVRHBA_SoftwareInstallationServiceCapabilities_map, makeInstallationCapabilities());
    createAssocInstallationService(m_agent, m_hostName.c_str(), m_host, m_installationService);
    associate(m_agent, Link::InstallServiceConformsToProfile, profile, m_installationService,
              "Computer System, Update Profile");
    associate(m_agent, Link::ElementCapabilities, m_installationService, capabilities,
              "Element Capabilities, Norvane FC HBA Firmware Installation Service");
}

void Adapter_Update::buildWWNService()
{
    NVR_LOG("Starting the WWN Management Service");
    auto service = make<NVRHBA_FCHBAWWNService>();
    setHost(*service);
    setService(*service, "NVRHBA_FCHBAWWNService", "NVRHBA_FCHBAWWNService", "Norvane FC HBA WWN Management Service");
    set(service->StartMode, "Automatic");
    set(service->Status, "Ok");
    set(service->StatusDescriptions, {"ok"});
    m_wwnService = insert(m_agent.m_NVRHBA_FCHBAWWNService_map, service, "Failed to create WWN Services class");
    associate(m_agent, Link::HostedFCHBAWWNService, m_host, m_wwnService,
              "Hosted Service, Norvane FCHBA WWN Management Service");
    associate(m_agent, Link::FCHBAWWNServiceAffectsSystem, m_host, m_wwnService,
              text("FCHBA WWN Management Service Affects System: %s", m_hostName.c_str()).c_str());
}

void Adapter_Update::buildTagService()
{
    NVR_LOG("Starting the FCTagService");
    auto service = make<NVRHBA_FCTagService>();
    setHost(*service);
    setService(*service, "NVRHBA_FCTagService", "NVRHBA_FCTagService", "Norvane FC HBA Tagging Service");
    set(service->StatusDescriptions, {"ok"});
    m_tagService = insert(m_agent.m_NVRHBA_FCTagService_map, service);
    tie(Link::HostedFCTagService, m_host, m_tagService);
    tie(Link::FCTagElementSoftwareIdentity, buildTagIdentity(), m_tagService);
}

void Adapter_Update::buildBootBIOSService()
{
    NVR_LOG("Starting the BootBIOSService");
    auto service = make<NVRHBA_BootBIOSService>();
    setHost(*service);
    setService(*service, "NVRHBA_BootBIOSService", "NVRHBA_BootBIOSService", "Norvane FC HBA Boot BIOS Service");
    set(service->StartMode, "Automatic");
    set(service->Status, "Ok");
    set(service->StatusDescriptions, {"ok"});
    m_bootBIOSService = insert(m_agent.m_NVRHBA_BootBIOSService_map, service);
    associate(m_agent, Link::HostedBootBIOSService, m_host, m_bootBIOSService,
              "Hosted Service, Norvane FC HBA Boot BIOS Service");
    associate(m_agent, Link::BootBIOSServiceAffectsSystem, m_host, m_bootBIOSService,
              text("Boot BIOS Service Affects System: %s", m_hostName.c_str()).c_str());
}

void Adapter_Update::buildDriverParamService()
{
    NVR_LOG("Starting the FCHBASetDriverParamService");
    auto service = make<NVRHBA_FCHBADriverParamService>();
    setHost(*service);
    setService(*service, "NVRHBA_FCHBADriverParamService", "NVRHBA_FCHBADriverParamService",
               "Norvane FC HBA Set Driver Parameters Service");
    set(service->StartMode, "Automatic");
    set(service->Status, "OK");
    set(service->StatusDescriptions, {"OK"});
    m_driverParamService = insert(m_agent.m_NVRHBA_FCHBADriverParamService_map, service);
    associate(m_agent, Link::FCHBADriverParamServiceAffectsSystem, m_host, m_driverParamService,
              text("FCHBA Driver Param Service Affects System: %s", m_hostName.c_str()).c_str());
    associate(m_agent, Link::HostedFCHBADriverParamService, m_host, m_driverParamService,
              "Associates FCHBA driver management service to host system");
    NVR_LOG("Ending the FCHBASetDriverSetParamService");
}

void Adapter_Update::buildServiceLinks(Instance* port, const char* name)
{
    if (m_installationService) associate(m_agent, Link::InstallServiceAffectsFCPort, port, m_installationService, name);
    if (m_bootBIOSService) associate(m_agent, Link::BootBIOSServiceAffectsFCPort, port, m_bootBIOSService, name);
    if (m_wwnService) associate(m_agent, Link::FCHBAWWNServiceAffectsFCPort, port, m_wwnService, name);
    if (m_driverParamService)
        associate(m_agent, Link::FCHBADriverParamServiceAffectsFCPort, port, m_driverParamService, name);
    if (m_tagService) associate(m_agent, Link::FCTagServiceAffectsPort, port, m_tagService, name);
}

void Adapter_Update::buildRecordLog()
{
    const CLogger& logger = *CLogger::instance();
    auto made = make<NVRHBA_RecordLog>();
    set(made->InstanceID, text("NVRHBA:ProviderLog:%s", m_hostName.c_str()));
    set(made->MaxNumberOfRecords, 1024);
    set(made->LogState, 4);
    set(made->OverwritePolicy, 2);
    set(made->EnabledState, logger.isEnabled() ? 2 : 3);
    set(made->RequestedState, logger.isEnabled() ? 2 : 5);
    set(made->OperationalStatus, {2});
    set(made->HealthState, 5);
    set(made->Name, "Record logs for Norvane CIM Provider");
    set(made->ElementName, "Record logs for Norvane CIM Provider");
    const String path = m_agent.m_fileLogger.getPath();
    if (!path.empty()) set(made->TracePath, path);
    set(made->LogLevel, logger.getLevel());
    set(made->LogMode, logger.getMode());
    const String id = made->InstanceID.value;
    const Instance* log = insert(m_agent.m_NVRHBA_RecordLog_map, made, "Insert Failed : m_NVRHBA_NVRHBA_RecordLog_map");
    const Instance* profile = createProfile("Record Log");
    associate(m_agent, Link::RecordLogConformsToProfile, profile, log,
              text("%s conformant to %s profile", id.c_str(), "Record Log").c_str());

    auto capabilities = make<NVRHBA_EnabledRecordLogCapabilities>();
    set(capabilities->InstanceID, "NVRHBA provider log capabilities");
    set(capabilities->RequestedStatesSupported, {2, 3});
    set(capabilities->LogParamsSupported, {2, 3});
    set(capabilities->ElementNameEditSupported, false);
    const Instance* able = insert(m_agent.m_NVRHBA_EnabledRecordLogCapabilities_map, capabilities,
                                  "Insert Failed : m_NVRHBA_NVRHBA_EnabledRecordLogCapabilities_map");
    associate(m_agent, Link::RecordLogCapabilities, log, able, text("%s : Logging capabilities", id.c_str()).c_str());
    associate(m_agent, Link::ProviderUseOfLog, log, m_providerIdentity,
              text("%s uses log : %s", string_property(m_providerIdentity, "ElementName").c_str(), id.c_str()).c_str());
}

void Adapter_Update::buildAccessPoint()
{
    const std::string url = readWebLaunchURL();
    if (url.empty()) return;
    auto& map = m_agent.m_NVRHBA_RemoteServiceAccessPoint_map;
    if (!map.empty()) {
        m_accessPoint = map[0];
        return;
    }
    auto point = make<NVRHBA_RemoteServiceAccessPoint>();
    set(point->Description, "Fabrimon WebLaunch URL");
    set(point->Name, "Fabrimon");
    set(point->ElementName, "NVR FC HBA:Fabrimon Management Interface");
    setHost(*point);
    set(point->CreationClassName, "NVRHBA_RemoteServiceAccessPoint");
    set(point->AccessInfo, url);
    set(point->InfoFormat, 200);
    m_accessPoint = insert(map, point);
    NVR_LOG("Remote Hosted Service Access Point");
    tie(Link::RemoteHostedAccessPoint, m_host, m_accessPoint);
}

} // namespace cimple
