#include "host/Value.h"

#include "host/PathText.h"

#include <algorithm>
#include <cstdio>
#include <strings.h>

namespace host {

bool same_name(const char* a, const char* b)
{
    return strcasecmp(a, b) == 0;
}
bool same_name(const std::string& a, const std::string& b)
{
    return a.size() == b.size() && strcasecmp(a.c_str(), b.c_str()) == 0;
}

std::string lower_case(std::string text)
{
    for (char& c : text)
        if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
    return text;
}

namespace {

struct Type_Row {
    CMPIType type;
    const char* name;
    int bits;
};

constexpr Type_Row type_rows[] = {
    {CMPI_null, "null", 0},         {CMPI_boolean, "boolean", 0},   {CMPI_char16, "char16", 16},
    {CMPI_real32, "real32", 0},     {CMPI_real64, "real64", 0},     {CMPI_uint8, "uint8", 8},
    {CMPI_uint16, "uint16", 16},    {CMPI_uint32, "uint32", 32},    {CMPI_uint64, "uint64", 64},
    {CMPI_sint8, "sint8", 8},       {CMPI_sint16, "sint16", 16},    {CMPI_sint32, "sint32", 32},
    {CMPI_sint64, "sint64", 64},    {CMPI_string, "string", 0},     {CMPI_chars, "chars", 0},
    {CMPI_dateTime, "datetime", 0}, {CMPI_instance, "instance", 0}, {CMPI_ref, "ref", 0},
    {CMPI_args, "args", 0},         {CMPI_charsptr, "charsptr", 0}, {CMPI_enumeration, "enumeration", 0},
    {CMPI_class, "class", 0},       {CMPI_filter, "filter", 0},     {CMPI_ptr, "ptr", 0},
};

const Type_Row* row_of(CMPIType type)
{
    for (const Type_Row& row : type_rows)
        if (row.type == (type & ~CMPI_ARRAY)) return &row;
    return nullptr;
}

} // namespace

std::string type_name(CMPIType type)
{
    const Type_Row* row = row_of(type);
    std::string name = row ? row->name : "type " + std::to_string(type & ~CMPI_ARRAY);
    return (type & CMPI_ARRAY) ? name + "[]" : name;
}

int integer_bits(CMPIType type)
{
    const Type_Row* row = (type & CMPI_ARRAY) ? nullptr : row_of(type);
    return row ? row->bits : 0;
}

bool is_integer(CMPIType type)
{
    return integer_bits(type) != 0;
}
bool is_signed(CMPIType type)
{
    return (type & ~0x30) == CMPI_sint8 && is_integer(type);
}

Value Value::null_of(CMPIType type)
{
    Value v;
    v.m_type = type;
    return v;
}

Value Value::boolean(bool value)
{
    Value v = null_of(CMPI_boolean);
    v.m_content = static_cast<std::uint64_t>(value ? 1 : 0);
    return v;
}

Value Value::integer(CMPIType type, std::uint64_t value)
{
    Value v = null_of(type);
    int spare = 64 - integer_bits(type);
    if (spare > 0 && spare < 64) {
        value <<= spare;
        value =
            is_signed(type) ? static_cast<std::uint64_t>(static_cast<std::int64_t>(value) >> spare) : value >> spare;
    }
    v.m_content = value;
    return v;
}

Value Value::real(CMPIType type, double value)
{
    Value v = null_of(type);
    v.m_content = type == CMPI_real32 ? static_cast<double>(static_cast<float>(value)) : value;
    return v;
}

Value Value::string(std::string text)
{
    Value v = null_of(CMPI_string);
    v.m_content = std::move(text);
    return v;
}

Value Value::datetime(std::string text)
{
    Value v = null_of(CMPI_dateTime);
    v.m_content = std::move(text);
    return v;
}

Value Value::reference(Path path)
{
    Value v = null_of(CMPI_ref);
    v.m_content = std::shared_ptr<const Path>(std::make_shared<Path>(std::move(path)));
    return v;
}

Value Value::instance(Instance instance)
{
    Value v = null_of(CMPI_instance);
    v.m_content = std::shared_ptr<const Instance>(std::make_shared<Instance>(std::move(instance)));
    return v;
}

Value Value::array(CMPIType element, std::vector<Value> elements)
{
    Value v = null_of(static_cast<CMPIType>(element | CMPI_ARRAY));
    v.m_content = std::move(elements);
    return v;
}

std::uint64_t Value::as_uint() const
{
    if (auto* number = std::get_if<std::uint64_t>(&m_content)) return *number;
    return 0;
}

double Value::as_real() const
{
    if (auto* number = std::get_if<double>(&m_content)) return *number;
    return 0;
}

const std::string& Value::as_text() const
{
    static const auto& empty = *new std::string;
    auto* text = std::get_if<std::string>(&m_content);
    return text ? *text : empty;
}

const Path* Value::as_path() const
{
    auto* path = std::get_if<std::shared_ptr<const Path>>(&m_content);
    return path ? path->get() : nullptr;
}

const Instance* Value::as_instance() const
{
    auto* instance = std::get_if<std::shared_ptr<const Instance>>(&m_content);
    return instance ? instance->get() : nullptr;
}

const std::vector<Value>& Value::elements() const
{
    static const auto& none = *new std::vector<Value>;
    auto* elements = std::get_if<std::vector<Value>>(&m_content);
    return elements ? *elements : none;
}

bool Value::operator==(const Value& other) const
{
    if (m_content.index() != other.m_content.index()) return false;
    if (auto* path = as_path()) return *path == *other.as_path();
    if (auto* instance = as_instance()) {
        const Instance& theirs = *other.as_instance();
        return instance->path == theirs.path && instance->properties.size() == theirs.properties.size() &&
               std::all_of(instance->properties.begin(), instance->properties.end(), [&](const Named_Value& p) {
                   const Value* match = theirs.find(p.name);
                   return match && *match == p.value;
               });
    }
    if (is_null()) return true;
    bool numbers = is_integer(m_type) && is_integer(other.m_type);
    return (numbers || m_type == other.m_type) && m_content == other.m_content;
}

std::string Value::to_text() const
{
    if (is_null()) return "NULL";
    if (is_array()) {
        std::string text;
        for (const Value& element : elements())
            text += (text.empty() ? "" : ", ") + element.to_text();
        return "{" + text + "}";
    }
    if (auto* path = as_path()) return path->to_text();
    if (auto* instance = as_instance()) return instance->to_text();
    if (m_type == CMPI_boolean) return as_boolean() ? "true" : "false";
    if (is_signed(m_type)) return std::to_string(as_int());
    if (is_integer(m_type)) return std::to_string(as_uint());
    if (std::holds_alternative<double>(m_content)) {
        char text[40];
        std::snprintf(text, sizeof text, m_type == CMPI_real32 ? "%.9g" : "%.17g", as_real());
        return text;
    }
    return as_text();
}

namespace {

const Value* find_in(const std::vector<Named_Value>& values, const std::string& name)
{
    for (const Named_Value& v : values)
        if (same_name(v.name, name)) return &v.value;
    return nullptr;
}

void set_in(std::vector<Named_Value>& values, const std::string& name, Value value)
{
    for (Named_Value& v : values)
        if (same_name(v.name, name)) {
            v.value = std::move(value);
            return;
        }
    values.push_back({name, std::move(value)});
}

} // namespace

const Value* Path::find(const std::string& name) const
{
    return find_in(keys, name);
}
void Path::set(const std::string& name, Value value)
{
    set_in(keys, name, std::move(value));
}

bool Path::operator==(const Path& other) const
{
    return same_name(class_name, other.class_name) && same_name(name_space, other.name_space) &&
           keys.size() == other.keys.size() && std::all_of(keys.begin(), keys.end(), [&](const Named_Value& key) {
               const Value* match = other.find(key.name);
               return match && *match == key.value;
           });
}

std::string Path::to_text() const
{
    return path_to_text(*this);
}

const Value* Instance::find(const std::string& name) const
{
    return find_in(properties, name);
}

const Value& Instance::get(const std::string& name) const
{
    static const auto& null = *new Value;
    const Value* value = find(name);
    return value ? *value : null;
}

void Instance::set(const std::string& name, Value value)
{
    set_in(properties, name, std::move(value));
}

std::string Instance::to_text() const
{
    std::string text = "instance of " + path.class_name + " {\n";
    for (const Named_Value& p : properties) {
        bool quoted = !p.value.is_null() && !p.value.is_array() &&
                      (p.value.type() == CMPI_string || p.value.type() == CMPI_dateTime || p.value.type() == CMPI_ref);
        text += "  " + p.name + " = " + (quoted ? quote(p.value.to_text()) : p.value.to_text()) + ";\n";
    }
    return text + "};";
}

} // namespace host
