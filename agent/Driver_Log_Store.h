/// The lines of the driver's log that a client can read: the newest ones, newest first. Plain data, under the agent's
/// locks.
#pragma once

#include <string>
#include <vector>

#include "runtime/Type.h"

namespace cimple {

struct Driver_Log_Store {
    uint32 capacity = 200;
    sint32 index = -1;
    std::vector<std::string> lines;
};

} // namespace cimple
