/// The file in which clients carry an adapter's tag table: an XML document with the root element ApexConfig.
///
/// Text in, table out, and back; no files and no adapter. Any thread.
#pragma once

#include <string>

#include "services/Tag_Table.h"

namespace cimple {

/// What a file tells of where its table comes from. Nothing of it is read back.
struct Apex_Origin {
    std::string created; ///< the time, as a CIM datetime
    std::string host;
    std::string adapter;
};

/// The document, indented by tabs, one Row an entry; reserved bytes are written as zeros. Throws std::bad_alloc.
std::string apexConfigText(const Tag_Table& table, const Apex_Origin& origin);

/// Reads a document. The table has as many entries as numberOfEntries says; those that no Row speaks of, and all
/// reserved bytes, are zero. A name that is none is logged and leaves its eight bytes zero.
///
/// Throws std::runtime_error, with words for the log, for bad syntax, elements more than 64 deep, and elements that are
/// missing or out of order; std::bad_alloc for more entries than an adapter can have (logged), for more elements than
/// such a file needs, and when memory is short.
Tag_Table readApexConfig(std::string text);

} // namespace cimple
