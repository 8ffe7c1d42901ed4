#include "runtime/Instance_values.h"

#include <charconv>
#include <system_error>

#include "runtime/Datetime.h"
#include "runtime/strings.h"

namespace cimple {

namespace {

template <class T>
const T& as(const void* value)
{
    return *static_cast<const T*>(value);
}

void append_unsigned(uint64 value, String& text)
{
    Integer_Buffer buffer;
    std::size_t size;
    const char* digits = uint64_to_str(buffer, value, size);
    text.append(digits, size);
}

void append_signed(sint64 value, String& text)
{
    Integer_Buffer buffer;
    std::size_t size;
    const char* digits = sint64_to_str(buffer, value, size);
    text.append(digits, size);
}

// As "%f" writes it, with the point that a server's locale may turn into a comma.
void append_real(double value, String& text)
{
    char buffer[352]; // the largest double has 309 digits before the point
    const auto result = std::to_chars(buffer, buffer + sizeof(buffer), value, std::chars_format::fixed, 6);
    text.append(buffer, static_cast<std::size_t>(result.ptr - buffer));
}

} // namespace

void append_scalar(uint16 type, const void* value, String& text)
{
    switch (type) {
    case BOOLEAN:
        return text.append(as<boolean>(value) ? "true" : "false");
    case UINT8:
        return append_unsigned(as<uint8>(value), text);
    case SINT8:
        return append_signed(as<sint8>(value), text);
    case UINT16:
        return append_unsigned(as<uint16>(value), text);
    case SINT16:
        return append_signed(as<sint16>(value), text);
    case UINT32:
        return append_unsigned(as<uint32>(value), text);
    case SINT32:
        return append_signed(as<sint32>(value), text);
    case UINT64:
        return append_unsigned(as<uint64>(value), text);
    case SINT64:
        return append_signed(as<sint64>(value), text);
    case REAL32:
        return append_real(as<real32>(value), text);
    case REAL64:
        return append_real(as<real64>(value), text);
    case DATETIME: {
        char buffer[Datetime::text_size];
        as<Datetime>(value).ascii(buffer);
        return text.append(buffer);
    }
    default:
        return;
    }
}

} // namespace cimple
