/// Serves the ports of the host, with their status read anew.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_FCPort_Methods.h"

namespace cimple {

class NVRHBA_FCPort_Provider : public Read_Only_Provider<NVRHBA_FCPort>, public NVRHBA_FCPort_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCPort* model, const Enum_Handler& handler);
};

} // namespace cimple
