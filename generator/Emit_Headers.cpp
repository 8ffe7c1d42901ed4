#include "generator/Emit.h"

#include <set>

namespace generator {
namespace {

constexpr const char* header_notice = "// Made by the generator from the MOF files: change those.\n";

/// The class's features but its methods: what its instances hold.
std::vector<const mof::Feature*> members_of(const mof::Class& target)
{
    std::vector<const mof::Feature*> members;
    for (const auto& feature : target.features)
        if (feature->kind != mof::Feature::Kind::method) members.push_back(feature.get());
    return members;
}

std::vector<const mof::Feature*> declared_methods_of(const mof::Class& target)
{
    std::vector<const mof::Feature*> methods;
    for (const auto& feature : target.declared)
        if (feature->kind == mof::Feature::Kind::method) methods.push_back(feature.get());
    return methods;
}

std::string comment_of(const mof::Typed_Element& element)
{
    std::string comment;
    if (element.subscript > 0) comment += "[" + std::to_string(element.subscript) + "]";
    return comment.empty() ? "" : " // " + comment;
}

std::string emit_method_record(const mof::Feature& method)
{
    std::string text = "/// A call of " + method.origin + "." + method.name + ".\n";
    text += "struct " + method_record_name(method) + " : Instance {\n";
    for (const auto& parameter : method.parameters)
        text += "    " + shape_of(parameter).member_type() + " " + parameter.name + ";" + comment_of(parameter) + "\n";
    mof::Typed_Element result;
    result.type = method.type;
    text += "    " + shape_of(result).member_type() + " return_value;\n\n";
    return text + "    static const Meta_Method meta;\n};\n\n";
}

} // namespace

std::string emit_class_header(const Catalogue&, const mof::Class& target)
{
    // By key in lower case: MOF may spell one class in two ways.
    std::set<std::string> targets;
    std::set<std::string> headers;
    const auto note_target = [&](const mof::Typed_Element& element) {
        const Shape shape = shape_of(element);
        if (shape.is_reference && shape.subscript == 0 && !shape.target.empty() && shape.target != target.name)
            targets.insert(shape.target);
    };
    const auto members = members_of(target);
    for (const auto* member : members)
        note_target(*member);
    for (const auto* method : declared_methods_of(target))
        for (const auto& parameter : method->parameters)
            note_target(parameter);
    for (const auto* method : methods_of(target))
        if (method->origin != target.name) headers.insert(method->origin);

    std::string text = "/// " + target.name;
    if (target.super) text += ", a " + target.super->name;
    text += ".\n";
    text += header_notice;
    text += "#pragma once\n\n#include \"runtime/Instance.h\"\n";
    for (const auto& header : headers)
        text += "#include \"classes/" + header + ".h\"\n";
    text += "\nnamespace cimple {\n\n";
    for (const auto& name : targets)
        text += "struct " + name + ";\n";
    if (!targets.empty()) text += "\n";

    text += "struct " + target.name + " : Instance {\n";
    std::string origin;
    for (const auto* member : members) {
        if (member->origin != origin) {
            origin = member->origin;
            text += "    // " + origin + "\n";
        }
        text += "    " + shape_of(*member).member_type() + " " + member->name + ";" + comment_of(*member) + "\n";
    }
    text += "\n    static const Meta_Class meta;\n};\n\n";
    for (const auto* method : declared_methods_of(target))
        text += emit_method_record(*method);
    return text + "} // namespace cimple\n";
}

std::string emit_methods_header(const mof::Class& target)
{
    std::string text = "/// Answers \"not supported\" to each method that " + target.name + " inherits.\n";
    text += "///\n/// A provider derives from it and declares what it serves; a method that the class itself declares "
            "is not here.\n";
    text += header_notice;
    text += "#pragma once\n\n#include \"runtime/Registration.h\"\n\nnamespace cimple {\n\n";
    text += "struct " + target.name + "_Methods {\n";
    bool first = true;
    for (const auto* method : methods_of(target)) {
        if (method->origin == target.name) continue;
        if (!first) text += "\n";
        first = false;
        text += "    template <class... Arguments>\n    Invoke_Method_Status " + method->name +
                "(Arguments&&...)\n    {\n        return INVOKE_METHOD_UNSUPPORTED;\n    }\n";
    }
    return text + "};\n\n} // namespace cimple\n";
}

std::string emit_repository_header(const Catalogue&)
{
    std::string text = "/// The class records of the module, all of them, in one list.\n";
    text += header_notice;
    text += "#pragma once\n\n#include \"runtime/Meta_Class.h\"\n\nnamespace cimple {\n\n"
            "extern const Meta_Repository the_repository;\n\n} // namespace cimple\n";
    return text;
}

} // namespace generator
