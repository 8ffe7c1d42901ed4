/// A list that the library is asked for: with room for one entry, and once more with room for as many as it then says.
///
/// A value of one thread. The library's count is not believed beyond the room that it had.
#pragma once

#include <memory>
#include <new>
#include <vector>

#include "foundation/Library_List.h"
#include "foundation/management_api.h"

namespace cimple {

template <class List>
class Counted_List {
public:
    using Entry = typename Library_List<List>::Entry;

    /// Asks, and asks again after status 7. False without memory for the entries, when nothing else may be called.
    template <class Ask>
    bool fill(Ask ask)
    {
        if (!give(1)) return false;
        status = ask(m_list->get());
        if (status != RM_STATUS_MORE_DATA) return true;
        if (!give(count())) return false;
        status = ask(m_list->get());
        return true;
    }

    uint32 status = RM_STATUS_ERROR;

    /// As the library left it.
    uint32 count() const { return m_list->get()->count; }
    /// How many entries were counted and had room.
    uint32 size() const { return m_list->size(); }
    const Entry& operator[](uint32 index) const { return (*m_list)[index]; }
    /// All of them. Throws std::bad_alloc.
    std::vector<Entry> entries() const
    {
        return size() ? std::vector<Entry>(&(*this)[0], &(*this)[0] + size()) : std::vector<Entry>();
    }

private:
    bool give(uint32 room)
    {
        m_list.reset();
        try {
            m_list = std::make_unique<Library_List<List>>(room);
        } catch (const std::bad_alloc&) {
            return false;
        }
        m_list->get()->count = room;
        return true;
    }

    std::unique_ptr<Library_List<List>> m_list; // null before fill
};

} // namespace cimple
