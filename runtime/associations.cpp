#include "runtime/associations.h"

namespace cimple {

namespace {

// The target of a scalar reference; null for any other feature.
const Meta_Reference* as_end(const Meta_Feature* feature)
{
    return is_reference(feature) && !as_reference(feature)->subscript ? as_reference(feature) : nullptr;
}

bool holds(const Instance* association, const Meta_Reference* end, const Instance* source)
{
    const Instance* target = reference_of(association, end);
    return target && is_subclass(end->meta_class, source->meta_class) && key_eq(source, target);
}

bool fits(const String& wanted, const char* name)
{
    return wanted.empty() || equali(wanted, name);
}

bool is_of_class(const Instance* instance, const String& name)
{
    if (name.empty()) return true;
    for (const Meta_Class* one = instance->meta_class; one; one = one->super_meta_class)
        if (equali(name, one->name)) return true;
    return false;
}

} // namespace

bool ref_of(const Instance* source, const Instance* association, const String& role)
{
    if (!source || !association) return false;
    for (const Meta_Feature* feature : features_of(association->meta_class)) {
        const Meta_Reference* end = as_end(feature);
        if (end && fits(role, end->name) && holds(association, end, source)) return true;
    }
    return false;
}

int get_associators(const Instance* source, const Instance* association, const String& result_class, const String& role,
                    const String& result_role, Array<Instance*>& result)
{
    if (!ref_of(source, association, role)) return -1;
    int count = 0;
    for (const Meta_Feature* feature : features_of(association->meta_class)) {
        const Meta_Reference* end = as_end(feature);
        if (!end || holds(association, end, source)) continue;
        Instance* target = reference_of(const_cast<Instance*>(association), end);
        if (!target || !is_of_class(target, result_class) || !fits(result_role, end->name)) continue;
        result.append(target);
        ++count;
    }
    return count;
}

} // namespace cimple
