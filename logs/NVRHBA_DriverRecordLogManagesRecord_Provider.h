/// The provider of the ties between the driver's log and its lines.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_DriverRecordLogManagesRecord.h"

namespace cimple {

class NVRHBA_DriverRecordLogManagesRecord_Provider
    : public Read_Only_Association_Provider<NVRHBA_DriverRecordLogManagesRecord> {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_DriverRecordLogManagesRecord* model, const Enum_Handler& handler);
};

} // namespace cimple
