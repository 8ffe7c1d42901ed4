/// What an entry handed to the bridge's factory. The fake factory makes no adapter.
#pragma once

#include "cmpi/CMPI_Adapter.h"

namespace cimple::fake {

struct Factory_Call {
    char tag = 0;
    MI_Table_Set* tables = nullptr;
    Registration* registration = nullptr;
    const CMPIBroker* broker = nullptr;
    const CMPIContext* context = nullptr;
    const char* provider_name = nullptr;
    char kind = 0;
};

/// The latest call of the process. One thread.
Factory_Call& last_factory_call();

} // namespace cimple::fake
