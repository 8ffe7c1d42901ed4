/// How much of itself a long test goes through.
///
/// Under a sanitizer all takes some ten times as long. There a test that is long even without goes through a sample of
/// its cases, unless the environment has NVR_ALL, as under the test presets asan-all and tsan-all.
#pragma once

#include <cstddef>
#include <cstdlib>

namespace nvrtest {

/// Each how many of the cases are gone through: 1 for all. Any thread.
inline std::size_t each_of_cases([[maybe_unused]] std::size_t under_addresses,
                                 [[maybe_unused]] std::size_t under_threads)
{
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
    if (std::getenv("NVR_ALL")) return 1;
#endif
#if defined(__SANITIZE_ADDRESS__)
    return under_addresses;
#elif defined(__SANITIZE_THREAD__)
    return under_threads;
#else
    return 1;
#endif
}

} // namespace nvrtest
