/// A table of frame tags, in the form in which an adapter's library reads and writes it.
#pragma once

#include "foundation/Library_List.h"
#include "foundation/management_api.h"

namespace cimple {

using Tag_Table = Library_List<CPQFC_QOSCONFIG>;

/// With that count, and room for it. Throws std::bad_alloc; also for a count that no adapter can have, whether an
/// adapter or a file tells of it: so what is written can be read.
inline Tag_Table makeTagTable(sint64 entries)
{
    if (entries < 0 || entries > sint64{CPQFC_QOS_MAX_ENTRIES}) throw std::bad_alloc();
    Tag_Table table(static_cast<uint32>(entries));
    table.get()->count = static_cast<uint32>(entries);
    return table;
}

} // namespace cimple
