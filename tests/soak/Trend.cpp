#include "tests/soak/Trend.h"

#include <cmath>

namespace soak {

Trend Trend::through(const std::vector<std::pair<double, double>>& points)
{
    Trend trend;
    const auto count = static_cast<double>(points.size());
    double mean_x = 0, mean_y = 0;
    for (const auto& [x, y] : points) {
        mean_x += x / count;
        mean_y += y / count;
    }
    double spread = 0, together = 0;
    for (const auto& [x, y] : points) {
        spread += (x - mean_x) * (x - mean_x);
        together += (x - mean_x) * (y - mean_y);
    }
    if (spread == 0) return trend;
    trend.slope = together / spread;
    trend.change = trend.slope * (points.back().first - points.front().first);
    if (points.size() < 3) return trend;
    double left = 0;
    for (const auto& [x, y] : points) {
        const double off = y - mean_y - trend.slope * (x - mean_x);
        left += off * off;
    }
    trend.error = std::sqrt(left / (count - 2) / spread);
    return trend;
}

bool Trend::is_level(double tolerance) const
{
    return std::fabs(slope) < 2 * error || std::fabs(change) <= tolerance;
}

} // namespace soak
