/// Serves the diagnostic tests from the agent's map, and runs them.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/CIM_ConcreteJob.h"
#include "classes/CIM_DiagnosticSettingData.h"
#include "classes/CIM_JobSettingData.h"
#include "classes/CIM_ManagedElement.h"
#include "classes/NVRHBA_FCHBADiagnosticTest.h"
#include "classes/NVRHBA_FCHBADiagnosticTest_Methods.h"

namespace cimple {

class NVRHBA_FCHBADiagnosticTest_Provider : public Read_Only_Provider<NVRHBA_FCHBADiagnosticTest>,
                                            public NVRHBA_FCHBADiagnosticTest_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCHBADiagnosticTest* model, const Enum_Handler& handler);

    /// Runs the test on the port behind the port controller `ManagedElement`, to its end: that takes up to two minutes,
    /// and as long again where a cancel fails, under the agent's locks. Settings that are null are the defaults; those
    /// that are given are written over the defaults for good. Return value 0 for a test that was carried out, whatever
    /// it found; 1 for an unknown test; 5 for instances, settings or a target that are none; 40000 plus the status of a
    /// test that could not be carried out. `Job` is the job that the run has left, also beside a failure.
    Invoke_Method_Status RunDiagnosticService(const NVRHBA_FCHBADiagnosticTest* self,
                                              CIM_ManagedElement*& ManagedElement,
                                              CIM_DiagnosticSettingData*& DiagnosticSettings,
                                              CIM_JobSettingData*& JobSettings, CIM_ConcreteJob*& Job,
                                              Property<uint32>& return_value);
};

} // namespace cimple
