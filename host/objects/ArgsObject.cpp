#include "host/objects/ArgsObject.h"

#include "host/Broker.h"
#include "host/Convert.h"

namespace host {
namespace {

CMPIArgs* clone(const CMPIArgs* self, CMPIStatus* status)
{
    auto* object = unwrap<Args_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? &object->broker.make<Args_Object>(Origin::cloned, object->values)->face : nullptr;
}

Named_Value* find(Args_Object& object, const char* name)
{
    for (Named_Value& value : object.values)
        if (same_name(value.name.c_str(), name)) return &value;
    return nullptr;
}

CMPIStatus add_arg(const CMPIArgs* self, const char* name, const CMPIValue* value, const CMPIType type)
{
    auto* object = unwrap<Args_Object>(self);
    if (!object) return status_of(CMPI_RC_ERR_INVALID_HANDLE);
    if (!name || !*name) return status_of(CMPI_RC_ERR_INVALID_PARAMETER);
    int code = CMPI_RC_OK;
    Value taken = value_of(value, type, code);
    if (code != CMPI_RC_OK) return status_of(code);
    if (Named_Value* old = find(*object, name))
        old->value = std::move(taken);
    else
        object->values.push_back({name, std::move(taken)});
    return status_of(CMPI_RC_OK);
}

CMPIData get_arg(const CMPIArgs* self, const char* name, CMPIStatus* status)
{
    auto* object = unwrap<Args_Object>(self);
    if (!object || !name)
        return no_data(status, object ? CMPI_RC_ERR_INVALID_PARAMETER : CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    Named_Value* argument = find(*object, name);
    if (!argument) return no_data(status, CMPI_RC_ERR_NOT_FOUND, object->broker.manner().not_found_state);
    put_status(status, CMPI_RC_OK);
    return data_of(object->broker, argument->value, Origin::got);
}

CMPIData get_arg_at(const CMPIArgs* self, CMPICount index, CMPIString** name, CMPIStatus* status)
{
    auto* object = unwrap<Args_Object>(self);
    if (!object) return no_data(status, CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    if (index >= object->values.size())
        return no_data(status, CMPI_RC_ERR_NO_SUCH_PROPERTY, object->broker.manner().not_found_state);
    if (name) *name = object->broker.make_string(Origin::got, object->values[index].name);
    put_status(status, CMPI_RC_OK);
    return data_of(object->broker, object->values[index].value, Origin::got);
}

CMPICount get_arg_count(const CMPIArgs* self, CMPIStatus* status)
{
    auto* object = unwrap<Args_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? static_cast<CMPICount>(object->values.size()) : 0;
}

} // namespace

CMPIArgsFT Args_Object::table(const Manner& manner)
{
    CMPIArgsFT ft{};
    ft.ftVersion = manner.object_version;
    ft.release = release_face<Args_Object, CMPIArgs>;
    ft.clone = clone;
    ft.addArg = add_arg;
    ft.getArg = get_arg;
    ft.getArgAt = get_arg_at;
    ft.getArgCount = get_arg_count;
    return ft;
}

Args_Object::Args_Object(Broker& owner, Origin from, std::vector<Named_Value> content)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().args},
      values(std::move(content))
{
}

std::string Args_Object::to_text() const
{
    std::string text;
    for (const Named_Value& value : values)
        text += (text.empty() ? "" : ", ") + value.name + "=" + value.value.to_text();
    return text;
}

} // namespace host
