#include "host/serve/Xml_Reader.h"

#include <charconv>

namespace host {
namespace {

constexpr std::string_view blanks = " \t\r\n";

bool is_character(unsigned long code)
{
    if (code < 0x20) return code == '\t' || code == '\n' || code == '\r';
    return code < 0xD800 || (code >= 0xE000 && code < 0xFFFE) || (code >= 0x10000 && code <= 0x10FFFF);
}

/// Is the text between "&" and ";" one that XML knows without a declaration?
bool is_reference(std::string_view name)
{
    for (const std::string_view known : {"lt", "gt", "amp", "quot", "apos"})
        if (name == known) return true;
    if (name.size() < 2 || name[0] != '#') return false;
    const bool is_hexadecimal = name[1] == 'x';
    const std::string_view digits = name.substr(is_hexadecimal ? 2 : 1);
    unsigned long code = 0;
    const auto [stop, error] =
        std::from_chars(digits.data(), digits.data() + digits.size(), code, is_hexadecimal ? 16 : 10);
    return !digits.empty() && error == std::errc() && stop == digits.data() + digits.size() && is_character(code);
}

/// Where the first reference begins that XML does not know; npos if all are known.
std::size_t unknown_reference(std::string_view text)
{
    constexpr struct {
        std::string_view opening, closing;
    } plain[] = {{"<![CDATA[", "]]>"}, {"<!--", "-->"}, {"<?", "?>"}};
    for (std::size_t at = 0; (at = text.find_first_of("&<", at)) != std::string_view::npos;) {
        const std::string_view rest = text.substr(at);
        if (rest[0] == '&') {
            const std::size_t end = rest.substr(0, 16).find(';');
            if (end == std::string_view::npos || !is_reference(rest.substr(1, end - 1))) return at;
            at += end;
            continue;
        }
        std::size_t skipped = 1;
        for (const auto& section : plain)
            if (rest.substr(0, section.opening.size()) == section.opening)
                skipped = std::min(rest.find(section.closing, section.opening.size()), rest.size());
        at += skipped;
    }
    return std::string_view::npos;
}

} // namespace

bool is_xml_text(std::string_view text)
{
    for (std::size_t i = 0; i < text.size();) {
        const unsigned char lead = static_cast<unsigned char>(text[i]);
        if (lead < 0x80) {
            if (!is_character(lead)) return false;
            ++i;
            continue;
        }
        const std::size_t length = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
        if (lead < 0xC2 || lead > 0xF4 || text.size() - i < length) return false;
        unsigned long code = lead & (0x7Fu >> length);
        for (std::size_t k = 1; k < length; ++k) {
            const unsigned char next = static_cast<unsigned char>(text[i + k]);
            if ((next & 0xC0) != 0x80) return false;
            code = code << 6 | (next & 0x3F);
        }
        const unsigned long least[] = {0, 0, 0x80, 0x800, 0x10000};
        if (code < least[length] || !is_character(code)) return false;
        i += length;
    }
    return true;
}

std::string read_xml(std::string_view text, pugi::xml_document& document)
{
    if (!is_xml_text(text)) return "no UTF-8, or characters that XML has not";
    if (const std::size_t at = unknown_reference(text); at != std::string_view::npos)
        return "a reference to what is not declared at byte " + std::to_string(at);
    // A text of blanks is a value like others, where it stands alone.
    const pugi::xml_parse_result result = document.load_buffer(
        text.data(), text.size(), pugi::parse_default | pugi::parse_ws_pcdata_single, pugi::encoding_utf8);
    if (!result) return std::string(result.description()) + " at byte " + std::to_string(result.offset);
    if (first_element(document).next_sibling()) return "something behind the end of the document";
    const std::size_t last = text.find_last_not_of(blanks);
    if (last == std::string_view::npos || text[last] != '>') return "text behind the end of the document";
    return "";
}

std::string text_of(const pugi::xml_node& element)
{
    std::string text;
    for (const pugi::xml_node& part : element.children())
        if (part.type() == pugi::node_pcdata || part.type() == pugi::node_cdata) text += part.value();
    return text;
}

pugi::xml_node first_element(const pugi::xml_node& parent)
{
    for (const pugi::xml_node& child : parent.children())
        if (child.type() == pugi::node_element) return child;
    return {};
}

} // namespace host
