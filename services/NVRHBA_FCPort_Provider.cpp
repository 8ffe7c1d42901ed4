#include "services/NVRHBA_FCPort_Provider.h"

#include "agent/enumerate.h"
#include "foundation/CLogger.h"

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

} // namespace cimple
