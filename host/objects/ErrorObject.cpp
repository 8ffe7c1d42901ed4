#include "host/objects/ErrorObject.h"

#include "host/Broker.h"
#include "host/objects/ArrayObject.h"

namespace host {
namespace {

CMPIError* clone(const CMPIError* self, CMPIStatus* status)
{
    auto* object = unwrap<Error_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    if (!object) return nullptr;
    auto* copy = object->broker.make<Error_Object>(Origin::cloned);
    copy->type = object->type;
    copy->severity = object->severity;
    copy->probable_cause = object->probable_cause;
    copy->source_format = object->source_format;
    copy->status_code = object->status_code;
    copy->other_type = object->other_type;
    copy->owning_entity = object->owning_entity;
    copy->message_id = object->message_id;
    copy->message = object->message;
    copy->probable_cause_description = object->probable_cause_description;
    copy->source = object->source;
    copy->other_source_format = object->other_source_format;
    copy->status_description = object->status_description;
    copy->recommended_actions = object->recommended_actions;
    copy->message_arguments = object->message_arguments;
    return &copy->face;
}

template <std::string Error_Object::*field>
CMPIString* get_text(const CMPIError* self, CMPIStatus* status)
{
    auto* object = unwrap<Error_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? object->broker.make_string(Origin::got, object->*field) : nullptr;
}

template <std::string Error_Object::*field>
CMPIStatus set_text(CMPIError* self, const char* text)
{
    auto* object = unwrap<Error_Object>(self);
    if (object) object->*field = text ? text : "";
    return status_of(object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
}

/// Enumerations are int-sized in every set of CMPI headers, and of different names.
template <int Error_Object::*field, class Number>
Number get_number(const CMPIError* self, CMPIStatus* status)
{
    auto* object = unwrap<Error_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return static_cast<Number>(object ? object->*field : 0);
}

template <int Error_Object::*field, class Number>
CMPIStatus set_number(CMPIError* self, const Number number)
{
    auto* object = unwrap<Error_Object>(self);
    if (object) object->*field = static_cast<int>(number);
    return status_of(object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
}

template <std::vector<Value> Error_Object::*field>
CMPIArray* get_texts(const CMPIError* self, CMPIStatus* status)
{
    auto* object = unwrap<Error_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? &object->broker.make<Array_Object>(Origin::got, static_cast<CMPIType>(CMPI_string), object->*field)
                         ->face
                  : nullptr;
}

template <std::vector<Value> Error_Object::*field, class Array>
CMPIStatus set_texts(CMPIError* self, Array* texts)
{
    auto* object = unwrap<Error_Object>(self);
    auto* given = unwrap<Array_Object>(texts);
    if (!object || !given) return status_of(CMPI_RC_ERR_INVALID_HANDLE);
    if (given->element_type != CMPI_string) return status_of(CMPI_RC_ERR_TYPE_MISMATCH);
    object->*field = given->elements;
    return status_of(CMPI_RC_OK);
}

} // namespace

CMPIErrorFT Error_Object::table(const Manner& manner)
{
    CMPIErrorFT ft{};
    ft.ftVersion = manner.object_version;
    ft.release = release_face<Error_Object, CMPIError>;
    ft.clone = clone;
    ft.getErrorType = get_number<&Error_Object::type>;
    ft.getOtherErrorType = get_text<&Error_Object::other_type>;
    ft.getOwningEntity = get_text<&Error_Object::owning_entity>;
    ft.getMessageID = get_text<&Error_Object::message_id>;
    ft.getMessage = get_text<&Error_Object::message>;
    ft.getPerceivedSeverity = get_number<&Error_Object::severity>;
    ft.getProbableCause = get_number<&Error_Object::probable_cause>;
    ft.getProbableCauseDescription = get_text<&Error_Object::probable_cause_description>;
    ft.getRecommendedActions = get_texts<&Error_Object::recommended_actions>;
    ft.getErrorSource = get_text<&Error_Object::source>;
    ft.getErrorSourceFormat = get_number<&Error_Object::source_format>;
    ft.getOtherErrorSourceFormat = get_text<&Error_Object::other_source_format>;
    ft.getCIMStatusCode = get_number<&Error_Object::status_code>;
    ft.getCIMStatusCodeDescription = get_text<&Error_Object::status_description>;
    ft.getMessageArguments = get_texts<&Error_Object::message_arguments>;
    ft.setErrorType = set_number<&Error_Object::type>;
    ft.setOtherErrorType = set_text<&Error_Object::other_type>;
    ft.setProbableCauseDescription = set_text<&Error_Object::probable_cause_description>;
    ft.setRecommendedActions = set_texts<&Error_Object::recommended_actions>;
    ft.setErrorSource = set_text<&Error_Object::source>;
    ft.setErrorSourceFormat = set_number<&Error_Object::source_format>;
    ft.setOtherErrorSourceFormat = set_text<&Error_Object::other_source_format>;
    ft.setCIMStatusCodeDescription = set_text<&Error_Object::status_description>;
    ft.setMessageArguments = set_texts<&Error_Object::message_arguments>;
    return ft;
}

Error_Object::Error_Object(Broker& owner, Origin from)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().error}
{
}

} // namespace host
