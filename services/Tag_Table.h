/// A table of frame tags, in the form in which an adapter's library reads and writes it.
#pragma once

#include "foundation/Library_List.h"
#include "foundation/management_api.h"

namespace cimple {

using Tag_Table = Library_List<CPQFC_QOSCONFIG>;

/// With that count, and room for it. Throws std::bad_alloc.
inline Tag_Table makeTagTable(uint32 entries)
{
    Tag_Table table(entries);
    table.get()->count = entries;
    return table;
}

} // namespace cimple
