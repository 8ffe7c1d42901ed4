/// The dump service of the host and the dump settings of each port, as instances.
///
/// Both operations work on the agent's maps, under its data mutex and that of the adapter maps.
#pragma once

#include "runtime/Type.h"

namespace cimple {

class ProviderAgent;

class NVR_Dump {
public:
    /// Makes the instances of all ports of the FC port map. Result 0; 40008 for an instance that cannot be made, 32769
    /// for one that is refused or a port whose name is none: the rest is then left out.
    static uint32 FC_CreateDumpClasses(ProviderAgent& agent);
    /// Empties the maps. Result 0.
    static uint32 FC_ClearDumpClasses(ProviderAgent& agent);
};

} // namespace cimple
