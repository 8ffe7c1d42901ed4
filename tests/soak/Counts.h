/// What has been done, counted by all threads.
#pragma once

#include <atomic>
#include <cstdint>

namespace soak {

struct Counts {
    std::atomic<std::uint64_t> requests{0};
    std::atomic<std::uint64_t> errors{0};  ///< requests of another status than OK
    std::atomic<std::uint64_t> faults{0};  ///< library calls that were made to fail, lie, throw or take long
    std::atomic<std::uint64_t> alerts{0};  ///< indications that were delivered
    std::atomic<std::uint64_t> unloads{0}; ///< last clean-ups
};

} // namespace soak
