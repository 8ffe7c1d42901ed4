#include <cstring>

#include "runtime/Owned_References.h"

// Operations that write into instances that exist.

namespace cimple {

namespace {

bool is_reference_array(const Meta_Feature* feature)
{
    return is_reference(feature) && as_reference(feature)->subscript;
}

bool is_null_in(const Instance* model, const Meta_Feature* feature)
{
    if (is_property(feature)) return null_of(model, as_property(feature)) != 0;
    const Meta_Reference* reference = as_reference(feature);
    return reference->subscript ? null_of(model, reference) != 0 : reference_of(model, reference) == nullptr;
}

void set_null(Instance* instance, const Meta_Feature* feature, uint8 state)
{
    if (is_property(feature))
        null_of(instance, as_property(feature)) = state;
    else if (is_reference_array(feature))
        null_of(instance, as_reference(feature)) = state;
}

void copy_property(Instance* dest, const Instance* src, const Meta_Property* property)
{
    void* to = feature_at(dest, property->offset);
    const void* from = feature_at(src, property->offset);
    if (property->subscript)
        *static_cast<Array_Base*>(to) = *static_cast<const Array_Base*>(from);
    else if (property->type == STRING)
        *static_cast<String*>(to) = *static_cast<const String*>(from);
    else if (property->type == DATETIME)
        *static_cast<Datetime*>(to) = *static_cast<const Datetime*>(from);
    else
        std::memcpy(to, from, type_sizes[property->type]);
    null_of(dest, property) = null_of(src, property);
}

void copy_reference(Instance* dest, const Instance* src, const Meta_Reference* reference)
{
    if (!reference->subscript) {
        // The old target goes last: the new one may be a part of it.
        Instance* fresh = clone(reference_of(src, reference));
        Instance* old = reference_of(dest, reference);
        reference_of(dest, reference) = fresh;
        unref(old);
        return;
    }
    Owned_References fresh(reference_array_of(src, reference));
    fresh.swap_with(reference_array_of(dest, reference));
    null_of(dest, reference) = null_of(src, reference);
}

void copy_feature(Instance* dest, const Instance* src, const Meta_Feature* feature)
{
    if (is_property(feature))
        copy_property(dest, src, as_property(feature));
    else if (is_reference(feature))
        copy_reference(dest, src, as_reference(feature));
}

// 0, or -1 for a method.
int want(Instance* instance, const Meta_Feature* feature)
{
    if (is_method(feature)) return -1;
    if (is_reference(feature) && !is_reference_array(feature)) {
        Instance*& target = reference_of(instance, as_reference(feature));
        if (!target) target = create(as_reference(feature)->meta_class, false);
    } else {
        set_null(instance, feature, 0);
    }
    return 0;
}

void set_name_space(Instance* instance, const String& name_space, bool force)
{
    if (!instance) return;
    if (force || instance->__name_space.empty()) instance->__name_space = name_space;
    for (const Meta_Feature* feature : features_of(record_of(instance))) {
        if (!is_reference(feature)) continue;
        const Meta_Reference* reference = as_reference(feature);
        if (!reference->subscript) {
            set_name_space(reference_of(instance, reference), name_space, force);
            continue;
        }
        for (Instance* element : reference_array_of(instance, reference))
            set_name_space(element, name_space, force);
    }
}

} // namespace

void copy(Instance* dest, const Instance* src, const Instance* model)
{
    if (!dest || !src || dest == src || dest->meta_class != src->meta_class) return;
    if (model && model->meta_class != src->meta_class) return;
    for (const Meta_Feature* feature : features_of(record_of(dest))) {
        if (is_method(feature) || (model && is_null_in(model, feature))) continue;
        copy_feature(dest, src, feature);
    }
}

void copy_keys(Instance* dest, const Instance* src)
{
    if (!dest || !src || dest == src || dest->meta_class != src->meta_class) return;
    for (const Meta_Feature* feature : features_of(record_of(dest)))
        if (is_key(feature)) copy_feature(dest, src, feature);
}

void nullify_properties(Instance* instance, bool keys, bool non_keys, uint8 state)
{
    for (const Meta_Feature* feature : features_of(record_of(instance)))
        if (is_key(feature) ? keys : non_keys) set_null(instance, feature, state);
}

bool keys_non_null(const Instance* instance)
{
    for (const Meta_Feature* feature : features_of(record_of(instance)))
        if (is_key(feature) && !is_reference_array(feature) && is_null_in(instance, feature)) return false;
    return true;
}

int filter_properties(Instance* instance, const char* const* properties, bool keep_keys)
{
    if (!properties) {
        nullify_properties(instance, true, true, 0);
        return 0;
    }
    nullify_properties(instance, !keep_keys, true, 1);
    constexpr uint32 any = META_FLAG_PROPERTY | META_FLAG_REFERENCE | META_FLAG_METHOD;
    for (; *properties; ++properties) {
        const Meta_Feature* feature = find_feature(record_of(instance), *properties, any);
        if (!feature || is_key(feature)) continue;
        if (want(instance, feature) != 0) return -1;
    }
    return 0;
}

void set_name_space_recursive(Instance* instance, const char* name_space, bool force)
{
    set_name_space(instance, String(name_space), force);
}

} // namespace cimple
