/// Asks a library for a list that may answer "more, this many", and then asks once more with that much room.
#pragma once

#include <cstddef>
#include <new>
#include <vector>

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

struct Asked {
    uint32 status; ///< of the last call
    int calls;     ///< 1 or 2; 0 if there was no memory for the first
};

/// Fills `records` by `ask(Record* room, uint32* count)`, `*count` being the room on the way in and the number of
/// records on the way out. Statuses 7 and 191 mean that more room is needed. On success `records` has what was given,
/// but never more than there was room for, zeroed behind what the library wrote; otherwise it is empty. A need
/// of more than `limit` records counts as memory that is not to be had.
template <class Record, class Ask>
Asked ask_again(std::vector<Record>& records, uint32 first, uint32 limit, Ask ask)
{
    Asked asked{RM_STATUS_ERROR, 0};
    uint32 room = first;
    for (;;) {
        try {
            records.assign(room, Record());
        } catch (const std::bad_alloc&) {
            records.clear();
            return asked;
        }
        uint32 count = room;
        asked.status = ask(records.data(), &count);
        asked.calls++;
        if (asked.status == RM_STATUS_OK) {
            if (count < room) records.resize(count);
            return asked;
        }
        records.clear();
        const bool more = asked.status == RM_STATUS_MORE_DATA || asked.status == RM_STATUS_LIST_TOO_LONG;
        if (!more || asked.calls == 2) return asked;
        if (count > limit) return asked; // as memory that is not to be had
        room = count;
    }
}

} // namespace cimple
