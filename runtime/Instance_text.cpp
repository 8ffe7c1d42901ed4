#include <charconv>
#include <cstdlib>
#include <cstring>
#include <limits>

#include "runtime/Instance.h"
#include "runtime/Instance_values.h"
#include "runtime/strings.h"

// The text of an instance's keys, and back.

namespace cimple {

namespace {

// Far deeper than the references of any class nest; each level doubles the backslashes of the text.
constexpr int deepest_nesting = 16;

int append_model_path(const Instance* instance, String& text);

int append_property(const Instance* instance, const Meta_Property* property, String& text)
{
    if (property->subscript || null_of(instance, property)) return -1;
    const void* value = feature_at(instance, property->offset);
    switch (property->type) {
    case STRING:
        text.append('"');
        text.append(*static_cast<const String*>(value));
        text.append('"');
        break;
    case CHAR16:
        text.append('\'');
        text.append(static_cast<char>(*static_cast<const char16*>(value)));
        text.append('\'');
        break;
    default:
        append_scalar(property->type, value, text);
    }
    return 0;
}

int append_reference(const Instance* instance, const Meta_Reference* reference, String& text)
{
    if (reference->subscript || !reference_of(instance, reference)) return -1;
    String path;
    if (append_model_path(reference_of(instance, reference), path) != 0) return -1;
    text.append('"');
    const char* from = path.c_str();
    const char* end = from + path.size();
    while (const void* quote = std::memchr(from, '"', static_cast<std::size_t>(end - from))) {
        const char* at = static_cast<const char*>(quote);
        text.append(from, static_cast<std::size_t>(at - from));
        text.append("\\\"", 2);
        from = at + 1;
    }
    text.append(from, static_cast<std::size_t>(end - from));
    text.append('"');
    return 0;
}

int append_model_path(const Instance* instance, String& text)
{
    bool first = true;
    for (const Meta_Feature* feature : features_of(record_of(instance))) {
        if (!is_key(feature)) continue;
        if (first) text.append(record_of(instance)->name);
        text.append(first ? '.' : ',');
        first = false;
        text.append(feature->name);
        text.append('=');
        const int status = is_property(feature) ? append_property(instance, as_property(feature), text)
                                                : append_reference(instance, as_reference(feature), text);
        if (status != 0) return -1;
    }
    return first ? -1 : 0;
}

/// Reads the pieces of a path from a text that it does not own. Each take is true, or false for another piece.
class Path_Reader {
public:
    Path_Reader(const char* text, std::size_t size) : m_at(text), m_end(text + size) {}

    bool at_end() const { return m_at == m_end; }

    bool take(char c)
    {
        if (at_end() || *m_at != c) return false;
        ++m_at;
        return true;
    }

    bool take_name(String& name)
    {
        const char* end = m_at;
        while (end != m_end && (is_letter(*end) || (end != m_at && is_digit(*end))))
            ++end;
        name.assign(m_at, static_cast<std::size_t>(end - m_at));
        m_at = end;
        return !name.empty();
    }

    // A backslash stands only before a backslash or a double quote.
    bool take_quoted(String& value)
    {
        value.clear();
        if (!take('"')) return false;
        while (!at_end() && *m_at != '"') {
            const char* run = m_at;
            while (!at_end() && *m_at != '"' && *m_at != '\\')
                ++m_at;
            value.append(run, static_cast<std::size_t>(m_at - run));
            if (!at_end() && *m_at == '\\') {
                ++m_at;
                if (at_end() || (*m_at != '"' && *m_at != '\\')) return false;
                value.append(*m_at++);
            }
        }
        return take('"');
    }

    // What stands before the next "," or the end.
    void take_word(String& word)
    {
        const char* end = m_at;
        while (end != m_end && *end != ',')
            ++end;
        word.assign(m_at, static_cast<std::size_t>(end - m_at));
        m_at = end;
    }

private:
    static bool is_letter(char c) { return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || c == '_'; }
    static bool is_digit(char c) { return c >= '0' && c <= '9'; }

    const char* m_at;
    const char* m_end;
};

// All of [first, last) in base 10, else all of it in base 16 with or without "0x".
bool scan_digits(const char* first, const char* last, uint64& value)
{
    auto result = std::from_chars(first, last, value, 10);
    if (result.ptr == last) return result.ec == std::errc();
    if (last - first > 2 && first[0] == '0' && (first[1] == 'x' || first[1] == 'X')) first += 2;
    result = std::from_chars(first, last, value, 16);
    return result.ptr == last && result.ec == std::errc();
}

template <class T>
bool scan_integer(const String& word, void* place)
{
    const char* first = word.c_str();
    const char* last = first + word.size();
    const bool negative = *first == '-';
    if (negative || *first == '+') ++first;
    uint64 magnitude;
    if (first == last || !scan_digits(first, last, magnitude)) return false;
    constexpr auto largest = static_cast<uint64>(std::numeric_limits<T>::max());
    constexpr uint64 smallest = std::is_signed_v<T> ? largest + 1 : 0;
    if (magnitude > (negative ? smallest : largest)) return false;
    *static_cast<T*>(place) = static_cast<T>(negative ? 0 - magnitude : magnitude);
    return true;
}

bool scan_word(uint16 type, const String& word, void* place)
{
    switch (type) {
    case BOOLEAN:
        return word.size() == std::strlen(word.c_str()) &&
               str_to_boolean(word.c_str(), *static_cast<boolean*>(place)) == 0;
    case UINT8:
        return scan_integer<uint8>(word, place);
    case SINT8:
        return scan_integer<sint8>(word, place);
    case UINT16:
        return scan_integer<uint16>(word, place);
    case SINT16:
        return scan_integer<sint16>(word, place);
    case UINT32:
        return scan_integer<uint32>(word, place);
    case SINT32:
        return scan_integer<sint32>(word, place);
    case UINT64:
        return scan_integer<uint64>(word, place);
    case SINT64:
        return scan_integer<sint64>(word, place);
    default:
        return false;
    }
}

const Meta_Class* find_class_from(const Meta_Class* meta_class, const String& name)
{
    for (const Meta_Class* one = meta_class; one; one = one->super_meta_class)
        if (equali(name, one->name)) return one;
    return find_meta_class(meta_class->meta_repository, name.c_str());
}

Ref<Instance> parse_path(const Meta_Class* meta_class, const char* text, std::size_t size, int nesting);

// A null byte of 1 (or a null reference) is a key that was not given yet.
bool parse_property(Path_Reader& reader, Instance* instance, const Meta_Property* property)
{
    if (property->subscript || !null_of(instance, property)) return false;
    void* place = feature_at(instance, property->offset);
    if (property->type == STRING) {
        if (!reader.take_quoted(*static_cast<String*>(place))) return false;
    } else {
        String word;
        reader.take_word(word);
        if (!scan_word(property->type, word, place)) return false;
    }
    null_of(instance, property) = 0;
    return true;
}

bool parse_reference(Path_Reader& reader, Instance* instance, const Meta_Reference* reference, int nesting)
{
    if (reference->subscript || reference_of(instance, reference)) return false;
    String path;
    if (!reader.take_quoted(path)) return false;
    Ref<Instance> target = parse_path(reference->meta_class, path.c_str(), path.size(), nesting + 1);
    // Providers read a reference as its declared class.
    if (!target || !is_subclass(reference->meta_class, target->meta_class)) return false;
    reference_of(instance, reference) = target.release();
    return true;
}

Ref<Instance> parse_path(const Meta_Class* meta_class, const char* text, std::size_t size, int nesting)
{
    const Ref<Instance> fault;
    Path_Reader reader(text, size);
    String name;
    if (nesting > deepest_nesting || !reader.take_name(name) || !reader.take('.')) return fault;
    const Meta_Class* found = find_class_from(meta_class, name);
    if (!found) return fault;
    Ref<Instance> instance(create(found, false));
    nullify_properties(instance.get(), true, true, 1);
    uint32 pairs = 0;
    while (!reader.at_end()) {
        if (pairs && !reader.take(',')) return fault;
        if (!reader.take_name(name) || !reader.take('=')) return fault;
        const Meta_Feature* feature =
            find_feature(found, name.c_str(), META_FLAG_PROPERTY | META_FLAG_REFERENCE | META_FLAG_METHOD);
        if (!feature || !is_key(feature)) return fault;
        const bool taken = is_property(feature)
                               ? parse_property(reader, instance.get(), as_property(feature))
                               : parse_reference(reader, instance.get(), as_reference(feature), nesting);
        if (!taken) return fault;
        ++pairs;
    }
    return pairs == found->num_keys ? instance : fault;
}

} // namespace

int instance_to_model_path(const Instance* instance, String& text)
{
    text.clear();
    return instance ? append_model_path(instance, text) : -1;
}

Instance* model_path_to_instance(const Meta_Class* meta_class, const char* text)
{
    if (!meta_class || !text) return nullptr;
    return parse_path(meta_class, text, std::strlen(text), 0).release();
}

} // namespace cimple
