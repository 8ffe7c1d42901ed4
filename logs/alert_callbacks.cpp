// Which ports of the host are registered for events, and how they come to be.
#include <algorithm>
#include <string>
#include <utility>
#include <vector>

#include "agent/Agent_Wait.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "foundation/management_binding.h"
#include "inventory/Adapter.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"
#include "logs/NVRHBA_AlertIndication_Provider.h"
#include "logs/alert_callbacks.h"
#include "runtime/Immortal.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

struct Registered_Port {
    HBA_CALLBACKHANDLE handle;
    std::string wwpn;
};

/// Process-wide: a registration that a library does not take back outlives the provider. Under
/// m_IndicationProviderMutex.
std::vector<Registered_Port>& registered_ports()
{
    static Immortal<std::vector<Registered_Port>> ports;
    return *ports;
}

bool isRegistered(const std::string& wwpn)
{
    const auto& ports = registered_ports();
    return std::any_of(ports.begin(), ports.end(), [&](const Registered_Port& port) { return port.wwpn == wwpn; });
}

bool removeCallback(const Registered_Port& port)
{
    HBA_STATUS status = HBA_STATUS_ERROR; // a library that throws has not taken it back
    guarded([&] { status = HBA_RemoveCallback(port.handle); });
    if (status == HBA_STATUS_OK) return true;
    NVR_LOG("Failed to un-register the Indication notification");
    return false;
}

/// The first failure ends the walk, and keeps the rest.
uint32 unregisterPorts()
{
    auto& ports = registered_ports();
    NVR_LOG("m_callbackHandles.size() is now %d ", static_cast<int>(ports.size()));
    while (!ports.empty()) {
        if (!removeCallback(ports.back())) return NVR_FAILURE;
        ports.pop_back();
        NVR_LOG("m_callbackHandles.size() is now %d (should reach 0)", static_cast<int>(ports.size()));
    }
    return 0;
}

/// An adapter of the library for a scope; null where it cannot be opened.
class Open_Adapter {
public:
    explicit Open_Adapter(std::string& name)
    {
        guarded([&] { m_handle = HBA_OpenAdapter(name.data()); });
    }
    ~Open_Adapter() noexcept(false)
    {
        if (m_handle != 0) guarded([&] { HBA_CloseAdapter(m_handle); });
    }
    Open_Adapter(const Open_Adapter&) = delete;
    Open_Adapter& operator=(const Open_Adapter&) = delete;
    operator HBA_HANDLE() const { return m_handle; }

private:
    HBA_HANDLE m_handle = 0;
};

uint32 registerPort(const Adapter& adapter, int index, const Port& port, void* provider)
{
    // Memory first: a registration must not be forgotten.
    std::string name = adapter.name();
    Registered_Port registration{nullptr, port.portName()};
    auto& ports = registered_ports();
    ports.reserve(ports.size() + 1);
    HBA_STATUS status = HBA_STATUS_ERROR;
    {
        const Open_Adapter handle(name);
        HBA_WWN wwpn;
        if (handle == 0) NVR_LOG("Failed to Open Adapter, Skipping registration for Indication notification");
        if (handle == 0 || !string2HBAName(&wwpn, registration.wwpn.c_str())) return NVR_FAILURE;
        guarded([&] {
            status = HBA_RegisterForAdapterPortEvents(&NVRHBA_AlertIndication_Provider::hbaThreadProc, provider, handle,
                                                      wwpn, &registration.handle);
        });
        if (status == HBA_STATUS_OK)
            ports.push_back(std::move(registration));
        else if (registration.handle) // it is registered all the same, and each event would come once more
            guarded([&] { HBA_RemoveCallback(registration.handle); });
    }
    if (status != HBA_STATUS_OK) {
        NVR_LOG("Failed to register the Indication notification");
        return NVR_FAILURE;
    }
    NVR_LOG("Registered for link events, adapter %d . reg_status=%d", index, static_cast<int>(status));
    return 0;
}

} // namespace

void retryRemovals()
{
    auto& ports = registered_ports();
    ports.erase(std::remove_if(ports.begin(), ports.end(), removeCallback), ports.end());
    keepLibrariesMapped(!ports.empty());
}

uint32 NVRHBA_AlertIndication_Provider::setHBACallbacks(bool register_ports)
{
    NVR_LOG("Entered NVRHBA_AlertIndication_Provider::setHBACallbacks(%s)", register_ports ? "true" : "false");
    return register_ports ? registerPorts() : unregisterPorts();
}

uint32 NVRHBA_AlertIndication_Provider::registerPorts()
{
    retryRemovals(); // what an earlier clean-up had to leave
    ProviderAgent& agent = *m_agent;
    const Ready_Lock adapters(agent.m_AdapterDataReadyMutex, agent.m_bIsAdapterDataReady, agent.m_AdapterDataReadyCond,
                              "m_bIsAdapterDataReady");
    if (!agent.m_pData || agent.m_pData->getAdapters().empty() || !agent.m_pData->haveAdapters()) return NVR_FAILURE;
    int index = 0;
    for (Adapter* adapter : agent.m_pData->getAdapters()) {
        const int number = index++;
        if (adapter->type() != Adapter::type_fc) {
            NVR_LOG("Skippping Adapter [%s] since it is not an FC Adapter", adapter->name().c_str());
            continue;
        }
        for (const Port* port : *adapter->getPorts()) {
            // One that is still registered, or that two adapters list, would tell every event twice.
            if (isRegistered(port->portName())) continue;
            if (registerPort(*adapter, number, *port, this) != 0) return NVR_FAILURE;
        }
    }
    return 0;
}

} // namespace cimple
