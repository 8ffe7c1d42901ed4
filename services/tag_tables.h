/// Tag tables between an adapter, a file and the log.
///
/// Under the agent's data mutex, as all calls of the library.
#pragma once

#include <string>

#include "services/Tag_Table.h"

namespace cimple {

/// Writes each entry to the log, byte by byte.
void PrintQoSEntry(const Tag_Table& table);

/// Replaces the content of the file, which must be a regular one if it is there. A failure is logged, and leaves no
/// part of a table that somebody could load. Throws std::bad_alloc.
void WriteConfigTablesToFile(const std::string& path, const Tag_Table& table, const std::string& adapter);

/// Reads the file and loads its table into the opened adapter. Result a return value of the service: 0; 1 if the
/// library refuses the table; 32968 for a file that cannot be opened or is not as it should be; 32774 without memory;
/// 32768 for any other exception. The adapter is asked only for 0 and 1.
uint32 loadConfigTable(const std::string& path, uint32 handle);

} // namespace cimple
