#include "agent/NVRHBA_FCPortStatistics_Provider.h"

#include "agent/enumerate.h"
#include "foundation/CLogger.h"

namespace cimple {

Enum_Instances_Status NVRHBA_FCPortStatistics_Provider::enum_instances(const NVRHBA_FCPortStatistics*,
                                                                       const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    if (!agent.m_bLoaded) {
        NVR_LOG("RM Init failed for %s", "agent/NVRHBA_FCPortStatistics_Provider.cpp");
        return ENUM_INSTANCES_OK;
    }
    enumerateActive<&ProviderAgent::GetFCPortStats>(agent, agent.m_NVRHBA_FCPortStatistics_map, handler);
    NVR_LOG("NVRHBA_FCPortStatistics_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

} // namespace cimple
