/// How the numbers of the Common HBA API and the management library become those of the CIM port classes.
///
/// Constant tables and pure functions over them.
#pragma once

#include <cstddef>

#include "runtime/Array.h"
#include "runtime/Type.h"

namespace cimple {

/// OperationalStatus and StatusDescriptions of a port state.
struct Status_Row {
    uint32 state;
    uint16 status;
    const char* text;
};
/// Of NVRHBA_FCPort, which shows the management library's states too.
const Status_Row& port_status(uint32 state);
/// Of the controllers.
const Status_Row& controller_status(uint32 state);

/// PortType; `text` goes to OtherPortType and OtherNetworkPortType, null sets neither.
struct Port_Type_Row {
    uint32 from;
    uint16 to;
    const char* text;
};
const Port_Type_Row& port_type(uint32 type);

/// Bits a second of a speed code; 0 for one that is none.
uint64 port_speed(uint32 code);
/// Of the fastest speed in a mask of speed codes; 0 for none.
uint64 max_port_speed(uint32 codes);

/// SupportedCOS: the classes of service in a mask; 0 alone for none.
Array<uint16> classes_of_service(uint32 mask);

/// SupportedFC4Types: the types in the API's map of 32 bytes, each in an element of its own.
Array<uint16> fc4_types(const uint32 (&map)[32]);

/// ControlledBy.AccessState of a port state.
uint16 access_state(uint32 state);

} // namespace cimple
