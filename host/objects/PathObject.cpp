#include "host/objects/PathObject.h"

#include "host/Broker.h"
#include "host/Convert.h"

namespace host {
namespace {

CMPIObjectPath* clone(const CMPIObjectPath* self, CMPIStatus* status)
{
    auto* object = unwrap<Path_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? &object->broker.make<Path_Object>(Origin::cloned, object->data)->face : nullptr;
}

/// One field of the path, as setters and getters share it.
template <std::string Path::*field>
CMPIStatus set_field(CMPIObjectPath* self, const char* text)
{
    auto* object = unwrap<Path_Object>(self);
    if (!object) return status_of(CMPI_RC_ERR_INVALID_HANDLE);
    object->data.*field = text ? text : "";
    return status_of(CMPI_RC_OK);
}

template <std::string Path::*field>
CMPIString* get_field(const CMPIObjectPath* self, CMPIStatus* status)
{
    auto* object = unwrap<Path_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? object->broker.make_string(Origin::got, object->data.*field) : nullptr;
}

CMPIString* get_hostname(const CMPIObjectPath* self, CMPIStatus* status)
{
    auto* object = unwrap<Path_Object>(self);
    if (object && object->data.host.empty()) {
        put_status(status, CMPI_RC_OK);
        return nullptr;
    }
    return get_field<&Path::host>(self, status);
}

CMPIStatus add_key(CMPIObjectPath* self, const char* name, const CMPIValue* value, const CMPIType type)
{
    auto* object = unwrap<Path_Object>(self);
    if (!object) return status_of(CMPI_RC_ERR_INVALID_HANDLE);
    if (!name || !*name) return status_of(CMPI_RC_ERR_INVALID_PARAMETER);
    int code = CMPI_RC_OK;
    Value taken = value_of(value, type, code);
    if (code == CMPI_RC_OK) object->data.set(name, std::move(taken));
    return status_of(code);
}

CMPIData get_key(const CMPIObjectPath* self, const char* name, CMPIStatus* status)
{
    auto* object = unwrap<Path_Object>(self);
    if (!object || !name)
        return no_data(status, object ? CMPI_RC_ERR_INVALID_PARAMETER : CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    const Value* value = object->data.find(name);
    if (!value) return no_data(status, CMPI_RC_ERR_NOT_FOUND, object->broker.manner().not_found_state);
    put_status(status, CMPI_RC_OK);
    CMPIData data = data_of(object->broker, *value, Origin::got);
    data.state = static_cast<CMPIValueState>(data.state | object->broker.manner().key_state);
    return data;
}

CMPIData get_key_at(const CMPIObjectPath* self, CMPICount index, CMPIString** name, CMPIStatus* status)
{
    auto* object = unwrap<Path_Object>(self);
    if (!object) return no_data(status, CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    if (index >= object->data.keys.size())
        return no_data(status, CMPI_RC_ERR_NO_SUCH_PROPERTY, object->broker.manner().not_found_state);
    const Named_Value& key = object->data.keys[index];
    if (name) *name = object->broker.make_string(Origin::got, key.name);
    put_status(status, CMPI_RC_OK);
    CMPIData data = data_of(object->broker, key.value, Origin::got);
    data.state = static_cast<CMPIValueState>(data.state | object->broker.manner().key_state);
    return data;
}

CMPICount get_key_count(const CMPIObjectPath* self, CMPIStatus* status)
{
    auto* object = unwrap<Path_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? static_cast<CMPICount>(object->data.keys.size()) : 0;
}

CMPIStatus set_name_space_from(CMPIObjectPath* self, const CMPIObjectPath* source)
{
    auto *object = unwrap<Path_Object>(self), *from = unwrap<Path_Object>(source);
    if (!object || !from) return status_of(CMPI_RC_ERR_INVALID_HANDLE);
    object->data.name_space = from->data.name_space;
    return status_of(CMPI_RC_OK);
}

CMPIStatus set_host_and_name_space_from(CMPIObjectPath* self, const CMPIObjectPath* source)
{
    CMPIStatus status = set_name_space_from(self, source);
    if (status.rc == CMPI_RC_OK) unwrap<Path_Object>(self)->data.host = unwrap<Path_Object>(source)->data.host;
    return status;
}

CMPIData get_property_qualifier(const CMPIObjectPath* self, const char* property, const char* qualifier,
                                CMPIStatus* status)
{
    auto* object = unwrap<Path_Object>(self);
    if (!object) return no_data(status, CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    if (!property || !qualifier) return no_data(status, CMPI_RC_ERR_INVALID_PARAMETER, CMPI_badValue);
    Value value = object->broker.schema().property_qualifier(object->data.class_name, property, qualifier);
    if (value.is_null()) return no_data(status, CMPI_RC_ERR_NOT_FOUND, object->broker.manner().not_found_state);
    put_status(status, CMPI_RC_OK);
    return data_of(object->broker, value, Origin::got);
}

CMPIString* to_string(const CMPIObjectPath* self, CMPIStatus* status)
{
    auto* object = unwrap<Path_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? object->broker.make_string(Origin::got, object->to_text()) : nullptr;
}

} // namespace

CMPIObjectPathFT Path_Object::table(const Manner& manner)
{
    CMPIObjectPathFT ft{};
    ft.ftVersion = manner.object_version;
    ft.release = release_face<Path_Object, CMPIObjectPath>;
    ft.clone = clone;
    ft.setNameSpace = set_field<&Path::name_space>;
    ft.getNameSpace = get_field<&Path::name_space>;
    ft.setHostname = set_field<&Path::host>;
    ft.getHostname = get_hostname;
    ft.setClassName = set_field<&Path::class_name>;
    ft.getClassName = get_field<&Path::class_name>;
    ft.addKey = add_key;
    ft.getKey = get_key;
    ft.getKeyAt = get_key_at;
    ft.getKeyCount = get_key_count;
    ft.setNameSpaceFromObjectPath = set_name_space_from;
    ft.setHostAndNameSpaceFromObjectPath = set_host_and_name_space_from;
    // No manner has the other qualifier getters: no server that was looked at fills them.
    if (!manner.property_qualifier_absent) ft.getPropertyQualifier = get_property_qualifier;
    ft.toString = to_string;
    return ft;
}

Path_Object::Path_Object(Broker& owner, Origin from, Path path)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().path}, data(std::move(path))
{
}

} // namespace host
