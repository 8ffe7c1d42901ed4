/// Serves the counters of each port, read anew at each enumeration.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_FCPortStatistics.h"
#include "classes/NVRHBA_FCPortStatistics_Methods.h"

namespace cimple {

class NVRHBA_FCPortStatistics_Provider : public Read_Only_Provider<NVRHBA_FCPortStatistics>,
                                         public NVRHBA_FCPortStatistics_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_FCPortStatistics* model, const Enum_Handler& handler);
};

} // namespace cimple
