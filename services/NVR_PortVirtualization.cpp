#include "services/NVR_PortVirtualization.h"

#include "agent/ProviderAgent.h"
#include "agent/associations.h"
#include "agent/instance_table.h"
#include "agent/library_name.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_ResourcePool.h"
#include "classes/NVRHBA_VirtualFCPort.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "services/NVR_MethodWrapper.h"

namespace cimple {

namespace {

/// ResourceType of the pools.
constexpr uint16 resource_type = 10;

bool libraryName(HBA_WWN& wwn, const char* wwpn)
{
    return library_name(wwn, wwpn, "NVRVCNA_PortVirtualization::CreatePortVirtualizationClasses::Id2HBAName failed",
                        "NVRVCNA_PortVirtualization::CreatePortVirtualizationClasses::str2HBAName failed");
}

/// One build. Each step answers false to end it.
class Build {
public:
    explicit Build(ProviderAgent& agent) : m_agent(agent)
    {
        const Instance_Map& hosts = agent.m_CIM_ComputerSystem_map;
        if (!hosts.empty()) m_host = hosts[0];
    }

    bool addPort(const NVRHBA_FCPort& port);

private:
    const Instance* addPool(const char* wwpn, uint32 count);
    bool addVPort(const NVRHBA_FCPort& port, const HBA_WWN& wwn, const RM_VPORTENTRY& entry, const Instance* pool);
    Ref<NVRHBA_VirtualFCPort> makeVPort(const HBA_WWN& port, const RM_VPORTENTRY& entry, const HBA_WWN& wwn,
                                        const std::string& name, const std::string& node);

    ProviderAgent& m_agent;
    const Instance* m_host = nullptr;
};

bool Build::addPort(const NVRHBA_FCPort& port)
{
    const char* wwpn = port.DeviceID.value.c_str();
    NVR_LOG("FC Port ID: %s", wwpn);
    HBA_WWN wwn = {};
    if (!libraryName(wwn, wwpn)) return false;
    VPort_List list;
    if (const int status = NVR_MethodWrapper::ListVPorts(wwn, &list)) {
        NVR_LOG("NVRVCNA_PortVirtualization::Failure in listing vports for port: %s, Rm Error: %d", wwpn, status);
        return true;
    }
    if (list.count == 0) {
        NVR_LOG("Need not create any resource pools since no vports exist for FCport: %s", wwpn);
        return true;
    }
    NVR_LOG("No of vports:%d for %s", static_cast<int>(list.count), wwpn);
    const Instance* pool = addPool(wwpn, list.count);
    if (!pool) return false;
    for (const RM_VPORTENTRY& entry : list.entries)
        if (!addVPort(port, wwn, entry, pool)) return false;
    NVR_LOG("Freeing VPList");
    return true;
}

const Instance* Build::addPool(const char* wwpn, uint32 count)
{
    NVR_LOG("Creating Resource pool ");
    auto made = makeOrLog<NVRHBA_ResourcePool>("Failed to create ResourcePool");
    if (!made) return nullptr;
    const String id = text("NVR:Resource Pool:%s", wwpn);
    set(made->InstanceID, id);
    set(made->ElementName, id);
    set(made->PoolID, id);
    set(made->Primordial, false);
    set(made->Capacity, count);
    set(made->Reserved, 0);
    set(made->ResourceType, resource_type);
    const Instance* pool = insertOrLog(m_agent.m_NVRHBA_ResourcePool_map, Ref<Instance>(made.release()));
    if (!pool) return nullptr;
    NVR_LOG("Resource Pool created and inserted in map");

    NVR_LOG("Creating HostedResource pool ");
    if (!associate(m_agent, Link::HostedResourcePool, m_host, pool)) return nullptr;
    NVR_LOG("HostedResource Pool created and inserted in map");
    return pool;
}

bool Build::addVPort(const NVRHBA_FCPort& port, const HBA_WWN& wwn, const RM_VPORTENTRY& entry, const Instance* pool)
{
    const std::string name = wwnText(entry.wwpn);
    const std::string node = wwnText(entry.wwnn);
    NVR_LOG("VPort Id :%s Node name: %s", name.c_str(), node.c_str());
    HBA_WWN vport = {};
    if (!libraryName(vport, name.c_str())) return false;
    auto made = makeVPort(wwn, entry, vport, name, node);
    if (!made) return false;
    const Instance* inserted = insertOrLog(m_agent.m_NVRHBA_VirtualFCPort_map, Ref<Instance>(made.release()));
    if (!inserted) return false;
    NVR_LOG("Created VirtualFCPort and inserted in map");

    if (!associate(m_agent, Link::VPortHostedDependency, &port, inserted)) return false;
    NVR_LOG("VPortHostedDependency created and inserted in map");
    if (!associate(m_agent, Link::ElementAllocatedFromPool, pool, inserted)) return false;
    NVR_LOG("ElementAllocatedFromPool created and inserted in map");
    return true;
}

Ref<NVRHBA_VirtualFCPort> Build::makeVPort(const HBA_WWN& port, const RM_VPORTENTRY& entry, const HBA_WWN& wwn,
                                           const std::string& name, const std::string& node)
{
    RM_VPORTATTRIBUTES attributes = {};
    const int status = NVR_MethodWrapper::ListVPortAttributes(port, wwn, &attributes);
    if (status != 0)
        NVR_LOG("NVRVCNA_PortVirtualization::Failure in listing vports information for port: %s, Rm Error: %d",
                name.c_str(), status);
    auto made = makeOrLog<NVRHBA_VirtualFCPort>("Failed to create VirtualFCPort");
    if (!made) return made;
    if (m_host) {
        set(made->SystemCreationClassName, string_property(m_host, "CreationClassName"));
        set(made->SystemName, string_property(m_host, "Name"));
    }
    set(made->CreationClassName, "NVR_VirtualFCPort");
    set(made->Name, name);
    set(made->DeviceID, name);
    set(made->NodeWWN, node);
    set(made->PortFCId, entry.portFcId);
    if (status == 0) set(made->VPortName, fieldText(attributes.name));
    return made;
}

} // namespace

uint32 NVR_PortVirtualization::CreatePortVirtualizationClasses(ProviderAgent& agent)
{
    NVR_LOG("NVR_PortVirtualization::CreatePortVirtualizationClasses");
    const auto& ports = agent.m_NVRHBA_FCPort_map;
    if (ports.empty()) {
        NVR_LOG("Unable to create the Port Virtualization classes, No Physical Port(FCoE) exists");
        return 0;
    }
    ClearPortVirtualizationMaps(agent);
    NVR_LOG("No of FC Ports: %d", static_cast<int>(ports.size()));
    Build build(agent);
    for (std::size_t i = 0; i < ports.size(); i++)
        if (!build.addPort(*ports[i])) break;
    return 0;
}

void NVR_PortVirtualization::ClearPortVirtualizationMaps(ProviderAgent& agent)
{
    NVR_LOG("ClearPortVirtualizationMaps for FC invoked");
    agent.m_NVRHBA_ResourcePool_map.clear();
    agent.m_NVRHBA_ElementAllocatedFromPool_map.clear();
    agent.m_NVRHBA_HostedResourcePool_map.clear();
    agent.m_NVRHBA_VirtualFCPort_map.clear();
    agent.m_NVRHBA_VMSystemDevice_map.clear();
    agent.m_NVRHBA_VPortHostedDependency_map.clear();
    NVR_LOG("Exiting ClearPortVirtualizationMaps ");
}

} // namespace cimple
