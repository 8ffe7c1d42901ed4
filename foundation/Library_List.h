/// A list in the form in which a library fills or reads it: a count word, and entries behind it.
///
/// `List` is the library's structure, with its members `count` and `entry[1]`. Movable. One thread.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdlib>
#include <memory>
#include <new>

#include "runtime/Type.h"

namespace cimple {

template <class List>
class Library_List {
public:
    using Entry = std::remove_reference_t<decltype(List::entry[0])>;

    /// Larger lists count as memory that is not to be had, whoever asks for them.
    static constexpr uint64 most_bytes = 16 * 1024 * 1024;

    /// All zero, the count too. Throws std::bad_alloc.
    explicit Library_List(uint32 room) : m_room(room)
    {
        const uint64 bytes = offsetof(List, entry) + sizeof(Entry) * uint64{room};
        if (bytes <= most_bytes)
            m_list.reset(static_cast<List*>(std::calloc(1, std::max(bytes, uint64{sizeof(List)}))));
        if (!m_list) throw std::bad_alloc();
    }

    List* get() { return m_list.get(); }
    const List* get() const { return m_list.get(); }

    /// How many entries the count tells of, but no more than there is room for.
    uint32 size() const { return std::min<uint32>(m_list->count, m_room); }
    Entry& operator[](uint32 index) { return m_list->entry[index]; }
    const Entry& operator[](uint32 index) const { return m_list->entry[index]; }

private:
    struct Free {
        void operator()(List* list) const { std::free(list); }
    };
    uint32 m_room;
    std::unique_ptr<List, Free> m_list;
};

} // namespace cimple
