#include "foundation/AttributeBlock.h"

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>

#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"

namespace cimple {

void AttributeBlock::Free::operator()(unsigned char* bytes) const
{
    std::free(bytes);
}

AttributeBlock::AttributeBlock(uint32 capacity)
    : m_capacity(capacity), m_owned(static_cast<unsigned char*>(std::calloc(capacity, 1))), m_bytes(m_owned.get())
{
}

uint32 AttributeBlock::fill(Forward<uint32(HBA_WWN, void*, uint32*)>& operation, const HBA_WWN& wwn)
{
    uint32 size = m_capacity;
    return operation(wwn, m_bytes, &size);
}

const unsigned char* AttributeBlock::find(uint16 number, std::size_t& room, uint16& length, uint32& status)
{
    length = 0;
    status = RM_STATUS_ERROR;
    const void* value = RM_GetAttributeValue(m_bytes, number, &length, &status);
    // An address that lies elsewhere counts as none, which null does as well.
    const auto offset = reinterpret_cast<std::uintptr_t>(value) - reinterpret_cast<std::uintptr_t>(m_bytes);
    if (offset >= m_capacity) return nullptr;
    room = m_capacity - offset;
    return m_bytes + offset;
}

bool AttributeBlock::number(uint16 number, uint32& value, uint32& status)
{
    value = 0;
    return bytes(number, &value, sizeof value, status);
}

bool AttributeBlock::bytes(uint16 number, void* value, std::size_t size, uint32& status)
{
    std::size_t room = 0;
    uint16 length = 0;
    const unsigned char* found = find(number, room, length, status);
    if (status != RM_STATUS_OK || !found || room < size) return false;
    std::memcpy(value, found, size);
    return true;
}

bool AttributeBlock::wholeBytes(uint16 number, void* value, std::size_t size, uint32& status)
{
    std::size_t room = 0;
    uint16 length = 0;
    return find(number, room, length, status) && length >= size && bytes(number, value, size, status);
}

bool AttributeBlock::text(uint16 number, std::string& value, uint32& status)
{
    value.clear();
    std::size_t room = 0;
    uint16 length = 0;
    const unsigned char* found = find(number, room, length, status);
    if (status != RM_STATUS_OK || !found) return false;
    const char* text = reinterpret_cast<const char*>(found);
    value.assign(text, ::strnlen(text, std::min({std::size_t{length}, room, std::size_t{RM_TEXT_SIZE - 1}})));
    return true;
}

bool AttributeBlock::wide(uint16 number, uint64& value)
{
    std::size_t room = 0;
    uint16 length = 0;
    uint32 status = 0;
    const unsigned char* found = find(number, room, length, status);
    if (!found || room < sizeof value) return false;
    std::memcpy(&value, found, sizeof value);
    return true;
}

bool AttributeBlock::number(uint16 number, const char* name, uint32& value)
{
    uint32 status = 0;
    const bool found = this->number(number, value, status);
    if (found)
        NVR_LOG("%s: [ %d ]", name, static_cast<int>(value));
    else
        NVR_LOG("ERROR: RM_GetHBAAttributeValue HA_%s call failed (%d)", name, static_cast<int>(status));
    return found;
}

bool AttributeBlock::text(uint16 number, const char* name, std::string& value)
{
    uint32 status = 0;
    const bool found = text(number, value, status);
    if (found)
        NVR_LOG("%s : [ %s ]", name, value.c_str());
    else
        NVR_LOG("ERROR: %s: RM_GetHBAAttributes call failed (%d)", name, static_cast<int>(status));
    return found;
}

bool AttributeBlock::address(uint16 number, const char* name, std::string& value)
{
    uint8 address[6];
    uint32 status = 0;
    const bool found = bytes(number, address, sizeof address, status);
    value = found ? macText(address, ':') : "";
    if (found)
        NVR_LOG("%s : [ %s ]", name, value.c_str());
    else
        NVR_LOG("ERROR: %s: RM_GetHBAAttributes call failed (%d)", name, static_cast<int>(status));
    return found;
}

} // namespace cimple
