#pragma once

#include "generator/Catalogue.h"

#include <string>
#include <vector>

/// The C++ texts that are made from the catalogue. Pure functions: the same input gives the same text.
namespace generator {

/// "classes/<Class>.h": the structure of the class's instances and of calls of the methods that it declares.
std::string emit_class_header(const Catalogue& catalogue, const mof::Class& target);

/// "classes/<Class>_Methods.h": a base class that answers "not supported" to every inherited method.
std::string emit_methods_header(const mof::Class& target);

/// "classes/repository.h" and the records of all classes.
std::string emit_repository_header(const Catalogue& catalogue);
std::string emit_records(const Catalogue& catalogue);

/// One unit with the procs, tables and factories of the providers from `first` to before `last`.
std::string emit_providers(const Catalogue& catalogue, std::size_t first, std::size_t last);
/// The registration records, the list and `cimple_module`.
std::string emit_registrations(const Catalogue& catalogue);
/// The linker's version script: what the module exports.
std::string emit_exports(const Catalogue& catalogue);

} // namespace generator
