/// Single values between the two worlds: a Value to a CMPIData and back.
#pragma once

#include <cmpift.h>

#include "cmpi/Value.h"

namespace cimple {

/// How deep instances may lie in instances that a client or another provider sent; what lies deeper is refused.
constexpr unsigned deepest_instance = 32;

/// A value made for the broker. The string, date-time, path or array that was made for it goes back to the broker with
/// this record: have it set, added or returned before. Elements of arrays and embedded instances stay with the broker
/// until the request ends, since servers keep pointers to them.
struct Made_Data {
    CMPIData data{};

    Made_Data() = default;
    Made_Data(const Made_Data&) = delete;
    Made_Data& operator=(const Made_Data&) = delete;
    ~Made_Data();

    /// What a setter of CMPI takes: null for a null value.
    const CMPIValue* value() const { return data.state & CMPI_nullValue ? nullptr : &data.value; }
};

/// Runtime to CMPI. `flags` of the feature tell a reference from an embedded instance; `name_space` is for instances
/// without one. Bytes of strings that no XML can carry become '?'. 0, or -1 with a warning.
int to_cmpi_data(const CMPIBroker* broker, const char* name_space, const Value& value, uint32 flags, Made_Data& made);

/// The characters of a string that a client sent: 0, with null and a word in the log where it has none; or -1 with a
/// warning.
int read_chars(const CMPIString* string, const char*& text);

/// CMPI to runtime. `depth` counts how many instances the data lies in. 0, or -1 with a warning.
int cmpi_to_cimple_value(const CMPIBroker* broker, const Meta_Repository* repository, const CMPIData& data,
                         unsigned depth, Value& value);

} // namespace cimple
