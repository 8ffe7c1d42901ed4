/// Serves the dump settings of each port from the agent's map.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_DumpData.h"

namespace cimple {

class NVRHBA_DumpData_Provider : public Read_Only_Provider<NVRHBA_DumpData> {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_DumpData* model, const Enum_Handler& handler);
};

} // namespace cimple
