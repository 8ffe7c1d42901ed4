#include "cmpi/xml_text.h"

#include <cstring>

namespace cimple {

namespace {

// Bytes of the character at `text`, 0 if XML cannot carry it: a control character, a surrogate, U+FFFE, U+FFFF, or
// bytes that are no (shortest) UTF-8.
std::size_t character_size(const unsigned char* text, std::size_t size)
{
    const unsigned first = text[0];
    if (first < 0x80) return first >= 0x20 || first == '\t' || first == '\n' || first == '\r' ? 1 : 0;

    std::size_t length = 0;
    uint32 code = 0, least = 0;
    if ((first & 0xE0) == 0xC0) {
        length = 2, code = first & 0x1F, least = 0x80;
    } else if ((first & 0xF0) == 0xE0) {
        length = 3, code = first & 0x0F, least = 0x800;
    } else if ((first & 0xF8) == 0xF0) {
        length = 4, code = first & 0x07, least = 0x10000;
    }
    if (length == 0 || length > size) return 0;
    for (std::size_t i = 1; i < length; ++i) {
        if ((text[i] & 0xC0) != 0x80) return 0;
        code = code << 6 | (text[i] & 0x3F);
    }
    const bool surrogate = code >= 0xD800 && code <= 0xDFFF;
    if (code < least || code > 0x10FFFF || surrogate || code == 0xFFFE || code == 0xFFFF) return 0;
    return length;
}

// Whether the eight bytes at `text` are printable ASCII, as nearly all that hardware says of itself.
bool is_plain(const unsigned char* text)
{
    constexpr uint64 in_each = 0x0101010101010101, high_bits = 0x80 * in_each;
    uint64 eight;
    std::memcpy(&eight, text, sizeof eight);
    return (((eight - 0x20 * in_each) | eight) & high_bits) == 0; // none is below 0x20, none beyond 0x7F
}

} // namespace

std::size_t carried_by_xml(const char* text, std::size_t size)
{
    const auto* bytes = reinterpret_cast<const unsigned char*>(text);
    std::size_t at = 0;
    while (at < size) {
        const bool eight = size - at >= 8 && is_plain(bytes + at);
        const std::size_t length = eight ? 8 : character_size(bytes + at, size - at);
        if (length == 0) break;
        at += length;
    }
    return at;
}

String as_xml_text(const String& text)
{
    const char* bytes = text.c_str();
    const std::size_t size = text.size();
    std::size_t good = carried_by_xml(bytes, size);
    if (good == size) return text;

    String result;
    result.reserve(size);
    std::size_t at = 0;
    while (true) {
        result.append(bytes + at, good);
        at += good;
        if (at == size) return result;
        result.append('?');
        ++at;
        good = carried_by_xml(bytes + at, size - at);
    }
}

} // namespace cimple
