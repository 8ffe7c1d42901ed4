/// Runs a step whose exceptions end there: true if it ran through. Forced unwinding (a cancelled thread) goes on.
#pragma once

#include <cxxabi.h>

namespace cimple {

template <class Step>
bool guarded(Step step)
{
    try {
        step();
        return true;
    } catch (abi::__forced_unwind&) {
        throw;
    } catch (...) {
        return false;
    }
}

} // namespace cimple
