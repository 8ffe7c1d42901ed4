#include <cstring>

#include "runtime/Instance.h"

namespace cimple {

namespace {

template <class T>
bool same(const void* a, const void* b)
{
    return *static_cast<const T*>(a) == *static_cast<const T*>(b);
}

// Of two properties with the same type and subscript: null bytes and values.
bool same_property(const Instance* a, const Meta_Property* of_a, const Instance* b, const Meta_Property* of_b)
{
    if (null_of(a, of_a) != null_of(b, of_b)) return false;
    const void* value_a = feature_at(a, of_a->offset);
    const void* value_b = feature_at(b, of_b->offset);
    if (of_a->subscript) return same<Array_Base>(value_a, value_b);
    switch (of_a->type) {
    case REAL32:
        return same<real32>(value_a, value_b);
    case REAL64:
        return same<real64>(value_a, value_b);
    case STRING:
        return same<String>(value_a, value_b);
    case DATETIME:
        return same<Datetime>(value_a, value_b);
    default:
        return std::memcmp(value_a, value_b, type_sizes[of_a->type]) == 0;
    }
}

// The key of b's class that answers to the i-th feature of a's, or null. A class shares the records of what it inherits
// unchanged, at the same place of the list, so the search by name is rare.
const Meta_Feature* matching_key(const Meta_Record* of_a, std::size_t i, const Meta_Record* of_b, uint32 mask)
{
    const Meta_Feature* feature = of_a->meta_features[i];
    if (i < of_b->num_meta_features && of_b->meta_features[i] == feature) return feature;
    const Meta_Feature* found = find_feature(of_b, feature->name, mask);
    return found && is_key(found) ? found : nullptr;
}

bool related(const Meta_Class* a, const Meta_Class* b)
{
    return a == b || is_subclass(a, b) || is_subclass(b, a);
}

bool same_key_property(const Instance* a, const Meta_Property* of_a, const Instance* b, const Meta_Property* of_b)
{
    return of_b && of_a->type == of_b->type && of_a->subscript == of_b->subscript && same_property(a, of_a, b, of_b);
}

bool same_key_reference(const Instance* a, const Meta_Reference* of_a, const Instance* b, const Meta_Reference* of_b)
{
    return of_b && !of_b->subscript && related(of_a->meta_class, of_b->meta_class) &&
           key_eq(reference_of(a, of_a), reference_of(b, of_b));
}

bool identical_arrays(const Array<Instance*>& a, const Array<Instance*>& b)
{
    if (a.size() != b.size()) return false;
    for (std::size_t i = 0; i < a.size(); ++i)
        if (!identical(a[i], b[i])) return false;
    return true;
}

bool identical_references(const Instance* a, const Instance* b, const Meta_Reference* reference)
{
    if (!reference->subscript) return identical(reference_of(a, reference), reference_of(b, reference));
    return null_of(a, reference) == null_of(b, reference) &&
           identical_arrays(reference_array_of(a, reference), reference_array_of(b, reference));
}

} // namespace

bool key_eq(const Instance* a, const Instance* b)
{
    if (!a || !b) return a == b;
    const Meta_Record* of_a = record_of(a);
    const Meta_Record* of_b = record_of(b);
    for (std::size_t i = 0; i < of_a->num_meta_features; ++i) {
        const Meta_Feature* feature = of_a->meta_features[i];
        if (!is_key(feature)) continue;
        if (is_property(feature)) {
            const Meta_Feature* other = matching_key(of_a, i, of_b, META_FLAG_PROPERTY);
            if (!same_key_property(a, as_property(feature), b, as_property(other))) return false;
        } else if (is_reference(feature) && !as_reference(feature)->subscript) {
            const Meta_Feature* other = matching_key(of_a, i, of_b, META_FLAG_REFERENCE);
            if (!same_key_reference(a, as_reference(feature), b, as_reference(other))) return false;
        }
    }
    return true;
}

bool identical(const Instance* a, const Instance* b)
{
    if (!a || !b) return a == b;
    if (a->meta_class != b->meta_class || a->__name_space != b->__name_space) return false;
    for (const Meta_Feature* feature : features_of(record_of(a))) {
        if (is_property(feature)) {
            if (!same_property(a, as_property(feature), b, as_property(feature))) return false;
        } else if (is_reference(feature)) {
            if (!identical_references(a, b, as_reference(feature))) return false;
        }
    }
    return true;
}

} // namespace cimple
