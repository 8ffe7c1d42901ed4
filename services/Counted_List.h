/// A list as the library fills it: a count word, `head` bytes up to its records, and room for some of them.
///
/// A value of one thread. The library's count is not believed beyond the room that it had.
#pragma once

#include <algorithm>
#include <cstring>
#include <new>
#include <vector>

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

class Counted_List {
public:
    Counted_List(std::size_t head, std::size_t record) : m_head(head), m_record(record) {}

    /// Asks with room for one record, and once more, with as much as the library then says, after status 7. False
    /// without memory, which is also that for a need of more than 16 MiB.
    template <class Ask>
    bool fill(Ask ask)
    {
        if (!give(1)) return false;
        status = ask(m_bytes.data());
        if (status != RM_STATUS_MORE_DATA) return true;
        if (!give(count())) return false;
        status = ask(m_bytes.data());
        return true;
    }

    uint32 status = RM_STATUS_ERROR;

    /// As the library left it.
    uint32 count() const
    {
        uint32 count = 0;
        std::memcpy(&count, m_bytes.data(), sizeof count);
        return count;
    }
    /// How many records were counted and had room.
    uint32 size() const { return std::min(count(), m_room); }
    /// One of them.
    template <class Record>
    Record record(uint32 index) const
    {
        Record one;
        std::memcpy(&one, m_bytes.data() + m_head + std::size_t{index} * sizeof one, sizeof one);
        return one;
    }
    /// All of them. Throws std::bad_alloc.
    template <class Record>
    std::vector<Record> records() const
    {
        std::vector<Record> all(size());
        if (!all.empty()) std::memcpy(all.data(), m_bytes.data() + m_head, all.size() * sizeof(Record));
        return all;
    }

private:
    bool give(uint32 room)
    {
        constexpr uint64 most_bytes = 16 * 1024 * 1024;
        const uint64 size = m_head + uint64(m_record) * room;
        if (size > most_bytes) return false;
        try {
            m_bytes.assign(size, 0);
        } catch (const std::bad_alloc&) {
            return false;
        }
        m_room = room;
        std::memcpy(m_bytes.data(), &room, sizeof room);
        return true;
    }

    const std::size_t m_head;
    const std::size_t m_record;
    uint32 m_room = 0;
    std::vector<unsigned char> m_bytes;
};

} // namespace cimple
