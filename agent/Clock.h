/// The agent's clock and sleep: the one place that a test replaces.
#pragma once

#include <atomic>

#include "runtime/Datetime.h"

namespace cimple {

/// Microseconds since the epoch; the system's clock unless a test has stored another.
extern std::atomic<uint64 (*)()> agent_clock;

/// Lets so many microseconds go by on the calling thread; the system's sleep unless a test has stored another.
extern std::atomic<void (*)(uint64)> agent_sleep;

/// The current time by that clock, in the host's zone.
Datetime agent_now();

} // namespace cimple
