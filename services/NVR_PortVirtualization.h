/// The virtual ports of the host's ports, and the pool of each port that they come from, as instances.
///
/// Both operations work on the agent's maps, under its data mutex and that of the adapter maps.
#pragma once

#include "runtime/Type.h"

namespace cimple {

class ProviderAgent;

class NVR_PortVirtualization {
public:
    /// Empties the maps and builds them for all ports of the FC port map. An instance that cannot be made or is refused
    /// ends the build where it stands; a port whose virtual ports cannot be listed costs only itself. Result 0, always.
    static uint32 CreatePortVirtualizationClasses(ProviderAgent& agent);
    static void ClearPortVirtualizationMaps(ProviderAgent& agent);
};

} // namespace cimple
