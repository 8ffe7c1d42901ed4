/// Serves the help services of the diagnostic tests from the agent's map.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_HelpService.h"
#include "classes/NVRHBA_HelpService_Methods.h"

namespace cimple {

class NVRHBA_HelpService_Provider : public Read_Only_Provider<NVRHBA_HelpService>, public NVRHBA_HelpService_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_HelpService* model, const Enum_Handler& handler);
};

} // namespace cimple
