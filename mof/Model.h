#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

/// What MOF text declares, as plain data: qualifiers, classes and their features.
///
/// Everything is owned by the `Repository` that read it and does not change after `Repository::resolve`; then any
/// number of threads may read it. Names compare without case everywhere, and keep the spelling of their declaration.
namespace mof {

/// Are two names the same, without regard to the case of ASCII letters?
bool same_name(std::string_view a, std::string_view b);

/// Where something stands in the text that was read. Lines and columns start at 1; columns count bytes.
struct Location {
    std::string file;
    std::size_t line = 0;
    std::size_t column = 0;
};

/// The intrinsic types of CIM. The first fourteen bear the numbers that class records use.
enum class Type : std::uint8_t {
    boolean,
    uint8,
    sint8,
    uint16,
    sint16,
    uint32,
    sint32,
    uint64,
    sint64,
    real32,
    real64,
    char16,
    string,
    datetime,
    reference,
};

/// The type's keyword ("uint16"; "ref" for a reference).
const char* type_name(Type type);

/// One scalar constant. Which fields count is told by `kind`.
struct Literal {
    enum class Kind : std::uint8_t { null, boolean, integer, real, character, string };

    Kind kind = Kind::null;
    bool boolean = false;
    bool negative = false;       ///< integer: its sign
    std::uint64_t magnitude = 0; ///< integer: its absolute value; character: the UTF-16 unit
    double real = 0;
    std::string text; ///< string: its characters in UTF-8, adjacent strings joined
};

/// A constant or a list of constants, as a default or a qualifier's value.
struct Value {
    bool is_array = false;
    std::vector<Literal> items; ///< exactly one where `is_array` is false

    /// The first item's text where it is a string, else "".
    const std::string& text() const;
};

/// One qualifier as it stands before a class, a feature or a parameter.
struct Qualifier {
    std::string name;
    Value value; ///< a bare boolean qualifier holds true; other bare ones what their declaration defaults to
    Location where;
};

/// The qualifiers of one declaration, in the order of the text.
struct Qualifiers : std::vector<Qualifier> {
    /// The qualifier of that name, or null.
    const Qualifier* find(std::string_view name) const;
    /// True where a boolean qualifier of that name stands here and does not say false, and where any other stands.
    bool has(std::string_view name) const;
    /// The first text of the qualifier of that name ("" where it is missing or holds no string).
    const std::string& text(std::string_view name) const;
};

/// A qualifier's declaration ("Qualifier Key : boolean = false, ...").
struct Qualifier_Declaration {
    std::string name;
    Type type = Type::boolean;
    bool is_array = false;
    bool has_default = false;
    Value default_value;
    std::vector<std::string> scopes;  ///< as written: "property", "any", ...
    std::vector<std::string> flavors; ///< as written: "EnableOverride", "ToSubclass", ...
    Location where;
};

/// What features and parameters have in common: a name, a type and qualifiers.
struct Typed_Element {
    std::string name;
    Type type = Type::boolean; ///< a method's is its return type
    std::string target;        ///< class of a reference (type `reference` only)
    int subscript = 0;         ///< 0 scalar, -1 array of variable length, n > 0 array of fixed length n
    Qualifiers qualifiers;
    Location where;
};

/// A method's parameter.
struct Parameter : Typed_Element {
    bool is_in = true;   ///< an input unless In (false) is said
    bool is_out = false; ///< an output where Out is said
};

/// A property, a reference or a method of a class.
struct Feature : Typed_Element {
    enum class Kind : std::uint8_t { property, reference, method };

    Kind kind = Kind::property;
    bool is_key = false; ///< says Key, or overrides a feature that is one
    bool has_default = false;
    Value default_value;                 ///< an override without a default of its own keeps the inherited one
    std::vector<Parameter> parameters;   ///< of a method, in order
    std::string origin;                  ///< name of the class that declares this very feature
    const Feature* overridden = nullptr; ///< the superclass's feature that this one replaces, or null

    /// The qualifier of that name on this feature or, failing that, on the features that it overrides, nearest first.
    /// For texts and tables that clients read (Description, Values). Flags are not inherited this way: Write,
    /// Required and the like stand only where they are said; `is_key` is the one that passes on.
    const Qualifier* inherited_qualifier(std::string_view qualifier_name) const;
};

/// A class. `features` is filled by `Repository::resolve`.
struct Class {
    std::string name;
    std::string super_name; ///< "" at a root
    Qualifiers qualifiers;
    Location where;

    std::vector<std::shared_ptr<Feature>> declared; ///< what the class itself declares, in the order of the text

    const Class* super = nullptr;
    /// All features: the superclass's first, in its order, an override at the position of what it overrides; then the
    /// class's own. A feature inherited unchanged is the superclass's object.
    std::vector<std::shared_ptr<const Feature>> features;

    bool is_association() const { return qualifiers.has("Association"); }
    bool is_indication() const { return qualifiers.has("Indication"); }
    bool is_abstract() const { return qualifiers.has("Abstract"); }

    /// The feature of that name, own or inherited, or null.
    const Feature* find_feature(std::string_view feature_name) const;
    /// The method of that name, or null.
    const Feature* find_method(std::string_view method_name) const;
    /// The property or reference of that name, or null.
    const Feature* find_property(std::string_view property_name) const;

    /// Is this class `ancestor`, or does it derive from it?
    bool derives_from(std::string_view ancestor) const;
};

} // namespace mof
