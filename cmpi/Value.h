/// A tagged CIM value: what crosses the seam between instances and CMPI objects.
///
/// A Value owns its content (strings and date-times by their counters, arrays by copy, instances by a count), but for
/// one made by `view`, which looks at the instance it came from and must not outlive it; a copy of a view owns. No
/// locks.
#pragma once

#include "runtime/Instance.h"

namespace cimple {

/// A Type for scalars; array_tag added for arrays.
enum Value_Type : int {
    NONE_VALUE = -1,
    // 0 to 13 are the scalar Types.
    INSTANCE_VALUE = 14,
    INSTANCE_ARRAY_VALUE = 142,
};
constexpr int array_tag = 128;

/// "uint32", "string_array", "instance"; "none" for what is no tag.
const char* value_type_name(int tag);

/// The tag that a feature's values have: NONE_VALUE for a method.
int value_type_of(const Meta_Feature* feature);

class Value {
public:
    Value() = default;
    Value(const Value& other);
    Value& operator=(const Value& other);
    ~Value() { clear(); }

    int type() const { return m_type; }
    /// No value, whatever the tag. A cleared Value is none and null.
    bool null() const { return m_null; }
    void clear()
    {
        if (m_at == m_place) destroy_content();
        m_type = NONE_VALUE;
        m_null = true;
        m_at = nullptr;
    }

    /// An empty value of that tag (zero, an empty string or array, a null instance) that counts as null.
    void set_null(int tag);

    /// Typed setters: boolean to Datetime, arrays of them, an instance or an array of instances (counted up; a null
    /// instance is a null value).
    template <class T>
    void set(const T& value)
    {
        assign(Type_Of<T>::code, &value);
    }
    template <class T>
    void set(const Array<T>& array)
    {
        assign(Type_Of<T>::code + array_tag, &array);
    }
    void set(const Array<Instance*>& array) { assign(INSTANCE_ARRAY_VALUE, &array); }
    void set(Instance* const& instance);
    /// The scalar of type `type` at `source`, which must not lie in this Value.
    void set_scalar(Type type, const void* source) { assign(type, source); }

    /// Typed getters: the content, null for a Value of another tag.
    template <class T>
    const T* get() const
    {
        return m_type == Type_Of<T>::code ? static_cast<const T*>(m_at) : nullptr;
    }
    template <class T>
    const Array<T>* get_array() const
    {
        return m_type == Type_Of<T>::code + array_tag ? static_cast<const Array<T>*>(m_at) : nullptr;
    }
    Instance* get_instance() const;
    const Array<Instance*>* get_instance_array() const;

    /// The content of any array of scalars, and the place of any content.
    const Array_Base* get_scalars() const;
    const void* data() const { return m_at; }

    /// Appends to a Value that is (and owns) an array of scalars, or of instances (counted up, null allowed).
    void append(const Value& scalar);
    void append(Instance* instance);
    void set_not_null() { m_null = false; }

    /// Out of an instance's feature: a copy, or a view. 0, or -1 for a method or a null instance.
    int get(const Instance* instance, const Meta_Feature* feature);
    int view(const Instance* instance, const Meta_Feature* feature)
    {
        clear();
        if (!instance || !is_property(feature)) return view_other(instance, feature);
        const Meta_Property* property = as_property(feature);
        m_type = property->subscript ? property->type + array_tag : property->type;
        m_at = feature_at(instance, property->offset);
        m_null = null_of(instance, property) != 0;
        return 0;
    }

    /// Into an instance's feature, null flag and all. Result 0; -1, with a warning, where the tags differ, an instance
    /// is of a class that the feature cannot hold, or the feature is a method; the feature is then unchanged.
    int set(Instance* instance, const Meta_Feature* feature) const;

private:
    void assign(int tag, const void* source);
    void destroy_content();
    int view_other(const Instance* instance, const Meta_Feature* feature);

    int m_type = NONE_VALUE;
    bool m_null = true;
    const void* m_at = nullptr; // m_place, or in a view the instance's field
    alignas(8) unsigned char m_place[8] = {};
};

} // namespace cimple
