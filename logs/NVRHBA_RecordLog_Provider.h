/// Serves the record logs, of the provider and of the driver, from the agent's map.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_RecordLog.h"
#include "classes/NVRHBA_RecordLog_Methods.h"

namespace cimple {

class NVRHBA_RecordLog_Provider : public Read_Only_Provider<NVRHBA_RecordLog>, public NVRHBA_RecordLog_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_RecordLog* model, const Enum_Handler& handler);

    template <class... Arguments>
    Invoke_Method_Status SetLogParams(Arguments&&...)
    {
        return INVOKE_METHOD_UNSUPPORTED;
    }
};

} // namespace cimple
