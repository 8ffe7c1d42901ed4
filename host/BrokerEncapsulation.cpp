// The eft of the broker: constructors of the encapsulated types, and questions on them.
#include "host/Broker.h"
#include "host/objects/ArgsObject.h"
#include "host/objects/ArrayObject.h"
#include "host/objects/DateTimeObject.h"
#include "host/objects/ErrorObject.h"
#include "host/objects/InstanceObject.h"
#include "host/objects/PathObject.h"
#include "host/objects/SelectExpObject.h"

#include <ctime>

namespace host {
namespace {

constexpr CMPICount largest_array = 16 * 1024 * 1024;

CMPIInstance* new_instance(const CMPIBroker* mb, const CMPIObjectPath* op, CMPIStatus* status)
{
    auto* path = unwrap<Path_Object>(op);
    put_status(status, path ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_PARAMETER);
    if (!path) return nullptr;
    Instance instance;
    instance.path = path->data;
    return &Broker::of(mb)->make<Instance_Object>(Origin::made, std::move(instance))->face;
}

CMPIObjectPath* new_object_path(const CMPIBroker* mb, const char* ns, const char* cn, CMPIStatus* status)
{
    Path path;
    path.name_space = ns ? ns : "";
    path.class_name = cn ? cn : "";
    put_status(status, CMPI_RC_OK);
    return &Broker::of(mb)->make<Path_Object>(Origin::made, std::move(path))->face;
}

CMPIArgs* new_args(const CMPIBroker* mb, CMPIStatus* status)
{
    put_status(status, CMPI_RC_OK);
    return &Broker::of(mb)->make<Args_Object>(Origin::made, std::vector<Named_Value>())->face;
}

CMPIString* new_string(const CMPIBroker* mb, const char* data, CMPIStatus* status)
{
    Broker& broker = *Broker::of(mb);
    bool refused = !data && !broker.manner().string_of_null;
    put_status(status, refused ? CMPI_RC_ERR_INVALID_PARAMETER : CMPI_RC_OK);
    if (refused) return nullptr;
    if (!data) return &broker.make<String_Object>(Origin::made, std::nullopt)->face;
    return broker.make_string(Origin::made, data);
}

CMPIArray* new_array(const CMPIBroker* mb, CMPICount max, CMPIType type, CMPIStatus* status)
{
    bool wrong = max > largest_array || (type & CMPI_ARRAY) != 0;
    put_status(status, wrong ? CMPI_RC_ERR_INVALID_PARAMETER : CMPI_RC_OK);
    if (wrong) return nullptr;
    CMPIType element = type == CMPI_chars || type == CMPI_charsptr ? static_cast<CMPIType>(CMPI_string) : type;
    std::vector<Value> elements(max, Value::null_of(element));
    return &Broker::of(mb)->make<Array_Object>(Origin::made, element, std::move(elements))->face;
}

CMPIDateTime* make_date_time(const CMPIBroker* mb, const std::string& text, CMPIStatus* status)
{
    bool good = is_date_time(text);
    put_status(status, good ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_PARAMETER);
    return good ? &Broker::of(mb)->make<Date_Time_Object>(Origin::made, text)->face : nullptr;
}

CMPIDateTime* new_date_time(const CMPIBroker* mb, CMPIStatus* status)
{
    timespec now{};
    clock_gettime(CLOCK_REALTIME, &now);
    auto microseconds =
        static_cast<std::uint64_t>(now.tv_sec) * 1000000 + static_cast<std::uint64_t>(now.tv_nsec) / 1000;
    return make_date_time(mb, date_time_text(microseconds, false), status);
}

CMPIDateTime* new_date_time_from_binary(const CMPIBroker* mb, CMPIUint64 time, CMPIBoolean interval, CMPIStatus* status)
{
    return make_date_time(mb, date_time_text(time, interval != CMPI_false), status);
}

CMPIDateTime* new_date_time_from_chars(const CMPIBroker* mb, const char* text, CMPIStatus* status)
{
    return make_date_time(mb, text ? text : "", status);
}

CMPISelectExp* new_select_exp(const CMPIBroker* mb, const char* query, const char* language, CMPIArray** projection,
                              CMPIStatus* status)
{
    if (projection) *projection = nullptr;
    put_status(status, query ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_QUERY);
    if (!query) return nullptr;
    return &Broker::of(mb)->make<Select_Exp_Object>(Origin::made, query, language ? language : "")->face;
}

CMPIBoolean class_path_is_a(const CMPIBroker* mb, const CMPIObjectPath* op, const char* type, CMPIStatus* status)
{
    auto* path = unwrap<Path_Object>(op);
    bool good = path && type;
    bool known = good && Broker::of(mb)->schema().find(path->data.class_name);
    put_status(status, !good ? CMPI_RC_ERR_INVALID_PARAMETER : known ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_CLASS);
    return known && Broker::of(mb)->schema().is_a(path->data.class_name, type) ? CMPI_true : CMPI_false;
}

CMPIString* to_string(const CMPIBroker* mb, const void* face, CMPIStatus* status)
{
    Object* object = object_at(face);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? Broker::of(mb)->make_string(Origin::made, object->to_text()) : nullptr;
}

CMPIBoolean is_of_type(const CMPIBroker*, const void* face, const char* type, CMPIStatus* status)
{
    Object* object = object_at(face);
    put_status(status, object && type ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object && type && same_name(type, kind_name(object->kind)) ? CMPI_true : CMPI_false;
}

CMPIString* get_type(const CMPIBroker* mb, const void* face, CMPIStatus* status)
{
    Object* object = object_at(face);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? Broker::of(mb)->make_string(Origin::made, kind_name(object->kind)) : nullptr;
}

// There is no message catalogue: the default text is the message.
CMPIString* get_message(const CMPIBroker* mb, const char*, const char* text, CMPIStatus* status, CMPICount, ...)
{
    put_status(status, CMPI_RC_OK);
    return Broker::of(mb)->make_string(Origin::made, text ? text : "");
}

CMPIString* get_message_2(const CMPIBroker* mb, const char* id, const CMPIMsgFileHandle, const char* text,
                          CMPIStatus* status, CMPICount, ...)
{
    return get_message(mb, id, text, status, 0);
}

CMPIStatus open_message_file(const CMPIBroker*, const char*, CMPIMsgFileHandle* handle)
{
    if (handle) *handle = nullptr;
    return status_of(CMPI_RC_OK);
}

CMPIStatus close_message_file(const CMPIBroker*, const CMPIMsgFileHandle)
{
    return status_of(CMPI_RC_OK);
}

std::string told(const char* text, const CMPIString* string)
{
    auto* object = unwrap<String_Object>(string);
    return text ? text : object ? object->to_text() : "";
}

CMPIStatus log_message(const CMPIBroker* mb, int severity, const char* id, const char* text, const CMPIString* string)
{
    Broker::of(mb)->log().line("module logs (severity %d) %s: %s", severity, id ? id : "", told(text, string).c_str());
    return status_of(CMPI_RC_OK);
}

CMPIStatus trace(const CMPIBroker* mb, int level, const char* component, const char* text, const CMPIString* string)
{
    Broker::of(mb)->log().line("module traces (level %d) %s: %s", level, component ? component : "",
                               told(text, string).c_str());
    return status_of(CMPI_RC_OK);
}

CMPIError* new_error(const CMPIBroker* mb, const char* owner, const char* id, const char* message,
                     const CMPIErrorSeverity severity, const CMPIErrorProbableCause cause, const CMPIrc code,
                     CMPIStatus* status)
{
    auto* error = Broker::of(mb)->make<Error_Object>(Origin::made);
    error->owning_entity = owner ? owner : "";
    error->message_id = id ? id : "";
    error->message = message ? message : "";
    error->severity = static_cast<int>(severity);
    error->probable_cause = static_cast<int>(cause);
    error->status_code = code;
    put_status(status, CMPI_RC_OK);
    return &error->face;
}

} // namespace

void fill_encapsulation(CMPIBrokerEncFT& table, const Manner& manner)
{
    table.ftVersion = manner.encapsulation_version;
    table.newInstance = new_instance;
    table.newObjectPath = new_object_path;
    table.newArgs = new_args;
    table.newString = new_string;
    table.newArray = new_array;
    table.newDateTime = new_date_time;
    table.newDateTimeFromBinary = new_date_time_from_binary;
    table.newDateTimeFromChars = new_date_time_from_chars;
    table.newSelectExp = new_select_exp;
    table.classPathIsA = class_path_is_a;
    table.toString = to_string;
    table.isOfType = is_of_type;
    table.getType = get_type;
    table.getMessage = get_message;
    table.logMessage = log_message;
    table.trace = trace;
    if (manner.messages_absent) return;
    table.newCMPIError = new_error;
    table.openMessageFile = open_message_file;
    table.closeMessageFile = close_message_file;
    table.getMessage2 = get_message_2;
}

} // namespace host
