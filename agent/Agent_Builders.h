/// The refresh's way up: what stands on higher floors and fills maps during updateAdapterMaps.
///
/// Whoever composes a program out of the agent defines `agent_builders` once. An entry may be null: the agent then
/// skips the step with its words, since nothing is there to speak of. All are called by the fetch thread (the clear
/// operations also when the agent goes), with the agent's locks held; none may call ProviderAgent::GetInstance.
#pragma once

#include "runtime/Type.h"

namespace cimple {

class ProviderAgent;

struct Agent_Builders {
    // clearAdapterMaps, in this order.
    void (*clearDriverLogClasses)(ProviderAgent& agent);
    void (*clearPortVirtualizationClasses)(ProviderAgent& agent);
    void (*clearDiagnosticsClasses)(ProviderAgent& agent, int kind);

    // updateAdapterMaps behind the walk, in this order. Results: 0, or the status that is logged.
    uint32 (*CreateFCDriverLogClasses)(ProviderAgent& agent);
    uint32 (*FC_CreateDumpClasses)(ProviderAgent& agent);
    uint32 (*CreatePortVirtualizationClasses)(ProviderAgent& agent);
    uint32 (*CreateFCHBADiagnosticClassFeature)(ProviderAgent& agent);
};

extern const Agent_Builders agent_builders;

} // namespace cimple
