#include "runtime/Type.h"

namespace cimple {

const char* const type_names[number_of_types] = {
    "boolean", "uint8",  "sint8",  "uint16", "sint16", "uint32", "sint32",
    "uint64",  "sint64", "real32", "real64", "char16", "string", "datetime",
};

} // namespace cimple
