#include "host/Schema.h"

#include "mof/Repository.h"

#include <algorithm>
#include <cstdlib>
#include <sys/stat.h>

namespace host {
namespace {

CMPIType cmpi_type(mof::Type type, int subscript)
{
    constexpr CMPIType types[] = {CMPI_boolean, CMPI_uint8,  CMPI_sint8,  CMPI_uint16,   CMPI_sint16,
                                  CMPI_uint32,  CMPI_sint32, CMPI_uint64, CMPI_sint64,   CMPI_real32,
                                  CMPI_real64,  CMPI_char16, CMPI_string, CMPI_dateTime, CMPI_ref};
    CMPIType scalar = types[static_cast<std::size_t>(type)];
    return static_cast<CMPIType>(subscript == 0 ? scalar : scalar | CMPI_ARRAY);
}

std::string literal_text(const mof::Literal& literal)
{
    switch (literal.kind) {
    case mof::Literal::Kind::boolean:
        return literal.boolean ? "true" : "false";
    case mof::Literal::Kind::integer:
        return (literal.negative ? "-" : "") + std::to_string(literal.magnitude);
    default:
        return literal.text;
    }
}

std::vector<std::string> texts(const mof::Qualifier* qualifier)
{
    std::vector<std::string> result;
    if (qualifier)
        for (const mof::Literal& item : qualifier->value.items)
            result.push_back(literal_text(item));
    return result;
}

std::vector<std::pair<std::string, std::string>> words_of(const mof::Qualifier* map, const mof::Qualifier* values)
{
    std::vector<std::string> words = texts(values), entries = texts(map);
    std::vector<std::pair<std::string, std::string>> result;
    for (std::size_t i = 0; i < words.size(); ++i) {
        if (map && i >= entries.size()) break;
        result.emplace_back(map ? entries[i] : std::to_string(i), words[i]);
    }
    return result;
}

Element_Record element_of(const mof::Typed_Element& source)
{
    Element_Record record;
    record.name = source.name;
    record.type = cmpi_type(source.type, source.subscript);
    record.reference_class = source.target;
    record.embedded = source.type == mof::Type::string &&
                      (source.qualifiers.has("EmbeddedInstance") || source.qualifiers.has("EmbeddedObject"));
    record.required = source.qualifiers.has("Required");
    record.description = source.qualifiers.text("Description");
    record.words = words_of(source.qualifiers.find("ValueMap"), source.qualifiers.find("Values"));
    return record;
}

Element_Record property_of(const mof::Feature& source)
{
    Element_Record record = element_of(source);
    record.key = source.is_key;
    record.writable = source.qualifiers.has("Write");
    // Texts and tables may be said by a superclass only.
    if (record.description.empty())
        if (auto* description = source.inherited_qualifier("Description"))
            record.description = description->value.text();
    if (record.words.empty())
        record.words = words_of(source.inherited_qualifier("ValueMap"), source.inherited_qualifier("Values"));
    for (const char* name : {"EmbeddedInstance", "EmbeddedObject"})
        if (source.type == mof::Type::string && source.inherited_qualifier(name)) record.embedded = true;
    return record;
}

Method_Record method_of(const mof::Feature& source)
{
    Method_Record record;
    record.name = source.name;
    record.type = cmpi_type(source.type, source.subscript);
    record.is_static = source.qualifiers.has("Static");
    record.description = source.qualifiers.text("Description");
    record.words = words_of(source.inherited_qualifier("ValueMap"), source.inherited_qualifier("Values"));
    for (const mof::Parameter& parameter : source.parameters) {
        Element_Record element = element_of(parameter);
        element.in = parameter.is_in;
        element.out = parameter.is_out;
        record.parameters.push_back(std::move(element));
    }
    return record;
}

/// The hash of a name without its case.
std::size_t name_hash(const char* name)
{
    std::size_t hash = 14695981039346656037ull;
    for (; *name; ++name) {
        auto c = static_cast<unsigned char>(*name);
        if (c >= 'A' && c <= 'Z') c = static_cast<unsigned char>(c + 32);
        hash = (hash ^ c) * 1099511628211ull;
    }
    return hash;
}

bool entry_covers(const std::string& entry, const Value& value)
{
    if (entry == value.to_text()) return true;
    std::size_t dots = entry.find("..");
    if (dots == std::string::npos || !is_integer(value.type())) return false;
    std::string low = entry.substr(0, dots), high = entry.substr(dots + 2);
    if (low.empty() && high.empty()) return true;
    if (is_signed(value.type()))
        return (low.empty() || value.as_int() >= std::strtoll(low.c_str(), nullptr, 0)) &&
               (high.empty() || value.as_int() <= std::strtoll(high.c_str(), nullptr, 0));
    return (low.empty() || value.as_uint() >= std::strtoull(low.c_str(), nullptr, 0)) &&
           (high.empty() || value.as_uint() <= std::strtoull(high.c_str(), nullptr, 0));
}

Value literal_value(const mof::Literal& literal)
{
    switch (literal.kind) {
    case mof::Literal::Kind::null:
        return {};
    case mof::Literal::Kind::boolean:
        return Value::boolean(literal.boolean);
    case mof::Literal::Kind::integer:
        return Value::sint64(static_cast<std::int64_t>(literal.negative ? 0 - literal.magnitude : literal.magnitude));
    case mof::Literal::Kind::real:
        return Value::real(CMPI_real64, literal.real);
    case mof::Literal::Kind::character:
        return Value::integer(CMPI_char16, literal.magnitude);
    case mof::Literal::Kind::string:
        return Value::string(literal.text);
    }
    return {};
}

} // namespace

std::string Element_Record::word_for(const Value& value) const
{
    if (value.is_null()) return "";
    // An exact entry wins over a range that covers it, wherever it stands.
    for (const auto& [entry, word] : words)
        if (entry.find("..") == std::string::npos && entry == value.to_text()) return word;
    for (const auto& [entry, word] : words)
        if (entry_covers(entry, value)) return word;
    return "";
}

const Element_Record* Method_Record::find_parameter(const std::string& wanted) const
{
    for (const Element_Record& parameter : parameters)
        if (same_name(parameter.name, wanted)) return &parameter;
    return nullptr;
}

int Class_Record::find_property(const char* wanted) const
{
    std::size_t hash = name_hash(wanted);
    auto it = std::lower_bound(m_by_hash.begin(), m_by_hash.end(), std::make_pair(hash, -1));
    for (; it != m_by_hash.end() && it->first == hash; ++it)
        if (same_name(properties[static_cast<std::size_t>(it->second)].name.c_str(), wanted)) return it->second;
    return -1;
}

const Element_Record* Class_Record::property(const std::string& wanted) const
{
    int at = find_property(wanted.c_str());
    return at < 0 ? nullptr : &properties[static_cast<std::size_t>(at)];
}

const Method_Record* Class_Record::method(const std::string& wanted) const
{
    for (const Method_Record& record : methods)
        if (same_name(record.name, wanted)) return &record;
    return nullptr;
}

bool Class_Record::is_a(const std::string& class_name) const
{
    for (const Class_Record* c = this; c; c = c->super)
        if (same_name(c->name, class_name)) return true;
    return false;
}

Schema::Schema() : m_repository(std::make_unique<mof::Repository>()) {}
Schema::~Schema() = default;

std::shared_ptr<const Schema> Schema::from_files(const std::vector<std::string>& paths, std::string& error)
{
    std::shared_ptr<Schema> schema(new Schema);
    for (const std::string& path : paths) {
        struct stat info {};
        if (stat(path.c_str(), &info) != 0) {
            error = path + ": no such file or folder";
            return nullptr;
        }
        bool read =
            S_ISDIR(info.st_mode) ? schema->m_repository->read_folder(path) : schema->m_repository->read_file(path);
        if (!read) {
            error = schema->m_repository->fault_text();
            if (error.empty()) error = path + ": no MOF files there";
            return nullptr;
        }
    }
    if (!schema->m_repository->resolve()) {
        error = schema->m_repository->fault_text();
        return nullptr;
    }
    schema->build();
    return schema;
}

std::shared_ptr<const Schema> Schema::from_text(const std::string& mof, std::string& error)
{
    std::shared_ptr<Schema> schema(new Schema);
    if (!schema->m_repository->read_text("text", mof) || !schema->m_repository->resolve()) {
        error = schema->m_repository->fault_text();
        return nullptr;
    }
    schema->build();
    return schema;
}

void Schema::build()
{
    for (const mof::Class* source : m_repository->classes()) {
        auto record = std::make_unique<Class_Record>();
        record->name = source->name;
        record->declaration = source;
        record->association = source->is_association();
        record->indication = source->is_indication();
        record->abstract = source->is_abstract();
        record->description = source->qualifiers.text("Description");
        for (const auto& feature : source->features) {
            if (feature->kind == mof::Feature::Kind::method)
                record->methods.push_back(method_of(*feature));
            else
                record->properties.push_back(property_of(*feature));
        }
        for (std::size_t i = 0; i < record->properties.size(); ++i)
            record->m_by_hash.emplace_back(name_hash(record->properties[i].name.c_str()), static_cast<int>(i));
        std::sort(record->m_by_hash.begin(), record->m_by_hash.end());
        m_by_name[lower_case(record->name)] = record.get();
        m_order.push_back(record.get());
        m_classes.push_back(std::move(record));
    }
    for (auto& record : m_classes) {
        // The Association and Indication qualifiers pass on to subclasses.
        for (const mof::Class* up = record->declaration; up; up = up->super) {
            record->association = record->association || up->is_association();
            record->indication = record->indication || up->is_indication();
        }
        if (!record->declaration->super) continue;
        Class_Record* super = m_by_name.at(lower_case(record->declaration->super->name));
        record->super = super;
        super->subclasses.push_back(record.get());
    }
}

const Class_Record* Schema::find(const std::string& name) const
{
    auto it = m_by_name.find(lower_case(name));
    return it == m_by_name.end() ? nullptr : it->second;
}

bool Schema::is_a(const std::string& name, const std::string& ancestor) const
{
    const Class_Record* record = find(name);
    return record ? record->is_a(ancestor) : same_name(name, ancestor);
}

std::vector<const Class_Record*> Schema::family(const Class_Record& root) const
{
    std::vector<const Class_Record*> all{&root};
    for (std::size_t i = 0; i < all.size(); ++i)
        for (const Class_Record* subclass : all[i]->subclasses)
            all.push_back(subclass);
    return all;
}

std::string Schema::qualifier_type(const std::string& name) const
{
    for (const mof::Qualifier_Declaration& declaration : m_repository->qualifiers())
        if (same_name(declaration.name, name)) return mof::type_name(declaration.type);
    return "";
}

Value Schema::property_qualifier(const std::string& class_name, const std::string& property,
                                 const std::string& qualifier) const
{
    const Class_Record* record = find(class_name);
    const mof::Feature* feature = record ? record->declaration->find_property(property) : nullptr;
    if (!feature) return {};
    if (same_name(qualifier, "Key")) return feature->is_key ? Value::boolean(true) : Value();
    const mof::Qualifier* found = feature->inherited_qualifier(qualifier);
    if (!found || found->value.items.empty()) return {};
    if (!found->value.is_array) return literal_value(found->value.items.front());
    std::vector<Value> elements;
    for (const mof::Literal& item : found->value.items)
        elements.push_back(literal_value(item));
    CMPIType element = elements.front().is_null() ? static_cast<CMPIType>(CMPI_string) : elements.front().type();
    return Value::array(element, std::move(elements));
}

} // namespace host
