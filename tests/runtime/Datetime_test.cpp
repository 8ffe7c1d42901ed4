#include "runtime/Datetime.h"

#include <cstdlib>
#include <ctime>
#include <gtest/gtest.h>
#include <limits>
#include <string>

#include "runtime/Time.h"

using namespace cimple;

namespace {

std::string ascii(const Datetime& time)
{
    char text[Datetime::text_size];
    time.ascii(text);
    return text;
}

std::string pretty(const Datetime& time)
{
    char text[Datetime::text_size];
    time.pretty(text);
    return text;
}

/// Local time is Berlin's for the length of a test: an hour east of UTC, two in summer.
class DatetimeInBerlin : public ::testing::Test {
protected:
    void SetUp() override { set_zone("CET-1CEST,M3.5.0,M10.5.0/3"); }
    void TearDown() override { set_zone("UTC0"); }
    static void set_zone(const char* zone)
    {
        setenv("TZ", zone, 1);
        tzset();
    }
};

} // namespace

TEST(DatetimeText, FiveMinutesAreAnIntervalAndPrintBackTheSame)
{
    Datetime time;
    ASSERT_EQ(time.set("00000000000500.000000:000"), 1);
    EXPECT_TRUE(time.is_interval());
    EXPECT_EQ(time.usec(), 300u * 1000000);
    EXPECT_EQ(time.utc(), 0);
    EXPECT_EQ(ascii(time), "00000000000500.000000:000");
    EXPECT_EQ(pretty(time), "00000000 00 05 00.000000:000");
}

TEST(DatetimeText, EveryFieldOfAnIntervalCounts)
{
    Datetime time;
    ASSERT_EQ(time.set("00000012030405.678901:000"), 1);
    EXPECT_EQ(time.usec(), ((12u * 24 + 3) * 3600ull + 4 * 60 + 5) * 1000000 + 678901);
    EXPECT_EQ(ascii(time), "00000012030405.678901:000");
    ASSERT_EQ(time.set("99999999235959.999999:000"), 1);
    EXPECT_EQ(ascii(time), "99999999235959.999999:000");
}

TEST(DatetimeText, TheDefaultIsTheZeroInterval)
{
    EXPECT_EQ(ascii(Datetime()), "00000000000000.000000:000");
    EXPECT_TRUE(Datetime() == Datetime(0));
    EXPECT_TRUE(Datetime().is_interval());
}

TEST(DatetimeText, OtherFormsAreRefusedAndChangeNothing)
{
    const char* const refused[] = {
        "",
        "0000000000500.000000:000",   // 24
        "000000000000500.000000:000", // 26
        "20260102030405.000000+06",
        "20260102030405.000000+0600",
        "00000000000500.000000:001", // a tail other than 000
        "00000000000500.000000:00a",
        "00000000000500,000000:000",
        "0000000000050a.000000:000",
        "00000000000500.00000a:000",
        "00000000000500.000000 000",
        "-0000000000500.000000:000",
        "2026010203040 .000000+060",
        "20260102030405:000000+060",
        "20260102030405.000000+0 0",
        "20260102030405.000000*060",
        "2026010203****.******+060",
        "19690101000000.000000+000", // before the epoch
        "00000000000000.000000+000",
    };
    for (const char* text : refused) {
        Datetime time(77);
        EXPECT_EQ(time.set(text), 0) << text;
        EXPECT_TRUE(time == Datetime(77)) << text;
    }
    Datetime time(77);
    EXPECT_EQ(time.set(nullptr), 0);
    EXPECT_TRUE(time == Datetime(77));
}

TEST_F(DatetimeInBerlin, ATimestampIsReadAsLocalTimeWhateverItsOffsetSays)
{
    Datetime winter;
    ASSERT_EQ(winter.set("20260115120000.000042+060"), 1);
    EXPECT_TRUE(winter.is_timestamp());
    EXPECT_EQ(winter.utc(), 60);
    EXPECT_EQ(winter.usec(), 1768474800ull * 1000000 + 42); // 11:00 UTC
    EXPECT_EQ(ascii(winter), "20260115120000.000042+060");
    EXPECT_EQ(pretty(winter), "2026/01/15 12:00:00.000042+060");

    Datetime elsewhere;
    ASSERT_EQ(elsewhere.set("20260115120000.000042-300"), 1);
    EXPECT_EQ(elsewhere.usec(), winter.usec());
    EXPECT_EQ(elsewhere.utc(), -300);
    EXPECT_EQ(ascii(elsewhere), "20260115120000.000042-300");
    EXPECT_TRUE(elsewhere != winter);

    Datetime summer;
    ASSERT_EQ(summer.set("20260715120000.000000+060"), 1);
    EXPECT_EQ(summer.usec(), 1784109600ull * 1000000) << "daylight saving is left to the system: 10:00 UTC";
}

TEST(DatetimeValue, WritingLeavesACopyUnchanged)
{
    Datetime one(5);
    Datetime two(one);
    two.set_timestamp(6, -60);
    EXPECT_EQ(one.usec(), 5u);
    EXPECT_TRUE(one.is_interval());
    EXPECT_EQ(two.utc(), -60);
    one = two;
    EXPECT_TRUE(one == two);
    one.set_interval(6);
    EXPECT_FALSE(one == two);
    EXPECT_EQ(one.utc(), 0);
    Datetime& alias = one;
    one = alias;
    EXPECT_EQ(one.usec(), 6u);
}

TEST(DatetimeValue, NowIsATimestampOfTheSystemClock)
{
    const uint64 before = Time::now();
    const Datetime now = Datetime::now();
    const uint64 after = Time::now();
    EXPECT_TRUE(now.is_timestamp());
    EXPECT_LE(before, now.usec());
    EXPECT_LE(now.usec(), after);
    EXPECT_NEAR(double(after) / 1e6, double(std::time(nullptr)), 2.0);
}

TEST(DatetimeValue, ValuesThatOutgrowTheirFieldsStayInTheBuffer)
{
    const uint64 most = std::numeric_limits<uint64>::max();
    EXPECT_EQ(ascii(Datetime(most)), "213503982080149.551615:000");
    for (const sint32 utc : {std::numeric_limits<sint32>::min(), std::numeric_limits<sint32>::max()}) {
        EXPECT_LT(ascii(Datetime(most, utc)).size(), Datetime::text_size);
        EXPECT_LT(pretty(Datetime(most, utc)).size(), Datetime::text_size);
    }
    EXPECT_NE(ascii(Datetime(0, std::numeric_limits<sint32>::max())).find("+2147483647"), std::string::npos);
}

TEST(TimeValue, SleepTakesAtLeastItsTime)
{
    const auto start = Time::now();
    Time::sleep(20000);
    EXPECT_GE(Time::now() - start, 19000u);
    Time::sleep(0);
}
