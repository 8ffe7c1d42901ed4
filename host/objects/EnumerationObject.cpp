#include "host/objects/EnumerationObject.h"

#include "host/Broker.h"
#include "host/Convert.h"
#include "host/objects/ArrayObject.h"

namespace host {
namespace {

CMPIEnumeration* clone(const CMPIEnumeration* self, CMPIStatus* status)
{
    auto* object = unwrap<Enumeration_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    if (!object) return nullptr;
    auto* copy = object->broker.make<Enumeration_Object>(Origin::cloned, object->element_type, object->elements);
    copy->position = object->position;
    return &copy->face;
}

CMPIData get_next(const CMPIEnumeration* self, CMPIStatus* status)
{
    auto* object = unwrap<Enumeration_Object>(self);
    if (!object) return no_data(status, CMPI_RC_ERR_INVALID_HANDLE, CMPI_badValue);
    if (object->position >= object->elements.size())
        return no_data(status, CMPI_RC_ERR_NOT_FOUND, CMPI_notFound | CMPI_nullValue);
    put_status(status, CMPI_RC_OK);
    return data_of(object->broker, object->elements[object->position++], Origin::got);
}

CMPIBoolean has_next(const CMPIEnumeration* self, CMPIStatus* status)
{
    auto* object = unwrap<Enumeration_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object && object->position < object->elements.size() ? CMPI_true : CMPI_false;
}

CMPIArray* to_array(const CMPIEnumeration* self, CMPIStatus* status)
{
    auto* object = unwrap<Enumeration_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    if (!object) return nullptr;
    return &object->broker.make<Array_Object>(Origin::got, object->element_type, object->elements)->face;
}

} // namespace

CMPIEnumerationFT Enumeration_Object::table(const Manner& manner)
{
    CMPIEnumerationFT ft{};
    ft.ftVersion = manner.object_version;
    ft.release = release_face<Enumeration_Object, CMPIEnumeration>;
    ft.clone = clone;
    ft.getNext = get_next;
    ft.hasNext = has_next;
    ft.toArray = to_array;
    return ft;
}

Enumeration_Object::Enumeration_Object(Broker& owner, Origin from, CMPIType type, std::vector<Value> content)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().enumeration},
      element_type(type), elements(std::move(content))
{
}

std::string Enumeration_Object::to_text() const
{
    return "enumeration of " + std::to_string(elements.size()) + " objects, " + std::to_string(position) + " taken";
}

} // namespace host
