/// One run of updateAdapterMaps: its steps, and what earlier steps made that later ones tie to.
///
/// Lives for the run, under m_AdapterMapsReadyMutex and m_DataMutex. Instances are the maps' own. The order of the
/// steps is the order of enumeration. A refused instance throws Update_Ended, which ends the run; a refused association
/// of the builders is logged, and the run goes on.
#pragma once

#include "agent/ProviderAgent.h"
#include "agent/associations.h"
#include "agent/instance_table.h"

namespace cimple {

class FCAdapter;
class FCAdapterAttributes;
class FCPort;
class FCPortAttributes;

class Adapter_Update {
public:
    explicit Adapter_Update(ProviderAgent& agent) : m_agent(agent) {}

    /// The host by up-call or of our own making, and the Base Server profile.
    void buildHost();
    void buildProfiles();
    /// Throws std::exception for a host without adapters.
    void testForAdapters();
    void buildProviderIdentity();
    void buildConfigSettings();
    void buildServices();
    void buildRecordLog();
    void buildAccessPoint();
    /// From the first adapter found.
    void buildDriverIdentities();
    void walkAdapters();

private:
    /// What a port's instances are made from and tied to.
    struct Port_Scope {
        const FCAdapterAttributes& adapter;
        FCPort& port;
        const FCPortAttributes& attributes;
        uint32 adapterNumber; // its index in the inventory
        const char* adapterName;
        uint32 adapterPorts;
        const char* wwpn;
        HBA_WWN wwn; // the library's form of it
        Instance* package;
        Instance* product;
        Instance* group;
        bool isFirst; // of its adapter
    };

    // host_instances.cpp
    Ref<Instance> askForHost();
    void askForBaseServerProfile();
    Ref<Instance> makeHost();
    void readHostName();

    // profile_instances.cpp
    Instance* createRegisteredProfile(const char* name);
    Instance* createProfile(const char* name);

    // service_instances.cpp
    void buildInstallationService();
    void buildWWNService();
    void buildTagService();
    void buildBootBIOSService();
    void buildDriverParamService();
    void buildServiceLinks(Instance* port, const char* name);

    // adapter_instances.cpp
    void buildAdapter(FCAdapter& adapter, uint32 number);

    // port_instances.cpp
    void buildPort(const Port_Scope& scope);
    /// Null if the port is to be passed over.
    Instance* buildPCIDevice(const Port_Scope& scope);
    void buildVPD(const Port_Scope& scope, const Instance* device);
    void buildTransceiver(const Port_Scope& scope);
    Instance* buildFCPort(const Port_Scope& scope);
    Instance* buildStatistics(const Port_Scope& scope);
    Instance* buildSCSIProtocolController(const Port_Scope& scope);
    Instance* buildPortController(const Port_Scope& scope);
    void buildInitiatorEndpoint(const Port_Scope& scope, Instance* port);

    // software_instances.cpp
    void buildFirmwareIdentities(const Port_Scope& scope, Instance* controller);
    Instance* insertIdentity(Ref<NVRHBA_SoftwareIdentity> identity);
    Instance* buildTagIdentity();

    /// The two properties by which a logical element names its host.
    template <class T>
    void setHost(T& instance)
    {
        set(instance.SystemCreationClassName, m_hostClass);
        set(instance.SystemName, m_hostName);
    }
    /// An association of the walk: without it the run ends.
    Instance* tie(Link link, const Instance* first, const Instance* second);
    /// The same, but a missing end, which the association's words tell, answers false and ends nothing.
    bool tieIfMade(Link link, const Instance* first, const Instance* second);

    ProviderAgent& m_agent;
    Instance* m_host = nullptr;
    String m_hostClass;
    String m_hostName;

    Instance* m_softwareInventory = nullptr;
    Instance* m_physicalPackage = nullptr;
    Instance* m_hostDiscoveredResources = nullptr;
    Instance* m_fcHBA = nullptr;
    Instance* m_storageHBA = nullptr;
    Instance* m_fcInitiatorPorts = nullptr;
    Instance* m_software = nullptr;
    Instance* m_accessPoints = nullptr;
    Instance* m_pciDevice = nullptr;

    Instance* m_providerIdentity = nullptr;
    Instance* m_driverIdentity = nullptr;
    Instance* m_installationService = nullptr;
    Instance* m_bootBIOSService = nullptr;
    Instance* m_wwnService = nullptr;
    Instance* m_driverParamService = nullptr;
    Instance* m_tagService = nullptr;
    Instance* m_accessPoint = nullptr;
};

} // namespace cimple
