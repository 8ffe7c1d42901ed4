/// The time of day that the test program and the module in it see: the machine's, set forward at will.
///
/// The program defines gettimeofday, which the loader then binds for all that it loads. Waiting is not touched.
#pragma once

#include <chrono>

namespace nvrtest {

/// From now on the time of day is later by so much more. Any thread.
void advance_clock(std::chrono::seconds by);

} // namespace nvrtest
