#include "host/StaticInstances.h"

#include <algorithm>

namespace host {

void Static_Instances::add(Instance instance)
{
    const Class_Record* record = m_schema.find(instance.path.class_name);
    if (instance.path.keys.empty() && record)
        for (const Element_Record& property : record->properties)
            if (const Value* value = property.key ? instance.find(property.name) : nullptr)
                instance.path.keys.push_back({property.name, *value});
    std::lock_guard lock(m_mutex);
    m_instances.push_back(std::move(instance));
}

void Static_Instances::clear()
{
    std::lock_guard lock(m_mutex);
    m_instances.clear();
}

std::vector<Instance> Static_Instances::of_class(const std::string& name_space, const std::string& class_name) const
{
    std::lock_guard lock(m_mutex);
    std::vector<Instance> found;
    for (const Instance& instance : m_instances)
        if (same_name(instance.path.name_space, name_space) && m_schema.is_a(instance.path.class_name, class_name))
            found.push_back(instance);
    return found;
}

std::optional<Instance> Static_Instances::get(const Path& path) const
{
    std::lock_guard lock(m_mutex);
    for (const Instance& instance : m_instances)
        if (instance.path == path) return instance;
    return std::nullopt;
}

bool Static_Instances::has_name_space(const std::string& name_space) const
{
    std::lock_guard lock(m_mutex);
    return std::any_of(m_instances.begin(), m_instances.end(),
                       [&](const Instance& instance) { return same_name(instance.path.name_space, name_space); });
}

void keep_properties(Instance& instance, const std::optional<std::vector<std::string>>& names, const Schema& schema)
{
    if (!names) return;
    const Class_Record* record = schema.find(instance.path.class_name);
    auto goes = [&](const Named_Value& property) {
        const Element_Record* element = record ? record->property(property.name) : nullptr;
        if (element && element->key) return false;
        return std::none_of(names->begin(), names->end(),
                            [&](const std::string& name) { return same_name(name, property.name); });
    };
    auto& properties = instance.properties;
    properties.erase(std::remove_if(properties.begin(), properties.end(), goes), properties.end());
}

} // namespace host
