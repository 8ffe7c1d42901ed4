#include "host/objects/StringObject.h"

#include "host/Broker.h"

namespace host {
namespace {

CMPIString* clone(const CMPIString* self, CMPIStatus* status)
{
    auto* object = unwrap<String_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? &object->broker.make<String_Object>(Origin::cloned, object->text)->face : nullptr;
}

const char* get_char_ptr(const CMPIString* self, CMPIStatus* status)
{
    auto* object = unwrap<String_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object && object->text ? object->text->c_str() : nullptr;
}

} // namespace

CMPIStringFT String_Object::table(const Manner& manner)
{
    CMPIStringFT ft{};
    ft.ftVersion = manner.object_version;
    ft.release = release_face<String_Object, CMPIString>;
    ft.clone = clone;
    ft.getCharPtr = get_char_ptr;
    return ft;
}

String_Object::String_Object(Broker& owner, Origin from, std::optional<std::string> characters)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().string},
      text(std::move(characters))
{
}

} // namespace host
