#include "agent/instance_table.h"

#include <cstdarg>
#include <cstdio>
#include <vector>

#include "foundation/CLogger.h"

namespace cimple {

String text(const char* format, ...)
{
    char buffer[256];
    va_list arguments;
    va_start(arguments, format);
    const int size = std::vsnprintf(buffer, sizeof buffer, format, arguments);
    va_end(arguments);
    if (size < 0) return String();
    if (static_cast<std::size_t>(size) < sizeof buffer) return String(buffer, static_cast<std::size_t>(size));
    std::vector<char> longer(static_cast<std::size_t>(size) + 1);
    va_start(arguments, format);
    std::vsnprintf(longer.data(), longer.size(), format, arguments);
    va_end(arguments);
    return String(longer.data(), static_cast<std::size_t>(size));
}

String string_property(const Instance* instance, const char* name)
{
    const Meta_Feature* feature = find_feature(instance->meta_class, name, META_FLAG_PROPERTY);
    if (!feature) return String();
    const Meta_Property* property = as_property(feature);
    if (property->type != STRING || property->subscript != 0 || null_of(instance, property)) return String();
    return *static_cast<const String*>(feature_at(instance, property->offset));
}

void logCreationFailed(const char* failure)
{
    NVR_LOG("%s", failure);
}

void logInsertFailed(const Instance_Map& map, const char* failure)
{
    if (failure)
        NVR_LOG("%s", failure);
    else
        NVR_LOG("Insert Failed : m_%s_map", map.meta_class()->name);
}

Instance* insertOrLog(Instance_Map& map, Ref<Instance> instance, const char* failure)
{
    try {
        if (map.insert(instance.get()) >= 0) return instance.release();
    } catch (const std::bad_alloc&) {
    }
    logInsertFailed(map, failure);
    return nullptr;
}

Instance* insert(Instance_Map& map, Ref<Instance> instance, const char* failure)
{
    Instance* inserted = insertOrLog(map, std::move(instance), failure);
    if (!inserted) throw Update_Ended();
    return inserted;
}

} // namespace cimple
