// The rebuild of the SAN-side maps: its walk over adapters and ports, and how a failure ends it.
#include <malloc.h>

#include "agent/SAN_Update.h"
#include "agent/instance_table.h"
#include "classes/CIM_ComputerSystem.h"
#include "classes/NVRHBA_SCSIProtocolInitiatorEndpoint.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "inventory/Adapter.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"
#include "inventory/Target.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

/// From so many on the memory of the old maps is given back to the system before the new ones are made. The allocator
/// seldom gives this refresh's thread the arena of the last one's, and the server would hold both.
constexpr std::size_t many_paths = 4096;

std::string smallLetters(const char* text)
{
    std::string small;
    for (; *text; text++)
        small += static_cast<char>(lower_case[static_cast<uint8>(*text)]);
    return small;
}

} // namespace

SAN_Update::SAN_Update(ProviderAgent& agent) : m_agent(agent)
{
    if (agent.m_CIM_ComputerSystem_map.empty()) return; // then there are no endpoints either
    m_host = agent.m_CIM_ComputerSystem_map[0];
    m_hostClass = string_property(m_host, "CreationClassName");
    m_hostName = string_property(m_host, "Name");
    const auto& endpoints = agent.m_NVRHBA_SCSIProtocolInitiatorEndpoint_map;
    for (std::size_t i = 0; i < endpoints.size(); i++)
        m_initiators.emplace(smallLetters(endpoints[i]->Name.value.c_str()), endpoints[i]);
}

void SAN_Update::walkAdapters()
{
    const NVR_Data& data = *m_agent.m_pData;
    if (data.getAdapters().size() != static_cast<std::size_t>(data.getNumberOfAdapters())) throw std::exception();
    for (Adapter* adapter : data.getAdapters()) {
        if (adapter->type() != Adapter::type_fc) {
            NVR_LOG("Skippping Adapter [%s] since it is not an FC Adapter", adapter->name().c_str());
            continue;
        }
        NVR_LOG("%s", adapter->name().c_str());
        int number = 0;
        for (Port* port : *adapter->getPorts()) {
            NVR_LOG("*********************************");
            NVR_LOG("*********************************");
            NVR_LOG("Creating classes for port %d.", number);
            number++;
            buildPort(*port);
        }
    }
}

void SAN_Update::buildPort(Port& port)
{
    const auto found = m_initiators.find(smallLetters(port.portName().c_str()));
    if (found == m_initiators.end()) return;
    NVR_LOG("%s", string_property(found->second, "Name").c_str());
    const int count = static_cast<int>(port.getNumberOfTargets());
    int index = 0;
    for (const Target* target : *port.getTargets()) {
        NVR_LOG("Creating classes for target %d of %d.", index, count);
        Target_Scope scope{*target, found->second, port.portName().c_str(), {}, {}, {}, {}};
        buildTarget(scope, index++);
    }
}

uint32 ProviderAgent::updateSANMaps()
{
    NVR_LOG("PERF: updateSANMaps: Entry");
    const std::size_t paths = m_NVRHBA_SCSIProtocolEndpoint_map.size();
    clearSANMaps();
    for (Blocks* blocks : {&m_SANEndpointBlocks, &m_SANUnitBlocks, &m_SANLinkBlocks})
        blocks->rewind();
    if (paths >= many_paths) malloc_trim(0);
    const bool is_walked = guarded([this] {
        if (m_pData && m_pData->haveAdapters()) SAN_Update(*this).walkAdapters();
    });
    if (!is_walked) return NVR_FAILURE; // a refused instance, or an inventory that contradicts itself
    NVR_LOG("PERF: updateSANMaps: cleanExit");
    return 0;
}

} // namespace cimple
