#include "runtime/strings.h"

#include <cmath>
#include <cstdlib>
#include <limits>
#include <locale.h>

#include "runtime/String.h"

namespace cimple {

namespace {

bool is_digit(char c)
{
    return c >= '0' && c <= '9';
}

bool scan_hexadecimal(const char* digits, uint64& value)
{
    value = 0;
    int count = 0;
    for (; *digits; ++digits, ++count) {
        if (count == 16) return false;
        if (is_digit(*digits))
            value = value << 4 | static_cast<uint64>(*digits - '0');
        else if (*digits >= 'A' && *digits <= 'F')
            value = value << 4 | static_cast<uint64>(*digits - 'A' + 10);
        else
            return false;
    }
    return count > 0;
}

bool scan_decimal(const char* digits, uint64& value)
{
    value = 0;
    if (!*digits) return false;
    for (; *digits; ++digits) {
        if (!is_digit(*digits)) return false;
        const auto digit = static_cast<uint64>(*digits - '0');
        if (value > (std::numeric_limits<uint64>::max() - digit) / 10) return false;
        value = value * 10 + digit;
    }
    return true;
}

bool scan_magnitude(const char* text, uint64& value)
{
    if (text[0] == '0' && (text[1] == 'x' || text[1] == 'X')) return scan_hexadecimal(text + 2, value);
    return scan_decimal(text, value);
}

template <class T>
int scan_unsigned(const char* text, T& value)
{
    uint64 wide;
    if (!text || !scan_magnitude(text, wide) || wide > std::numeric_limits<T>::max()) return -1;
    value = static_cast<T>(wide);
    return 0;
}

template <class T>
int scan_signed(const char* text, T& value)
{
    if (!text) return -1;
    const bool negative = *text == '-';
    if (negative || *text == '+') ++text;
    uint64 wide;
    if (!scan_magnitude(text, wide)) return -1;
    const uint64 limit = static_cast<uint64>(std::numeric_limits<T>::max()) + (negative ? 1 : 0);
    if (wide > limit) return -1;
    value = static_cast<T>(negative ? 0 - wide : wide);
    return 0;
}

const char* skip_digits(const char* text)
{
    while (is_digit(*text))
        ++text;
    return text;
}

const char* skip_sign(const char* text)
{
    return *text == '+' || *text == '-' ? text + 1 : text;
}

bool is_real(const char* text)
{
    const char* whole = skip_sign(text);
    const char* point = skip_digits(whole);
    if (point == whole || *point != '.') return false;
    const char* end = skip_digits(point + 1);
    if (end == point + 1) return false;
    if (*end == 'e' || *end == 'E') {
        const char* exponent = skip_sign(end + 1);
        end = skip_digits(exponent);
        if (end == exponent) return false;
    }
    return *end == '\0';
}

// The server's locale may write the decimal point as a comma.
locale_t c_locale()
{
    static const locale_t locale = newlocale(LC_ALL_MASK, "C", nullptr);
    return locale;
}

template <class T>
int scan_real(const char* text, T& value)
{
    if (!text || !is_real(text)) return -1;
    const double real = strtod_l(text, nullptr, c_locale());
    if (std::fabs(real) > std::numeric_limits<T>::max()) return -1;
    value = static_cast<T>(real);
    return 0;
}

struct Small_Number {
    char text[4];
    uint8 size;
};

struct Small_Numbers {
    Small_Number of[128];
};

constexpr Small_Numbers make_small_numbers()
{
    Small_Numbers numbers{};
    for (unsigned i = 0; i < 128; ++i) {
        Small_Number& number = numbers.of[i];
        if (i >= 100) number.text[number.size++] = static_cast<char>('0' + i / 100);
        if (i >= 10) number.text[number.size++] = static_cast<char>('0' + i / 10 % 10);
        number.text[number.size++] = static_cast<char>('0' + i % 10);
    }
    return numbers;
}

constexpr Small_Numbers small_numbers = make_small_numbers();

// Written backward from the buffer's end.
char* write_digits(Integer_Buffer& buffer, uint64 value)
{
    char* first = buffer + sizeof(buffer) - 1;
    *first = '\0';
    do {
        *--first = static_cast<char>('0' + value % 10);
        value /= 10;
    } while (value);
    return first;
}

} // namespace

int str_to_uint8(const char* text, uint8& value)
{
    return scan_unsigned(text, value);
}

int str_to_uint16(const char* text, uint16& value)
{
    return scan_unsigned(text, value);
}

int str_to_uint32(const char* text, uint32& value)
{
    return scan_unsigned(text, value);
}

int str_to_uint64(const char* text, uint64& value)
{
    return scan_unsigned(text, value);
}

int str_to_sint8(const char* text, sint8& value)
{
    return scan_signed(text, value);
}

int str_to_sint16(const char* text, sint16& value)
{
    return scan_signed(text, value);
}

int str_to_sint32(const char* text, sint32& value)
{
    return scan_signed(text, value);
}

int str_to_sint64(const char* text, sint64& value)
{
    return scan_signed(text, value);
}

int str_to_real32(const char* text, real32& value)
{
    return scan_real(text, value);
}

int str_to_real64(const char* text, real64& value)
{
    return scan_real(text, value);
}

int str_to_boolean(const char* text, boolean& value)
{
    const bool is_true = equali(text, "true");
    if (!is_true && !equali(text, "false")) return -1;
    value = is_true;
    return 0;
}

const char* uint64_to_str(Integer_Buffer& buffer, uint64 value, std::size_t& size)
{
    if (value < 128) {
        size = small_numbers.of[value].size;
        return small_numbers.of[value].text;
    }
    const char* text = write_digits(buffer, value);
    size = static_cast<std::size_t>(buffer + sizeof(buffer) - 1 - text);
    return text;
}

const char* sint64_to_str(Integer_Buffer& buffer, sint64 value, std::size_t& size)
{
    if (value >= 0) return uint64_to_str(buffer, static_cast<uint64>(value), size);
    char* text = write_digits(buffer, 0 - static_cast<uint64>(value));
    *--text = '-';
    size = static_cast<std::size_t>(buffer + sizeof(buffer) - 1 - text);
    return text;
}

} // namespace cimple
