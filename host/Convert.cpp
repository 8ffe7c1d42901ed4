#include "host/Convert.h"

#include "host/Broker.h"
#include "host/objects/ArrayObject.h"
#include "host/objects/DateTimeObject.h"
#include "host/objects/InstanceObject.h"
#include "host/objects/PathObject.h"
#include "host/objects/StringObject.h"

namespace host {
namespace {

Value array_of(const CMPIValue& value, CMPIType type, int& code)
{
    CMPIType element = static_cast<CMPIType>(type & ~CMPI_ARRAY);
    if (element == CMPI_chars || element == CMPI_charsptr) element = CMPI_string;
    Value null = Value::null_of(static_cast<CMPIType>(element | CMPI_ARRAY));
    if (!value.array) return null;
    auto* array = unwrap<Array_Object>(value.array);
    if (!array) {
        code = CMPI_RC_ERR_INVALID_HANDLE;
        return null;
    }
    if (array->element_type != element) {
        code = CMPI_RC_ERR_TYPE_MISMATCH;
        return null;
    }
    return Value::array(element, array->elements);
}

/// A value behind a pointer to an encapsulated object: null pointers are null values, foreign ones a fault.
template <class T, class Face, class Make>
Value object_of(const Face* face, CMPIType type, int& code, Make make)
{
    if (!face) return Value::null_of(type);
    if (auto* object = unwrap<T>(face)) return make(*object);
    code = CMPI_RC_ERR_INVALID_HANDLE;
    return Value::null_of(type);
}

Value string_of(const char* text)
{
    return text ? Value::string(text) : Value::null_of(CMPI_string);
}

} // namespace

Value value_of(const CMPIValue* value, CMPIType type, int& code)
{
    if (type == CMPI_null) return {};
    if (type == CMPI_chars) return string_of(reinterpret_cast<const char*>(value));
    if (!value) return Value::null_of(type == CMPI_charsptr ? static_cast<CMPIType>(CMPI_string) : type);
    if (type & CMPI_ARRAY) return array_of(*value, type, code);
    switch (type) {
    case CMPI_boolean:
        return Value::boolean(value->boolean != 0);
    case CMPI_char16:
        return Value::integer(type, value->char16);
    case CMPI_uint8:
        return Value::integer(type, value->uint8);
    case CMPI_uint16:
        return Value::integer(type, value->uint16);
    case CMPI_uint32:
        return Value::integer(type, value->uint32);
    case CMPI_uint64:
        return Value::integer(type, value->uint64);
    case CMPI_sint8:
        return Value::integer(type, static_cast<std::uint64_t>(value->sint8));
    case CMPI_sint16:
        return Value::integer(type, static_cast<std::uint64_t>(value->sint16));
    case CMPI_sint32:
        return Value::integer(type, static_cast<std::uint64_t>(value->sint32));
    case CMPI_sint64:
        return Value::integer(type, static_cast<std::uint64_t>(value->sint64));
    case CMPI_real32:
        return Value::real(type, static_cast<double>(value->real32));
    case CMPI_real64:
        return Value::real(type, value->real64);
    case CMPI_charsptr:
        return string_of(value->chars);
    case CMPI_string:
        return object_of<String_Object>(value->string, type, code, [](String_Object& s) {
            return s.text ? Value::string(*s.text) : Value::null_of(CMPI_string);
        });
    case CMPI_dateTime:
        return object_of<Date_Time_Object>(value->dateTime, type, code,
                                           [](Date_Time_Object& d) { return Value::datetime(d.text); });
    case CMPI_ref:
        return object_of<Path_Object>(value->ref, type, code, [](Path_Object& p) { return Value::reference(p.data); });
    case CMPI_instance:
        return object_of<Instance_Object>(value->inst, type, code,
                                          [](Instance_Object& i) { return Value::instance(i.data()); });
    default:
        code = CMPI_RC_ERR_INVALID_DATA_TYPE;
        return {};
    }
}

CMPIData null_data(CMPIType type)
{
    CMPIData data{};
    data.type = type;
    data.state = CMPI_nullValue;
    return data;
}

CMPIData no_data(CMPIStatus* status, int code, int state)
{
    put_status(status, code);
    CMPIData data{};
    data.state = static_cast<CMPIValueState>(state);
    return data;
}

CMPIData data_of(Broker& broker, const Value& value, Origin origin)
{
    if (value.is_null()) return null_data(value.type());
    CMPIData data{};
    data.type = value.type();
    data.state = CMPI_goodValue;
    if (value.is_array()) {
        auto element = static_cast<CMPIType>(value.type() & ~CMPI_ARRAY);
        data.value.array = &broker.make<Array_Object>(origin, element, value.elements())->face;
        return data;
    }
    switch (value.type()) {
    case CMPI_boolean:
        data.value.boolean = value.as_boolean() ? CMPI_true : CMPI_false;
        break;
    case CMPI_char16:
        data.value.char16 = static_cast<CMPIChar16>(value.as_uint());
        break;
    case CMPI_uint8:
        data.value.uint8 = static_cast<CMPIUint8>(value.as_uint());
        break;
    case CMPI_uint16:
        data.value.uint16 = static_cast<CMPIUint16>(value.as_uint());
        break;
    case CMPI_uint32:
        data.value.uint32 = static_cast<CMPIUint32>(value.as_uint());
        break;
    case CMPI_uint64:
        data.value.uint64 = value.as_uint();
        break;
    case CMPI_sint8:
        data.value.sint8 = static_cast<CMPISint8>(value.as_int());
        break;
    case CMPI_sint16:
        data.value.sint16 = static_cast<CMPISint16>(value.as_int());
        break;
    case CMPI_sint32:
        data.value.sint32 = static_cast<CMPISint32>(value.as_int());
        break;
    case CMPI_sint64:
        data.value.sint64 = value.as_int();
        break;
    case CMPI_real32:
        data.value.real32 = static_cast<CMPIReal32>(value.as_real());
        break;
    case CMPI_real64:
        data.value.real64 = value.as_real();
        break;
    case CMPI_string:
        data.value.string = broker.make_string(origin, value.as_text());
        break;
    case CMPI_dateTime:
        data.value.dateTime = &broker.make<Date_Time_Object>(origin, value.as_text())->face;
        break;
    case CMPI_ref:
        data.value.ref = &broker.make<Path_Object>(origin, *value.as_path())->face;
        break;
    case CMPI_instance:
        data.value.inst = &broker.make<Instance_Object>(origin, *value.as_instance())->face;
        break;
    default:
        data.state = CMPI_badValue;
        break;
    }
    return data;
}

} // namespace host
