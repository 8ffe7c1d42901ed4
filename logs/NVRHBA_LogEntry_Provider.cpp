#include "logs/NVRHBA_LogEntry_Provider.h"

namespace cimple {

Enum_Instances_Status NVRHBA_LogEntry_Provider::enum_instances(const NVRHBA_LogEntry*, const Enum_Handler&)
{
    return ENUM_INSTANCES_OK;
}

} // namespace cimple
