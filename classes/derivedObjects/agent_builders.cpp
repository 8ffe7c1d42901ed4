// What the module composes into the agent's refresh.
#include "agent/Agent_Builders.h"
#include "diagnostics/NVR_Diagnostics.h"
#include "logs/NVRHBA_DriverLogProfile.h"
#include "services/NVR_Dump.h"
#include "services/NVR_PortVirtualization.h"

namespace cimple {

const Agent_Builders agent_builders = {
    &NVRHBA_DriverLogProfile::ClearFCDriverLogClasses,
    &NVR_PortVirtualization::ClearPortVirtualizationMaps,
    &NVR_Diagnostics::ClearDiagnosticClassMaps,
    &NVRHBA_DriverLogProfile::CreateFCDriverLogClasses,
    &NVR_Dump::FC_CreateDumpClasses,
    &NVR_PortVirtualization::CreatePortVirtualizationClasses,
    &NVR_Diagnostics::CreateFCHBADiagnosticClassFeature,
};

} // namespace cimple
