// What the module composes into the agent's refresh.
#include "agent/Agent_Builders.h"
#include "logs/NVRHBA_DriverLogProfile.h"
#include "services/NVR_Dump.h"
#include "services/NVR_PortVirtualization.h"

namespace cimple {

const Agent_Builders agent_builders = {
    &NVRHBA_DriverLogProfile::ClearFCDriverLogClasses,
    &NVR_PortVirtualization::ClearPortVirtualizationMaps,
    nullptr,
    &NVRHBA_DriverLogProfile::CreateFCDriverLogClasses,
    &NVR_Dump::FC_CreateDumpClasses,
    &NVR_PortVirtualization::CreatePortVirtualizationClasses,
    nullptr,
};

} // namespace cimple
