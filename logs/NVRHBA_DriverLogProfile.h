/// The record log of the FC driver, as instances: the log itself, what it can do, and whose log it is.
///
/// Both operations work on the agent's maps, under its data mutex and that of the adapter maps.
#pragma once

#include "runtime/Type.h"

namespace cimple {

class ProviderAgent;

class NVRHBA_DriverLogProfile {
public:
    /// From the first FC adapter of the inventory; without one there is no log. Result 0, or 32769 for an instance that
    /// is refused or a driver without a software identity; what was made by then stays.
    static uint32 CreateFCDriverLogClasses(ProviderAgent& agent);
    /// Empties the map of the log's entries; the other instances stand in the maps of the provider's own log.
    static void ClearFCDriverLogClasses(ProviderAgent& agent);
};

} // namespace cimple
