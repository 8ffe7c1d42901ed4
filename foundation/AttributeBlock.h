/// A block of numbered attributes as the management library fills it, and the one reader over it.
///
/// Its buffer is zeroed at the start. The library is not trusted: a value counts only as far as it lies inside the
/// buffer. Threads as with any plain object.
#pragma once

#include <cstddef>
#include <memory>
#include <string>

#include "foundation/management_binding.h"

namespace cimple {

class AttributeBlock {
public:
    /// Over a buffer of its own; empty (valid() is false) if memory is short.
    explicit AttributeBlock(uint32 capacity);

    bool valid() const { return m_bytes != nullptr; }

    /// Has `operation` (RM_GetHBAAttributes, RM_GetPortAttributes, RM_GetPortStatistics) fill the block for a port.
    /// Result the library's status.
    uint32 fill(Forward<uint32(HBA_WWN, void*, uint32*)>& operation, const HBA_WWN& wwn);

    // Readers without words. Result true, or false for an attribute that is missing; the value is then 0 or empty and
    // `status` tells why.
    bool number(uint16 number, uint32& value, uint32& status);
    bool text(uint16 number, std::string& value, uint32& status); ///< at most 255 bytes, up to the first zero byte
    bool bytes(uint16 number, void* value, std::size_t size, uint32& status);
    /// The same, but an attribute that the library says is shorter is missing.
    bool wholeBytes(uint16 number, void* value, std::size_t size, uint32& status);
    /// A 64-bit number; here a value counts whatever the status says.
    bool wide(uint16 number, uint64& value);

    // The same with the log's words, `name` being the attribute's name there.
    bool number(uint16 number, const char* name, uint32& value);
    bool text(uint16 number, const char* name, std::string& value);
    /// Six bytes, as "%02x:%02x:%02x:%02x:%02x:%02x".
    bool address(uint16 number, const char* name, std::string& value);

protected:
    /// Over one that outlives it.
    AttributeBlock(unsigned char* buffer, uint32 capacity) : m_capacity(capacity), m_bytes(buffer) {}

private:
    /// The bytes of the attribute that lie inside the block, `room` of them, and the `length` that it claims to have;
    /// null if there is none. `status` as the library gave it.
    const unsigned char* find(uint16 number, std::size_t& room, uint16& length, uint32& status);

    struct Free {
        void operator()(unsigned char* bytes) const;
    };
    const uint32 m_capacity;
    std::unique_ptr<unsigned char[], Free> m_owned;
    unsigned char* const m_bytes;
};

/// One that stands where it is declared and asks for no memory.
template <uint32 capacity>
class Local_Attribute_Block : public AttributeBlock {
public:
    Local_Attribute_Block() : AttributeBlock(m_buffer, capacity) {}

private:
    unsigned char m_buffer[capacity] = {};
};

} // namespace cimple
