/// CMPIInstance of the broker: an Instance, its class, and the property filter that a provider set.
///
/// Properties are kept in the order they were set; `m_slots` finds those of the class without a search.
#pragma once

#include "host/objects/Object.h"

#include <optional>
#include <vector>

namespace host {

struct Manner;
struct Class_Record;

class Instance_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::instance;
    static CMPIInstanceFT table(const Manner& manner);

    Instance_Object(Broker& owner, Origin from, Instance content);
    std::string to_text() const override { return m_data.to_text(); }

    /// All that was set.
    const Instance& data() const { return m_data; }
    /// What is returned to a client: without the properties that the filter leaves out.
    Instance filtered() const;
    /// The value of a property of the class, or of one that was set; null if there is none of that name.
    const Value* find(const char* name) const;
    /// Properties of the class, and those beyond it that were set.
    std::size_t size() const;
    /// Name and value at an index below size(); a null value where it was not set.
    Named_Value at(std::size_t index) const;
    /// Sets by the manner's rules on types, unknown names and filters; a CMPI code.
    int set(const char* name, const CMPIValue* value, CMPIType type);
    /// `names` null takes the filter away; keys always pass.
    void set_filter(const char** names, const char** keys);
    /// The path, with keys from the properties where it has none.
    Path path() const;
    void set_path(const Path& path);

    CMPIInstance face;

private:
    void take_class();
    bool passes(int slot, const char* name) const;
    void store(int slot, const char* name, Value value);

    Instance m_data;
    const Class_Record* m_class = nullptr;
    std::vector<int> m_slots; ///< position in m_data.properties for each property of the class, or -1
    std::optional<std::vector<std::string>> m_filter;
};

} // namespace host
