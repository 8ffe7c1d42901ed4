#include "cmpi/Container.h"

#include "cmpi/warnings.h"

namespace cimple {

namespace {

bool is_converted(const Meta_Feature* feature, uint32 flag_mask)
{
    return (!flag_mask || feature->flags & flag_mask) && !is_method(feature);
}

} // namespace

std::vector<Feature_List::Entry>& Feature_List::of(const Meta_Record* record)
{
    if (record == m_record) return m_entries;
    m_record = nullptr; // until all are there
    m_entries.clear();
    for (const Meta_Feature* feature : features_of(record))
        if (is_converted(feature, m_flag_mask)) m_entries.push_back({feature, {}});
    m_record = record;
    return m_entries;
}

void Container::convert_feature(const Instance* instance, const Meta_Feature* feature, Value& value, Kept_Text* kept)
{
    if (value.view(instance, feature) != 0) {
        CONVERSION_WARN("unexpected failure: %s.%s", record_of(instance)->name, feature->name);
        return;
    }
    if (value.null()) return;
    if (set_value(feature->name, value, feature->flags, kept) != 0)
        CONVERSION_WARN("conversion error: %s.%s", record_of(instance)->name, feature->name);
}

int Container::convert(const Instance* instance, uint32 flag_mask)
{
    if (!instance) {
        CONVERSION_WARN("ignored null instance arg");
        return -1;
    }
    Value value;
    for (const Meta_Feature* feature : features_of(record_of(instance)))
        if (is_converted(feature, flag_mask)) convert_feature(instance, feature, value, nullptr);
    return 0;
}

int Container::convert(const Instance* instance, Feature_List& features)
{
    Value value;
    for (Feature_List::Entry& entry : features.of(record_of(instance)))
        convert_feature(instance, entry.feature, value, &entry.kept);
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
