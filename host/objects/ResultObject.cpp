#include "host/objects/ResultObject.h"

#include "host/Broker.h"
#include "host/Convert.h"
#include "host/Host.h"
#include "host/objects/ErrorObject.h"
#include "host/objects/InstanceObject.h"
#include "host/objects/PathObject.h"

namespace host {
namespace {

CMPIResult* clone(const CMPIResult* self, CMPIStatus* status)
{
    // A second handle on the same results would be of no use to anybody.
    put_status(status, unwrap<Result_Object>(self) ? CMPI_RC_ERR_NOT_SUPPORTED : CMPI_RC_ERR_INVALID_HANDLE);
    return nullptr;
}

CMPIStatus return_data(const CMPIResult* self, const CMPIValue* value, const CMPIType type)
{
    auto* object = unwrap<Result_Object>(self);
    return object ? object->take(value, type) : status_of(CMPI_RC_ERR_INVALID_HANDLE);
}

CMPIStatus return_instance(const CMPIResult* self, const CMPIInstance* instance)
{
    auto* object = unwrap<Result_Object>(self);
    return object ? object->take(instance) : status_of(CMPI_RC_ERR_INVALID_HANDLE);
}

CMPIStatus return_object_path(const CMPIResult* self, const CMPIObjectPath* path)
{
    auto* object = unwrap<Result_Object>(self);
    return object ? object->take(path) : status_of(CMPI_RC_ERR_INVALID_HANDLE);
}

CMPIStatus return_done(const CMPIResult* self)
{
    auto* object = unwrap<Result_Object>(self);
    return object ? object->finish() : status_of(CMPI_RC_ERR_INVALID_HANDLE);
}

CMPIStatus return_error(const CMPIResult* self, const CMPIError* error)
{
    auto* object = unwrap<Result_Object>(self);
    return object ? object->take(error) : status_of(CMPI_RC_ERR_INVALID_HANDLE);
}

} // namespace

CMPIResultFT Result_Object::table(const Manner& manner)
{
    CMPIResultFT ft{};
    ft.ftVersion = manner.object_version;
    if (!manner.result_life_absent) {
        ft.release = release_face<Result_Object, CMPIResult>;
        ft.clone = clone;
    }
    ft.returnData = return_data;
    ft.returnInstance = return_instance;
    ft.returnObjectPath = return_object_path;
    ft.returnDone = return_done;
    if (!manner.origin_and_error_absent) ft.returnError = return_error;
    return ft;
}

Result_Object::Result_Object(Broker& owner, Origin from, Answer& answer, const Result_Sink* sink, Takes takes,
                             std::string class_name)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().result}, m_answer(answer),
      m_sink(sink), m_takes(takes), m_class(std::move(class_name))
{
}

std::string Result_Object::to_text() const
{
    return std::to_string(m_answer.instances.size()) + " instances, " + std::to_string(m_answer.paths.size()) +
           " paths" + (m_sink ? ", " + std::to_string(m_answer.handed_on) + " handed on" : "");
}

bool Result_Object::open(const char* call, Takes takes)
{
    if (m_done) broker.violation(std::string(call) + " after returnDone");
    if (m_takes == takes) return true;
    broker.violation(std::string(call) + " in an operation that returns something else");
    return false;
}

void Result_Object::check_path(const char* call, const Path& path)
{
    const Class_Record* record = broker.schema().find(path.class_name);
    if (!record) {
        broker.violation(std::string(call) + ": unknown class " + path.class_name);
        return;
    }
    if (!m_class.empty() && !record->is_a(m_class))
        broker.violation(std::string(call) + ": " + record->name + " is no " + m_class);
    for (const Element_Record& property : record->properties)
        if (property.key && !path.find(property.name))
            broker.violation(std::string(call) + ": a path of " + record->name + " lacks the key " + property.name);
}

CMPIStatus Result_Object::take(const CMPIInstance* instance)
{
    auto* given = unwrap<Instance_Object>(instance);
    if (!given) {
        broker.violation("returnInstance of no instance");
        return status_of(CMPI_RC_ERR_INVALID_PARAMETER);
    }
    if (!open("returnInstance", Takes::instances)) return status_of(CMPI_RC_ERR_INVALID_PARAMETER);
    Instance taken = given->filtered();
    check_path("returnInstance", taken.path);
    if (m_sink && m_sink->instance) {
        m_answer.handed_on++;
        m_sink->instance(std::move(taken));
    } else {
        m_answer.instances.push_back(std::move(taken));
    }
    return status_of(CMPI_RC_OK);
}

CMPIStatus Result_Object::take(const CMPIObjectPath* path)
{
    auto* given = unwrap<Path_Object>(path);
    if (!given) {
        broker.violation("returnObjectPath of no path");
        return status_of(CMPI_RC_ERR_INVALID_PARAMETER);
    }
    if (!open("returnObjectPath", Takes::paths)) return status_of(CMPI_RC_ERR_INVALID_PARAMETER);
    check_path("returnObjectPath", given->data);
    if (m_sink && m_sink->path) {
        m_answer.handed_on++;
        m_sink->path(Path(given->data));
    } else {
        m_answer.paths.push_back(given->data);
    }
    return status_of(CMPI_RC_OK);
}

CMPIStatus Result_Object::take(const CMPIValue* value, CMPIType type)
{
    // Servers take instances and paths by this way as well.
    if (value && type == CMPI_instance && m_takes == Takes::instances) return take(value->inst);
    if (value && type == CMPI_ref && m_takes == Takes::paths) return take(value->ref);
    if (!open("returnData", Takes::data)) return status_of(CMPI_RC_ERR_INVALID_PARAMETER);
    int code = CMPI_RC_OK;
    m_answer.value = value_of(value, type, code);
    return status_of(code);
}

CMPIStatus Result_Object::take(const CMPIError* error)
{
    auto* given = unwrap<Error_Object>(error);
    if (!given) return status_of(CMPI_RC_ERR_INVALID_HANDLE);
    if (m_answer.status.ok()) m_answer.status = {given->status_code, given->message};
    return status_of(CMPI_RC_OK);
}

CMPIStatus Result_Object::finish()
{
    if (m_done) broker.violation("returnDone twice");
    m_done = true;
    return status_of(CMPI_RC_OK);
}

} // namespace host
