#include "generator/Emit_Server_Files.h"

#include "generator/Entry_Kinds.h"

#include <algorithm>
#include <set>

namespace generator {
namespace {

constexpr const char* registration_notice = "// Made by the generator from the class catalogue.\n\n";
/// The module's file is lib<location>.so.
constexpr const char* location = "norvane_fc_provider";
constexpr const char* vendor = "Norvane";
constexpr const char* module_name_space = "root/norvane";
/// The interop namespace goes by two names, and a server looks providers up by the one that a client used.
constexpr const char* interop_name_spaces[] = {"root/pg_interop", "root/interop"};

bool is_own(const mof::Class& target)
{
    return target.name.rfind("NVRHBA_", 0) == 0;
}

/// Is the class one of those that clients look for in the interop namespace?
bool is_of_profiles(const mof::Class& target)
{
    return target.derives_from("CIM_RegisteredProfile") || target.derives_from("CIM_ReferencedProfile") ||
           target.derives_from("CIM_ElementConformsToProfile");
}

std::vector<std::string> name_spaces_of(const mof::Class& target)
{
    std::vector<std::string> names = {module_name_space};
    if (is_of_profiles(target))
        names.insert(names.end(), std::begin(interop_name_spaces), std::end(interop_name_spaces));
    return names;
}

/// Classes in order of compilation, one MOF file each for the module's own and for the others, told in the list too.
void add_classes(const std::vector<const mof::Class*>& order, const std::string& others_file,
                 const std::string& own_file, std::vector<Text_File>& files, std::string& list)
{
    std::string others = registration_notice, own = registration_notice;
    std::set<std::string> in_own;
    for (const mof::Class* target : order) {
        if (is_own(*target)) in_own.insert(target->name);
        // A class of another's that needs one of the module's cannot stand in the earlier file.
        if (!is_own(*target) && target->super && in_own.count(target->super->name))
            throw Error(target->name + " derives from a class of the module");
        const bool is_in_own = in_own.count(target->name) != 0;
        (is_in_own ? own : others) += emit_mof(*target) + "\n";
        list += (is_in_own ? own_file : others_file) + " " + target->name + "\n";
    }
    files.push_back({others_file, others});
    files.push_back({own_file, own});
}

std::string emit_sfcb(const Catalogue& catalogue)
{
    std::string text;
    for (const Provider& provider : catalogue.providers) {
        const mof::Class& target = *provider.target;
        std::string types, name_spaces;
        for (const Entry_Kind& kind : entries_of(target)) {
            std::string word = kind.word;
            word[0] = static_cast<char>(word[0] - 'A' + 'a');
            types += " " + word;
        }
        for (const std::string& name : name_spaces_of(target))
            name_spaces += " " + name;
        text += "[" + target.name + "]\n   provider: " + target.name + "_Provider\n   location: " + location +
                "\n   type:" + types + "\n   namespace:" + name_spaces + "\n   group: " + location +
                "\n   unload: never\n\n";
    }
    return text;
}

/// The server's numbers of provider types.
int pegasus_type(const Entry_Kind& kind)
{
    switch (kind.letter) {
    case 'A':
        return 3;
    case 'N':
        return 4;
    case 'M':
        return 5;
    default:
        return 2;
    }
}

std::string emit_pegasus(const Catalogue& catalogue, const std::string& version)
{
    const std::string module = "\"" + std::string(location) + "\"";
    std::string text =
        registration_notice +
        ("instance of PG_ProviderModule {\n    Name = " + module + ";\n    Vendor = \"" + vendor +
         "\";\n    Version = \"" + version +
         "\";\n    InterfaceType = \"CMPI\";\n    InterfaceVersion = \"2.0.0\";\n    Location = " + module + ";\n};\n");
    std::size_t number = 0;
    for (const Provider& provider : catalogue.providers) {
        const mof::Class& target = *provider.target;
        const std::string name = "\"" + target.name + "_Provider\"";
        std::string types, name_spaces;
        for (const Entry_Kind& kind : entries_of(target))
            types += (types.empty() ? "" : ", ") + std::to_string(pegasus_type(kind));
        for (const std::string& name_space : name_spaces_of(target))
            name_spaces += (name_spaces.empty() ? "\"" : ", \"") + name_space + "\"";
        text += "\ninstance of PG_Provider {\n    ProviderModuleName = " + module + ";\n    Name = " + name +
                ";\n};\n\ninstance of PG_ProviderCapabilities {\n    ProviderModuleName = " + module +
                ";\n    ProviderName = " + name + ";\n    CapabilityID = \"" + std::to_string(++number) +
                "\";\n    ClassName = \"" + target.name + "\";\n    Namespaces = { " + name_spaces +
                " };\n    ProviderType = { " + types +
                " };\n    SupportedProperties = NULL;\n    SupportedMethods = NULL;\n};\n";
    }
    return text;
}

} // namespace

std::vector<Text_File> emit_server_files(const Catalogue& catalogue, const std::string& version)
{
    std::vector<Text_File> files;
    std::string list;

    std::string qualifiers = registration_notice;
    for (const mof::Qualifier_Declaration& qualifier : catalogue.mof.qualifiers())
        qualifiers += emit_mof(qualifier);
    files.push_back({"mof/00_qualifiers.mof", qualifiers});

    add_classes(compile_order(catalogue.mof, catalogue.classes), "mof/10_schema.mof", "mof/20_module.mof", files, list);

    std::vector<const mof::Class*> of_profiles;
    for (const Provider& provider : catalogue.providers)
        if (is_of_profiles(*provider.target)) of_profiles.push_back(provider.target);
    add_classes(compile_order(catalogue.mof, of_profiles), "interop/30_schema.mof", "interop/31_module.mof", files,
                list);

    files.push_back({"classes.txt", list});
    files.push_back({std::string("sfcb/") + location + ".reg", emit_sfcb(catalogue)});
    files.push_back({"pegasus/registration.mof", emit_pegasus(catalogue, version)});
    return files;
}

} // namespace generator
