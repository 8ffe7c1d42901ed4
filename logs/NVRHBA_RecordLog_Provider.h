/// Serves the record logs, of the provider and of the driver, from the agent's map, and the methods that steer them.
///
/// Each method runs under the agent's three locks. Its return value is 0 for done, 33068 for a target of another class,
/// 32968 for a bad argument. A target of the class that is not the driver's log stands for the provider's; properties
/// are written where the map has it.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_RecordLog.h"
#include "classes/NVRHBA_RecordLog_Methods.h"

namespace cimple {

class NVRHBA_RecordLog_Provider : public Read_Only_Provider<NVRHBA_RecordLog>, public NVRHBA_RecordLog_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_RecordLog* model, const Enum_Handler& handler);

    /// Level (5 alone is in range), mode (1 to 4) and trace file of the module's logger, which are stored too. Modes 2
    /// and 4 need a path that can be written. The driver's log has no such parameters: result 131.
    Invoke_Method_Status SetLogParams(const NVRHBA_RecordLog* self, const Property<uint16>& LogLevel,
                                      const Property<uint16>& LogMode, const Property<String>& TracePath,
                                      Property<uint32>& return_value);

    /// Clears all that the module's logger recorded, or the driver's lines.
    Invoke_Method_Status ClearLog(const NVRHBA_RecordLog* self, Property<uint32>& return_value);

    /// 2 enables the module's logger, and for the driver's log reads the driver's lines anew; 3 disables it, and drops
    /// them.
    Invoke_Method_Status RequestStateChange(const NVRHBA_RecordLog* self, const Property<uint16>& RequestedState,
                                            CIM_ConcreteJob*& Job, const Property<Datetime>& TimeoutPeriod,
                                            Property<uint32>& return_value);
};

} // namespace cimple
