/// The agent's clock: the one place that a test replaces.
#pragma once

#include <atomic>

#include "runtime/Datetime.h"

namespace cimple {

/// Microseconds since the epoch; the system's clock unless a test has stored another.
extern std::atomic<uint64 (*)()> agent_clock;

/// The current time by that clock, in the host's zone.
Datetime agent_now();

} // namespace cimple
