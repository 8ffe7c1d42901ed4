/// Serves the logs of the diagnostic tests from the agent's map, and clears them.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_DiagnosticsLog.h"
#include "classes/NVRHBA_DiagnosticsLog_Methods.h"

namespace cimple {

class NVRHBA_DiagnosticsLog_Provider : public Read_Only_Provider<NVRHBA_DiagnosticsLog>,
                                       public NVRHBA_DiagnosticsLog_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_DiagnosticsLog* model, const Enum_Handler& handler);

    /// Takes the service and completion records of the log's test out of their maps, with their ties to log and port;
    /// jobs and records of settings stay. Return value 0; 5 for an instance that is not served; 4 if a map cannot be
    /// built anew, which is then left as it is.
    Invoke_Method_Status ClearLog(const NVRHBA_DiagnosticsLog* self, Property<uint32>& return_value);
};

} // namespace cimple
