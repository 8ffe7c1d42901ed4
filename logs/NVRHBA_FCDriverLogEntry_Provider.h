/// The provider of the lines of the driver's log.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCDriverLogEntry.h"

namespace cimple {

class NVRHBA_FCDriverLogEntry_Provider : public Read_Only_Provider<NVRHBA_FCDriverLogEntry> {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCDriverLogEntry* model, const Enum_Handler& handler);
};

} // namespace cimple
