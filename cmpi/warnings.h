/// Log call sites of the conversion layer: its warnings can be turned off as a whole.
#pragma once

#include "runtime/log.h"

#define CONVERSION_WARN(...)                                                                                           \
    do {                                                                                                               \
        if (::cimple::log_warnings_enabled()) CIMPLE_WARN(__VA_ARGS__);                                                \
    } while (0)
