#include "generator/Emit.h"
#include "generator/Entry_Kinds.h"

#include <set>

namespace generator {
namespace {

constexpr const char* table_notice = "// Made by the generator from the MOF files and providers.txt: change those.\n";
constexpr const char* module_name = "norvane_fc_provider_Module";
constexpr const char* proc_parameters = "(const Registration*, int code, void* arg0, void* arg1, void* arg2, void* "
                                        "arg3, void* arg4, void* arg5, void* arg6, "
                                        "void* arg7)";

bool has_inherited_methods(const mof::Class& target)
{
    for (const auto* method : methods_of(target))
        if (method->origin != target.name) return true;
    return false;
}

/// A family member's provider: the template over its class, its log words and its map.
std::string emit_derived_provider(const Provider& provider)
{
    const std::string& name = provider.target->name;
    std::string text = "struct " + name + "_Family {\n    using Class = " + name + ";\n";
    text += "    static constexpr const char* name = \"" + name + "_Provider\";\n";
    text += "    static constexpr const char* file = \"derivedObjects/" + name + "_Provider\";\n";
    text += std::string("    static constexpr bool is_san = ") +
            (provider.kind == Provider_Kind::san ? "true" : "false") + ";\n";
    text += "    template <class Agent>\n    static auto& map(Agent& agent)\n    {\n        return agent.m_" + name +
            "_map;\n    }\n};\n";
    text += "class " + name + "_Provider : public Derived_Provider<" + name + "_Family>";
    if (has_inherited_methods(*provider.target)) text += ", public " + name + "_Methods";
    return text + " {};\n";
}

std::string emit_method_list(const mof::Class& target)
{
    const auto methods = methods_of(target);
    if (methods.empty()) return "";
    const std::string provider = target.name + "_Provider";
    std::string text = "const Method_Entry<" + provider + ", " + target.name + "> " + target.name + "_methods[] = {\n";
    for (const auto* method : methods) {
        const std::string record = method_record_name(*method);
        text += "    {&" + record + "::meta, [](" + provider + "& provider, const " + target.name +
                "* self, Instance* record) -> int {\n";
        text += "         auto& call = *static_cast<" + record + "*>(record);\n         return provider." +
                method->name + "(self, ";
        for (const auto& parameter : method->parameters)
            text += "call." + parameter.name + ", ";
        text += "call.return_value);\n     }},\n";
    }
    return text + "};\n";
}

std::string emit_proc(const mof::Class& target)
{
    const std::string types = "<" + target.name + "_Provider, " + target.name + ">";
    const std::size_t methods = methods_of(target).size();
    std::string call;
    switch (kind_of(target)) {
    case Class_Kind::association:
        call = "association_proc" + types + "(";
        break;
    case Class_Kind::indication:
        call = "indication_proc" + types + "(";
        break;
    case Class_Kind::plain:
        call = "plain_proc" + types + "(";
        call += methods ? "{" + target.name + "_methods, " + std::to_string(methods) + "}, " : "{}, ";
    }
    return "int " + target.name + "_proc" + proc_parameters + "\n{\n    return " + call +
           "code, {{arg0, arg1, arg2, arg3, arg4, arg5, arg6, arg7}});\n}\n";
}

std::string emit_entries(const mof::Class& target, std::size_t index)
{
    const std::string& name = target.name;
    std::string text = "namespace {\nMI_Table_Set " + name + "_tables{};\nconst Provider_Entry " + name +
                       "_entry = {&" + name + "_tables, &registrations[" + std::to_string(index) +
                       "]};\n} // namespace\n";
    for (const Entry_Kind& kind : entries_of(target)) {
        const std::string mi = std::string("CMPI") + kind.word + "MI";
        const std::string factory = std::string("_Create_") + kind.word + "MI";
        text += "NORVANE_ENTRY " + mi + "* " + name + "_Provider" + factory +
                "(const CMPIBroker* broker, const CMPIContext* context)\n{\n    return provider_entry<" + mi + ">(" +
                name + "_entry, broker, context, '" + kind.letter + "');\n}\n";
        text += "NORVANE_ENTRY " + mi + "* " + name + factory +
                "(const CMPIBroker* broker, const CMPIContext* context, CMPIStatus*)\n{\n    return " + name +
                "_Provider" + factory + "(broker, context);\n}\n";
    }
    return text;
}

} // namespace

std::string emit_providers(const Catalogue& catalogue, std::size_t first, std::size_t last)
{
    std::set<std::string> headers = {"classes/Provider_Proc.h", "classes/module_table.h"};
    for (std::size_t i = first; i < last; ++i) {
        const Provider& provider = catalogue.providers[i];
        const std::string stem = "classes/" + provider.target->name;
        headers.insert(stem + ".h");
        if (provider.kind == Provider_Kind::own) {
            headers.insert(provider.header);
        } else {
            headers.insert(catalogue.derived_header);
            if (has_inherited_methods(*provider.target)) headers.insert(stem + "_Methods.h");
        }
    }
    std::string text = table_notice;
    for (const auto& header : headers)
        text += "#include \"" + header + "\"\n";
    text += "\nnamespace cimple {\n\n";
    for (std::size_t i = first; i < last; ++i) {
        const Provider& provider = catalogue.providers[i];
        text += "// " + provider.target->name + "\nnamespace {\n";
        if (provider.kind != Provider_Kind::own) text += emit_derived_provider(provider);
        if (kind_of(*provider.target) == Class_Kind::plain) text += emit_method_list(*provider.target);
        text += "} // namespace\n" + emit_proc(*provider.target) + emit_entries(*provider.target, i) + "\n";
    }
    return text + "} // namespace cimple\n";
}

std::string emit_registrations(const Catalogue& catalogue)
{
    std::string text = table_notice;
    text += "#include \"classes/module_table.h\"\n\n";
    for (const auto& provider : catalogue.providers)
        text += "#include \"classes/" + provider.target->name + ".h\"\n";
    text += "\nnamespace cimple {\n\n";
    for (const auto& provider : catalogue.providers)
        text += "int " + provider.target->name + "_proc" + proc_parameters + ";\n";
    text += "\nRegistration registrations[] = {\n";
    for (const auto& provider : catalogue.providers)
        text += std::string("    {\"") + module_name + "\", \"" + provider.target->name + "_Provider\", " +
                provider.target->name + "_proc, &" + provider.target->name + "::meta, nullptr},\n";
    text += "};\n\nnamespace {\n\nRegistration* head = nullptr;\n\n"
            "/// Pushes the records in their order, so that the last one leads the list.\n"
            "const bool is_linked = [] {\n    for (Registration& registration : registrations) {\n"
            "        registration.next = head;\n        head = &registration;\n    }\n    return true;\n}();\n\n"
            "} // namespace\n\nNORVANE_ENTRY Registration* cimple_module()\n{\n"
            "    return is_linked ? head : nullptr;\n}\n\n} // namespace cimple\n";
    return text;
}

std::string emit_exports(const Catalogue& catalogue)
{
    std::string text =
        "{\nglobal:\n    cimple_module;\n    __cimple_trace;\n    __cimple_assert;\n    _thread_context_key;\n"
        "    _thread_context_key_once;\n";
    for (const auto& provider : catalogue.providers)
        for (const Entry_Kind& kind : entries_of(*provider.target)) {
            text += "    " + provider.target->name + "_Create_" + kind.word + "MI;\n";
            text += "    " + provider.target->name + "_Provider_Create_" + kind.word + "MI;\n";
        }
    return text + "local:\n    *;\n};\n";
}

} // namespace generator
