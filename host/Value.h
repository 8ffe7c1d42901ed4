/// CIM values, object paths and instances as plain data: what a client of the host hands in and gets back, and what
/// the broker keeps inside its encapsulated objects.
///
/// Values own their content and copy deeply (references and embedded instances share it, never changing it). No
/// locks: one thread at a time, as with any standard container. Types are CMPI type codes (`CMPI_uint32`,
/// `CMPI_string`, with `CMPI_ARRAY` added for arrays).
#pragma once

#include <cmpidt.h>

#include <cstdint>
#include <memory>
#include <string>
#include <variant>
#include <vector>

namespace host {

struct Path;
struct Instance;

class Value {
public:
    /// Null, of no type.
    Value() = default;
    /// Null, of that type.
    static Value null_of(CMPIType type);
    static Value boolean(bool value);
    /// `type` is one of the integer types or `CMPI_char16`; the value is cut to its width.
    static Value integer(CMPIType type, std::uint64_t value);
    static Value uint8(std::uint8_t v) { return integer(CMPI_uint8, v); }
    static Value uint16(std::uint16_t v) { return integer(CMPI_uint16, v); }
    static Value uint32(std::uint32_t v) { return integer(CMPI_uint32, v); }
    static Value uint64(std::uint64_t v) { return integer(CMPI_uint64, v); }
    static Value sint32(std::int32_t v) { return integer(CMPI_sint32, static_cast<std::uint64_t>(v)); }
    static Value sint64(std::int64_t v) { return integer(CMPI_sint64, static_cast<std::uint64_t>(v)); }
    static Value real(CMPIType type, double value);
    static Value string(std::string text);
    /// The 25 characters of a CIM date-time; not checked here.
    static Value datetime(std::string text);
    static Value reference(Path path);
    static Value instance(Instance instance);
    /// `element` is the type of one element; the elements have it or are null.
    static Value array(CMPIType element, std::vector<Value> elements);

    CMPIType type() const { return m_type; }
    bool is_null() const { return std::holds_alternative<std::monostate>(m_content); }
    bool is_array() const { return (m_type & CMPI_ARRAY) != 0; }

    // What follows asks for a value of that kind; of another one, or of null, it answers 0, "", or nothing.
    bool as_boolean() const { return as_uint() != 0; }
    std::uint64_t as_uint() const;
    std::int64_t as_int() const { return static_cast<std::int64_t>(as_uint()); }
    double as_real() const;
    /// The text of a string or a date-time.
    const std::string& as_text() const;
    const Path* as_path() const;
    const Instance* as_instance() const;
    const std::vector<Value>& elements() const;

    /// The same kind and content; integers of different widths compare by number, names and paths as in `Path`.
    bool operator==(const Value& other) const;
    bool operator!=(const Value& other) const { return !(*this == other); }

    /// For people: texts bare, arrays in braces, null as "NULL", references as paths.
    std::string to_text() const;

private:
    CMPIType m_type = CMPI_null;
    std::variant<std::monostate, std::uint64_t, double, std::string, std::shared_ptr<const Path>,
                 std::shared_ptr<const Instance>, std::vector<Value>>
        m_content;
};

/// A property, a key or an argument.
struct Named_Value {
    std::string name;
    Value value;
};

/// An object path: a class's (no keys) or an instance's. Names compare without case.
struct Path {
    std::string host;
    std::string name_space;
    std::string class_name;
    std::vector<Named_Value> keys;

    /// The key's value, or null.
    const Value* find(const std::string& name) const;
    /// Sets or replaces a key.
    void set(const std::string& name, Value value);
    /// Class, namespace and keys are the same, in any order; the host is not looked at.
    bool operator==(const Path& other) const;
    bool operator!=(const Path& other) const { return !(*this == other); }
    /// The usual text form, see PathText.h.
    std::string to_text() const;
};

struct Instance {
    Path path;
    std::vector<Named_Value> properties;

    /// The property's value, or null when it was not set.
    const Value* find(const std::string& name) const;
    /// The property's value, or a null one when it was not set.
    const Value& get(const std::string& name) const;
    /// Sets or replaces a property.
    void set(const std::string& name, Value value);
    /// MOF text, one property a line.
    std::string to_text() const;
};

/// Names are compared without case, all over CIM.
bool same_name(const std::string& a, const std::string& b);
bool same_name(const char* a, const char* b);
std::string lower_case(std::string text);

/// "uint32", "string[]", "boolean"; "ref" for references.
std::string type_name(CMPIType type);
bool is_integer(CMPIType type);
bool is_signed(CMPIType type);
/// Bits of an integer type, 0 for others.
int integer_bits(CMPIType type);

} // namespace host
