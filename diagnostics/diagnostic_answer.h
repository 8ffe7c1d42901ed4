/// Return values of the diagnostic methods.
#pragma once

#include "runtime/Type.h"

namespace cimple {

enum Diagnostic_Answer : uint32 {
    ANSWER_OK = 0,
    ANSWER_UNKNOWN_TEST = 1,
    ANSWER_FAILED = 4,
    ANSWER_INVALID = 5,
    ANSWER_STATUS = 40000 ///< and the status of the library
};

} // namespace cimple
