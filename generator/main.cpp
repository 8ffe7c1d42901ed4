/// The class generator: MOF files in, C++ out.
///
///     norvane_generator classes MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER
///         writes classes/<Class>.h for every class, classes/<Class>_Methods.h for every class that has a provider,
///         classes/repository.h and records.cpp
///
/// Exit status 0, or 1 with the reason on standard error.
#include "generator/Emit.h"
#include "generator/Output.h"

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

int usage()
{
    std::cerr << "usage: norvane_generator classes MOF_FOLDER CATALOGUE PROVIDERS OUTPUT_FOLDER\n";
    return 1;
}

} // namespace

int main(int count, char** arguments)
{
    if (count != 6 || std::string(arguments[1]) != "classes") return usage();
    try {
        generator::Catalogue catalogue;
        catalogue.read(arguments[2], arguments[3], arguments[4]);
        write_classes(catalogue, arguments[5]);
    } catch (const std::exception& error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
    return 0;
}
