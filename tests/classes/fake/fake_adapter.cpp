/// The bridge's factory, as far as the entries can tell: it gives the MI record of the kind out of the table set.
#include "tests/classes/fake/fake_adapter.h"

namespace cimple {

namespace fake {

Factory_Call& last_factory_call()
{
    static Factory_Call call;
    return call;
}

} // namespace fake

extern "C" int cimple_cmpi_adapter(char tag, MI_Table_Set* tables, Registration* registration, const CMPIBroker* broker,
                                   const CMPIContext* context, const char* provider_name, char kind, void** result)
{
    fake::last_factory_call() = {tag, tables, registration, broker, context, provider_name, kind};
    switch (kind) {
    case 'I':
        *result = &tables->instance_mi;
        break;
    case 'M':
        *result = &tables->method_mi;
        break;
    case 'A':
        *result = &tables->association_mi;
        break;
    case 'N':
        *result = &tables->indication_mi;
        break;
    default:
        break;
    }
    return 0;
}

} // namespace cimple
