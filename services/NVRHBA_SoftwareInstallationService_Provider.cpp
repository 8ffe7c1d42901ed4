#include "services/NVRHBA_SoftwareInstallationService_Provider.h"

#include "agent/enumerate.h"
#include "foundation/CLogger.h"

namespace cimple {

Enum_Instances_Status
NVRHBA_SoftwareInstallationService_Provider::enum_instances(const NVRHBA_SoftwareInstallationService*,
                                                            const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_SoftwareInstallationService_map, handler);
    NVR_LOG("NVRHBA_SoftwareInstallationService_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status
NVRHBA_SoftwareInstallationService_Provider::StartService(const NVRHBA_SoftwareInstallationService*,
                                                          Property<uint32>& return_value)
{
    return_value.set(0u);
    return INVOKE_METHOD_OK;
}

} // namespace cimple
