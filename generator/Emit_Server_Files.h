#pragma once

#include "generator/Catalogue.h"

#include <string>
#include <utility>
#include <vector>

/// The files by which a CIM server learns of the module: its classes as MOF and its providers as registrations. Pure
/// functions: the same input gives the same text.
namespace generator {

/// A file's name below the output folder, and its text.
using Text_File = std::pair<std::string, std::string>;

/// A class, or the declaration of a qualifier, as the DMTF's own MOF would write it (DSP0004).
std::string emit_mof(const mof::Class& target);
std::string emit_mof(const mof::Qualifier_Declaration& qualifier);

/// The classes that are wanted and all that they need, none before a class that it needs: superclasses, references,
/// reference parameters.
std::vector<const mof::Class*> compile_order(const mof::Repository& classes,
                                             const std::vector<const mof::Class*>& wanted);

/// All files that are installed for CIM servers. `version` is the module's ("2.5.19").
///
///     mof/00_qualifiers.mof         for an empty namespace
///     mof/10_schema.mof             the DMTF's classes, and those of other providers, that the module's need
///     mof/20_module.mof             the module's classes
///     interop/30_schema.mof     what the next file needs
///     interop/31_module.mof            the classes of profiles and of what conforms to them, for the interop namespace
///     sfcb/norvane_fc_provider.reg  one stanza a class that has a provider
///     pegasus/registration.mof      PG_ProviderModule, PG_Provider and PG_ProviderCapabilities
///     classes.txt                   the classes by file, one "file class" a line, in the order of declaration
std::vector<Text_File> emit_server_files(const Catalogue& catalogue, const std::string& version);

} // namespace generator
