#include "cmpi/Container.h"

#include "cmpi/warnings.h"

namespace cimple {

int Container::convert(const Instance* instance, uint32 flag_mask)
{
    if (!instance) {
        CONVERSION_WARN("ignored null instance arg");
        return -1;
    }
    const Meta_Record* record = record_of(instance);
    Value value;
    for (std::size_t i = 0; i < record->num_meta_features; ++i) {
        const Meta_Feature* feature = record->meta_features[i];
        if (flag_mask && !(feature->flags & flag_mask)) continue;
        if (is_method(feature)) continue;
        if (value.view(instance, feature) != 0) {
            CONVERSION_WARN("unexpected failure: %s.%s", record->name, feature->name);
            continue;
        }
        if (value.null()) continue;
        if (set_value(feature->name, value, feature->flags) != 0)
            CONVERSION_WARN("conversion error: %s.%s", record->name, feature->name);
    }
    return 0;
}

int Container::convert(const Meta_Record* record, uint32 flag_mask, Instance*& instance)
{
    if (!instance) instance = create(static_cast<const Meta_Class*>(record), false);
    nullify_properties(instance, true, true, 1);

    Value value;
    const std::size_t size = get_size();
    for (std::size_t i = 0; i < size; ++i) {
        const char* name = nullptr;
        if (get_name(i, name) != 0) {
            CONVERSION_WARN("get_name() failed: class=%s, index=%u", record->name, static_cast<unsigned>(i));
            continue;
        }
        const Meta_Feature* feature = find_feature(record, name, META_FLAG_PROPERTY | META_FLAG_REFERENCE);
        if (!feature) {
            CONVERSION_WARN("unknown feature: %s.%s", record->name, name);
            continue;
        }
        if (flag_mask && !(feature->flags & flag_mask)) continue;
        int expected_type = value_type_of(feature);
        if (expected_type == NONE_VALUE) {
            CONVERSION_WARN("unexpected error: %s.%s", record->name, feature->name);
            continue;
        }
        if (get_value(i, expected_type, value) != 0 || value.set(instance, feature) != 0)
            CONVERSION_WARN("conversion error: %s.%s", record->name, feature->name);
    }
    return 0;
}

} // namespace cimple
