/// Runs a step whose exceptions end there: true if it ran through. Forced unwinding (a cancelled thread) goes on.
#pragma once

#include "runtime/Forced_Unwind.h"

namespace cimple {

template <class Step>
bool guarded(Step step)
{
    try {
        step();
        return true;
    } catch (...) {
        if (is_forced_unwind()) throw;
        return false;
    }
}

} // namespace cimple
