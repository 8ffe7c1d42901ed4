// A TOML table as a scenario reads it: typed values with a default each, messages with file and line, and no key that
// nobody asked for. Holds references into the parsed document; for the reader's own stack only.
#ifndef _simulator_Fields_h
#define _simulator_Fields_h

#ifndef TOML_HEADER_ONLY
#define TOML_HEADER_ONLY 0
#endif
#include <toml++/toml.h>

#include "simulator/Model.h"

#include <set>
#include <string>
#include <vector>

namespace nvrsim {

class Fields {
public:
    /// `defaults`, null or a table that stands behind `own`: it answers for keys that `own` lacks.
    Fields(const std::string& file, const toml::table& own, const toml::table* defaults = nullptr)
        : m_file(file), m_own(own), m_defaults(defaults)
    {
    }

    /// Null if the key is nowhere.
    const toml::node* find(const char* key);
    bool has(const char* key) { return find(key) != nullptr; }

    // Each leaves the target as it is when the key is missing, and throws Scenario_Error for a wrong type or range.
    void text(const char* key, std::string& target, size_t longest = 255);
    void boolean(const char* key, bool& target);
    void wwn(const char* key, Wwn& target);
    void bytes(const char* key, Bytes& target, size_t shortest, size_t longest);
    void bytes(const char* key, std::optional<Bytes>& target, size_t shortest, size_t longest);
    void real(const char* key, double& target, double low, double high);
    /// Integers, or "0x..." texts where TOML's signed range does not reach.
    template <class T>
    void number(const char* key, T& target, uint64_t low = 0, uint64_t high = T(-1))
    {
        if (const toml::node* node = find(key)) target = static_cast<T>(to_number(*node, key, low, high));
    }
    template <class T>
    void number(const char* key, std::optional<T>& target, uint64_t low = 0, uint64_t high = T(-1))
    {
        if (const toml::node* node = find(key)) target = static_cast<T>(to_number(*node, key, low, high));
    }
    /// One of several words; the word's index goes to the target.
    void word(const char* key, uint32_t& target, std::initializer_list<const char*> words);

    /// Null if missing; throws if it is something else.
    const toml::table* table(const char* key);
    const toml::array* array(const char* key);
    /// Tables of an array of tables; empty if missing.
    std::vector<const toml::table*> tables(const char* key);

    /// Numbered attributes: integer, text, { u64 = n }, { hex = "..." }, or false for an attribute that is left out.
    void attributes(const char* key, Attributes& target, bool wide);

    /// Throws for a key that was never looked for.
    void refuse_unknown() const;

    [[noreturn]] void fail(const toml::node& at, const std::string& reason) const;
    [[noreturn]] void fail(const std::string& reason) const { fail(m_own, reason); }
    uint64_t to_number(const toml::node& node, const std::string& what, uint64_t low, uint64_t high) const;
    Wwn to_wwn(const toml::node& node, const std::string& what) const;
    Bytes to_bytes(const toml::node& node, const std::string& what, size_t shortest, size_t longest) const;
    std::string to_string(const toml::node& node, const std::string& what, size_t longest) const;
    const std::string& file() const { return m_file; }

private:
    const std::string& m_file;
    const toml::table& m_own;
    const toml::table* m_defaults;
    std::set<std::string> m_known;
};

[[noreturn]] void scenario_fault(const std::string& file, const toml::source_region& at, const std::string& reason);

} // namespace nvrsim

#endif // _simulator_Fields_h
