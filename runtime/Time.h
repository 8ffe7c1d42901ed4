/// Clock and sleep in microseconds.
#pragma once

#include "runtime/Type.h"

namespace cimple {

class Time {
public:
    /// Microseconds since the Unix epoch.
    static uint64 now();
    static void sleep(uint64 usec);
};

} // namespace cimple
