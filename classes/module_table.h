/// The module's table of providers, and what its exported entries have in common.
///
/// The records are static and live for ever; the list of cimple_module is linked by the one initialiser of
/// registrations.cpp before anything can call an entry.
#pragma once

#include "cmpi/CMPI_Adapter.h"
#include "runtime/Registration.h"

/// An exported function with an unmangled name.
#define NORVANE_ENTRY extern "C" __attribute__((visibility("default")))

namespace cimple {

/// One record a provider, in the order of providers.txt.
extern Registration registrations[];

/// What the entries of one provider hand to the bridge.
struct Provider_Entry {
    MI_Table_Set* tables;
    Registration* registration;
};

/// The MI record of `kind` ('I', 'M', 'A' or 'N'), or null where the bridge could not make one.
template <class MI>
MI* provider_entry(const Provider_Entry& entry, const CMPIBroker* broker, const CMPIContext* context, char kind)
{
    void* result = nullptr;
    cimple_cmpi_adapter('C', entry.tables, entry.registration, broker, context, entry.registration->provider_name, kind,
                        &result);
    return static_cast<MI*>(result);
}

} // namespace cimple
