#include "host/serve/Xml_Writer.h"

#include "host/ScalarText.h"
#include "host/serve/Xml_Reader.h"
#include "mof/Model.h"

#include <algorithm>

namespace host {
namespace {

bool is_wanted(const Write_Options& options, const std::string& name)
{
    if (!options.properties) return true;
    return std::any_of(options.properties->begin(), options.properties->end(),
                       [&](const std::string& each) { return same_name(each, name); });
}

/// One UTF-16 unit as UTF-8. Half of a pair is no character: "?".
std::string utf8(unsigned unit)
{
    if (unit >= 0xD800 && unit < 0xE000) return "?";
    if (unit < 0x80) return std::string(1, static_cast<char>(unit));
    const char last = static_cast<char>(0x80 | (unit & 0x3F));
    if (unit < 0x800) return {static_cast<char>(0xC0 | unit >> 6), last};
    return {static_cast<char>(0xE0 | unit >> 12), static_cast<char>(0x80 | (unit >> 6 & 0x3F)), last};
}

/// VALUE.REFERENCE; it says in which namespace it points only if the path does.
void write_reference(std::string& out, const Path& path)
{
    out += "<VALUE.REFERENCE>";
    if (!path.name_space.empty()) {
        out += "<LOCALINSTANCEPATH>";
        write_name_space(out, path.name_space);
    }
    write_instance_name(out, path);
    if (!path.name_space.empty()) out += "</LOCALINSTANCEPATH>";
    out += "</VALUE.REFERENCE>";
}

void write_scalar(std::string& out, const Value& value, const Schema& schema)
{
    if (value.is_null()) {
        out += "<VALUE.NULL/>";
        return;
    }
    if (const Path* path = value.as_path()) {
        write_reference(out, *path);
        return;
    }
    out += "<VALUE>";
    if (const Instance* embedded = value.as_instance()) {
        std::string inner;
        write_instance(inner, *embedded, schema, {});
        write_text(out, inner);
    } else if (value.type() == CMPI_char16) {
        write_text(out, utf8(static_cast<unsigned>(value.as_uint())));
    } else {
        write_text(out, scalar_text(value));
    }
    out += "</VALUE>";
}

void write_property(std::string& out, const std::string& name, const Value& value, const Element_Record* declared,
                    const std::string& origin, const Schema& schema)
{
    // A value's own type counts where nothing is declared, or the provider gave another one.
    CMPIType type = value.type() != CMPI_null || !declared ? value.type() : declared->type;
    if (value.is_null() && declared) type = declared->type;
    const bool is_array = (type & CMPI_ARRAY) != 0;
    const bool is_reference = (type & ~CMPI_ARRAY) == CMPI_ref && !is_array;
    const char* element = is_reference ? "PROPERTY.REFERENCE" : is_array ? "PROPERTY.ARRAY" : "PROPERTY";
    out += std::string("<") + element;
    write_attribute(out, "NAME", name);
    if (!is_reference) write_attribute(out, "TYPE", xml_type(type));
    if (is_reference && declared) write_attribute(out, "REFERENCECLASS", declared->reference_class);
    if (!origin.empty()) write_attribute(out, "CLASSORIGIN", origin);
    // Clients of old do not know the attribute, so it stands only where an instance does.
    if (!value.is_null() && ((type & ~CMPI_ARRAY) == CMPI_instance || (declared && declared->embedded)))
        write_attribute(out, "EmbeddedObject", "instance");
    out += '>';
    write_value(out, value, schema);
    out += std::string("</") + element + ">";
}

std::string origin_of(const Class_Record* record, const std::string& name)
{
    const mof::Feature* feature = record && record->declaration ? record->declaration->find_feature(name) : nullptr;
    return feature ? feature->origin : "";
}

std::string literal_text(const mof::Literal& literal)
{
    switch (literal.kind) {
    case mof::Literal::Kind::boolean:
        return literal.boolean ? "TRUE" : "FALSE";
    case mof::Literal::Kind::integer:
    case mof::Literal::Kind::character:
        return (literal.negative ? "-" : "") + std::to_string(literal.magnitude);
    case mof::Literal::Kind::real:
        return scalar_text(Value::real(CMPI_real64, literal.real));
    default:
        return literal.text;
    }
}

void write_literals(std::string& out, const mof::Value& value)
{
    if (value.items.empty() || (!value.is_array && value.items[0].kind == mof::Literal::Kind::null)) return;
    if (value.is_array) out += "<VALUE.ARRAY>";
    for (const mof::Literal& literal : value.items) {
        out += "<VALUE>";
        write_text(out, literal_text(literal));
        out += "</VALUE>";
    }
    if (value.is_array) out += "</VALUE.ARRAY>";
}

const char* literal_type(const mof::Value& value)
{
    if (value.items.empty()) return "string";
    switch (value.items[0].kind) {
    case mof::Literal::Kind::boolean:
        return "boolean";
    case mof::Literal::Kind::integer:
        return value.items[0].negative ? "sint64" : "uint32";
    case mof::Literal::Kind::real:
        return "real64";
    default:
        return "string";
    }
}

void write_qualifiers(std::string& out, const mof::Qualifiers& qualifiers, const Schema& schema,
                      const Write_Options& options)
{
    if (!options.qualifiers) return;
    for (const mof::Qualifier& qualifier : qualifiers) {
        out += "<QUALIFIER";
        write_attribute(out, "NAME", qualifier.name);
        const std::string declared = schema.qualifier_type(qualifier.name);
        write_attribute(out, "TYPE", declared.empty() ? literal_type(qualifier.value) : declared);
        out += '>';
        write_literals(out, qualifier.value);
        out += "</QUALIFIER>";
    }
}

/// The attributes that features and parameters share, and what closes the tag.
void open_element(std::string& out, const std::string& tag, const mof::Typed_Element& element,
                  const std::string& origin)
{
    out += "<" + tag;
    write_attribute(out, "NAME", element.name);
    if (element.type == mof::Type::reference)
        write_attribute(out, "REFERENCECLASS", element.target);
    else
        write_attribute(out, "TYPE", mof::type_name(element.type));
    if (element.subscript > 0) write_attribute(out, "ARRAYSIZE", std::to_string(element.subscript));
    if (!origin.empty()) write_attribute(out, "CLASSORIGIN", origin);
    out += '>';
}

void write_feature(std::string& out, const mof::Feature& feature, const Schema& schema, const Write_Options& options)
{
    const bool is_array = feature.subscript != 0;
    const std::string tag = feature.kind == mof::Feature::Kind::method      ? "METHOD"
                            : feature.kind == mof::Feature::Kind::reference ? "PROPERTY.REFERENCE"
                            : is_array                                      ? "PROPERTY.ARRAY"
                                                                            : "PROPERTY";
    open_element(out, tag, feature, options.class_origin ? feature.origin : "");
    write_qualifiers(out, feature.qualifiers, schema, options);
    if (feature.has_default && feature.kind == mof::Feature::Kind::property) write_literals(out, feature.default_value);
    for (const mof::Parameter& parameter : feature.parameters) {
        std::string kind = parameter.type == mof::Type::reference ? "PARAMETER.REFERENCE" : "PARAMETER";
        if (parameter.subscript)
            kind = parameter.type == mof::Type::reference ? "PARAMETER.REFARRAY" : "PARAMETER.ARRAY";
        open_element(out, kind, parameter, "");
        write_qualifiers(out, parameter.qualifiers, schema, options);
        out += "</" + kind + ">";
    }
    out += "</" + tag + ">";
}

} // namespace

std::string xml_type(CMPIType type)
{
    type = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    if (type == CMPI_instance || type == CMPI_chars || type == CMPI_null) return "string";
    return type == CMPI_ref ? "reference" : type_name(type);
}

void write_text(std::string& out, const std::string& text)
{
    const bool is_clean = is_xml_text(text);
    for (const char c : text) {
        const unsigned char byte = static_cast<unsigned char>(c);
        switch (c) {
        case '&':
            out += "&amp;";
            break;
        case '<':
            out += "&lt;";
            break;
        case '>':
            out += "&gt;";
            break;
        case '"':
            out += "&quot;";
            break;
        case '\'':
            out += "&apos;";
            break;
        case '\r':
            out += "&#13;";
            break;
        default:
            // Of a broken text only what is surely a character survives.
            out += is_clean || (byte >= 0x20 && byte < 0x80) || c == '\n' || c == '\t' ? c : '?';
        }
    }
}

void write_attribute(std::string& out, const char* name, const std::string& value)
{
    out += std::string(" ") + name + "=\"";
    write_text(out, value);
    out += '"';
}

void write_instance_name(std::string& out, const Path& path)
{
    out += "<INSTANCENAME";
    write_attribute(out, "CLASSNAME", path.class_name);
    out += '>';
    for (const Named_Value& key : path.keys) {
        out += "<KEYBINDING";
        write_attribute(out, "NAME", key.name);
        out += '>';
        if (const Path* reference = key.value.as_path()) {
            write_reference(out, *reference);
        } else {
            const CMPIType type = key.value.type();
            out += "<KEYVALUE";
            write_attribute(out, "VALUETYPE",
                            type == CMPI_boolean                                             ? "boolean"
                            : is_integer(type) || type == CMPI_real32 || type == CMPI_real64 ? "numeric"
                                                                                             : "string");
            out += '>';
            write_text(out, scalar_text(key.value));
            out += "</KEYVALUE>";
        }
        out += "</KEYBINDING>";
    }
    out += "</INSTANCENAME>";
}

void write_name_space(std::string& out, const std::string& name_space)
{
    out += "<LOCALNAMESPACEPATH>";
    for (std::size_t start = 0; start <= name_space.size();) {
        const std::size_t end = std::min(name_space.find('/', start), name_space.size());
        out += "<NAMESPACE";
        write_attribute(out, "NAME", name_space.substr(start, end - start));
        out += "/>";
        start = end + 1;
    }
    out += "</LOCALNAMESPACEPATH>";
}

void write_instance_path(std::string& out, const Path& path, const std::string& host)
{
    out += "<INSTANCEPATH><NAMESPACEPATH><HOST>";
    write_text(out, path.host.empty() ? host : path.host);
    out += "</HOST>";
    write_name_space(out, path.name_space);
    out += "</NAMESPACEPATH>";
    write_instance_name(out, path);
    out += "</INSTANCEPATH>";
}

void write_value(std::string& out, const Value& value, const Schema& schema)
{
    if (value.is_null()) return;
    if (!value.is_array()) {
        write_scalar(out, value, schema);
        return;
    }
    const char* element = (value.type() & ~CMPI_ARRAY) == CMPI_ref ? "VALUE.REFARRAY" : "VALUE.ARRAY";
    out += std::string("<") + element + ">";
    for (const Value& each : value.elements())
        write_scalar(out, each, schema);
    out += std::string("</") + element + ">";
}

void write_instance(std::string& out, const Instance& instance, const Schema& schema, const Write_Options& options)
{
    const Class_Record* record = schema.find(instance.path.class_name);
    out += "<INSTANCE";
    write_attribute(out, "CLASSNAME", instance.path.class_name);
    out += '>';
    for (const Named_Value& property : instance.properties)
        if (is_wanted(options, property.name))
            write_property(out, property.name, property.value, record ? record->property(property.name) : nullptr,
                           options.class_origin ? origin_of(record, property.name) : "", schema);
    out += "</INSTANCE>";
}

void write_class(std::string& out, const Class_Record& record, const Schema& schema, const Write_Options& options)
{
    out += "<CLASS";
    write_attribute(out, "NAME", record.name);
    if (record.super) write_attribute(out, "SUPERCLASS", record.super->name);
    out += '>';
    if (record.declaration) {
        write_qualifiers(out, record.declaration->qualifiers, schema, options);
        // The order of the DTD: properties and references first, methods behind them.
        for (const bool methods : {false, true})
            for (const auto& feature : record.declaration->features) {
                if ((feature->kind == mof::Feature::Kind::method) != methods) continue;
                if (options.local_only && !same_name(feature->origin, record.name)) continue;
                if (!methods && !is_wanted(options, feature->name)) continue;
                write_feature(out, *feature, schema, options);
            }
    }
    out += "</CLASS>";
}

void write_out_parameter(std::string& out, const Named_Value& parameter, const Schema& schema)
{
    const CMPIType type = static_cast<CMPIType>(parameter.value.type() & ~CMPI_ARRAY);
    out += "<PARAMVALUE";
    write_attribute(out, "NAME", parameter.name);
    write_attribute(out, "PARAMTYPE", xml_type(type));
    if (type == CMPI_instance) write_attribute(out, "EmbeddedObject", "instance");
    out += '>';
    write_value(out, parameter.value, schema);
    out += "</PARAMVALUE>";
}

} // namespace host
