#pragma once

#include "mof/Repository.h"

#include <cstdint>
#include <stdexcept>
#include <string>
#include <vector>

/// What the generator knows: the classes in repository order and the providers in order of registration.
namespace generator {

/// Why the input cannot be generated from. `what` names the file and the reason.
struct Error : std::runtime_error {
    using std::runtime_error::runtime_error;
};

/// Where a class's provider comes from.
enum class Provider_Kind { plain, san, own };

struct Provider {
    const mof::Class* target = nullptr;
    Provider_Kind kind = Provider_Kind::plain;
    std::string header; ///< of an own provider, from the repository's root
};

/// The input of one run. Holds the MOF repository that everything else points into.
struct Catalogue {
    mof::Repository mof;
    std::vector<const mof::Class*> classes; ///< in repository order
    std::vector<Provider> providers;        ///< in order of registration
    std::string derived_header;             ///< declares Derived_Provider, from the repository's root

    /// Reads the MOF folder and the two lists ("" for no providers). Throws Error: MOF that does not parse, a list that
    /// names an unknown class or one twice, a class that the list leaves out, an unknown kind of provider.
    void read(const std::string& mof_folder, const std::string& catalogue_file, const std::string& providers_file);
};

/// A feature as class records see it: MOF's strings that carry instances have become references.
struct Shape {
    bool is_reference = false;
    std::string target; ///< class of a reference; "" for one that may hold an instance of any class
    mof::Type type = mof::Type::boolean;
    int subscript = 0;

    /// The C++ type of the member ("Property<uint32>", "NVRHBA_FCPort*").
    std::string member_type() const;
};

Shape shape_of(const mof::Typed_Element& element);

/// The flags of a class, feature or parameter record.
std::uint32_t class_flags(const mof::Class& target);
std::uint32_t feature_flags(const mof::Feature& feature);
std::uint32_t parameter_flags(const mof::Parameter& parameter);

/// Name of the structure that carries a call of `method`: of the class that declares it.
std::string method_record_name(const mof::Feature& method);

/// The methods of a class, inherited ones first.
std::vector<const mof::Feature*> methods_of(const mof::Class& target);

} // namespace generator
