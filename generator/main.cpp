/// The class generator: MOF files in, C++ out.
///
///     norvane_generator classes MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER
///         writes classes/<Class>.h for every class, classes/<Class>_Methods.h for every class that has a provider,
///         classes/repository.h and records.cpp
///     norvane_generator table MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER UNITS
///         writes providers_<n>.cpp for n from 1 to UNITS, registrations.cpp and exports.map
///     norvane_generator reference MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER PROFILES
///         writes <Class>.md for every class, index.md and names.md
///
/// Exit status 0, or 1 with the reason on standard error.
#include "generator/Emit.h"
#include "generator/Output.h"
#include "generator/Reference.h"

#include <cstdlib>
#include <iostream>

namespace {

void write_classes(const generator::Catalogue& catalogue, const std::string& folder)
{
    for (const auto* target : catalogue.classes)
        generator::write_file(folder + "/classes/" + target->name + ".h",
                              generator::emit_class_header(catalogue, *target));
    for (const auto& provider : catalogue.providers)
        generator::write_file(folder + "/classes/" + provider.target->name + "_Methods.h",
                              generator::emit_methods_header(*provider.target));
    generator::write_file(folder + "/classes/repository.h", generator::emit_repository_header(catalogue));
    generator::write_file(folder + "/records.cpp", generator::emit_records(catalogue));
}

void write_table(const generator::Catalogue& catalogue, const std::string& folder, std::size_t units)
{
    const std::size_t count = catalogue.providers.size();
    for (std::size_t unit = 0; unit < units; ++unit)
        generator::write_file(folder + "/providers_" + std::to_string(unit + 1) + ".cpp",
                              generator::emit_providers(catalogue, count * unit / units, count * (unit + 1) / units));
    generator::write_file(folder + "/registrations.cpp", generator::emit_registrations(catalogue));
    generator::write_file(folder + "/exports.map", generator::emit_exports(catalogue));
}

void write_reference(const generator::Catalogue& catalogue, const std::string& folder, const std::string& profiles)
{
    const auto subjects = generator::read_subjects(catalogue, profiles);
    for (const auto* target : catalogue.classes)
        generator::write_file(folder + "/" + target->name + ".md",
                              generator::emit_class_page(catalogue, subjects, *target));
    generator::write_file(folder + "/index.md", generator::emit_profile_index(subjects));
    generator::write_file(folder + "/names.md", generator::emit_name_index(catalogue));
}

int usage()
{
    std::cerr << "usage: norvane_generator classes MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER\n"
                 "       norvane_generator table MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER UNITS\n"
                 "       norvane_generator reference MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER PROFILES\n";
    return 1;
}

} // namespace

int main(int count, char** arguments)
{
    const std::string what = count > 1 ? arguments[1] : "";
    const bool is_table = what == "table" && count == 7;
    const bool is_reference = what == "reference" && count == 7;
    if (!is_table && !is_reference && !(what == "classes" && count == 6)) return usage();
    const unsigned long units = is_table ? std::strtoul(arguments[6], nullptr, 10) : 1;
    if (units < 1 || units > 64) return usage();
    try {
        generator::Catalogue catalogue;
        catalogue.read(arguments[2], arguments[3], arguments[4]);
        if (is_table)
            write_table(catalogue, arguments[5], units);
        else if (is_reference)
            write_reference(catalogue, arguments[5], arguments[6]);
        else
            write_classes(catalogue, arguments[5]);
    } catch (const std::exception& error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
    return 0;
}
