#include "diagnostics/NVRHBA_FCHBADiagnosticTest_Provider.h"

#include "agent/enumerate.h"
#include "foundation/CLogger.h"

namespace cimple {

Enum_Instances_Status NVRHBA_FCHBADiagnosticTest_Provider::enum_instances(const NVRHBA_FCHBADiagnosticTest*,
                                                                          const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_FCHBADiagnosticTest_map, handler);
    NVR_LOG("NVRHBA_FCHBADiagnosticTest_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

} // namespace cimple
