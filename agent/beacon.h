/// A port's beacon as NVRHBA_FCPort.LocationIndicator shows it.
#pragma once

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

/// LocationIndicator's values.
enum Beacon : uint16 { BEACON_UNKNOWN = 0, BEACON_ON = 2, BEACON_OFF = 3, BEACON_NOT_SUPPORTED = 4 };

/// Asks the library for the beacon of the port with this WWPN text. Result 0, `indicator` then holding what it said
/// (unchanged for a state that has no value); 32968 for a text that is no WWPN or a null pointer. Logs its steps.
uint32 GetBeaconState(const char* wwpn, uint16* indicator);

/// Switches the beacon of the port on or off (BEACON_ON, BEACON_OFF). Result 0, also where the library refuses; 32968
/// for another value. Logs its steps.
uint32 SetBeaconState(const HBA_WWN& port, uint16 indicator);

} // namespace cimple
