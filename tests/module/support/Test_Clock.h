/// The time of day that the test program and the module in it see: the machine's, set forward at will; and the sleeps
/// of the module, which take no time here.
///
/// The program defines gettimeofday and select, which the loader then binds for all that it loads. Waiting for
/// something is not touched.
#pragma once

#include <chrono>

namespace nvrtest {

/// From now on the time of day is later by so much more. Any thread.
void advance_clock(std::chrono::seconds by);

/// From now on time passes only by advance_clock: how long something takes decides nothing any more. Any thread.
void stop_clock();

/// How long all sleeps so far would have lasted. They leave the time of day alone. Any thread.
std::chrono::microseconds slept();

} // namespace nvrtest
