#include "generator/Emit.h"

#include <cstdio>

namespace generator {
namespace {

/// A string as a C++ literal. Octal escapes end after three digits, whatever follows.
std::string literal_of(const std::string& text)
{
    std::string result = "\"";
    for (const char c : text) {
        const auto byte = static_cast<unsigned char>(c);
        if (c == '"' || c == '\\') {
            result += '\\';
            result += c;
        } else if (byte < 0x20 || byte >= 0x7F) {
            char escape[8];
            std::snprintf(escape, sizeof escape, "\\%03o", byte);
            result += escape;
        } else {
            result += c;
        }
    }
    return result + "\"";
}

std::string number(const mof::Literal& literal)
{
    std::string text = std::to_string(literal.magnitude);
    if (!literal.negative) return text + "u";
    // The lowest 64-bit number has no literal of its own.
    return "-" + std::to_string(literal.magnitude - 1) + " - 1";
}

std::string constant(const mof::Literal& literal, mof::Type type)
{
    char text[64];
    switch (type) {
    case mof::Type::boolean:
        return literal.boolean ? "true" : "false";
    case mof::Type::string:
    case mof::Type::datetime:
        return literal_of(literal.text);
    case mof::Type::real32:
    case mof::Type::real64:
        std::snprintf(text, sizeof text, "static_cast<%s>(%.17g)", mof::type_name(type), literal.real);
        return text;
    default:
        return std::string("static_cast<") + mof::type_name(type) + ">(" + number(literal) + ")";
    }
}

std::string element_type(mof::Type type)
{
    const bool is_text = type == mof::Type::string || type == mof::Type::datetime;
    return is_text ? "char* const" : mof::type_name(type);
}

std::string hexadecimal(std::uint32_t flags)
{
    char text[16];
    std::snprintf(text, sizeof text, "0x%Xu", flags);
    return text;
}

/// The head that every record begins with.
std::string head(std::uint32_t flags, const std::string& name)
{
    return "{{0}, " + hexadecimal(flags) + ", " + literal_of(name) + ", nullptr, 0}";
}

std::string target_record(const std::string& target)
{
    return "&" + (target.empty() ? "Instance" : target) + "::meta";
}

/// Record of a property, reference or parameter: `symbol` is its C++ name, `place` the member whose offset it holds.
std::string emit_field(const std::string& symbol, const std::string& owner, const mof::Typed_Element& element,
                       std::uint32_t flags, const mof::Value* default_value)
{
    const Shape shape = shape_of(element);
    const std::string offset = "offsetof(" + owner + ", " + element.name + ")";
    if (shape.is_reference)
        return "const Meta_Reference " + symbol + " = {" + head(flags, element.name) + ", " +
               std::to_string(shape.subscript) + ", " + target_record(shape.target) + ", " + offset + "};\n";

    std::string text;
    std::string value = "nullptr";
    const bool is_null =
        !default_value || (!default_value->is_array && default_value->items.at(0).kind == mof::Literal::Kind::null);
    if (!is_null && !default_value->is_array) {
        text += "const " + element_type(shape.type) + " " + symbol +
                "_default = " + constant(default_value->items[0], shape.type) + ";\n";
        value = "&" + symbol + "_default";
    } else if (!is_null && !default_value->items.empty()) {
        text += "const " + element_type(shape.type) + " " + symbol + "_elements[] = {";
        for (const auto& item : default_value->items)
            text += constant(item, shape.type) + ", ";
        text += "};\nconst Meta_Array_Value " + symbol + "_default = {" + symbol + "_elements, " +
                std::to_string(default_value->items.size()) + "};\n";
        value = "&" + symbol + "_default";
    }
    return text + "const Meta_Property " + symbol + " = {" + head(flags, element.name) + ", " +
           std::to_string(static_cast<unsigned>(shape.type)) + ", " + std::to_string(shape.subscript) + ", " + offset +
           ", " + value + "};\n";
}

std::string emit_method(const mof::Feature& method)
{
    const std::string record = method_record_name(method);
    std::string text;
    std::string list;
    for (const auto& parameter : method.parameters) {
        const std::string symbol = method.origin + "_" + method.name + "_" + parameter.name + "_parameter";
        text += emit_field(symbol, record, parameter, parameter_flags(parameter), nullptr);
        list += "&" + symbol + ", ";
    }
    mof::Typed_Element result;
    result.name = "return_value";
    result.type = method.type;
    const std::string symbol = method.origin + "_" + method.name + "_result";
    text += emit_field(symbol, record, result, (1u << 0) | (1u << 24), nullptr);
    text += "const Meta_Feature* const " + record + "_features[] = {" + list + "&" + symbol + "};\n";
    text += "} // namespace\n";
    text += "const Meta_Method " + record + "::meta = {{" + head(feature_flags(method), method.name) + ", " + record +
            "_features, " + std::to_string(method.parameters.size() + 1) + ", sizeof(" + record + ")}, " +
            std::to_string(static_cast<unsigned>(method.type)) + "};\n";
    return text + "namespace {\n";
}

std::string symbol_of(const mof::Feature& feature)
{
    if (feature.kind == mof::Feature::Kind::method) return method_record_name(feature) + "::meta";
    return feature.origin + "_" + feature.name;
}

std::string emit_class(const mof::Class& target)
{
    std::string text = "// " + target.name + "\nnamespace {\n";
    for (const auto& feature : target.declared) {
        if (feature->kind == mof::Feature::Kind::method)
            text += emit_method(*feature);
        else
            text += emit_field(symbol_of(*feature), target.name, *feature, feature_flags(*feature),
                               feature->has_default ? &feature->default_value : nullptr);
    }
    std::string features;
    std::string locals;
    std::size_t keys = 0;
    for (const auto& feature : target.features) {
        features += "    &" + symbol_of(*feature) + ",\n";
        locals += feature->origin == target.name ? "1, " : "0, ";
        if (feature->is_key) ++keys;
    }
    const bool empty = target.features.empty();
    if (!empty) {
        text += "const Meta_Feature* const " + target.name + "_features[] = {\n" + features + "};\n";
        text += "const uint8 " + target.name + "_locals[] = {" + locals + "};\n";
    }
    text += "} // namespace\n";
    text += "const Meta_Class " + target.name + "::meta = {{" + head(class_flags(target), target.name) + ", " +
            (empty ? "nullptr" : target.name + "_features") + ", " + std::to_string(target.features.size()) +
            ", sizeof(" + target.name + ")}, " + (empty ? "nullptr" : target.name + "_locals") + ", " +
            (target.super ? "&" + target.super->name + "::meta" : "nullptr") + ", " + std::to_string(keys) +
            ", &the_repository};\n\n";
    return text;
}

/// The classes with each one behind its superclass, else in repository order: feature records stand before their use.
std::vector<const mof::Class*> supers_first(const Catalogue& catalogue)
{
    std::vector<const mof::Class*> ordered;
    std::vector<const mof::Class*> chain;
    const auto has = [&ordered](const mof::Class* target) {
        for (const mof::Class* other : ordered)
            if (other == target) return true;
        return false;
    };
    for (const mof::Class* target : catalogue.classes) {
        for (const mof::Class* at = target; at && !has(at); at = at->super)
            chain.push_back(at);
        for (; !chain.empty(); chain.pop_back())
            ordered.push_back(chain.back());
    }
    return ordered;
}

} // namespace

std::string emit_records(const Catalogue& catalogue)
{
    std::string text = "// Made by the generator from the MOF files: change those.\n"
                       "//\n// Constant data only: every object here is initialised by the compiler.\n"
                       "#include \"classes/repository.h\"\n\n#include <cstddef>\n\n";
    for (const mof::Class* target : catalogue.classes)
        text += "#include \"classes/" + target->name + ".h\"\n";
    text +=
        "\n// Records hold handles, so they are no standard-layout types; their members stand in order all the same.\n"
        "#pragma GCC diagnostic ignored \"-Winvalid-offsetof\"\n\nnamespace cimple {\n\n";
    for (const mof::Class* target : supers_first(catalogue))
        text += emit_class(*target);
    text += "namespace {\nconst Meta_Class* const all_classes[] = {\n";
    for (const mof::Class* target : catalogue.classes)
        text += "    &" + target->name + "::meta,\n";
    text += "};\n} // namespace\n\nconst Meta_Repository the_repository = {all_classes, " +
            std::to_string(catalogue.classes.size()) + "};\n\n} // namespace cimple\n";
    return text;
}

} // namespace generator
