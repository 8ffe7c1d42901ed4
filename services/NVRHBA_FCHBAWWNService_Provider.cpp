#include "services/NVRHBA_FCHBAWWNService_Provider.h"

#include "agent/enumerate.h"
#include "foundation/CLogger.h"

namespace cimple {

Enum_Instances_Status NVRHBA_FCHBAWWNService_Provider::enum_instances(const NVRHBA_FCHBAWWNService*,
                                                                      const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_FCHBAWWNService_map, handler);
    NVR_LOG("NVRHBA_FCHBAWWNService_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

} // namespace cimple
