/// Values across the CMPI seam: what a module hands in becomes a Value, and a Value becomes CMPIData of new objects.
///
/// Nothing of the module's is kept: texts, arrays, paths and instances are copied. Any thread.
#pragma once

#include "host/Ledger.h"
#include "host/Value.h"

#include <cmpift.h>

namespace host {

class Broker;

/// Copies a module's value. A null pointer, a null object inside, or the type CMPI_null give a null Value of the type
/// (texts as CMPI_string). For CMPI_chars `value` is the text itself, as CMPI has it. `code` becomes 61 for a type
/// that no property can have, and 60 for an object that is none of the broker's.
Value value_of(const CMPIValue* value, CMPIType type, int& code);

/// The data record for a value; encapsulated types are new objects of that origin in the current scope.
CMPIData data_of(Broker& broker, const Value& value, Origin origin);

/// A null of that type, and a record without a value (with a status).
CMPIData null_data(CMPIType type);
CMPIData no_data(CMPIStatus* status, int code, int state);

} // namespace host
