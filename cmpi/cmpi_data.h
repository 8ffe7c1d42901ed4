/// Single values between the two worlds: a Value to a CMPIData and back.
#pragma once

#include <cmpift.h>

#include "cmpi/Value.h"
#include "cmpi/cmpi_call.h"

namespace cimple {

/// How deep instances may lie in instances that a client or another provider sent; what lies deeper is refused.
constexpr unsigned deepest_instance = 32;

/// A value made for the broker. The string, date-time, path or array that was made for it goes back to the broker with
/// this record: have it set, added or returned before. Elements of arrays and embedded instances stay with the broker
/// until the request ends, since servers keep pointers to them.
struct Made_Data {
    CMPIData data{};
    bool is_kept = false; ///< the string is a Kept_Text's

    Made_Data() = default;
    Made_Data(const Made_Data&) = delete;
    Made_Data& operator=(const Made_Data&) = delete;
    ~Made_Data();

    /// What a setter of CMPI takes: null for a null value.
    const CMPIValue* value() const { return data.state & CMPI_nullValue ? nullptr : &data.value; }
};

/// The string of the broker's for a text that a feature has in one instance after the other, most of which the
/// instances of a large SAN share. Servers copy what they are given, so one string serves all.
struct Kept_Text {
    const char* last = nullptr; ///< where the last text was; only compared, since it may be gone
    String text;                ///< what `made` is of; holding it keeps its place from any other
    Made<CMPIString> made;      ///< from the second time in a row on
};

/// Runtime to CMPI. `flags` of the feature tell a reference from an embedded instance; `name_space` is for instances
/// without one; `kept` belongs to the feature, null for one that is converted once. Bytes of strings that no XML can
/// carry become '?'. 0, or -1 with a warning.
int to_cmpi_data(const CMPIBroker* broker, const char* name_space, const Value& value, uint32 flags, Kept_Text* kept,
                 Made_Data& made);

/// The characters of a string that a client sent: 0, with null and a word in the log where it has none; or -1 with a
/// warning.
int read_chars(const CMPIString* string, const char*& text);

/// CMPI to runtime. `depth` counts how many instances the data lies in. 0, or -1 with a warning.
int cmpi_to_cimple_value(const CMPIBroker* broker, const Meta_Repository* repository, const CMPIData& data,
                         unsigned depth, Value& value);

} // namespace cimple
