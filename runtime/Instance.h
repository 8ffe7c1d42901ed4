/// The head of every CIM object in flight, and the operations on such objects.
///
/// An instance is one block of memory: this head, and behind it the features of its class, each at the offset that the
/// class record gives. The generated structure of a class (classes/NVRHBA_FCPort.h) names those places. Instances are
/// made by `create` or `clone` and freed by `unref` (or `destroy`); they are counted atomically, and all other access
/// to one instance needs outside care. No operation here throws anything but std::bad_alloc, and none logs.
#pragma once

#include <atomic>
#include <cstdio>

#include "runtime/Array.h"
#include "runtime/Datetime.h"
#include "runtime/Meta_Class.h"
#include "runtime/Property.h"
#include "runtime/String.h"

namespace cimple {

constexpr uint32 instance_magic = 0xF00DFACE;

struct Instance {
    uint32 magic;
    std::atomic<uint32> refs;
    const Meta_Class* meta_class; // of a method call: its Meta_Method (look at it as a Meta_Record then)
    String __name_space;

    /// The root record, named "Instance": ancestor of every class, no features, not in the repository.
    static const Meta_Class meta;
};

static_assert(sizeof(Instance) == 24);

/// A new instance of `meta_class` (or a record for a method call), refs 1. With `defaults` each property takes its
/// default or is null; without, null bytes stay 0, and the caller must set them (nullify_properties).
Instance* create(const Meta_Class* meta_class, bool defaults);
Instance* create(const Meta_Method* meta_method, bool defaults);

/// A deep copy, refs 1: it shares no instance with its source. Null gives null.
Instance* clone(const Instance* instance);

/// As clone, but with the keys alone, in the ends of references too: all other properties are null.
Instance* clone_keys(const Instance* instance);
/// As clone, but the ends of references, unless they are embedded, have their keys alone.
Instance* clone_with_keys_of_ends(const Instance* instance);

/// Destructs and frees, whatever `refs` says. Null is ignored.
void destroy(Instance* instance);

/// Count up; count down, and free when the count falls from 1. Null is ignored.
void ref(const Instance* instance);
void unref(const Instance* instance);

/// Do the keys of `a` (by a's class) agree with those of `b`? Keys that only b's class has are not looked at, so that a
/// model of a base class finds instances of derived classes; a class without keys equals anything.
bool key_eq(const Instance* a, const Instance* b);

/// Same class record, same namespace, and all features equal, through references.
bool identical(const Instance* a, const Instance* b);

/// Assigns features (all; or keys only) between two instances of one class; does nothing for different classes.
/// Features that are null in `model` (null: no model) are passed over.
/// A model of a third class leaves everything as it is. Each feature is assigned whole or not at all.
void copy(Instance* dest, const Instance* src, const Instance* model = nullptr);
void copy_keys(Instance* dest, const Instance* src);

/// Writes `state` (1 null, 0 not) to the null byte of key properties if `keys`, of the others if `non_keys`. Reference
/// arrays count as properties; scalar references are left alone.
void nullify_properties(Instance* instance, bool keys, bool non_keys, uint8 state);

/// True if no key property is null and no scalar key reference is a null pointer.
bool keys_non_null(const Instance* instance);

/// Applies a client's property list: null marks every property as wanted (null byte 0); else only the named ones, and
/// the keys as they are if `keep_keys`. `properties` ends with a null pointer. Result 0, or -1 at a method's name.
int filter_properties(Instance* instance, const char* const* properties, bool keep_keys);

/// Sets `__name_space` of the instance and of all that its references reach; without `force` only where it is empty.
void set_name_space_recursive(Instance* instance, const char* name_space, bool force);

/// The text "Class.Key=value,..." of an instance's keys, and back. Text out: 0, or -1 where the text ends at an array
/// key or null key, or for a class without keys (text empty). Text in: an instance (refs 1) without non-key values, or
/// null; its class may be any that `meta_class` or its repository leads to, but the end of a reference is always of the
/// reference's own class or a subclass. Any text is safe.
int instance_to_model_path(const Instance* instance, String& text);
Instance* model_path_to_instance(const Meta_Class* meta_class, const char* text);

/// Writes a readable dump to `stream`; with `keys_only`, keys alone.
void print(std::FILE* stream, const Instance* instance, bool keys_only);

/// The place of a feature inside an instance.
inline void* feature_at(Instance* instance, uint32 offset)
{
    return reinterpret_cast<char*>(instance) + offset;
}
inline const void* feature_at(const Instance* instance, uint32 offset)
{
    return reinterpret_cast<const char*>(instance) + offset;
}

/// The null byte of a property (or reference array), directly behind its value.
inline uint32 null_offset(const Meta_Property* property)
{
    return property->offset + (property->subscript ? uint32(sizeof(Array_Base)) : type_sizes[property->type]);
}
inline uint8& null_of(Instance* instance, const Meta_Property* property)
{
    return *static_cast<uint8*>(feature_at(instance, null_offset(property)));
}
inline uint8 null_of(const Instance* instance, const Meta_Property* property)
{
    return *static_cast<const uint8*>(feature_at(instance, null_offset(property)));
}
inline uint8& null_of(Instance* instance, const Meta_Reference* reference_array)
{
    return *static_cast<uint8*>(feature_at(instance, reference_array->offset + uint32(sizeof(Array_Base))));
}
inline uint8 null_of(const Instance* instance, const Meta_Reference* reference_array)
{
    return *static_cast<const uint8*>(feature_at(instance, reference_array->offset + uint32(sizeof(Array_Base))));
}

/// The handle of a scalar reference, of a reference array, of a property array.
inline Instance*& reference_of(Instance* instance, const Meta_Reference* reference)
{
    return *static_cast<Instance**>(feature_at(instance, reference->offset));
}
inline Instance* reference_of(const Instance* instance, const Meta_Reference* reference)
{
    return *static_cast<Instance* const*>(feature_at(instance, reference->offset));
}
inline Array<Instance*>& reference_array_of(Instance* instance, const Meta_Reference* reference)
{
    return *static_cast<Array<Instance*>*>(feature_at(instance, reference->offset));
}
inline const Array<Instance*>& reference_array_of(const Instance* instance, const Meta_Reference* reference)
{
    return *static_cast<const Array<Instance*>*>(feature_at(instance, reference->offset));
}
inline Array_Base& array_of(Instance* instance, const Meta_Property* property)
{
    return *static_cast<Array_Base*>(feature_at(instance, property->offset));
}
inline const Array_Base& array_of(const Instance* instance, const Meta_Property* property)
{
    return *static_cast<const Array_Base*>(feature_at(instance, property->offset));
}

/// The method record of a call.
inline const Meta_Record* record_of(const Instance* instance)
{
    return instance->meta_class;
}

/// Typed forms for generated structures: `T::meta` is their class record.
template <class T>
T* create_as(bool defaults = true)
{
    return static_cast<T*>(create(&T::meta, defaults));
}
template <class T>
T* clone_as(const T* instance)
{
    return static_cast<T*>(clone(instance));
}

/// Owns one count of an instance.
template <class T = Instance>
class Ref {
public:
    Ref() = default;
    explicit Ref(T* owned) : m_instance(owned) {}
    Ref(const Ref& other) : m_instance(other.m_instance) { ref(m_instance); }
    Ref(Ref&& other) noexcept : m_instance(other.release()) {}
    ~Ref() { unref(m_instance); }
    Ref& operator=(Ref other) noexcept
    {
        T* mine = m_instance;
        m_instance = other.m_instance;
        other.m_instance = mine;
        return *this;
    }
    T* get() const { return m_instance; }
    T* operator->() const { return m_instance; }
    T& operator*() const { return *m_instance; }
    explicit operator bool() const { return m_instance != nullptr; }
    /// Hands the count over to the caller.
    T* release()
    {
        T* mine = m_instance;
        m_instance = nullptr;
        return mine;
    }
    void reset(T* owned = nullptr) { *this = Ref(owned); }

private:
    T* m_instance = nullptr;
};

} // namespace cimple
