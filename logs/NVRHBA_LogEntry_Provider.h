/// The provider of the records of the provider's log.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_LogEntry.h"

namespace cimple {

class NVRHBA_LogEntry_Provider : public Read_Only_Provider<NVRHBA_LogEntry> {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_LogEntry* model, const Enum_Handler& handler);
};

} // namespace cimple
