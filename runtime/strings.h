/// Text to scalar and back, by CIM's rules.
///
/// Text in: result 0, or -1 for a text of another form or a value outside the type (the destination is then unchanged).
/// Integers: decimal digits, or "0x"/"0X" with 1 to 16 digits 0-9 A-F (capitals only); signed forms take a leading
/// sign. Reals: [sign] digits "." digits [exponent]. Booleans: "true" or "false" in any case.
#pragma once

#include <cstddef>

#include "runtime/Type.h"

namespace cimple {

int str_to_uint8(const char* text, uint8& value);
int str_to_uint16(const char* text, uint16& value);
int str_to_uint32(const char* text, uint32& value);
int str_to_uint64(const char* text, uint64& value);
int str_to_sint8(const char* text, sint8& value);
int str_to_sint16(const char* text, sint16& value);
int str_to_sint32(const char* text, sint32& value);
int str_to_sint64(const char* text, sint64& value);
int str_to_real32(const char* text, real32& value);
int str_to_real64(const char* text, real64& value);
int str_to_boolean(const char* text, boolean& value);

/// Decimal text of an integer: a pointer into `buffer`, or to a static text for values below 128; `size` takes its
/// length.
using Integer_Buffer = char[22];
const char* uint64_to_str(Integer_Buffer& buffer, uint64 value, std::size_t& size);
const char* sint64_to_str(Integer_Buffer& buffer, sint64 value, std::size_t& size);

} // namespace cimple
