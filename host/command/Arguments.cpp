#include "host/command/Arguments.h"

#include "host/PathText.h"
#include "host/ScalarText.h"

#include <optional>
#include <vector>

namespace host {
namespace {

/// "[a,"b,c"]" into its elements, quotes taken off; nothing if the brackets or quotes do not close.
struct Word {
    std::string text;
    bool quoted = false;
};

std::optional<std::vector<Word>> split_array(const std::string& text)
{
    if (text.size() < 2 || text.front() != '[' || text.back() != ']') return std::nullopt;
    const std::string inside = text.substr(1, text.size() - 2);
    std::vector<Word> words;
    if (inside.find_first_not_of(' ') == std::string::npos) return words;
    Word word;
    bool open = false;
    for (std::size_t i = 0; i < inside.size(); ++i) {
        char c = inside[i];
        if (open && c == '\\' && i + 1 < inside.size())
            word.text += inside[++i];
        else if (c == '"')
            open = !open, word.quoted = true;
        else if (c == ',' && !open)
            words.push_back(std::exchange(word, {}));
        else if (c != ' ' || open || (!word.text.empty() && !word.quoted))
            word.text += c;
    }
    if (open) return std::nullopt;
    words.push_back(word);
    return words;
}

/// A quoted text without its quotes; any other as it is.
Word unquote(const std::string& text)
{
    if (text.size() < 2 || text.front() != '"' || text.back() != '"') return {text, false};
    Word word{"", true};
    for (std::size_t i = 1; i + 1 < text.size(); ++i) {
        if (text[i] == '\\' && i + 2 < text.size()) ++i;
        word.text += text[i];
    }
    return word;
}

class Reader {
public:
    Reader(const Element_Record& element, const Schema& schema, const std::string& name_space)
        : m_element(element), m_schema(schema), m_name_space(name_space),
          m_type(static_cast<CMPIType>(element.type & ~CMPI_ARRAY))
    {
    }

    bool read(const std::string& text, Value& value)
    {
        if (text == "NULL") {
            value = Value::null_of(m_element.type);
            return true;
        }
        if (!(m_element.type & CMPI_ARRAY)) {
            // A path brings quotes of its own.
            return read_one(m_type == CMPI_ref ? Word{text, false} : unquote(text), value);
        }
        std::optional<std::vector<Word>> words = split_array(text);
        if (!words) return fail("is an array: give [value,value]");
        std::vector<Value> elements;
        for (const Word& word : *words)
            if (!read_one(word, elements.emplace_back())) return false;
        value = Value::array(m_type, std::move(elements));
        return true;
    }

    const std::string& error() const { return m_error; }

private:
    bool fail(const std::string& reason)
    {
        m_error = m_element.name + " " + reason;
        return false;
    }

    bool read_one(const Word& word, Value& value)
    {
        if (m_element.embedded) return fail("carries an instance, which cannot be given on a command line");
        if (m_type == CMPI_string) {
            value = Value::string(word.text);
            return true;
        }
        if (m_type == CMPI_ref) return read_reference(word.text, value);
        return read_other(word.text, value);
    }

    /// A number may be given by its word, which counts as the number.
    bool read_other(const std::string& text, Value& value)
    {
        std::string number = text;
        for (const auto& [entry, word] : m_element.words)
            if (is_integer(m_type) && same_name(word, text) && entry.find("..") == std::string::npos) number = entry;
        const std::string wrong = read_scalar(number, m_type, value);
        if (wrong.empty()) return true;
        if (m_type == CMPI_boolean) return fail("is boolean: give true or false");
        if (m_type == CMPI_dateTime) return fail("is a date-time of 25 characters, as 20240131235959.000000+000");
        const bool has_words =
            is_integer(m_type) && !m_element.words.empty() && wrong.find("no number") != std::string::npos;
        return fail("is " + type_name(m_type) + ": " + wrong + (has_words ? " and no word of its" : ""));
    }

    bool read_reference(const std::string& text, Value& value)
    {
        Path_Parse path = parse_path(text, &m_schema, m_name_space);
        if (!path.ok) return fail("is an object path: " + path.error);
        if (!m_schema.is_a(path.path.class_name, m_element.reference_class))
            return fail("refers to " + m_element.reference_class + ", which " + path.path.class_name + " is not");
        value = Value::reference(std::move(path.path));
        return true;
    }

    const Element_Record& m_element;
    const Schema& m_schema;
    const std::string& m_name_space;
    const CMPIType m_type;
    std::string m_error;
};

} // namespace

bool split_argument(const std::string& text, std::string& name, std::string& value)
{
    std::size_t equals = text.find('=');
    if (equals == std::string::npos || equals == 0) return false;
    name = text.substr(0, equals);
    value = text.substr(equals + 1);
    return true;
}

Argument_Parse parse_argument(const Element_Record& element, const std::string& text, const Schema& schema,
                              const std::string& name_space)
{
    Argument_Parse result;
    Reader reader(element, schema, name_space);
    result.argument.name = element.name;
    result.ok = reader.read(text, result.argument.value);
    result.error = reader.error();
    return result;
}

} // namespace host
