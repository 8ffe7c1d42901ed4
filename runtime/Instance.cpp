#include "runtime/Instance.h"

#include <cstring>
#include <new>

#include "runtime/Blocks.h"
#include "runtime/Owned_References.h"

// The life of an instance: creation, cloning, destruction and counting. Refreshes and requests clone instances by the
// hundred thousand, so each operation is one walk over the features with a switch on the type.
//
// Empty strings, date-times and arrays of the known types are made without allocation, so a walk that runs out of
// memory half-way can always give the rest of the record empty values and then destroy it as any other instance.

namespace cimple {

namespace {

// One byte behind the record tells where the memory is from.
Instance* new_head(const Meta_Record* record)
{
    bool is_cut;
    void* place = Blocks::allocate(record->size + sizeof(is_cut), is_cut);
    auto* instance = new (place) Instance;
    *static_cast<bool*>(feature_at(instance, record->size)) = is_cut;
    instance->magic = instance_magic;
    instance->refs.store(1, std::memory_order_relaxed);
    // A method record is told from an instance by the flags in the common head of both records.
    instance->meta_class = static_cast<const Meta_Class*>(record);
    return instance;
}

void make_empty(Instance* instance, const Meta_Feature* feature) noexcept
{
    if (is_property(feature)) {
        const Meta_Property* property = as_property(feature);
        void* place = feature_at(instance, property->offset);
        if (property->subscript)
            new (place) Array_Base(array_traits[property->type]);
        else if (property->type == STRING)
            new (place) String;
        else if (property->type == DATETIME)
            new (place) Datetime;
    } else if (is_reference(feature)) {
        const Meta_Reference* reference = as_reference(feature);
        if (reference->subscript)
            new (feature_at(instance, reference->offset)) Array_Base(instance_array_traits);
        else
            reference_of(instance, reference) = nullptr;
    }
}

void set_default_array(Array_Base& array, uint16 type, const Meta_Array_Value& value)
{
    array.reserve(value.size);
    const auto* texts = static_cast<const char* const*>(value.elements);
    switch (type) {
    case STRING:
        for (uint32 i = 0; i < value.size; ++i) {
            const String element(texts[i]);
            array.append(&element, 1);
        }
        break;
    case DATETIME:
        for (uint32 i = 0; i < value.size; ++i) {
            Datetime element;
            element.set(texts[i]);
            array.append(&element, 1);
        }
        break;
    default:
        array.append(value.elements, value.size);
    }
}

// The feature has its empty value.
void set_default(Instance* instance, const Meta_Feature* feature)
{
    if (is_property(feature)) {
        const Meta_Property* property = as_property(feature);
        void* place = feature_at(instance, property->offset);
        if (!property->value)
            null_of(instance, property) = 1;
        else if (property->subscript)
            set_default_array(array_of(instance, property), property->type,
                              *static_cast<const Meta_Array_Value*>(property->value));
        else if (property->type == STRING)
            *static_cast<String*>(place) = *static_cast<const char* const*>(property->value);
        else if (property->type == DATETIME)
            static_cast<Datetime*>(place)->set(*static_cast<const char* const*>(property->value));
        else
            std::memcpy(place, property->value, type_sizes[property->type]);
    } else if (is_reference(feature) && as_reference(feature)->subscript) {
        null_of(instance, as_reference(feature)) = 1;
    }
}

Instance* create_record(const Meta_Record* record, bool defaults)
{
    Instance* instance = new_head(record);
    std::memset(feature_at(instance, sizeof(Instance)), 0, record->size - sizeof(Instance));
    std::size_t i = 0;
    try {
        for (; i < record->num_meta_features; ++i) {
            make_empty(instance, record->meta_features[i]);
            if (defaults) set_default(instance, record->meta_features[i]);
        }
    } catch (...) {
        for (++i; i < record->num_meta_features; ++i)
            make_empty(instance, record->meta_features[i]);
        destroy(instance);
        throw;
    }
    return instance;
}

using Clone = Instance* (*)(const Instance*);

// What the bytes of a copied record do not carry; `clone_end` copies the end of a reference. If it throws, the feature
// is not made.
void clone_feature(Instance* instance, const Instance* source, const Meta_Feature* feature, Clone clone_end)
{
    if (is_property(feature)) {
        const Meta_Property* property = as_property(feature);
        void* place = feature_at(instance, property->offset);
        const void* from = feature_at(source, property->offset);
        if (property->subscript)
            new (place) Array_Base(*static_cast<const Array_Base*>(from));
        else if (property->type == STRING)
            new (place) String(*static_cast<const String*>(from));
        else if (property->type == DATETIME)
            new (place) Datetime(*static_cast<const Datetime*>(from));
    } else if (is_reference(feature)) {
        const Meta_Reference* reference = as_reference(feature);
        if (!reference->subscript) {
            reference_of(instance, reference) = clone_end(reference_of(source, reference));
            return;
        }
        Owned_References clones(reference_array_of(source, reference));
        clones.swap_with(*new (feature_at(instance, reference->offset)) Array<Instance*>);
    }
}

void end_feature(Instance* instance, const Meta_Feature* feature) noexcept
{
    if (is_property(feature)) {
        const Meta_Property* property = as_property(feature);
        void* place = feature_at(instance, property->offset);
        if (property->subscript)
            static_cast<Array_Base*>(place)->~Array_Base();
        else if (property->type == STRING)
            static_cast<String*>(place)->~String();
        else if (property->type == DATETIME)
            static_cast<Datetime*>(place)->~Datetime();
    } else if (is_reference(feature)) {
        const Meta_Reference* reference = as_reference(feature);
        if (!reference->subscript) {
            unref(reference_of(instance, reference));
            return;
        }
        Array<Instance*>& elements = reference_array_of(instance, reference);
        for (Instance* element : elements)
            unref(element);
        elements.~Array();
    }
}

// A copy of the bytes and the namespace, of which `make(copy, source, feature)` makes each feature, or throws and does
// not.
template <class Make>
Instance* clone_record(const Instance* source, Make make)
{
    if (!source) return nullptr;
    const Meta_Record* record = record_of(source);
    Instance* instance = new_head(record);
    instance->__name_space = source->__name_space;
    // The head has a count of its own, which other threads may be writing to in the source.
    std::memcpy(feature_at(instance, sizeof(Instance)), feature_at(source, sizeof(Instance)),
                record->size - sizeof(Instance));
    std::size_t i = 0;
    try {
        for (; i < record->num_meta_features; ++i)
            make(instance, source, record->meta_features[i]);
    } catch (...) {
        for (; i < record->num_meta_features; ++i)
            make_empty(instance, record->meta_features[i]);
        destroy(instance);
        throw;
    }
    return instance;
}

} // namespace

Instance* create(const Meta_Class* meta_class, bool defaults)
{
    return create_record(meta_class, defaults);
}

Instance* create(const Meta_Method* meta_method, bool defaults)
{
    return create_record(meta_method, defaults);
}

Instance* clone(const Instance* source)
{
    return clone_record(source, [](Instance* instance, const Instance* from, const Meta_Feature* feature) {
        clone_feature(instance, from, feature, &clone);
    });
}

Instance* clone_keys(const Instance* source)
{
    return clone_record(source, [](Instance* instance, const Instance* from, const Meta_Feature* feature) {
        if (is_key(feature)) return clone_feature(instance, from, feature, &clone_keys);
        make_empty(instance, feature);
        if (is_property(feature))
            null_of(instance, as_property(feature)) = 1;
        else if (is_reference(feature) && as_reference(feature)->subscript)
            null_of(instance, as_reference(feature)) = 1;
    });
}

Instance* clone_with_keys_of_ends(const Instance* source)
{
    return clone_record(source, [](Instance* instance, const Instance* from, const Meta_Feature* feature) {
        constexpr uint32 embedded = META_FLAG_EMBEDDED_OBJECT | META_FLAG_EMBEDDED_INSTANCE;
        clone_feature(instance, from, feature, feature->flags & embedded ? &clone : &clone_keys);
    });
}

void destroy(Instance* instance)
{
    if (!instance) return;
    for (const Meta_Feature* feature : features_of(record_of(instance)))
        end_feature(instance, feature);
    const bool is_cut = *static_cast<const bool*>(feature_at(instance, record_of(instance)->size));
    instance->~Instance();
    Blocks::deallocate(instance, is_cut);
}

void ref(const Instance* instance)
{
    if (instance) const_cast<Instance*>(instance)->refs.fetch_add(1, std::memory_order_relaxed);
}

void unref(const Instance* instance)
{
    if (!instance) return;
    auto* counted = const_cast<Instance*>(instance);
    if (counted->refs.fetch_sub(1, std::memory_order_acq_rel) == 1) destroy(counted);
}

} // namespace cimple
