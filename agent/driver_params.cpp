// The driver's parameters: their current values read anew, and the walk that creates their instances.
#include <string>
#include <vector>

#include "agent/Clock.h"
#include "agent/ProviderAgent.h"
#include "agent/associations.h"
#include "agent/driver_param_instances.h"
#include "agent/instance_table.h"
#include "agent/library_name.h"
#include "agent/walk_ports.h"
#include "classes/NVRHBA_DriverParamGlobal.h"
#include "classes/NVRHBA_DriverParams.h"
#include "classes/NVRHBA_FCHBADriverParamService.h"
#include "classes/NVRHBA_SoftwareIdentity.h"
#include "foundation/NVR_Common.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

constexpr uint32 driver_params_interval = 4999999; // microseconds
constexpr uint16 driver_classification = 2;

/// Stores the current value of a record in the instance with this InstanceID; without one it is dropped.
template <class T>
void store(const Map<T>& map, const String& id, uint32 value)
{
    const Ref<T> key(create_as<T>(true));
    set(key->InstanceID, id);
    if (auto* instance = static_cast<T*>(map.lookup(key.get()))) set(instance->current, value);
}

NVRHBA_SoftwareIdentity* driverIdentity(const Map<NVRHBA_SoftwareIdentity>& identities)
{
    for (std::size_t i = 0; i < identities.size(); i++) {
        const auto& classifications = identities[i]->Classifications;
        if (!classifications.null && classifications.value.size() > 0 &&
            classifications.value[0] == driver_classification)
            return identities[i];
    }
    return nullptr;
}

} // namespace

bool ProviderAgent::rateLimitPassed(Datetime& last, uint32 interval)
{
    const Datetime now = agent_now();
    if (now.usec() - last.usec() <= interval) {
        NVR_LOG("PERF: Refresh Not yet required");
        return false;
    }
    NVR_LOG("PERF: update driver map");
    last = now;
    return true;
}

void ProviderAgent::UpdateDriverParamGlobal()
{
    NVR_LOG("Checking driver TimeOut...");
    if (!rateLimitPassed(m_driverParamGlobalTime, driver_params_interval) || !m_pData) return;
    const bool done = guarded([&] {
        walkFCPorts(*m_pData, [&](FCAdapter&, FCPort& port) {
            HBA_WWN wwn = {};
            if (!library_name(wwn, port.portName().c_str(), "Id2HBAName failed", "str2HBAName failed")) return false;
            std::vector<RM_DRIVERPARAM> records;
            if (readDriverParams(wwn, true, records) != 0) return false;
            for (const RM_DRIVERPARAM& record : records)
                store(m_NVRHBA_DriverParamGlobal_map, text_of(fieldText(record.name)), record.currentValue);
            return false; // the first port speaks for all
        });
    });
    if (!done) NVR_LOG("Found issue with Global Driver Refresh");
}

void ProviderAgent::UpdateDriverParams()
{
    NVR_LOG("Checking driver TimeOut...");
    if (!rateLimitPassed(m_driverParamsTime, driver_params_interval) || !m_pData) return;
    const bool done = guarded([&] {
        walkFCPorts(*m_pData, [&](FCAdapter&, FCPort& port) {
            HBA_WWN wwn = {};
            if (!library_name(wwn, port.portName().c_str(), "Id2HBAName failed", "str2HBAName failed")) return true;
            std::vector<RM_DRIVERPARAM> records;
            if (readDriverParams(wwn, false, records) != 0) return false;
            for (const RM_DRIVERPARAM& record : records)
                store(m_NVRHBA_DriverParams_map, driverParamID(port.portName(), record), record.currentValue);
            return true;
        });
    });
    if (!done) NVR_LOG("Found issue with local Driver Refresh");
}

void ProviderAgent::FetchDriverParams()
{
    NVR_LOG("Checking driver TimeOut...");
    // A refresh within the interval has emptied the maps: without this they would stay so.
    if (m_NVRHBA_DriverParams_map.empty() && m_NVRHBA_DriverParamGlobal_map.empty())
        m_fetchDriverParamsTime = Datetime();
    if (!rateLimitPassed(m_fetchDriverParamsTime, driver_params_interval)) return;
    clearDriverMaps();
    const bool done = guarded([&] {
        const Instance* driver = driverIdentity(m_NVRHBA_SoftwareIdentity_map);
        if (!driver) {
            NVR_LOG("Could not locate the FC DriverServiceAffectsDriver Identity");
            return;
        }
        const auto& services = m_NVRHBA_FCHBADriverParamService_map;
        associate(*this, Link::FCDriverServiceAffectsDriver, driver, services.empty() ? nullptr : services[0]);
        bool first = true;
        walkFCPorts(*m_pData, [&](FCAdapter&, FCPort& port) {
            if (first) {
                if (const uint32 status = nvrcimGetDriverParam(*this, port.portName(), true)) {
                    NVR_LOG("Call to nvrcimGetDriverParam to retrieve Global Driver Parameters failed");
                    NVR_LOG("rm_status = %d", static_cast<int>(status));
                }
                first = false;
            }
            if (const uint32 status = nvrcimGetDriverParam(*this, port.portName(), false)) {
                NVR_LOG("Call to nvrcimGetDriverParam to retrieve Local Driver Parameters failed");
                NVR_LOG("rm_status = %d", static_cast<int>(status));
            }
            return true;
        });
    });
    if (!done) NVR_LOG("Error getting driver params");
}

} // namespace cimple
