#include "host/objects/Object.h"

#include "host/Broker.h"

namespace host {

CMPIStatus status_of(int code)
{
    CMPIStatus status;
    status.rc = static_cast<CMPIrc>(code);
    status.msg = nullptr;
    return status;
}

void put_status(CMPIStatus* status, int code)
{
    if (status) *status = status_of(code);
}

Object* object_at(void* handle, Object_Kind kind)
{
    auto* object = static_cast<Object*>(handle);
    if (!object) return nullptr;
    if (object->magic == Object::dead) {
        object->broker.violation(std::string("use of a released ") + kind_name(object->kind));
        return nullptr;
    }
    return object->magic == Object::alive && object->kind == kind ? object : nullptr;
}

Object* object_at(const void* face)
{
    // Every face begins with its handle.
    auto* object = face ? static_cast<Object*>(static_cast<const CMPIString*>(face)->hdl) : nullptr;
    return object && object->magic == Object::alive ? object : nullptr;
}

CMPIStatus release_object(void* handle, Object_Kind kind)
{
    Object* object = object_at(handle, kind);
    if (!object) return status_of(CMPI_RC_ERR_INVALID_HANDLE);
    if (object->origin == Origin::lent)
        object->broker.violation(std::string("release of a ") + kind_name(kind) + " that the broker lent");
    else
        object->broker.retire(*object);
    return status_of(CMPI_RC_OK);
}

} // namespace host
