#include "logs/NVRHBA_FCDriverLogEntry_Provider.h"

namespace cimple {

Enum_Instances_Status NVRHBA_FCDriverLogEntry_Provider::enum_instances(const NVRHBA_FCDriverLogEntry*,
                                                                       const Enum_Handler&)
{
    return ENUM_INSTANCES_OK;
}

} // namespace cimple
