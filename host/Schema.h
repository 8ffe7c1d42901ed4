/// The classes that the host knows, as the broker asks for them: flat tables of properties with CMPI types, and the
/// questions "is a", "who derives from it", "what do the numbers mean".
///
/// Read once from MOF, constant afterwards; any thread. Pointers that it gives live as long as it does.
#pragma once

#include "host/Value.h"

#include <cmpidt.h>

#include <memory>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

namespace mof {
class Repository;
struct Class;
struct Feature;
struct Qualifiers;
struct Qualifier;
} // namespace mof

namespace host {

/// A property, a reference or a parameter.
struct Element_Record {
    std::string name;
    CMPIType type = CMPI_null;   ///< CMPI_ref for references; CMPI_string also where an instance is embedded
    bool embedded = false;       ///< a string type that carries an instance
    std::string reference_class; ///< of a reference
    bool key = false;
    bool writable = false;
    bool in = false, out = false; ///< of a parameter
    bool required = false;
    std::string description;
    std::vector<std::pair<std::string, std::string>> words; ///< (ValueMap entry, Values entry), in order

    /// The word that stands for a value in `Values`, also where it lies in a range ("0..9"), or "".
    std::string word_for(const Value& value) const;
};

struct Method_Record {
    std::string name;
    CMPIType type = CMPI_null; ///< of the return value
    bool is_static = false;
    std::vector<Element_Record> parameters;
    std::vector<std::pair<std::string, std::string>> words; ///< of the return value
    std::string description;

    const Element_Record* find_parameter(const std::string& name) const;
};

struct Class_Record {
    std::string name;
    const Class_Record* super = nullptr;
    bool association = false, indication = false, abstract = false;
    std::string description;
    std::vector<Element_Record> properties; ///< the superclass's first
    std::vector<Method_Record> methods;
    std::vector<const Class_Record*> subclasses; ///< direct ones
    const mof::Class* declaration = nullptr;

    /// Position in `properties` (no case), or -1.
    int find_property(const char* name) const;
    const Element_Record* property(const std::string& name) const;
    const Method_Record* method(const std::string& name) const;
    /// This class, or a superclass of it, has that name.
    bool is_a(const std::string& class_name) const;

private:
    friend class Schema;
    std::vector<std::pair<std::size_t, int>> m_by_hash; ///< sorted (hash of the lower-case name, position)
};

class Schema {
public:
    /// Reads MOF files and folders (every *.mof below). Null with `error` filled (file, line, reason) when something
    /// is wrong with them.
    static std::shared_ptr<const Schema> from_files(const std::vector<std::string>& paths, std::string& error);
    /// Reads one text; for tests.
    static std::shared_ptr<const Schema> from_text(const std::string& mof, std::string& error);

    Schema(const Schema&) = delete;
    Schema& operator=(const Schema&) = delete;
    ~Schema();

    /// The class of that name (no case), or null.
    const Class_Record* find(const std::string& name) const;
    /// True where `name` is `ancestor` or derives from it; names of unknown classes are only themselves.
    bool is_a(const std::string& name, const std::string& ancestor) const;
    /// The class and all that derive from it, each superclass before its subclasses.
    std::vector<const Class_Record*> family(const Class_Record& root) const;
    /// All classes, in the order of their declaration.
    const std::vector<const Class_Record*>& classes() const { return m_order; }

    /// The type that a qualifier is declared with ("uint32", also of its array), or "" if it is not declared.
    std::string qualifier_type(const std::string& name) const;
    /// The qualifier of a property, or a null value.
    Value property_qualifier(const std::string& class_name, const std::string& property,
                             const std::string& qualifier) const;

private:
    Schema();
    void build();

    std::unique_ptr<mof::Repository> m_repository;
    std::vector<std::unique_ptr<Class_Record>> m_classes;
    std::vector<const Class_Record*> m_order;
    std::unordered_map<std::string, Class_Record*> m_by_name; ///< lower-case names
};

} // namespace host
