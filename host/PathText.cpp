#include "host/PathText.h"

#include "host/Schema.h"

#include <cerrno>
#include <cstdlib>

namespace host {
namespace {

constexpr std::size_t longest_text = 64 * 1024;
constexpr int deepest_reference = 8;

bool is_name_start(char c)
{
    return (c >= 'A' && c <= 'Z') || (c >= 'a' && c <= 'z') || c == '_';
}
bool is_name_part(char c)
{
    return is_name_start(c) || (c >= '0' && c <= '9');
}
bool is_blank(char c)
{
    return c == ' ' || c == '\t' || c == '\n' || c == '\r';
}

/// Reads one text from left to right; the first fault ends it.
class Reader {
public:
    Reader(const std::string& text, const Schema* schema, int depth) : m_text(text), m_schema(schema), m_depth(depth) {}

    bool read(Path& path)
    {
        skip_blanks();
        if (!read_host(path) || !read_name_space(path) || !read_name(path.class_name, "a class name")) return false;
        m_class = m_schema ? m_schema->find(path.class_name) : nullptr;
        if (m_class) path.class_name = m_class->name;
        skip_blanks();
        if (at_end()) return true;
        if (peek() != '.') return fail("a '.' before the first key");
        do {
            ++m_at;
            if (!read_key(path)) return false;
            skip_blanks();
        } while (peek() == ',');
        return at_end() || fail("a ',' or the end");
    }

    const std::string& error() const { return m_error; }

private:
    bool at_end() const { return m_at >= m_text.size(); }
    char peek() const { return at_end() ? '\0' : m_text[m_at]; }
    void skip_blanks()
    {
        while (!at_end() && is_blank(m_text[m_at]))
            ++m_at;
    }

    bool fail(const std::string& expected)
    {
        return say("character " + std::to_string(m_at + 1) + ": expected " + expected +
                   (at_end() ? ", the text ends" : ", found '" + std::string(1, printable(peek())) + "'"));
    }
    bool say(const std::string& text)
    {
        if (m_error.empty()) m_error = text;
        return false;
    }
    static char printable(char c) { return c >= ' ' && c <= '~' ? c : '?'; }

    bool read_host(Path& path)
    {
        if (m_text.compare(m_at, 2, "//") != 0) return true;
        std::size_t slash = m_text.find('/', m_at + 2);
        if (slash == std::string::npos) return say("character 1: '//' without a host name and '/'");
        path.host = m_text.substr(m_at + 2, slash - m_at - 2);
        m_at = slash + 1;
        return true;
    }

    /// A namespace ends with the ':' that comes before any key.
    bool read_name_space(Path& path)
    {
        std::size_t colon = m_text.find_first_of(":.=\"", m_at);
        if (colon == std::string::npos || m_text[colon] != ':') {
            return m_text.find('/', m_at) < colon ? say("character " + std::to_string(m_at + 1) +
                                                        ": a namespace without ':' and a class behind it")
                                                  : true;
        }
        std::string name = m_text.substr(m_at, colon - m_at);
        while (!name.empty() && name.front() == '/')
            name.erase(0, 1);
        for (char c : name)
            if (!is_name_part(c) && c != '/' && c != '-')
                return say("character " + std::to_string(m_at + 1) + ": a namespace has letters, digits, '_' and '/'");
        path.name_space = name;
        m_at = colon + 1;
        return true;
    }

    bool read_name(std::string& name, const char* what)
    {
        skip_blanks();
        std::size_t start = m_at;
        if (!is_name_start(peek())) return fail(what);
        while (is_name_part(peek()))
            ++m_at;
        name = m_text.substr(start, m_at - start);
        return true;
    }

    bool read_key(Path& path)
    {
        std::string name;
        if (!read_name(name, "a key's name")) return false;
        const Element_Record* element = m_class ? m_class->property(name) : nullptr;
        if (m_class && (!element || !element->key)) {
            std::string keys;
            for (const Element_Record& property : m_class->properties)
                if (property.key) keys += (keys.empty() ? "" : ", ") + property.name;
            return say(m_class->name + " has no key " + name + "; its keys are " + keys);
        }
        if (element) name = element->name;
        if (path.find(name)) return say("the key " + name + " is given twice");
        skip_blanks();
        if (peek() != '=') return fail("'=' after the key " + name);
        ++m_at;
        skip_blanks();
        Value value;
        if (!(peek() == '"' ? read_quoted(name, element, value) : read_bare(name, element, value))) return false;
        path.keys.push_back({name, std::move(value)});
        return true;
    }

    bool read_quoted(const std::string& name, const Element_Record* element, Value& value)
    {
        std::string text;
        for (++m_at; peek() != '"'; ++m_at) {
            if (at_end()) return fail("the closing quote of the key " + name);
            if (peek() == '\\' && m_at + 1 < m_text.size()) ++m_at;
            text += m_text[m_at];
        }
        ++m_at;
        CMPIType type = element ? element->type : static_cast<CMPIType>(CMPI_string);
        if (type == CMPI_string)
            value = Value::string(text);
        else if (type == CMPI_dateTime)
            value = Value::datetime(text);
        else if (type != CMPI_ref)
            return say("the key " + name + " is " + type_name(type) + ", not a text");
        else
            return read_reference(name, text, value);
        return true;
    }

    bool read_reference(const std::string& name, const std::string& text, Value& value)
    {
        if (m_depth >= deepest_reference) return say("references lie too deep within each other");
        Path path;
        Reader inner(text, m_schema, m_depth + 1);
        if (!inner.read(path)) return say("in the reference " + name + ": " + inner.error());
        value = Value::reference(std::move(path));
        return true;
    }

    bool read_bare(const std::string& name, const Element_Record* element, Value& value)
    {
        std::size_t start = m_at;
        while (!at_end() && peek() != ',' && !is_blank(peek()))
            ++m_at;
        std::string word = m_text.substr(start, m_at - start);
        if (same_name(word, "true") || same_name(word, "false")) {
            if (element && element->type != CMPI_boolean)
                return say("the key " + name + " is " + type_name(element->type) + ", not a boolean");
            value = Value::boolean(same_name(word, "true"));
            return true;
        }
        CMPIType type = element ? element->type : static_cast<CMPIType>(CMPI_sint64);
        if (!is_integer(type)) {
            m_at = start;
            return say("the key " + name + " is " + type_name(type) +
                       (type == CMPI_boolean ? ": give TRUE or FALSE" : ": put its value in quotes"));
        }
        return read_number(name, word, type, element != nullptr, value);
    }

    bool read_number(const std::string& name, const std::string& word, CMPIType type, bool typed, Value& value)
    {
        bool negative = !word.empty() && word[0] == '-';
        std::size_t digits = negative || (!word.empty() && word[0] == '+') ? 1 : 0;
        bool good = word.size() > digits && word.find_first_not_of("0123456789", digits) == std::string::npos;
        if (!good) return say("the key " + name + ": '" + word.substr(0, 40) + "' is no number, text or boolean");
        errno = 0;
        std::uint64_t magnitude = std::strtoull(word.c_str() + digits, nullptr, 10);
        bool fits = errno == 0;
        if (!typed && !negative && magnitude > static_cast<std::uint64_t>(INT64_MAX)) type = CMPI_uint64;
        value = Value::integer(type, negative ? 0 - magnitude : magnitude);
        if (is_signed(type)) {
            std::uint64_t limit = (1ull << (integer_bits(type) - 1)) - (negative ? 0 : 1);
            fits = fits && magnitude <= limit;
        } else {
            fits = fits && (!negative || magnitude == 0) && value.as_uint() == magnitude;
        }
        return fits || say("the key " + name + ": " + word.substr(0, 40) + " does not fit into " + type_name(type));
    }

    const std::string& m_text;
    const Schema* m_schema;
    const Class_Record* m_class = nullptr;
    int m_depth;
    std::size_t m_at = 0;
    std::string m_error;
};

std::string key_to_text(const Value& value)
{
    if (value.is_null()) return "\"\"";
    if (is_integer(value.type())) return value.to_text();
    if (value.type() == CMPI_boolean) return value.as_boolean() ? "TRUE" : "FALSE";
    return quote(value.to_text());
}

} // namespace

Path_Parse parse_path(const std::string& text, const Schema* schema, const std::string& name_space)
{
    Path_Parse result;
    if (text.size() > longest_text) {
        result.error = "an object path of more than 64 KiB";
        return result;
    }
    if (text.find('\0') != std::string::npos) {
        result.error = "an object path with a zero byte";
        return result;
    }
    Reader reader(text, schema, 0);
    result.ok = reader.read(result.path);
    result.error = reader.error();
    if (result.path.name_space.empty()) result.path.name_space = name_space;
    return result;
}

std::string quote(const std::string& text)
{
    std::string quoted = "\"";
    for (char c : text) {
        if (c == '"' || c == '\\') quoted += '\\';
        quoted += c;
    }
    return quoted + '"';
}

std::string path_to_text(const Path& path)
{
    std::string text;
    if (!path.host.empty()) text += "//" + path.host + "/";
    if (!path.name_space.empty()) text += path.name_space + ":";
    text += path.class_name;
    char separator = '.';
    for (const Named_Value& key : path.keys) {
        text += separator + key.name + "=" + key_to_text(key.value);
        separator = ',';
    }
    return text;
}

} // namespace host
