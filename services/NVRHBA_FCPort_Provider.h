/// Serves the ports of the host, with their status read anew. One property can be changed: LocationIndicator, the
/// port's beacon.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_FCPort_Methods.h"

namespace cimple {

class NVRHBA_FCPort_Provider : public Read_Only_Provider<NVRHBA_FCPort>, public NVRHBA_FCPort_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCPort* model, const Enum_Handler& handler);

    /// Switches the beacon as LocationIndicator of `instance` says (2 on, 3 off), and shows it in the port from then
    /// on, whatever the library answered. INVALID_PARAMETER for another value, for none, and for an unknown port;
    /// FAILED for a port without a usable name, or one that has gone.
    Modify_Instance_Status modify_instance(const Instance* model, const Instance* instance);
};

} // namespace cimple
