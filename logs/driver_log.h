/// The driver's lines of the system's log, "/var/log/messages", on their way into the agent's store.
///
/// All run under the agent's locks, which is why no more of the file is held in memory than the store can show.
#pragma once

#include <string>
#include <vector>

#include "runtime/Type.h"

namespace cimple {

class ProviderAgent;
struct Driver_Log_Store;

/// Empties the agent's store and fills it from the system's log.
void refreshDriverLog(ProviderAgent& agent);

/// Reads the system's log and inserts its lines that hold `search` into `store`, the newest first, until the store is
/// full. `lines` is scratch for the newest of them, empty at the start, spent in the end; it grows to one more than the
/// store has room for. A line is looked at up to 1 MiB, and a zero byte in it becomes "?". What cannot be opened, or is
/// no regular file, has no lines.
void readEvents(const std::string& search, std::vector<std::string>& lines, Driver_Log_Store& store);

} // namespace cimple
