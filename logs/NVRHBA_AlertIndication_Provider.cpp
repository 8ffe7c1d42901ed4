#include "logs/NVRHBA_AlertIndication_Provider.h"

namespace cimple {

Load_Status NVRHBA_AlertIndication_Provider::load()
{
    return static_cast<Load_Status>(ProviderAgent::load());
}

Unload_Status NVRHBA_AlertIndication_Provider::unload()
{
    return static_cast<Unload_Status>(ProviderAgent::unload());
}

Enable_Indications_Status NVRHBA_AlertIndication_Provider::enable_indications(Indication_Handler* handler)
{
    delete handler;
    return ENABLE_INDICATIONS_FAILED;
}

Disable_Indications_Status NVRHBA_AlertIndication_Provider::disable_indications()
{
    return DISABLE_INDICATIONS_OK;
}

} // namespace cimple
