#include "services/service_method.h"

#include <string>

#include "agent/ProviderAgent.h"
#include "agent/library_name.h"
#include "classes/NVRHBA_FCPort.h"

namespace cimple {

bool isFirstService(const Instance_Map& services, const Instance* self)
{
    return isOfClass(self, *services.meta_class()) && (services.empty() || key_eq(self, services[0]));
}

bool isAnyService(const Instance_Map& services, const Instance* self)
{
    return isOfClass(self, *services.meta_class()) && (services.empty() || services.find(self) >= 0);
}

const char* deviceID(const Instance* port)
{
    if (!port) return nullptr;
    const Meta_Feature* feature = find_feature(port->meta_class, "DeviceID", META_FLAG_PROPERTY);
    if (!feature) return nullptr;
    const auto* property = static_cast<const Meta_Property*>(feature);
    if (property->type != STRING || property->subscript || null_of(port, property)) return nullptr;
    return static_cast<const String*>(feature_at(port, property->offset))->c_str();
}

bool isKnownFCPort(ProviderAgent& agent, const Instance* target)
{
    return isOfClass(target, NVRHBA_FCPort::meta) && agent.checkFCPort(deviceID(target)) != 0;
}

bool portName(HBA_WWN& name, const char* deviceID, const char* who)
{
    const std::string start = who;
    return library_name(name, deviceID, (start + "::Id2HBAName failed").c_str(),
                        (start + "::str2HBAName failed").c_str());
}

} // namespace cimple
