/// The class records: what a CIM class, its properties, references and methods are made of.
///
/// Records are static constant data, generated from the MOF files; nothing here is ever allocated or freed, and any
/// thread may read it. Names of classes and features compare without case.
#pragma once

#include <atomic>
#include <cstddef>

#include "runtime/Type.h"

namespace cimple {

struct Meta_Class;
struct Meta_Repository;
struct Meta_Qualifier;

/// Bits of Meta_Feature::flags, in the order of meta_flag_names.
enum Meta_Flag : uint32 {
    META_FLAG_PROPERTY = 1u << 0,
    META_FLAG_REFERENCE = 1u << 1,
    META_FLAG_METHOD = 1u << 2,
    META_FLAG_CLASS = 1u << 3,
    META_FLAG_ABSTRACT = 1u << 4,
    META_FLAG_AGGREGATE = 1u << 5,
    META_FLAG_AGGREGATION = 1u << 6,
    META_FLAG_ASSOCIATION = 1u << 7,
    META_FLAG_COMPOSITION = 1u << 8,
    META_FLAG_COUNTER = 1u << 9,
    META_FLAG_DELETE = 1u << 10,
    META_FLAG_DN = 1u << 11,
    META_FLAG_EMBEDDED_OBJECT = 1u << 12,
    META_FLAG_EXCEPTION = 1u << 13,
    META_FLAG_EXPENSIVE = 1u << 14,
    META_FLAG_EXPERIMENTAL = 1u << 15,
    META_FLAG_GAUGE = 1u << 16,
    META_FLAG_IF_DELETED = 1u << 17,
    META_FLAG_IN = 1u << 18,
    META_FLAG_INDICATION = 1u << 19,
    META_FLAG_INVISIBLE = 1u << 20,
    META_FLAG_KEY = 1u << 21,
    META_FLAG_LARGE = 1u << 22,
    META_FLAG_OCTETSTRING = 1u << 23,
    META_FLAG_OUT = 1u << 24,
    META_FLAG_READ = 1u << 25,
    META_FLAG_REQUIRED = 1u << 26,
    META_FLAG_STATIC = 1u << 27,
    META_FLAG_TERMINAL = 1u << 28,
    META_FLAG_WEAK = 1u << 29,
    META_FLAG_WRITE = 1u << 30,
    META_FLAG_EMBEDDED_INSTANCE = 1u << 31,
};

/// The CIM names of the 32 flags, by bit number.
extern const char* const meta_flag_names[32];

/// The common head of all records. `refs` is 0 in every static record: it is never counted and never freed.
struct Meta_Feature {
    std::atomic<uint32> refs;
    uint32 flags;
    const char* name;
    const Meta_Qualifier* const* meta_qualifiers;
    std::size_t num_meta_qualifiers;
};

/// What Meta_Class and Meta_Method have in common: a record whose features can be walked. An Instance's `meta_class`
/// may point at either, so code that only walks features takes it as this.
struct Meta_Record : Meta_Feature {
    const Meta_Feature* const* meta_features;
    std::size_t num_meta_features;
    uint32 size; // bytes of an instance (or method) record
};

struct Meta_Class : Meta_Record {
    const uint8* locals; // one a feature: 1 where this very class declares or overrides it
    const Meta_Class* super_meta_class;
    uint32 num_keys;
    const Meta_Repository* meta_repository;
};

struct Meta_Property : Meta_Feature {
    uint16 type;       // a Type
    sint16 subscript;  // 0 scalar, -1 array, n > 0 array of fixed length n
    uint32 offset;     // of the Property<T> in the instance record
    const void* value; // default or null; string and datetime: const char* const*; array: const Meta_Array_Value*
};

struct Meta_Reference : Meta_Feature {
    sint16 subscript; // 0 or -1
    const Meta_Class* meta_class;
    uint32 offset; // scalar: of one Instance*; array: of a Property<Array<Instance*>>
};

struct Meta_Method : Meta_Record {
    uint16 return_type;
};

/// Default of an array property.
struct Meta_Array_Value {
    const void* elements; // string and datetime elements are char const pointers
    uint32 size;
};

struct Meta_Repository {
    const Meta_Class* const* meta_classes;
    std::size_t num_meta_classes;
};

static_assert(sizeof(std::atomic<uint32>) == 4 && std::atomic<uint32>::is_always_lock_free);
static_assert(sizeof(Meta_Feature) == 32);

/// The first class of that name, or null; a null repository or name holds nothing.
const Meta_Class* find_meta_class(const Meta_Repository* repository, const char* name);

/// The first feature in list order with that name whose flags meet `mask`, or null.
const Meta_Feature* find_feature(const Meta_Record* record, const char* name, uint32 mask);

/// True if `ancestor` is the root record "Instance" (or has its name), or if the walk from `meta_class` along
/// `super_meta_class` meets `ancestor` by pointer or by name. A null `meta_class` is a subclass of the root only.
bool is_subclass(const Meta_Class* ancestor, const Meta_Class* meta_class);

/// The features of a record, for range-based walks.
struct Feature_Range {
    const Meta_Feature* const* first;
    std::size_t count;
    const Meta_Feature* const* begin() const { return first; }
    const Meta_Feature* const* end() const { return first + count; }
};
inline Feature_Range features_of(const Meta_Record* record)
{
    return {record->meta_features, record->num_meta_features};
}

inline bool is_property(const Meta_Feature* feature)
{
    return feature->flags & META_FLAG_PROPERTY;
}
inline bool is_reference(const Meta_Feature* feature)
{
    return feature->flags & META_FLAG_REFERENCE;
}
inline bool is_method(const Meta_Feature* feature)
{
    return feature->flags & META_FLAG_METHOD;
}
inline bool is_key(const Meta_Feature* feature)
{
    return feature->flags & META_FLAG_KEY;
}
inline const Meta_Property* as_property(const Meta_Feature* feature)
{
    return static_cast<const Meta_Property*>(feature);
}
inline const Meta_Reference* as_reference(const Meta_Feature* feature)
{
    return static_cast<const Meta_Reference*>(feature);
}
inline const Meta_Method* as_method(const Meta_Feature* feature)
{
    return static_cast<const Meta_Method*>(feature);
}

} // namespace cimple
