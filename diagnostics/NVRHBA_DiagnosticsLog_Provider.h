/// Serves the logs of the diagnostic tests from the agent's map.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_DiagnosticsLog.h"
#include "classes/NVRHBA_DiagnosticsLog_Methods.h"

namespace cimple {

class NVRHBA_DiagnosticsLog_Provider : public Read_Only_Provider<NVRHBA_DiagnosticsLog>,
                                       public NVRHBA_DiagnosticsLog_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_DiagnosticsLog* model, const Enum_Handler& handler);
};

} // namespace cimple
