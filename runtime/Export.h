/// What the shared module exports: everything else is hidden by the compiler's flags.
#pragma once

#define CIMPLE_EXPORT __attribute__((visibility("default")))
