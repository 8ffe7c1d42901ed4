/// The provider of the ties between the provider's log and its records.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_RecordLogManagesRecord.h"

namespace cimple {

class NVRHBA_RecordLogManagesRecord_Provider : public Read_Only_Association_Provider<NVRHBA_RecordLogManagesRecord> {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_RecordLogManagesRecord* model, const Enum_Handler& handler);
};

} // namespace cimple
