/// One namespace in which indication filters are active, and how many.
///
/// Copied whole; equal where the namespaces are, so that a list of them holds each namespace once.
#pragma once

#include "runtime/Array.h"
#include "runtime/String.h"

namespace cimple {

struct Filter_Record {
    String name_space;
    uint32 count = 0;
};

template <>
struct Traits_Of<Filter_Record> {
    static const Array_Traits& traits();
};

} // namespace cimple
