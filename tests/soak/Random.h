/// Numbers for one thread, the same in each run of the same seed.
#pragma once

#include <cstddef>
#include <iterator>
#include <random>

namespace soak {

class Random {
public:
    explicit Random(std::uint64_t seed) : m_source(seed) {}

    /// From 0 to `bound` - 1; `bound` is above 0.
    std::size_t below(std::size_t bound) { return m_source() % bound; }
    bool chance(std::size_t percent) { return below(100) < percent; }
    /// An element of what has some.
    template <class Range>
    auto& pick(Range& range)
    {
        return *std::next(std::begin(range), static_cast<std::ptrdiff_t>(below(std::size(range))));
    }

private:
    std::mt19937_64 m_source;
};

} // namespace soak
