/// Serves the profiles that the module implements: always all of them, made afresh, without waiting for a refresh.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_RegisteredProfile.h"
#include "classes/NVRHBA_RegisteredProfile_Methods.h"

namespace cimple {

class NVRHBA_RegisteredProfile_Provider : public Read_Only_Provider<NVRHBA_RegisteredProfile>,
                                          public NVRHBA_RegisteredProfile_Methods {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_RegisteredProfile* model, const Enum_Handler& handler);
};

} // namespace cimple
