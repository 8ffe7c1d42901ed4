#include "tests/soak/Trend.h"

#include <gmock/gmock.h>

using soak::Trend;

TEST(Trend, IsTheLineOfLeastSquares)
{
    const Trend trend = Trend::through({{0, 1}, {1, 3}, {2, 2}, {3, 5}});
    EXPECT_DOUBLE_EQ(trend.slope, 1.1);
    EXPECT_DOUBLE_EQ(trend.change, 3.3);
    EXPECT_NEAR(trend.error, 0.5196, 1e-4); // sqrt(2.7 / 2 / 5)
}

TEST(Trend, IsLevelWithinItsNoiseOrItsTolerance)
{
    EXPECT_TRUE(Trend::through({{0, 5}, {1, 9}, {2, 4}, {3, 9}, {4, 6}}).is_level(0)) << "noise";
    EXPECT_FALSE(Trend::through({{0, 5}, {1, 15}, {2, 24}, {3, 35}, {4, 46}}).is_level(10)) << "it rises";
    EXPECT_FALSE(Trend::through({{0, 46}, {1, 35}, {2, 24}, {3, 15}, {4, 5}}).is_level(10)) << "it falls";
    EXPECT_TRUE(Trend::through({{0, 5}, {1, 15}, {2, 24}, {3, 35}, {4, 46}}).is_level(50)) << "by little";
    EXPECT_TRUE(Trend::through({{0, 7}, {1, 7}, {2, 7}}).is_level(0)) << "it does not move";
}

TEST(Trend, OfTooFewPointsHasNoNoise)
{
    EXPECT_EQ(Trend::through({}).slope, 0);
    EXPECT_EQ(Trend::through({{1, 5}}).slope, 0);
    const Trend trend = Trend::through({{1, 5}, {2, 8}});
    EXPECT_EQ(trend.slope, 3);
    EXPECT_FALSE(trend.is_level(2));
}
