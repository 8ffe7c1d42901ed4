#include "logs/NVRHBA_RecordLogManagesRecord_Provider.h"

namespace cimple {

Enum_Instances_Status NVRHBA_RecordLogManagesRecord_Provider::enum_instances(const NVRHBA_RecordLogManagesRecord*,
                                                                             const Enum_Handler&)
{
    return ENUM_INSTANCES_OK;
}

} // namespace cimple
