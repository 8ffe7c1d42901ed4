#pragma once

#include "generator/Catalogue.h"

#include <string>
#include <vector>

/// The class reference: one page of Markdown for each class, and two indices, from the MOF and the list of profiles.
///
/// The pages are in GitHub's flavour of Markdown (tables), and link to each other as "<Class>.md". Pure functions but
/// for the reading: the same input gives the same text.
namespace generator {

/// A profile, or a subject beyond the profiles, with the classes that belong to it.
struct Subject {
    std::string name;
    bool is_profile = false;
    std::string about; ///< one sentence
    std::vector<const mof::Class*> classes;
};

/// The subjects of a profiles file (its form is told in classes/profiles.txt), in its order. Throws Error: a line of
/// another form, an unknown class, a class twice in a subject, a class with a provider in none, a subject without
/// `about`.
std::vector<Subject> read_subjects(const Catalogue& catalogue, const std::string& file);

/// The name of a subject's place in the index by profile ("fc-initiator-ports").
std::string anchor_of(const Subject& subject);

/// "<Class>.md".
std::string emit_class_page(const Catalogue& catalogue, const std::vector<Subject>& subjects, const mof::Class& target);
/// "index.md": the classes with a provider, by subject.
std::string emit_profile_index(const std::vector<Subject>& subjects);
/// "names.md": all classes by name, the module's own first.
std::string emit_name_index(const Catalogue& catalogue);

} // namespace generator
