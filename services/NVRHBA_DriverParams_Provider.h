/// Serves the driver's parameters of each port, with their current values read anew.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_DriverParams.h"

namespace cimple {

class NVRHBA_DriverParams_Provider : public Read_Only_Provider<NVRHBA_DriverParams> {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_DriverParams* model, const Enum_Handler& handler);
};

} // namespace cimple
