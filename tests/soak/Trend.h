/// A straight line through points, and whether it rises or falls by more than the points' own noise.
#pragma once

#include <cstddef>
#include <utility>
#include <vector>

namespace soak {

struct Trend {
    double slope = 0;  ///< of the line of least squares
    double error = 0;  ///< its standard error
    double change = 0; ///< from the first point to the last, along the line

    /// Through points (x, y); fewer than three have the slope but no error.
    static Trend through(const std::vector<std::pair<double, double>>& points);
    /// The slope is below two standard errors, or the change not more than `tolerance`.
    bool is_level(double tolerance) const;
};

} // namespace soak
