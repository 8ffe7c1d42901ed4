#include "services/NVRHBA_FCPort_Provider.h"

#include "agent/Agent_Wait.h"
#include "agent/beacon.h"
#include "agent/enumerate.h"
#include "agent/library_name.h"
#include "foundation/CLogger.h"
#include "services/service_method.h"

namespace cimple {

Enum_Instances_Status NVRHBA_FCPort_Provider::enum_instances(const NVRHBA_FCPort*, const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    if (!agent.m_bLoaded) {
        NVR_LOG("RM Init failed for %s", "services/NVRHBA_FCPort_Provider.cpp");
        return ENUM_INSTANCES_OK;
    }
    enumerateActive<&ProviderAgent::UpdateFCPortStatus>(agent, agent.m_NVRHBA_FCPort_map, handler);
    NVR_LOG("NVRHBA_FCPort_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Modify_Instance_Status NVRHBA_FCPort_Provider::modify_instance(const Instance* model, const Instance* instance)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    NVR_LOG("NVRHBA_FCPort_Provider::modify_instance");
    if (!model || !instance) {
        NVR_LOG("NVRHBA_FCPort_Provider::modify_instance invalid parameter");
        return MODIFY_INSTANCE_INVALID_PARAMETER;
    }
    const Map<NVRHBA_FCPort>& ports = agent.m_NVRHBA_FCPort_map;
    if (!isOfClass(model, NVRHBA_FCPort::meta) || !isOfClass(instance, NVRHBA_FCPort::meta) ||
        (!ports.empty() && ports.find(instance) < 0)) {
        NVR_LOG("Invalid instance of NVRHBA_FCPort Data");
        return MODIFY_INSTANCE_INVALID_PARAMETER;
    }
    const Property<uint16>& indicator = static_cast<const NVRHBA_FCPort*>(instance)->LocationIndicator;
    const bool wanted = !static_cast<const NVRHBA_FCPort*>(model)->LocationIndicator.null && !indicator.null;
    if (!wanted) return MODIFY_INSTANCE_INVALID_PARAMETER;
    NVR_LOG("Input BeaconState : %d", indicator.value);
    if (indicator.value != BEACON_ON && indicator.value != BEACON_OFF) {
        NVR_LOG("Invalid LocationIndicator, Valid values are '2' or '3'");
        return MODIFY_INSTANCE_INVALID_PARAMETER;
    }
    HBA_WWN port = {};
    if (!library_name(port, deviceID(instance), "NVRHBA_FCPort_Provider::Id2HBAName failed",
                      "NVRHBA_FCPort_Provider::::str2HBAName failed"))
        return MODIFY_INSTANCE_FAILED;
    if (SetBeaconState(port, indicator.value) != 0) return MODIFY_INSTANCE_FAILED;
    auto* published = static_cast<NVRHBA_FCPort*>(ports.lookup(instance));
    if (!published) return MODIFY_INSTANCE_FAILED;
    published->LocationIndicator.set(indicator.value);
    NVR_LOG("Beacon state modified successfully");
    return MODIFY_INSTANCE_OK;
}

} // namespace cimple
