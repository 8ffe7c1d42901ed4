/// Serves the driver's parameters that all ports share, with their current values read anew.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_DriverParamGlobal.h"

namespace cimple {

class NVRHBA_DriverParamGlobal_Provider : public Read_Only_Provider<NVRHBA_DriverParamGlobal> {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_DriverParamGlobal* model, const Enum_Handler& handler);
};

} // namespace cimple
