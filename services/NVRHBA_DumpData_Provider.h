/// Serves the dump settings of each port from the agent's map, and lets a client change how many dumps are kept.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_DumpData.h"

namespace cimple {

class NVRHBA_DumpData_Provider : public Read_Only_Provider<NVRHBA_DumpData> {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_DumpData* model, const Enum_Handler& handler);
    /// Changes `RetentionCount` of the setting with `instance`'s keys, if neither `model` nor `instance` has it null,
    /// and then reads all dump settings anew. Results: 0; 101 for another `DumpDirectory`, which cannot be changed: the
    /// count is left alone then; 102 for a null argument; 104 for no such setting and for a count that is refused.
    Modify_Instance_Status modify_instance(const NVRHBA_DumpData* model, const NVRHBA_DumpData* instance);
};

} // namespace cimple
