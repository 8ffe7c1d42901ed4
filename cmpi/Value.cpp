#include "cmpi/Value.h"

#include <cstring>
#include <new>

#include "cmpi/warnings.h"

namespace cimple {

namespace {

constexpr const char* scalar_names[] = {"boolean", "uint8",  "sint8",  "uint16",   "sint16",
                                        "uint32",  "sint32", "uint64", "sint64",   "real32",
                                        "real64",  "char16", "string", "datetime", "instance"};
constexpr const char* array_names[] = {"boolean_array", "uint8_array",    "sint8_array",   "uint16_array",
                                       "sint16_array",  "uint32_array",   "sint32_array",  "uint64_array",
                                       "sint64_array",  "real32_array",   "real64_array",  "char16_array",
                                       "string_array",  "datetime_array", "instance_array"};

bool is_scalar(int tag)
{
    return tag >= 0 && tag < static_cast<int>(number_of_types);
}

bool is_scalar_array(int tag)
{
    return is_scalar(tag - array_tag);
}

void construct(int scalar_tag, void* place, const void* source)
{
    const Array_Traits& traits = array_traits[scalar_tag];
    if (traits.construct)
        traits.construct(place, source);
    else
        std::memcpy(place, source, traits.element_size);
}

void destruct(int scalar_tag, void* place)
{
    if (array_traits[scalar_tag].destruct) array_traits[scalar_tag].destruct(place);
}

Array_Base& array_at(void* place)
{
    return *std::launder(static_cast<Array_Base*>(place));
}

void ref_elements(const Array_Base& instances)
{
    for (std::size_t i = 0; i < instances.size(); ++i)
        ref(*static_cast<Instance* const*>(instances.at(i)));
}

void unref_elements(Array_Base& instances)
{
    for (std::size_t i = 0; i < instances.size(); ++i)
        unref(*static_cast<Instance**>(instances.at(i)));
    instances.clear();
}

const char* class_name(const Instance* instance)
{
    return instance->meta_class ? record_of(instance)->name : "";
}

bool fits(const Instance* owner, const Meta_Reference* reference, const Instance* value)
{
    if (!value || is_subclass(reference->meta_class, value->meta_class)) return true;
    CONVERSION_WARN("failed to assign instance of %s to %s.%s", class_name(value), class_name(owner), reference->name);
    return false;
}

} // namespace

const char* value_type_name(int tag)
{
    if (tag >= 0 && tag <= INSTANCE_VALUE) return scalar_names[tag];
    if (tag >= array_tag && tag <= INSTANCE_ARRAY_VALUE) return array_names[tag - array_tag];
    return "none";
}

int value_type_of(const Meta_Feature* feature)
{
    if (is_reference(feature)) return as_reference(feature)->subscript ? INSTANCE_ARRAY_VALUE : INSTANCE_VALUE;
    if (is_property(feature)) {
        const Meta_Property* property = as_property(feature);
        return property->subscript ? property->type + array_tag : property->type;
    }
    return NONE_VALUE;
}

Value::Value(const Value& other)
{
    *this = other;
}

Value& Value::operator=(const Value& other)
{
    if (this == &other) return *this;
    if (other.m_type == NONE_VALUE) {
        clear();
    } else {
        bool null = other.m_null;
        assign(other.m_type, other.m_at);
        m_null = null;
    }
    return *this;
}

void Value::destroy_content()
{
    if (is_scalar(m_type)) {
        destruct(m_type, m_place);
    } else if (m_type == INSTANCE_VALUE) {
        unref(get_instance());
    } else {
        Array_Base& array = array_at(m_place);
        if (m_type == INSTANCE_ARRAY_VALUE) unref_elements(array);
        array.~Array_Base();
    }
}

void Value::assign(int tag, const void* source)
{
    clear();
    if (is_scalar(tag)) {
        construct(tag, m_place, source);
    } else if (tag == INSTANCE_VALUE) {
        std::memcpy(m_place, source, sizeof(Instance*));
    } else {
        new (m_place) Array_Base(*static_cast<const Array_Base*>(source));
    }
    m_type = tag;
    m_null = false;
    m_at = m_place;
    if (tag == INSTANCE_VALUE) ref(get_instance());
    if (tag == INSTANCE_ARRAY_VALUE) ref_elements(array_at(m_place));
}

void Value::set_null(int tag)
{
    const unsigned char zero[sizeof(m_place)] = {};
    if (tag == STRING) {
        set(String());
    } else if (tag == DATETIME) {
        set(Datetime());
    } else if (is_scalar(tag) || tag == INSTANCE_VALUE) {
        assign(tag, zero);
    } else if (is_scalar_array(tag)) {
        Array_Base empty(array_traits[tag - array_tag]);
        assign(tag, &empty);
    } else if (tag == INSTANCE_ARRAY_VALUE) {
        set(Array<Instance*>());
    } else {
        clear();
    }
    m_null = true;
}

void Value::set(Instance* const& instance)
{
    assign(INSTANCE_VALUE, &instance);
    m_null = get_instance() == nullptr;
}

Instance* Value::get_instance() const
{
    return m_type == INSTANCE_VALUE ? *static_cast<Instance* const*>(m_at) : nullptr;
}

const Array<Instance*>* Value::get_instance_array() const
{
    return m_type == INSTANCE_ARRAY_VALUE ? static_cast<const Array<Instance*>*>(m_at) : nullptr;
}

const Array_Base* Value::get_scalars() const
{
    return is_scalar_array(m_type) ? static_cast<const Array_Base*>(m_at) : nullptr;
}

void Value::append(const Value& scalar)
{
    array_at(m_place).append(scalar.m_at, 1);
}

void Value::append(Instance* instance)
{
    array_at(m_place).append(&instance, 1);
    ref(instance);
}

int Value::view_other(const Instance* instance, const Meta_Feature* feature)
{
    if (!instance || !is_reference(feature)) return -1;
    const Meta_Reference* reference = as_reference(feature);
    m_type = value_type_of(feature);
    m_at = feature_at(instance, reference->offset);
    m_null = m_type == INSTANCE_VALUE ? get_instance() == nullptr : null_of(instance, reference) != 0;
    return 0;
}

int Value::get(const Instance* instance, const Meta_Feature* feature)
{
    Value there;
    if (there.view(instance, feature) != 0) {
        clear();
        return -1;
    }
    *this = there;
    return 0;
}

int Value::set(Instance* instance, const Meta_Feature* feature) const
{
    if (!instance) {
        CONVERSION_WARN("null instance argument");
        return -1;
    }
    int tag = value_type_of(feature);
    if (tag == NONE_VALUE) return -1;
    if (tag != m_type) {
        CONVERSION_WARN("type mismatch: %s.%s", class_name(instance), feature->name);
        return -1;
    }

    if (is_property(feature)) {
        const Meta_Property* property = as_property(feature);
        void* place = feature_at(instance, property->offset);
        if (is_scalar(tag)) {
            destruct(tag, place);
            construct(tag, place, m_at);
        } else {
            array_of(instance, property) = *static_cast<const Array_Base*>(m_at);
        }
        null_of(instance, property) = m_null;
        return 0;
    }

    const Meta_Reference* reference = as_reference(feature);
    if (tag == INSTANCE_VALUE) {
        Instance* value = m_null ? nullptr : get_instance();
        if (!fits(instance, reference, value)) return -1;
        ref(value);
        unref(reference_of(instance, reference));
        reference_of(instance, reference) = value;
        return 0;
    }
    const Array<Instance*>& elements = *get_instance_array();
    for (const Instance* element : elements)
        if (!fits(instance, reference, element)) return -1;
    Array<Instance*> old = reference_array_of(instance, reference);
    reference_array_of(instance, reference) = elements;
    ref_elements(elements);
    for (const Instance* element : old)
        unref(element);
    null_of(instance, reference) = m_null;
    return 0;
}

} // namespace cimple
