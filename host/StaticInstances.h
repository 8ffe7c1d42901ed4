/// Instances that the server itself holds, as if another provider published them. Thread-safe.
#pragma once

#include "host/Schema.h"
#include "host/Value.h"

#include <mutex>
#include <optional>
#include <string>
#include <vector>

namespace host {

class Static_Instances {
public:
    explicit Static_Instances(const Schema& schema) : m_schema(schema) {}

    /// Keys are taken from the properties where the path has none.
    void add(Instance instance);
    void clear();
    /// Those of a class and its subclasses, in the order they came.
    std::vector<Instance> of_class(const std::string& name_space, const std::string& class_name) const;
    std::optional<Instance> get(const Path& path) const;
    bool has_name_space(const std::string& name_space) const;

private:
    const Schema& m_schema;
    mutable std::mutex m_mutex;
    std::vector<Instance> m_instances;
};

/// Leaves the named properties and the keys of the class in an instance.
void keep_properties(Instance& instance, const std::optional<std::vector<std::string>>& names, const Schema& schema);

} // namespace host
