#include "host/objects/ArrayObject.h"

#include "host/Broker.h"
#include "host/Convert.h"

namespace host {
namespace {

CMPIArray* clone(const CMPIArray* self, CMPIStatus* status)
{
    auto* object = unwrap<Array_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    if (!object) return nullptr;
    return &object->broker.make<Array_Object>(Origin::cloned, object->element_type, object->elements)->face;
}

CMPICount get_size(const CMPIArray* self, CMPIStatus* status)
{
    auto* object = unwrap<Array_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? static_cast<CMPICount>(object->elements.size()) : 0;
}

CMPIType get_simple_type(const CMPIArray* self, CMPIStatus* status)
{
    auto* object = unwrap<Array_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? object->element_type : static_cast<CMPIType>(CMPI_null);
}

CMPIData get_element_at(const CMPIArray* self, CMPICount index, CMPIStatus* status)
{
    auto* object = unwrap<Array_Object>(self);
    if (!object) return no_data(status, CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    if (index >= object->elements.size())
        return no_data(status, CMPI_RC_ERR_NO_SUCH_PROPERTY, CMPI_notFound | CMPI_nullValue);
    put_status(status, CMPI_RC_OK);
    const Value& element = object->elements[index];
    return element.is_null() ? null_data(object->element_type) : data_of(object->broker, element, Origin::got);
}

CMPIStatus set_element_at(CMPIArray* self, CMPICount index, const CMPIValue* value, CMPIType type)
{
    auto* object = unwrap<Array_Object>(self);
    if (!object) return status_of(CMPI_RC_ERR_INVALID_HANDLE);
    if (index >= object->elements.size()) return status_of(CMPI_RC_ERR_NO_SUCH_PROPERTY);
    bool chars = type == CMPI_chars && object->element_type == CMPI_string;
    bool fits =
        type == object->element_type || type == CMPI_null || (chars && object->broker.manner().array_takes_chars);
    if (!fits) return status_of(CMPI_RC_ERR_TYPE_MISMATCH);
    int code = CMPI_RC_OK;
    Value taken = value_of(value, type, code);
    if (code == CMPI_RC_OK) object->elements[index] = std::move(taken);
    return status_of(code);
}

} // namespace

CMPIArrayFT Array_Object::table(const Manner& manner)
{
    CMPIArrayFT ft{};
    ft.ftVersion = manner.object_version;
    ft.release = release_face<Array_Object, CMPIArray>;
    ft.clone = clone;
    ft.getSize = get_size;
    ft.getSimpleType = get_simple_type;
    ft.getElementAt = get_element_at;
    ft.setElementAt = set_element_at;
    return ft;
}

Array_Object::Array_Object(Broker& owner, Origin from, CMPIType element, std::vector<Value> values)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().array}, element_type(element),
      elements(std::move(values))
{
}

} // namespace host
