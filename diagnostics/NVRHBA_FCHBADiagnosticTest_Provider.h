/// Serves the diagnostic tests from the agent's map.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCHBADiagnosticTest.h"
#include "classes/NVRHBA_FCHBADiagnosticTest_Methods.h"

namespace cimple {

class NVRHBA_FCHBADiagnosticTest_Provider : public Read_Only_Provider<NVRHBA_FCHBADiagnosticTest>,
                                            public NVRHBA_FCHBADiagnosticTest_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCHBADiagnosticTest* model, const Enum_Handler& handler);
};

} // namespace cimple
