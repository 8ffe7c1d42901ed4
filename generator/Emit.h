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

} // namespace generator
