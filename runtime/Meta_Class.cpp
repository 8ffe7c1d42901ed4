#include "runtime/Meta_Class.h"

#include "runtime/Registration.h"

namespace cimple {

// The places that the records promise. The tail padding of a base takes a derived record's first member, which is what
// puts return_type directly behind size, and locals at the next multiple of a pointer.
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Winvalid-offsetof"
static_assert(offsetof(Meta_Feature, refs) == 0);
static_assert(offsetof(Meta_Feature, flags) == 4);
static_assert(offsetof(Meta_Feature, name) == 8);
static_assert(offsetof(Meta_Feature, meta_qualifiers) == 16);
static_assert(offsetof(Meta_Feature, num_meta_qualifiers) == 24);
static_assert(sizeof(Meta_Feature) == 32);

static_assert(offsetof(Meta_Class, meta_features) == 32);
static_assert(offsetof(Meta_Class, num_meta_features) == 40);
static_assert(offsetof(Meta_Class, size) == 48);
static_assert(offsetof(Meta_Class, locals) == 56);
static_assert(offsetof(Meta_Class, super_meta_class) == 64);
static_assert(offsetof(Meta_Class, num_keys) == 72);
static_assert(offsetof(Meta_Class, meta_repository) == 80);
static_assert(sizeof(Meta_Class) == 88);

static_assert(offsetof(Meta_Property, type) == 32);
static_assert(offsetof(Meta_Property, subscript) == 34);
static_assert(offsetof(Meta_Property, offset) == 36);
static_assert(offsetof(Meta_Property, value) == 40);
static_assert(sizeof(Meta_Property) == 48);

static_assert(offsetof(Meta_Reference, subscript) == 32);
static_assert(offsetof(Meta_Reference, meta_class) == 40);
static_assert(offsetof(Meta_Reference, offset) == 48);
static_assert(sizeof(Meta_Reference) == 56);

static_assert(offsetof(Meta_Method, meta_features) == offsetof(Meta_Class, meta_features));
static_assert(offsetof(Meta_Method, num_meta_features) == offsetof(Meta_Class, num_meta_features));
static_assert(offsetof(Meta_Method, size) == offsetof(Meta_Class, size));
static_assert(offsetof(Meta_Method, name) == offsetof(Meta_Class, name));
static_assert(offsetof(Meta_Method, flags) == offsetof(Meta_Class, flags));
static_assert(offsetof(Meta_Method, return_type) == 52);
static_assert(sizeof(Meta_Method) == 56);

static_assert(offsetof(Meta_Array_Value, size) == sizeof(void*));
static_assert(offsetof(Meta_Repository, num_meta_classes) == sizeof(void*));

static_assert(offsetof(Instance, magic) == 0);
static_assert(offsetof(Instance, refs) == 4);
static_assert(offsetof(Instance, meta_class) == 8);
static_assert(offsetof(Instance, __name_space) == 16);
static_assert(sizeof(Instance) == 24);

static_assert(offsetof(Registration, module_name) == 0);
static_assert(offsetof(Registration, provider_name) == 8);
static_assert(offsetof(Registration, proc) == 16);
static_assert(offsetof(Registration, meta_class) == 24);
static_assert(offsetof(Registration, next) == 32);
static_assert(sizeof(Registration) == 40);
#pragma GCC diagnostic pop

template <class T>
constexpr bool null_is_behind_value = offsetof(Property<T>, null) == sizeof(T);
template <class T>
constexpr bool size_is_told = sizeof(T) == type_sizes[Type_Of<T>::code];
template <class... T>
constexpr bool properties_are_laid_out = (... && (null_is_behind_value<T> && size_is_told<T> &&
                                                  sizeof(Array<T>) == sizeof(void*)));

static_assert(properties_are_laid_out<boolean, uint8, sint8, uint16, sint16, uint32, sint32, uint64, sint64, real32,
                                      real64, char16, String, Datetime>);
static_assert(offsetof(Property<Array_Base>, null) == sizeof(void*));

const char* const meta_flag_names[32] = {
    "Property",
    "Reference",
    "Method",
    "Class",
    "Abstract",
    "Aggregate",
    "Aggregation",
    "Association",
    "Composition",
    "Counter",
    "Delete",
    "DN",
    "EmbeddedObject",
    "Exception",
    "Expensive",
    "Experimental",
    "Gauge",
    "IfDeleted",
    "In",
    "Indication",
    "Invisible",
    "Key",
    "Large",
    "OctetString",
    "Out",
    "Read",
    "Required",
    "Static",
    "Terminal",
    "Weak",
    "Write",
    "EmbeddedInstance",
};

const Meta_Class Instance::meta = {
    {{{0}, META_FLAG_CLASS, "Instance", nullptr, 0}, nullptr, 0, sizeof(Instance)}, nullptr, nullptr, 0, nullptr};

const Meta_Class* find_meta_class(const Meta_Repository* repository, const char* name)
{
    if (!repository) return nullptr;
    for (std::size_t i = 0; i < repository->num_meta_classes; ++i)
        if (equali(repository->meta_classes[i]->name, name)) return repository->meta_classes[i];
    return nullptr;
}

const Meta_Feature* find_feature(const Meta_Record* record, const char* name, uint32 mask)
{
    if (!record) return nullptr;
    for (std::size_t i = 0; i < record->num_meta_features; ++i) {
        const Meta_Feature* feature = record->meta_features[i];
        if ((feature->flags & mask) && equali(feature->name, name)) return feature;
    }
    return nullptr;
}

bool is_subclass(const Meta_Class* ancestor, const Meta_Class* meta_class)
{
    if (!ancestor) return false;
    if (ancestor == &Instance::meta || equali(ancestor->name, Instance::meta.name)) return true;
    for (; meta_class; meta_class = meta_class->super_meta_class)
        if (meta_class == ancestor || equali(meta_class->name, ancestor->name)) return true;
    return false;
}

} // namespace cimple
