/// A value of a CIM property and, directly behind it, the byte that says whether there is one.
#pragma once

#include "runtime/Type.h"

namespace cimple {

template <class T>
struct Property {
    T value;
    uint8 null; // 1: no value

    /// Stores `v` and marks the property as having a value.
    template <class V>
    void set(const V& v)
    {
        value = v;
        null = 0;
    }
};

} // namespace cimple
