/// The provider of link alerts. It delivers none: enabling them is refused.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_AlertIndication.h"

namespace cimple {

class NVRHBA_AlertIndication_Provider {
public:
    Load_Status load();
    Unload_Status unload();
    /// Takes `handler` over. Result 140.
    Enable_Indications_Status enable_indications(Indication_Handler* handler);
    Disable_Indications_Status disable_indications();
};

} // namespace cimple
