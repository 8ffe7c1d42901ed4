#include "cmpi/cmpi_data.h"

#include <cstring>

#include "cmpi/CMPI_Containers.h"
#include "cmpi/Converter.h"
#include "cmpi/cmpi_call.h"
#include "cmpi/warnings.h"
#include "cmpi/xml_text.h"

namespace cimple {

namespace {

// The CMPI type of each scalar Type, by code.
constexpr CMPIType cmpi_types[number_of_types] = {
    CMPI_boolean, CMPI_uint8,  CMPI_sint8,  CMPI_uint16, CMPI_sint16, CMPI_uint32, CMPI_sint32,
    CMPI_uint64,  CMPI_sint64, CMPI_real32, CMPI_real64, CMPI_char16, CMPI_string, CMPI_dateTime,
};

// The tag of a CMPI type that is no array, NONE_VALUE for one that no feature can have.
int tag_of(CMPIType type)
{
    for (unsigned i = 0; i < number_of_types; ++i)
        if (cmpi_types[i] == type) return static_cast<int>(i);
    return type == CMPI_ref || type == CMPI_instance ? INSTANCE_VALUE : NONE_VALUE;
}

// --- Runtime to CMPI
// ---------------------------------------------------------------------------------------------------

CMPIString* new_string(const CMPIBroker* broker, const String& text)
{
    CMPIStatus status;
    if (carried_by_xml(text.c_str(), text.size()) == text.size())
        return ask(status, broker, &CMPIBrokerEncFT::newString, text.c_str());
    return ask(status, broker, &CMPIBrokerEncFT::newString, as_xml_text(text).c_str());
}

int string_to_cmpi(const CMPIBroker* broker, const String& text, CMPIValue& value)
{
    value.string = new_string(broker, text);
    return value.string ? 0 : -1;
}

int kept_string_to_cmpi(const CMPIBroker* broker, const String& text, Kept_Text& kept, Made_Data& made)
{
    const char* const place = text.c_str(); // equal texts of a SAN are at one
    if (!kept.made || kept.text.c_str() != place) {
        if (kept.last != place) {
            kept.last = place;
            return string_to_cmpi(broker, text, made.data.value);
        }
        kept.made.reset(new_string(broker, text));
        kept.text = text;
    }
    made.is_kept = true;
    made.data.value.string = kept.made.get();
    return kept.made ? 0 : -1;
}

int datetime_to_cmpi(const CMPIBroker* broker, const Datetime& datetime, CMPIValue& value)
{
    char text[Datetime::text_size];
    datetime.ascii(text);
    CMPIStatus status;
    value.dateTime = ask(status, broker, &CMPIBrokerEncFT::newDateTimeFromChars, text);
    return value.dateTime ? 0 : -1;
}

int scalar_to_cmpi(const CMPIBroker* broker, Type type, const void* source, CMPIValue& value)
{
    if (type == STRING) return string_to_cmpi(broker, *static_cast<const String*>(source), value);
    if (type == DATETIME) return datetime_to_cmpi(broker, *static_cast<const Datetime*>(source), value);
    // Every member of the union starts where the union does.
    switch (type_sizes[type]) {
    case 1:
        std::memcpy(&value, source, 1);
        break;
    case 2:
        std::memcpy(&value, source, 2);
        break;
    case 4:
        std::memcpy(&value, source, 4);
        break;
    default:
        std::memcpy(&value, source, 8);
    }
    return 0;
}

int instance_to_cmpi(const CMPIBroker* broker, const char* name_space, const Instance* instance, CMPIType type,
                     CMPIValue& value)
{
    if (!instance) {
        CONVERSION_WARN("null instance argument");
        return -1;
    }
    if (!instance->__name_space.empty()) name_space = instance->__name_space.c_str();
    if (!name_space || !*name_space) {
        CONVERSION_WARN("null namespace");
        return -1;
    }
    const char* class_name = record_of(instance)->name;
    if (!class_name || !*class_name) {
        CONVERSION_WARN("null classname");
        return -1;
    }

    CMPIStatus status;
    Made<CMPIObjectPath> path(ask(status, broker, &CMPIBrokerEncFT::newObjectPath, name_space, class_name));
    if (!path) {
        CONVERSION_WARN("CMNewObjectPath() failed");
        return -1;
    }
    if (CMPIObjectPath_Container(broker, nullptr, name_space, path.get()).convert(instance, META_FLAG_KEY) != 0) {
        CONVERSION_WARN("Container::convert() failed");
        return -1;
    }
    if (type == CMPI_ref) {
        value.ref = path.release();
        return 0;
    }

    value.inst = ask(status, broker, &CMPIBrokerEncFT::newInstance, path.get());
    if (!value.inst) {
        CONVERSION_WARN("CMNewInstance() failed");
        return -1;
    }
    if (CMPIInstance_Container(broker, nullptr, name_space, value.inst).convert(instance, 0) != 0) {
        CONVERSION_WARN("Container::convert() failed");
        return -1;
    }
    return 0;
}

int set_element(CMPIArray* array, std::size_t index, CMPIValue& value, CMPIType type)
{
    if (tell(array, &CMPIArrayFT::setElementAt, static_cast<CMPICount>(index), &value, type) == CMPI_RC_OK) return 0;
    CONVERSION_WARN("CMSetArrayElementAt() failed");
    return -1;
}

// An array of `elements`, each made a CMPIValue by `convert(index, value)`.
template <class Convert>
int array_to_cmpi(const CMPIBroker* broker, std::size_t size, CMPIType type, Made_Data& made, Convert convert)
{
    CMPIStatus status;
    made.data.type = static_cast<CMPIType>(type | CMPI_ARRAY);
    made.data.value.array = ask(status, broker, &CMPIBrokerEncFT::newArray, static_cast<CMPICount>(size), type);
    if (!made.data.value.array) {
        CONVERSION_WARN("CMNewArray() failed");
        return -1;
    }
    for (std::size_t i = 0; i < size; ++i) {
        CMPIValue element{};
        if (convert(i, element) != 0) {
            CONVERSION_WARN("element conversion failed");
            return -1;
        }
        if (set_element(made.data.value.array, i, element, type) != 0) return -1;
    }
    return 0;
}

CMPIType instance_type(uint32 flags)
{
    return flags & (META_FLAG_EMBEDDED_OBJECT | META_FLAG_EMBEDDED_INSTANCE) ? CMPI_instance : CMPI_ref;
}

// --- CMPI to runtime
// ---------------------------------------------------------------------------------------------------

// Names of CMPI objects come as strings of the broker's, which live as long as the request.
Instance* read_reference(const CMPIBroker* broker, const Meta_Repository* repository, const CMPIObjectPath* path,
                         const CMPIInstance* instance, unsigned depth)
{
    CMPIStatus status;
    const char* class_name = chars_of(ask(status, path, &CMPIObjectPathFT::getClassName));
    if (!class_name) {
        CONVERSION_WARN("CMGetClassName() failed");
        return nullptr;
    }
    const Meta_Class* meta_class = find_meta_class(repository, class_name);
    if (!meta_class) {
        CONVERSION_WARN("failed to find meta class: %s", class_name);
        return nullptr;
    }
    Instance* result = nullptr;
    if (instance)
        make_cimple_instance(broker, meta_class, path, instance, result, depth + 1);
    else
        make_cimple_reference(broker, meta_class, path, result, depth + 1);
    if (!result) CONVERSION_WARN("failed to create CIMPLE instance");
    return result;
}

int take_instance(const CMPIBroker* broker, const Meta_Repository* repository, const CMPIData& data, unsigned depth,
                  Value& value)
{
    const bool embedded = data.type == CMPI_instance;
    if (depth >= deepest_instance) {
        CONVERSION_WARN("failed to create CIMPLE instance");
        return -1;
    }
    if (embedded ? !data.value.inst : !data.value.ref) {
        CONVERSION_WARN("null instance");
        return -1;
    }
    const CMPIObjectPath* path = data.value.ref;
    const CMPIInstance* instance = nullptr;
    if (embedded) {
        CMPIStatus status;
        instance = data.value.inst;
        path = ask(status, instance, &CMPIInstanceFT::getObjectPath);
        if (!path) {
            CONVERSION_WARN("CMGetObjectPath() failed");
            return -1;
        }
    }
    Ref<Instance> result(read_reference(broker, repository, path, instance, depth));
    if (!result) return -1;
    value.set(result.get());
    return 0;
}

int take_string(const CMPIString* string, Value& value)
{
    const char* text = nullptr;
    if (read_chars(string, text) != 0) return -1;
    if (text)
        value.set(String(text));
    else
        value.set_null(STRING);
    return 0;
}

int take_datetime(const CMPIDateTime* datetime, Value& value)
{
    CMPIStatus status;
    const char* text = chars_of(ask(status, datetime, &CMPIDateTimeFT::getStringFormat));
    if (!text) {
        CONVERSION_WARN("CMGetStringFormat() failed");
        return -1;
    }
    Datetime result;
    if (result.set(text) != 1) {
        CONVERSION_WARN("conversion error");
        return -1;
    }
    value.set(result);
    return 0;
}

int take_scalar(const CMPIData& data, Type type, Value& value)
{
    if (type == STRING) return take_string(data.value.string, value);
    if (type == DATETIME) return take_datetime(data.value.dateTime, value);
    if (type == BOOLEAN)
        value.set(data.value.boolean != 0);
    else
        value.set_scalar(type, &data.value);
    return 0;
}

int take_array(const CMPIBroker* broker, const Meta_Repository* repository, const CMPIArray* array, CMPIType type,
               int tag, unsigned depth, Value& value)
{
    const bool instances = tag == INSTANCE_VALUE;
    CMPIStatus status;
    const CMPICount size = ask(status, array, &CMPIArrayFT::getSize);
    if (status.rc != CMPI_RC_OK) {
        CONVERSION_WARN("CMGetArrayCount() failed");
        return -1;
    }
    value.set_null(tag + array_tag);
    for (CMPICount i = 0; i < size; ++i) {
        CMPIData element = ask(status, array, &CMPIArrayFT::getElementAt, i);
        if (status.rc != CMPI_RC_OK) {
            CONVERSION_WARN("CMGetArrayElementAt() failed");
            return -1;
        }
        const bool null = (element.state & CMPI_nullValue) != 0;
        if (null) {
            CONVERSION_WARN(instances ? "encountered null instance element" : "encountered null array element");
            return -1;
        }
        if (element.type != type) {
            CONVERSION_WARN(instances ? "array element type mismatch" : "type mismatch");
            return -1;
        }
        Value scalar;
        if (instances ? take_instance(broker, repository, element, depth, scalar)
                      : take_scalar(element, static_cast<Type>(tag), scalar))
            return -1;
        if (scalar.null()) {
            CONVERSION_WARN(instances ? "encountered null instance element" : "encountered null array element");
            return -1;
        }
        if (instances)
            value.append(scalar.get_instance());
        else
            value.append(scalar);
    }
    value.set_not_null();
    return 0;
}

} // namespace

Made_Data::~Made_Data()
{
    if (is_kept || data.state & CMPI_nullValue) return;
    if (data.type & CMPI_ARRAY)
        release(data.value.array);
    else if (data.type == CMPI_string)
        release(data.value.string);
    else if (data.type == CMPI_dateTime)
        release(data.value.dateTime);
    else if (data.type == CMPI_ref)
        release(data.value.ref);
}

int read_chars(const CMPIString* string, const char*& text)
{
    text = nullptr;
    if (string) {
        CMPIStatus status;
        text = ask(status, string, &CMPIStringFT::getCharPtr);
        if (status.rc != CMPI_RC_OK) {
            CONVERSION_WARN("CMGetCharsPtr() failed");
            return -1;
        }
    }
    if (!text) CIMPLE_INFO("ignored null CMPI string");
    return 0;
}

int to_cmpi_data(const CMPIBroker* broker, const char* name_space, const Value& value, uint32 flags, Kept_Text* kept,
                 Made_Data& made)
{
    const int tag = value.type();
    if (tag == NONE_VALUE) {
        CONVERSION_WARN("missing type");
        return -1;
    }
    const bool is_array = tag >= array_tag;
    const int scalar_tag = is_array ? tag - array_tag : tag;
    const CMPIType type = scalar_tag == INSTANCE_VALUE ? instance_type(flags) : cmpi_types[scalar_tag];

    if (value.null()) {
        made.data.type = static_cast<CMPIType>(is_array ? type | CMPI_ARRAY : type);
        made.data.state = CMPI_nullValue;
        return 0;
    }
    if (is_array && scalar_tag == INSTANCE_VALUE) {
        const Array<Instance*>& instances = *value.get_instance_array();
        return array_to_cmpi(broker, instances.size(), type, made, [&](std::size_t i, CMPIValue& element) {
            return instance_to_cmpi(broker, name_space, instances[i], type, element);
        });
    }
    if (is_array) {
        const Array_Base& scalars = *value.get_scalars();
        return array_to_cmpi(broker, scalars.size(), type, made, [&](std::size_t i, CMPIValue& element) {
            return scalar_to_cmpi(broker, static_cast<Type>(scalar_tag), scalars.at(i), element);
        });
    }
    made.data.type = type;
    if (tag == INSTANCE_VALUE) return instance_to_cmpi(broker, name_space, value.get_instance(), type, made.data.value);
    if (tag == STRING && kept)
        return kept_string_to_cmpi(broker, *static_cast<const String*>(value.data()), *kept, made);
    return scalar_to_cmpi(broker, static_cast<Type>(tag), value.data(), made.data.value);
}

int cmpi_to_cimple_value(const CMPIBroker* broker, const Meta_Repository* repository, const CMPIData& data,
                         unsigned depth, Value& value)
{
    value.clear();
    const bool is_array = (data.type & CMPI_ARRAY) != 0;
    const auto type = static_cast<CMPIType>(data.type & ~CMPI_ARRAY);
    const int tag = tag_of(type);
    if (tag == NONE_VALUE) {
        CONVERSION_WARN("unknown type");
        return -1;
    }
    if (data.state & CMPI_nullValue) {
        value.set_null(is_array ? tag + array_tag : tag);
        return 0;
    }
    if (data.state & (CMPI_notFound | CMPI_badValue)) return -1;
    if (is_array) return take_array(broker, repository, data.value.array, type, tag, depth, value);
    if (tag == INSTANCE_VALUE) return take_instance(broker, repository, data, depth, value);
    return take_scalar(data, static_cast<Type>(tag), value);
}

} // namespace cimple
