/// The lines of the driver's log that a client can read: the newest ones, newest first. Under the agent's locks.
#pragma once

#include <string>
#include <vector>

#include "runtime/Type.h"

namespace cimple {

struct Driver_Log_Store {
    uint32 capacity = 200;
    sint32 index = -1; ///< of the last line; -1: there is none
    std::vector<std::string> lines;

    /// Appends a line. Result 0, also for an empty line, which is left out; 1 if the store is full.
    int insert(std::string line);
    void clear();
};

} // namespace cimple
