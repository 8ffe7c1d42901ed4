#include "host/ScalarText.h"

#include "host/objects/DateTimeObject.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>

namespace host {
namespace {

std::string read_integer(const std::string& text, CMPIType type, Value& value)
{
    const bool negative = !text.empty() && text[0] == '-';
    const std::size_t start = negative || (!text.empty() && text[0] == '+') ? 1 : 0;
    const bool hexadecimal = text.compare(start, 2, "0x") == 0 || text.compare(start, 2, "0X") == 0;
    const std::size_t first = start + (hexadecimal ? 2 : 0);
    const char* allowed = hexadecimal ? "0123456789abcdefABCDEF" : "0123456789";
    if (text.size() <= first || text.find_first_not_of(allowed, first) != std::string::npos)
        return "'" + text + "' is no number";
    errno = 0;
    const std::uint64_t magnitude = std::strtoull(text.c_str() + first, nullptr, hexadecimal ? 16 : 10);
    const int bits = integer_bits(type);
    const std::uint64_t most =
        is_signed(type) ? (1ull << (bits - 1)) - (negative ? 0 : 1) : (negative ? 0 : ~0ull >> (64 - bits));
    if (errno != 0 || magnitude > most) return text + " does not fit";
    value = Value::integer(type, negative ? 0 - magnitude : magnitude);
    return "";
}

std::string read_real(const std::string& text, CMPIType type, Value& value)
{
    char* end = nullptr;
    const double number = std::strtod(text.c_str(), &end);
    if (text.empty() || *end) return "'" + text + "' is no number";
    value = Value::real(type, number);
    return "";
}

} // namespace

std::string read_scalar(const std::string& text, CMPIType type, Value& value)
{
    switch (type) {
    case CMPI_string:
    case CMPI_chars:
        value = Value::string(text);
        return "";
    case CMPI_boolean:
        if (!same_name(text, "true") && !same_name(text, "false")) return "'" + text + "' is not true or false";
        value = Value::boolean(same_name(text, "true"));
        return "";
    case CMPI_dateTime:
        if (!is_date_time(text)) return "'" + text + "' is no date-time of 25 characters";
        value = Value::datetime(text);
        return "";
    case CMPI_real32:
    case CMPI_real64:
        return read_real(text, type, value);
    default:
        return is_integer(type) ? read_integer(text, type, value) : type_name(type) + " has no text";
    }
}

std::string scalar_text(const Value& value)
{
    if (value.is_null()) return "";
    switch (value.type()) {
    case CMPI_boolean:
        return value.as_boolean() ? "TRUE" : "FALSE";
    case CMPI_real32:
    case CMPI_real64: {
        char text[40];
        std::snprintf(text, sizeof text, value.type() == CMPI_real32 ? "%.9g" : "%.17g", value.as_real());
        return text;
    }
    default:
        if (!is_integer(value.type())) return value.as_text();
        return is_signed(value.type()) ? std::to_string(value.as_int()) : std::to_string(value.as_uint());
    }
}

} // namespace host
