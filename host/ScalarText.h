/// Scalars as text: decimal or 0x numbers, true and false, 25 characters of a date-time, bare texts. Pure functions.
#pragma once

#include "host/Value.h"

#include <string>

namespace host {

/// Reads a scalar of a type that has a text: not for references and instances. Result: empty, or what `text` is instead
/// ("'x' is no number", "300 does not fit"), with `value` untouched.
std::string read_scalar(const std::string& text, CMPIType type, Value& value);

/// Writes one: the opposite of `read_scalar`; "" for null. Reals with as many digits as it takes to read them back.
std::string scalar_text(const Value& value);

} // namespace host
