#pragma once

#include "mof/Model.h"

#include <cstddef>
#include <deque>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace mof {

/// Why MOF text was refused, and where.
struct Fault {
    Location where;
    std::string reason;

    /// "file:line:column: reason"
    std::string text() const;
};

/// A set of classes read from MOF files, with resolved inheritance.
///
/// Use: `read_file` (or `read_folder`, `read_text`) as often as needed, `resolve` once, then the look-ups. References
/// and superclasses may be declared after their use, also in another file. Not for several threads until `resolve` has
/// returned; read-only, and free for all threads, after that. Pointers that it gives live as long as it does.
///
/// Nothing here throws for bad text: each reading function answers false and adds to `faults`. Syntax stops a file at
/// its first fault; `resolve` reports every fault that it finds. Nesting of includes and depth of inheritance are
/// bounded, so hostile text costs no stack.
///
/// Qualifiers are checked against their declarations (name, type, list or scalar) as soon as one qualifier
/// declaration has been read; text without any declaration takes all qualifiers as they come.
class Repository {
public:
    Repository() = default;
    Repository(const Repository&) = delete;
    Repository& operator=(const Repository&) = delete;

    /// Reads one file and what it includes (`#pragma include ("other.mof")`, relative to the including file). A file
    /// that was read already is passed over. Result: false after a fault.
    bool read_file(const std::string& path);

    /// Reads every "*.mof" below `folder`, in the order of their names. Result: false after a fault, or if there are
    /// none.
    bool read_folder(const std::string& folder);

    /// Reads `text`; `name` stands for the file in faults.
    bool read_text(const std::string& name, std::string_view text);

    /// Links superclasses and fills `Class::features`. Result: false if there are faults, of reading or of resolving.
    bool resolve();

    const std::vector<Fault>& faults() const { return faults_; }
    /// All faults, one a line.
    std::string fault_text() const;

    /// The class of that name, or null.
    const Class* find_class(std::string_view name) const;
    /// All classes in the order of their declaration.
    const std::vector<const Class*>& classes() const { return order_; }
    /// Classes whose superclass is `name`, in the order of their declaration.
    std::vector<const Class*> subclasses(std::string_view name) const;
    /// All qualifier declarations, in their order.
    const std::deque<Qualifier_Declaration>& qualifiers() const { return qualifiers_; }
    /// The qualifier declaration of that name, or null.
    const Qualifier_Declaration* find_qualifier(std::string_view name) const;

private:
    friend class Parser;

    bool read_file_at_depth(const std::string& path, unsigned depth, const Location& from);
    bool parse(const std::string& name, std::string_view text, unsigned depth);
    void add_fault(Location where, std::string reason);
    bool add_class(Class&& declared);
    bool add_qualifier(Qualifier_Declaration&& declared);
    void link_supers();
    void check_qualifiers(Qualifiers& qualifiers);
    void check_qualifiers(Class& target);
    void resolve_features(Class& target);
    void override_feature(Feature& feature, const Feature& overridden);
    void check_references(Class& target);

    std::deque<Class> classes_;
    std::vector<const Class*> order_;
    std::unordered_map<std::string, Class*> by_name_; // names in lower case
    std::deque<Qualifier_Declaration> qualifiers_;
    std::unordered_map<std::string, Qualifier_Declaration*> qualifiers_by_name_;
    std::unordered_map<std::string, bool> files_read_;
    std::vector<Fault> faults_;
    bool resolved_ = false;
};

} // namespace mof
