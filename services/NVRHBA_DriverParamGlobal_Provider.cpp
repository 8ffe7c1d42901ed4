#include "services/NVRHBA_DriverParamGlobal_Provider.h"

#include "agent/enumerate.h"
#include "foundation/CLogger.h"

namespace cimple {

Enum_Instances_Status NVRHBA_DriverParamGlobal_Provider::enum_instances(const NVRHBA_DriverParamGlobal*,
                                                                        const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    if (!agent.m_bLoaded) {
        NVR_LOG("RM Init failed for %s", "services/NVRHBA_DriverParamGlobal_Provider.cpp");
        return ENUM_INSTANCES_OK;
    }
    enumerateActive<&ProviderAgent::UpdateDriverParamGlobal>(agent, agent.m_NVRHBA_DriverParamGlobal_map, handler);
    NVR_LOG("NVRHBA_DriverParamGlobal_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

} // namespace cimple
