#define TOML_IMPLEMENTATION
#include "simulator/Fields.h"

#include "simulator/Scenario.h"

#include <algorithm>
#include <cctype>
#include <cerrno>
#include <cstdlib>

namespace nvrsim {

void scenario_fault(const std::string& file, const toml::source_region& at, const std::string& reason)
{
    throw Scenario_Error(file + ":" + std::to_string(at.begin.line) + ": " + reason);
}

void Fields::fail(const toml::node& at, const std::string& reason) const
{
    scenario_fault(m_file, at.source(), reason);
}

const toml::node* Fields::find(const char* key)
{
    m_known.insert(key);
    if (const toml::node* node = m_own.get(key)) return node;
    return m_defaults ? m_defaults->get(key) : nullptr;
}

std::string Fields::to_string(const toml::node& node, const std::string& what, size_t longest) const
{
    const auto* text = node.as_string();
    if (!text) fail(node, "\"" + what + "\" must be a text");
    if (text->get().size() > longest)
        fail(node, "\"" + what + "\" is longer than " + std::to_string(longest) + " bytes");
    return text->get();
}

uint64_t Fields::to_number(const toml::node& node, const std::string& what, uint64_t low, uint64_t high) const
{
    uint64_t value = 0;
    if (const auto* integer = node.as_integer()) {
        // Counters of all ones are written -1, as the hardware does.
        if (integer->get() < 0 && !(integer->get() == -1 && high == UINT64_MAX))
            fail(node, "\"" + what + "\" must not be negative");
        value = static_cast<uint64_t>(integer->get());
    } else if (const auto* text = node.as_string()) {
        const std::string& digits = text->get();
        char* end = nullptr;
        errno = 0;
        value = digits.compare(0, 2, "0x") == 0 ? std::strtoull(digits.c_str(), &end, 16) : 0;
        if (!end || *end || digits.size() < 3 || errno) fail(node, "\"" + what + "\" is no number");
    } else {
        fail(node, "\"" + what + "\" must be a number");
    }
    if (value < low || value > high)
        fail(node, "\"" + what + "\" must lie between " + std::to_string(low) + " and " + std::to_string(high));
    return value;
}

Wwn Fields::to_wwn(const toml::node& node, const std::string& what) const
{
    Wwn wwn = 0;
    const auto* text = node.as_string();
    if (!text || !parse_wwn(text->get(), wwn))
        fail(node, "\"" + what + "\" must be a World Wide Name of 16 hexadecimal digits in quotes");
    return wwn;
}

Bytes Fields::to_bytes(const toml::node& node, const std::string& what, size_t shortest, size_t longest) const
{
    Bytes bytes;
    if (const auto* text = node.as_string()) {
        int high = -1;
        for (char c : text->get()) {
            if (std::isspace(static_cast<unsigned char>(c)) || c == ':') continue;
            if (!std::isxdigit(static_cast<unsigned char>(c)))
                fail(node, "\"" + what + "\" must hold hexadecimal digits only");
            const int digit = c <= '9' ? c - '0' : std::tolower(static_cast<unsigned char>(c)) - 'a' + 10;
            if (high < 0) {
                high = digit;
            } else {
                bytes += static_cast<char>(high << 4 | digit);
                high = -1;
            }
        }
        if (high >= 0) fail(node, "\"" + what + "\" has an odd number of hexadecimal digits");
    } else if (const auto* numbers = node.as_array()) {
        for (const toml::node& number : *numbers)
            bytes += static_cast<char>(to_number(number, what, 0, 255));
    } else {
        fail(node, "\"" + what + "\" must be hexadecimal digits in quotes or an array of bytes");
    }
    if (bytes.size() < shortest || bytes.size() > longest) {
        const std::string range = shortest == longest ? std::to_string(shortest)
                                                      : std::to_string(shortest) + " to " + std::to_string(longest);
        fail(node, "\"" + what + "\" has " + std::to_string(bytes.size()) + " bytes instead of " + range);
    }
    return bytes;
}

void Fields::text(const char* key, std::string& target, size_t longest)
{
    if (const toml::node* node = find(key)) target = to_string(*node, key, longest);
}

void Fields::boolean(const char* key, bool& target)
{
    const toml::node* node = find(key);
    if (!node) return;
    if (!node->is_boolean()) fail(*node, std::string("\"") + key + "\" must be true or false");
    target = node->as_boolean()->get();
}

void Fields::wwn(const char* key, Wwn& target)
{
    if (const toml::node* node = find(key)) target = to_wwn(*node, key);
}

void Fields::bytes(const char* key, Bytes& target, size_t shortest, size_t longest)
{
    if (const toml::node* node = find(key)) target = to_bytes(*node, key, shortest, longest);
}

void Fields::bytes(const char* key, std::optional<Bytes>& target, size_t shortest, size_t longest)
{
    if (const toml::node* node = find(key)) target = to_bytes(*node, key, shortest, longest);
}

void Fields::real(const char* key, double& target, double low, double high)
{
    const toml::node* node = find(key);
    if (!node) return;
    const auto value = node->value<double>();
    if (!value || !(*value >= low && *value <= high))
        fail(*node, std::string("\"") + key + "\" must be a number between " + std::to_string(low) + " and " +
                        std::to_string(high));
    target = *value;
}

void Fields::word(const char* key, uint32_t& target, std::initializer_list<const char*> words)
{
    const toml::node* node = find(key);
    if (!node) return;
    const std::string given = to_string(*node, key, 64);
    const auto found = std::find(words.begin(), words.end(), given);
    if (found == words.end()) {
        std::string list;
        for (const char* word : words)
            list += (list.empty() ? "\"" : ", \"") + std::string(word) + "\"";
        fail(*node, std::string("\"") + key + "\" must be one of " + list);
    }
    target = static_cast<uint32_t>(found - words.begin());
}

const toml::table* Fields::table(const char* key)
{
    const toml::node* node = find(key);
    if (node && !node->is_table()) fail(*node, std::string("\"") + key + "\" must be a table");
    return node ? node->as_table() : nullptr;
}

const toml::array* Fields::array(const char* key)
{
    const toml::node* node = find(key);
    if (node && !node->is_array()) fail(*node, std::string("\"") + key + "\" must be an array");
    return node ? node->as_array() : nullptr;
}

std::vector<const toml::table*> Fields::tables(const char* key)
{
    std::vector<const toml::table*> found;
    if (const toml::array* list = array(key))
        for (const toml::node& node : *list) {
            if (!node.is_table()) fail(node, std::string("\"") + key + "\" must hold tables, written [[" + key + "]]");
            found.push_back(node.as_table());
        }
    return found;
}

void Fields::attributes(const char* key, Attributes& target, bool wide)
{
    const toml::table* numbered = table(key);
    if (!numbered) return;
    for (const auto& [name, node] : *numbered) {
        char* end = nullptr;
        const std::string digits(name.str());
        const unsigned long number = std::strtoul(digits.c_str(), &end, 0);
        if (digits.empty() || *end || number == 0 || number > 0xFFFF)
            fail(node, "\"" + digits + "\" is no attribute number from 1 to 65535");
        std::optional<Bytes> value;
        const std::string what = std::string(key) + "." + digits;
        if (node.is_boolean()) {
            if (node.as_boolean()->get()) fail(node, "\"" + what + "\" may be false, for left out, but not true");
        } else if (const toml::table* typed = node.as_table()) {
            Fields inner(m_file, *typed);
            std::optional<uint64_t> u64;
            inner.number("u64", u64);
            inner.bytes("hex", value, 0, 1024);
            if (u64) value = encode64(*u64);
            if (!value) inner.fail("\"" + what + "\" must be { u64 = ... } or { hex = \"...\" }");
            inner.refuse_unknown();
        } else if (node.is_string()) {
            value = to_string(node, what, 1024);
        } else if (wide) {
            value = encode64(to_number(node, what, 0, UINT64_MAX));
        } else {
            value = encode32(static_cast<uint32_t>(to_number(node, what, 0, UINT32_MAX)));
        }
        target[static_cast<uint16_t>(number)] = value;
    }
}

void Fields::refuse_unknown() const
{
    for (const toml::table* table : {&m_own, m_defaults}) {
        if (!table) continue;
        for (const auto& [key, node] : *table)
            if (!m_known.count(std::string(key.str())))
                scenario_fault(m_file, key.source(), "unknown key \"" + std::string(key.str()) + "\"");
    }
}

} // namespace nvrsim
