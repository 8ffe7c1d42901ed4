#include "cmpi/CMPI_Containers.h"

#include <cstdlib>
#include <strings.h>

#include "cmpi/cmpi_call.h"
#include "cmpi/cmpi_data.h"
#include "cmpi/warnings.h"
#include "runtime/Forced_Unwind.h"

namespace cimple {

namespace {

// --- Casts
// -------------------------------------------------------------------------------------------------------------

template <class To>
void set_as(Value& value, uint64 bits)
{
    value.set(static_cast<To>(bits));
}

// Truncates an integer to another integer type.
bool set_truncated(Value& value, int type, uint64 bits)
{
    switch (type) {
    case UINT8:
        set_as<uint8>(value, bits);
        return true;
    case SINT8:
        set_as<sint8>(value, bits);
        return true;
    case UINT16:
        set_as<uint16>(value, bits);
        return true;
    case SINT16:
        set_as<sint16>(value, bits);
        return true;
    case UINT32:
        set_as<uint32>(value, bits);
        return true;
    case SINT32:
        set_as<sint32>(value, bits);
        return true;
    case SINT64:
        set_as<sint64>(value, bits);
        return true;
    default:
        return false;
    }
}

// Servers hand over keys as the widest integer of their choice, whatever the class says.
void narrow_key(int expected_type, Value& value)
{
    if (value.null()) {
        const bool narrows = value.type() == UINT64 ? expected_type >= UINT8 && expected_type <= SINT64
                                                    : value.type() == SINT64 && expected_type == UINT32;
        if (narrows) value.set_null(expected_type);
    } else if (const uint64* wide = value.get<uint64>()) {
        set_truncated(value, expected_type, *wide);
    } else if (const sint64* wide = value.get<sint64>()) {
        if (expected_type == UINT32) set_truncated(value, UINT32, static_cast<uint64>(*wide));
    }
}

// Reads a scalar argument out of a text. True where the data was replaced by it.
bool cast_cmpi_string_to_scalar(const char* text, int expected_type, Value& value)
{
    switch (expected_type) {
    case BOOLEAN:
        if (strncasecmp(text, "true", 4) == 0)
            value.set(true);
        else if (strncasecmp(text, "false", 5) == 0)
            value.set(false);
        else
            return false;
        return true;
    case UINT8:
    case SINT8:
    case UINT16:
    case SINT16:
    case UINT32:
    case SINT32:
        return set_truncated(value, expected_type, static_cast<uint64>(std::strtol(text, nullptr, 10)));
    case CHAR16:
    case DATETIME:
        CIMPLE_INFO("cast_cmpi_string_to_scalar(): Not supported");
        return false;
    case NONE_VALUE:
        CONVERSION_WARN("missing type");
        return false;
    default:
        CONVERSION_WARN("Default case - unsupported type");
        return false;
    }
}

} // namespace

// --- What the three share
// ----------------------------------------------------------------------------------------------

std::size_t CMPI_Container::get_size()
{
    if (m_size == not_known) m_size = count();
    return m_size;
}

int CMPI_Container::fetch(std::size_t index)
{
    if (index >= get_size()) {
        CONVERSION_WARN("bounds error");
        return -1;
    }
    if (index == m_fetched) return 0;
    m_fetched = not_known;
    CMPIString* name = nullptr;
    if (read(index, name, m_data) != 0) return -1;
    m_name = chars_of(name);
    m_fetched = index;
    return 0;
}

int CMPI_Container::get_name(std::size_t index, const char*& name)
{
    if (fetch(index) != 0 || !m_name) return -1;
    name = m_name;
    return 0;
}

int CMPI_Container::get_value(std::size_t index, int expected_type, Value& value)
{
    if (fetch(index) != 0) return -1;
    CMPIData data = m_data;
    m_fetched = not_known; // taking may give the data back to the broker
    if (take(data, expected_type, value) != 0) {
        CONVERSION_WARN("cmpi_to_cimple_value() failed");
        return -1;
    }
    if (value.type() == BOOLEAN && expected_type == INSTANCE_ARRAY_VALUE) value.set_null(INSTANCE_ARRAY_VALUE);
    if (value.type() != expected_type) {
        CONVERSION_WARN("type mismatch on %s: %s/%s", m_name ? m_name : "", value_type_name(value.type()),
                        value_type_name(expected_type));
        return -1;
    }
    return 0;
}

int CMPI_Container::take(CMPIData& data, int, Value& value)
{
    return cmpi_to_cimple_value(m_broker, m_repository, data, m_depth, value);
}

// --- Instance
// ----------------------------------------------------------------------------------------------------------

CMPIInstance_Container::CMPIInstance_Container(const CMPIBroker* broker, const Meta_Repository* repository,
                                               const char* name_space, CMPIInstance* instance, unsigned depth)
    : CMPI_Container(broker, repository, name_space, depth), m_instance(instance)
{
}

std::size_t CMPIInstance_Container::count()
{
    CMPIStatus status;
    CMPICount count = ask(status, m_instance, &CMPIInstanceFT::getPropertyCount);
    return status.rc == CMPI_RC_OK ? count : 0;
}

int CMPIInstance_Container::read(std::size_t index, CMPIString*& name, CMPIData& data)
{
    try {
        CMPIStatus status;
        data = ask(status, m_instance, &CMPIInstanceFT::getPropertyAt, static_cast<CMPICount>(index), &name);
        if (status.rc == CMPI_RC_OK) return 0;
        CONVERSION_WARN("CMGetPropertyAt() failed");
    } catch (...) {
        if (is_forced_unwind()) throw;
        CONVERSION_WARN("CMGetPropertyAt() threw exception: index=%u size=%u", static_cast<unsigned>(index),
                        static_cast<unsigned>(get_size()));
    }
    return -1;
}

int CMPIInstance_Container::set_value(const char* name, const Value& value, uint32 flags, Kept_Text* kept)
{
    Made_Data made;
    if (to_cmpi_data(m_broker, m_name_space, value, flags, kept, made) != 0) {
        CONVERSION_WARN("_to_cmpi_data() failed: feature=%s", name);
        return -1;
    }
    if (tell(m_instance, &CMPIInstanceFT::setProperty, name, made.value(), made.data.type) != CMPI_RC_OK) {
        CONVERSION_WARN("CMSetProperty() failed: %s", name);
        return -1;
    }
    return 0;
}

// --- Object path
// -------------------------------------------------------------------------------------------------------

CMPIObjectPath_Container::CMPIObjectPath_Container(const CMPIBroker* broker, const Meta_Repository* repository,
                                                   const char* name_space, CMPIObjectPath* path, unsigned depth)
    : CMPI_Container(broker, repository, name_space, depth), m_path(path)
{
}

std::size_t CMPIObjectPath_Container::count()
{
    CMPIStatus status;
    CMPICount count = ask(status, m_path, &CMPIObjectPathFT::getKeyCount);
    return status.rc == CMPI_RC_OK ? count : 0;
}

int CMPIObjectPath_Container::read(std::size_t index, CMPIString*& name, CMPIData& data)
{
    CMPIStatus status;
    data = ask(status, m_path, &CMPIObjectPathFT::getKeyAt, static_cast<CMPICount>(index), &name);
    if (status.rc == CMPI_RC_OK) return 0;
    CONVERSION_WARN("CMGetKeyAt() failed");
    return -1;
}

int CMPIObjectPath_Container::take(CMPIData& data, int expected_type, Value& value)
{
    if (CMPI_Container::take(data, expected_type, value) != 0) return -1;
    narrow_key(expected_type, value);
    return 0;
}

int CMPIObjectPath_Container::set_value(const char* name, const Value& value, uint32 flags, Kept_Text* kept)
{
    Made_Data made;
    if (to_cmpi_data(m_broker, m_name_space, value, flags, kept, made) != 0) {
        CONVERSION_WARN("_to_cmpi_data() failed: feature=%s", name);
        return -1;
    }
    if (tell(m_path, &CMPIObjectPathFT::addKey, name, made.value(), made.data.type) != CMPI_RC_OK) {
        CONVERSION_WARN("CMAddKey() failed");
        return -1;
    }
    return 0;
}

// --- Arguments
// ---------------------------------------------------------------------------------------------------------

CMPIArgs_Container::CMPIArgs_Container(const CMPIBroker* broker, const Meta_Repository* repository,
                                       const char* name_space, CMPIArgs* args, unsigned depth)
    : CMPI_Container(broker, repository, name_space, depth), m_args(args)
{
}

std::size_t CMPIArgs_Container::count()
{
    CMPIStatus status;
    CMPICount count = ask(status, m_args, &CMPIArgsFT::getArgCount);
    return status.rc == CMPI_RC_OK ? count : 0;
}

int CMPIArgs_Container::read(std::size_t index, CMPIString*& name, CMPIData& data)
{
    CMPIStatus status;
    data = ask(status, m_args, &CMPIArgsFT::getArgAt, static_cast<CMPICount>(index), &name);
    if (status.rc == CMPI_RC_OK) return 0;
    CONVERSION_WARN("CMGetArgAt() failed");
    return -1;
}

// Clients send every argument as text when they do not know the method's declaration.
int CMPIArgs_Container::take(CMPIData& data, int expected_type, Value& value)
{
    const bool text_for_another_type =
        data.type == CMPI_string && !(data.state & CMPI_nullValue) && expected_type != STRING;
    if (text_for_another_type) {
        const char* text = nullptr;
        if (read_chars(data.value.string, text) != 0 || !text) return -1;
        if (cast_cmpi_string_to_scalar(text, expected_type, value)) {
            CONVERSION_WARN("converting string to registered parameter type");
            release(data.value.string);
            return 0;
        }
    }
    return CMPI_Container::take(data, expected_type, value);
}

int CMPIArgs_Container::set_value(const char* name, const Value& value, uint32 flags, Kept_Text* kept)
{
    if (equali(name, "return_value")) {
        m_return_value = value;
        return 0;
    }
    Made_Data made;
    if (to_cmpi_data(m_broker, m_name_space, value, flags, kept, made) != 0) {
        CONVERSION_WARN("_to_cmpi_data() failed: feature=%s", name);
        return -1;
    }
    if (tell(m_args, &CMPIArgsFT::addArg, name, made.value(), made.data.type) != CMPI_RC_OK) {
        CONVERSION_WARN("CMAddArg() failed");
        return -1;
    }
    return 0;
}

} // namespace cimple
