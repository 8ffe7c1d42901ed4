#include "logs/NVRHBA_DriverRecordLogManagesRecord_Provider.h"

namespace cimple {

Enum_Instances_Status
NVRHBA_DriverRecordLogManagesRecord_Provider::enum_instances(const NVRHBA_DriverRecordLogManagesRecord*,
                                                             const Enum_Handler&)
{
    return ENUM_INSTANCES_OK;
}

} // namespace cimple
