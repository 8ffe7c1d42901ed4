/// The class generator: MOF files in, and out of them what follows from the classes.
///
///     norvane_generator classes MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER
///         writes classes/<Class>.h for every class, classes/<Class>_Methods.h for every class that has a provider,
///         classes/repository.h and records.cpp
///     norvane_generator table MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER UNITS
///         writes providers_<n>.cpp for n from 1 to UNITS, registrations.cpp and exports.map
///     norvane_generator reference MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER PROFILES
///         writes <Class>.md for every class, index.md and names.md
///     norvane_generator servers MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER VERSION
///         writes what CIM servers compile and register: MOF, sfcb's and OpenPegasus's registrations, and a list
///
/// Exit status 0, or 1 with the reason on standard error.
#include "generator/Emit.h"
#include "generator/Emit_Server_Files.h"
#include "generator/Output.h"
#include "generator/Reference.h"

#include <cstdlib>
#include <iostream>

namespace {

using generator::Catalogue;
using generator::write_file;

void write_classes(const Catalogue& catalogue, const std::string& folder, const std::string&)
{
    for (const auto* target : catalogue.classes)
        write_file(folder + "/classes/" + target->name + ".h", generator::emit_class_header(catalogue, *target));
    for (const auto& provider : catalogue.providers)
        write_file(folder + "/classes/" + provider.target->name + "_Methods.h",
                   generator::emit_methods_header(*provider.target));
    write_file(folder + "/classes/repository.h", generator::emit_repository_header(catalogue));
    write_file(folder + "/records.cpp", generator::emit_records(catalogue));
}

void write_table(const Catalogue& catalogue, const std::string& folder, const std::string& number)
{
    const unsigned long units = std::strtoul(number.c_str(), nullptr, 10);
    if (units < 1 || units > 64) throw generator::Error("UNITS is a number from 1 to 64, not " + number);
    const std::size_t count = catalogue.providers.size();
    for (std::size_t unit = 0; unit < units; ++unit)
        write_file(folder + "/providers_" + std::to_string(unit + 1) + ".cpp",
                   generator::emit_providers(catalogue, count * unit / units, count * (unit + 1) / units));
    write_file(folder + "/registrations.cpp", generator::emit_registrations(catalogue));
    write_file(folder + "/exports.map", generator::emit_exports(catalogue));
}

void write_reference(const Catalogue& catalogue, const std::string& folder, const std::string& profiles)
{
    const auto subjects = generator::read_subjects(catalogue, profiles);
    for (const auto* target : catalogue.classes)
        write_file(folder + "/" + target->name + ".md", generator::emit_class_page(catalogue, subjects, *target));
    write_file(folder + "/index.md", generator::emit_profile_index(subjects));
    write_file(folder + "/names.md", generator::emit_name_index(catalogue));
}

void write_server_files(const Catalogue& catalogue, const std::string& folder, const std::string& version)
{
    for (const auto& [name, text] : generator::emit_server_files(catalogue, version))
        write_file(folder + "/" + name, text);
}

/// What can be made, and the argument behind OUTPUT_FOLDER that it takes.
struct Product {
    const char* name;
    const char* argument; ///< "" for none
    void (*write)(const Catalogue& catalogue, const std::string& folder, const std::string& argument);
};

constexpr Product products[] = {
    {"classes", "", write_classes},
    {"table", " UNITS", write_table},
    {"reference", " PROFILES", write_reference},
    {"servers", " VERSION", write_server_files},
};

} // namespace

int main(int count, char** arguments)
{
    const std::string name = count > 1 ? arguments[1] : "";
    for (const Product& product : products) {
        if (name != product.name || count != (*product.argument ? 7 : 6)) continue;
        try {
            Catalogue catalogue;
            catalogue.read(arguments[2], arguments[3], arguments[4]);
            product.write(catalogue, arguments[5], count > 6 ? arguments[6] : "");
            return 0;
        } catch (const std::exception& error) {
            std::cerr << error.what() << '\n';
            return 1;
        }
    }
    for (const Product& product : products)
        std::cerr << "usage: norvane_generator " << product.name << " MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER"
                  << product.argument << '\n';
    return 1;
}
