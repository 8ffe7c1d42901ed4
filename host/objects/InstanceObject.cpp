#include "host/objects/InstanceObject.h"

#include "host/Broker.h"
#include "host/Convert.h"
#include "host/objects/PathObject.h"

#include <algorithm>

namespace host {
namespace {

CMPIInstance* clone(const CMPIInstance* self, CMPIStatus* status)
{
    auto* object = unwrap<Instance_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? &object->broker.make<Instance_Object>(Origin::cloned, object->data())->face : nullptr;
}

CMPIData get_property(const CMPIInstance* self, const char* name, CMPIStatus* status)
{
    auto* object = unwrap<Instance_Object>(self);
    if (!object || !name)
        return no_data(status, object ? CMPI_RC_ERR_INVALID_PARAMETER : CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    const Value* value = object->find(name);
    if (!value) return no_data(status, CMPI_RC_ERR_NO_SUCH_PROPERTY, object->broker.manner().not_found_state);
    put_status(status, CMPI_RC_OK);
    return data_of(object->broker, *value, Origin::got);
}

CMPIData get_property_at(const CMPIInstance* self, CMPICount index, CMPIString** name, CMPIStatus* status)
{
    auto* object = unwrap<Instance_Object>(self);
    if (!object) return no_data(status, CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    if (index >= object->size())
        return no_data(status, CMPI_RC_ERR_NO_SUCH_PROPERTY, object->broker.manner().not_found_state);
    Named_Value property = object->at(index);
    if (name) *name = object->broker.make_string(Origin::got, property.name);
    put_status(status, CMPI_RC_OK);
    return data_of(object->broker, property.value, Origin::got);
}

CMPICount get_property_count(const CMPIInstance* self, CMPIStatus* status)
{
    auto* object = unwrap<Instance_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? static_cast<CMPICount>(object->size()) : 0;
}

CMPIStatus set_property(const CMPIInstance* self, const char* name, const CMPIValue* value, CMPIType type)
{
    auto* object = unwrap<Instance_Object>(self);
    return status_of(object ? object->set(name, value, type) : CMPI_RC_ERR_INVALID_HANDLE);
}

CMPIStatus set_property_with_origin(const CMPIInstance* self, const char* name, const CMPIValue* value,
                                    const CMPIType type, const char*)
{
    return set_property(self, name, value, type);
}

CMPIObjectPath* get_object_path(const CMPIInstance* self, CMPIStatus* status)
{
    auto* object = unwrap<Instance_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? &object->broker.make<Path_Object>(Origin::got, object->path())->face : nullptr;
}

CMPIStatus set_property_filter(CMPIInstance* self, const char** names, const char** keys)
{
    auto* object = unwrap<Instance_Object>(self);
    if (object) object->set_filter(names, keys);
    return status_of(object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
}

CMPIStatus set_object_path(CMPIInstance* self, const CMPIObjectPath* path)
{
    auto* object = unwrap<Instance_Object>(self);
    auto* given = unwrap<Path_Object>(path);
    if (!object || !given) return status_of(CMPI_RC_ERR_INVALID_HANDLE);
    object->set_path(given->data);
    return status_of(CMPI_RC_OK);
}

/// What a class's property takes where types are looked at.
bool fits(const Element_Record& property, CMPIType type)
{
    if (type == property.type || type == CMPI_null) return true;
    if (property.type == CMPI_string)
        return type == CMPI_chars || type == CMPI_charsptr || (property.embedded && type == CMPI_instance);
    return property.type == CMPI_stringA && property.embedded && type == CMPI_instanceA;
}

} // namespace

CMPIInstanceFT Instance_Object::table(const Manner& manner)
{
    CMPIInstanceFT ft{};
    ft.ftVersion = manner.object_version;
    ft.release = release_face<Instance_Object, CMPIInstance>;
    ft.clone = clone;
    ft.getProperty = get_property;
    ft.getPropertyAt = get_property_at;
    ft.getPropertyCount = get_property_count;
    ft.setProperty = set_property;
    ft.getObjectPath = get_object_path;
    ft.setPropertyFilter = set_property_filter;
    ft.setObjectPath = set_object_path;
    if (!manner.origin_and_error_absent) ft.setPropertyWithOrigin = set_property_with_origin;
    return ft;
}

Instance_Object::Instance_Object(Broker& owner, Origin from, Instance content)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().instance},
      m_data(std::move(content))
{
    take_class();
}

void Instance_Object::take_class()
{
    m_class = broker.schema().find(m_data.path.class_name);
    m_slots.assign(m_class ? m_class->properties.size() : 0, -1);
    for (std::size_t i = 0; m_class && i < m_data.properties.size(); ++i) {
        int slot = m_class->find_property(m_data.properties[i].name.c_str());
        if (slot >= 0) m_slots[static_cast<std::size_t>(slot)] = static_cast<int>(i);
    }
}

const Value* Instance_Object::find(const char* name) const
{
    static const auto& null = *new Value;
    int slot = m_class ? m_class->find_property(name) : -1;
    if (slot < 0) return m_data.find(name);
    int at = m_slots[static_cast<std::size_t>(slot)];
    return at < 0 ? &null : &m_data.properties[static_cast<std::size_t>(at)].value;
}

std::size_t Instance_Object::size() const
{
    if (!m_class) return m_data.properties.size();
    auto known =
        static_cast<std::size_t>(std::count_if(m_slots.begin(), m_slots.end(), [](int at) { return at >= 0; }));
    return m_slots.size() + m_data.properties.size() - known;
}

Named_Value Instance_Object::at(std::size_t index) const
{
    if (!m_class) return m_data.properties[index];
    if (index < m_slots.size()) {
        const Element_Record& property = m_class->properties[index];
        int at = m_slots[index];
        return at < 0 ? Named_Value{property.name, Value::null_of(property.type)}
                      : m_data.properties[static_cast<std::size_t>(at)];
    }
    std::size_t beyond = index - m_slots.size();
    for (const Named_Value& property : m_data.properties)
        if (m_class->find_property(property.name.c_str()) < 0 && beyond-- == 0) return property;
    return {};
}

bool Instance_Object::passes(int slot, const char* name) const
{
    if (!m_filter) return true;
    if (slot >= 0 && m_class->properties[static_cast<std::size_t>(slot)].key) return true;
    return std::any_of(m_filter->begin(), m_filter->end(),
                       [&](const std::string& allowed) { return same_name(allowed.c_str(), name); });
}

void Instance_Object::store(int slot, const char* name, Value value)
{
    if (slot < 0) {
        m_data.set(name, std::move(value));
        return;
    }
    int& at = m_slots[static_cast<std::size_t>(slot)];
    if (at >= 0) {
        m_data.properties[static_cast<std::size_t>(at)].value = std::move(value);
        return;
    }
    at = static_cast<int>(m_data.properties.size());
    m_data.properties.push_back({m_class->properties[static_cast<std::size_t>(slot)].name, std::move(value)});
}

int Instance_Object::set(const char* name, const CMPIValue* value, CMPIType type)
{
    if (!name || !*name) return CMPI_RC_ERR_INVALID_PARAMETER;
    const Manner& manner = broker.manner();
    int slot = m_class ? m_class->find_property(name) : -1;
    if (m_class && slot < 0) {
        broker.violation("setProperty: the class " + m_class->name + " has no property " + name);
        if (!manner.unknown_property_kept) return CMPI_RC_OK;
    }
    if (manner.filter_at_set && !passes(slot, name)) return CMPI_RC_OK;

    const Element_Record* property = slot < 0 ? nullptr : &m_class->properties[static_cast<std::size_t>(slot)];
    if (property && !fits(*property, type)) {
        broker.violation("setProperty: " + m_class->name + "." + name + " is " + type_name(property->type) +
                         ", the value " + type_name(type));
        if (manner.types_must_match) return CMPI_RC_ERR_INVALID_DATA_TYPE;
    }
    int code = CMPI_RC_OK;
    Value taken = value_of(value, type, code);
    if (code != CMPI_RC_OK) return code;
    if (property && taken.is_null()) taken = Value::null_of(property->type);
    if (property && is_integer(property->type) && is_integer(taken.type()))
        taken = Value::integer(property->type, taken.as_uint());
    store(slot, name, std::move(taken));
    return CMPI_RC_OK;
}

void Instance_Object::set_filter(const char** names, const char** keys)
{
    m_filter.reset();
    if (!names) return;
    m_filter.emplace();
    for (; *names; ++names)
        m_filter->push_back(*names);
    for (; keys && *keys; ++keys)
        m_filter->push_back(*keys);
}

Instance Instance_Object::filtered() const
{
    Instance result;
    result.path = path();
    if (!m_filter) {
        result.properties = m_data.properties;
        return result;
    }
    for (const Named_Value& property : m_data.properties)
        if (passes(m_class ? m_class->find_property(property.name.c_str()) : -1, property.name.c_str()))
            result.properties.push_back(property);
    return result;
}

Path Instance_Object::path() const
{
    Path path = m_data.path;
    if (path.keys.empty() && m_class)
        for (const Element_Record& property : m_class->properties) {
            const Value* value = property.key ? find(property.name.c_str()) : nullptr;
            if (value && !value->is_null()) path.keys.push_back({property.name, *value});
        }
    return path;
}

void Instance_Object::set_path(const Path& path)
{
    m_data.path = path;
    take_class();
}

} // namespace host
