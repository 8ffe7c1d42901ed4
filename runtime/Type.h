/// The scalar types of CIM and their numbering, which runs through class records, values and tables.
#pragma once

#include <cstdint>

namespace cimple {

using boolean = bool;
using uint8 = std::uint8_t;
using sint8 = std::int8_t;
using uint16 = std::uint16_t;
using sint16 = std::int16_t;
using uint32 = std::uint32_t;
using sint32 = std::int32_t;
using uint64 = std::uint64_t;
using sint64 = std::int64_t;
using real32 = float;
using real64 = double;
using char16 = char16_t;

static_assert(sizeof(boolean) == 1 && sizeof(char16) == 2 && sizeof(real32) == 4 && sizeof(real64) == 8);

enum Type : uint16 {
    BOOLEAN = 0,
    UINT8 = 1,
    SINT8 = 2,
    UINT16 = 3,
    SINT16 = 4,
    UINT32 = 5,
    SINT32 = 6,
    UINT64 = 7,
    SINT64 = 8,
    REAL32 = 9,
    REAL64 = 10,
    CHAR16 = 11,
    STRING = 12,
    DATETIME = 13,
};

constexpr unsigned number_of_types = 14;

/// The CIM name of each Type ("boolean", "uint8", ... "datetime"), by code.
extern const char* const type_names[number_of_types];

/// The bytes that a value of each Type takes in a record (a string or datetime is one handle), by code.
inline constexpr uint8 type_sizes[number_of_types] = {1, 1, 1, 2, 2, 4, 4, 8, 8, 4, 8, 2, sizeof(void*), sizeof(void*)};

class String;
class Datetime;

/// Type_Of<T>::code: the Type code of a C++ value type.
template <class T>
struct Type_Of;
template <>
struct Type_Of<boolean> {
    static constexpr Type code = BOOLEAN;
};
template <>
struct Type_Of<uint8> {
    static constexpr Type code = UINT8;
};
template <>
struct Type_Of<sint8> {
    static constexpr Type code = SINT8;
};
template <>
struct Type_Of<uint16> {
    static constexpr Type code = UINT16;
};
template <>
struct Type_Of<sint16> {
    static constexpr Type code = SINT16;
};
template <>
struct Type_Of<uint32> {
    static constexpr Type code = UINT32;
};
template <>
struct Type_Of<sint32> {
    static constexpr Type code = SINT32;
};
template <>
struct Type_Of<uint64> {
    static constexpr Type code = UINT64;
};
template <>
struct Type_Of<sint64> {
    static constexpr Type code = SINT64;
};
template <>
struct Type_Of<real32> {
    static constexpr Type code = REAL32;
};
template <>
struct Type_Of<real64> {
    static constexpr Type code = REAL64;
};
template <>
struct Type_Of<char16> {
    static constexpr Type code = CHAR16;
};
template <>
struct Type_Of<String> {
    static constexpr Type code = STRING;
};
template <>
struct Type_Of<Datetime> {
    static constexpr Type code = DATETIME;
};

} // namespace cimple
