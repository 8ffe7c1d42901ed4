#include "runtime/strings.h"

#include <gtest/gtest.h>
#include <limits>
#include <string>

#include "tests/runtime/Comma_Locale.h"

using namespace cimple;

namespace {

template <class T>
void expect_read(int (*read)(const char*, T&), const char* text, T expected)
{
    T value = T(1);
    EXPECT_EQ(read(text, value), 0) << text;
    EXPECT_EQ(value, expected) << text;
}

template <class T>
void expect_refused(int (*read)(const char*, T&), const char* text)
{
    T value = T(1);
    EXPECT_EQ(read(text, value), -1) << text;
    EXPECT_EQ(value, T(1)) << text << " must leave the value alone";
}

std::string text_of(uint64 value)
{
    Integer_Buffer buffer;
    std::size_t size = 0;
    const char* text = uint64_to_str(buffer, value, size);
    EXPECT_EQ(size, std::string(text).size());
    return text;
}

std::string signed_text_of(sint64 value)
{
    Integer_Buffer buffer;
    std::size_t size = 0;
    const char* text = sint64_to_str(buffer, value, size);
    EXPECT_EQ(size, std::string(text).size());
    return text;
}

} // namespace

TEST(IntegerText, DecimalIsReadUpToTheLimitOfEachType)
{
    expect_read<uint8>(str_to_uint8, "255", 255);
    expect_refused<uint8>(str_to_uint8, "256");
    expect_read<uint16>(str_to_uint16, "65535", 65535);
    expect_refused<uint16>(str_to_uint16, "65536");
    expect_read<uint32>(str_to_uint32, "4294967295", 4294967295u);
    expect_refused<uint32>(str_to_uint32, "4294967296");
    expect_read<uint64>(str_to_uint64, "18446744073709551615", 18446744073709551615u);
    expect_refused<uint64>(str_to_uint64, "18446744073709551616");
    expect_refused<uint64>(str_to_uint64, "99999999999999999999999999");
    expect_read<sint8>(str_to_sint8, "-128", -128);
    expect_refused<sint8>(str_to_sint8, "-129");
    expect_read<sint8>(str_to_sint8, "+127", 127);
    expect_refused<sint8>(str_to_sint8, "128");
    expect_read<sint16>(str_to_sint16, "-32768", -32768);
    expect_refused<sint16>(str_to_sint16, "32768");
    expect_read<sint32>(str_to_sint32, "-2147483648", std::numeric_limits<sint32>::min());
    expect_refused<sint32>(str_to_sint32, "2147483648");
    expect_read<sint64>(str_to_sint64, "-9223372036854775808", std::numeric_limits<sint64>::min());
    expect_read<sint64>(str_to_sint64, "9223372036854775807", std::numeric_limits<sint64>::max());
    expect_refused<sint64>(str_to_sint64, "9223372036854775808");
    expect_refused<sint64>(str_to_sint64, "-9223372036854775809");
    expect_read<uint32>(str_to_uint32, "0007", 7);
}

TEST(IntegerText, HexadecimalHasCapitalsAndUpTo16Digits)
{
    expect_read<uint64>(str_to_uint64, "0xFFFFFFFFFFFFFFFF", 18446744073709551615u);
    expect_read<uint64>(str_to_uint64, "0X10000000C9A00001", 0x10000000C9A00001u);
    expect_refused<uint64>(str_to_uint64, "0x00000000000000001"); // 17 digits
    expect_refused<uint64>(str_to_uint64, "0x");
    expect_refused<uint64>(str_to_uint64, "0X");
    expect_refused<uint64>(str_to_uint64, "0xff");
    expect_refused<uint64>(str_to_uint64, "0xG");
    expect_refused<uint64>(str_to_uint64, "FF");
    expect_read<uint8>(str_to_uint8, "0xFF", 255);
    expect_refused<uint8>(str_to_uint8, "0x100");
    expect_read<sint8>(str_to_sint8, "-0x80", -128);
}

TEST(IntegerText, OtherTextsAreRefused)
{
    for (const char* text : {"", " 1", "1 ", "+1", "-1", "1.0", "1a", "+", "one"})
        expect_refused<uint64>(str_to_uint64, text);
    for (const char* text : {"", "+", "-", "--1", "+-1", "- 1", "1-"})
        expect_refused<sint64>(str_to_sint64, text);
    expect_refused<uint64>(str_to_uint64, nullptr);
    expect_refused<sint64>(str_to_sint64, nullptr);
}

TEST(RealText, AStrictFormIsRead)
{
    expect_read<real64>(str_to_real64, "1.5", 1.5);
    expect_read<real64>(str_to_real64, "-0.25", -0.25);
    expect_read<real64>(str_to_real64, "+1.0e3", 1000.0);
    expect_read<real64>(str_to_real64, "1.0E-2", 0.01);
    expect_read<real32>(str_to_real32, "0.5", 0.5f);
    for (const char* text : {"", "1", ".5", "1.", "1.5e", "1.5e+", "1.5 ", " 1.5", "1,5", "inf", "nan", "0x1.8p1",
                             "1.5f", "--1.5", "1.5.5"})
        expect_refused<real64>(str_to_real64, text);
    expect_refused<real64>(str_to_real64, nullptr);
    expect_refused<real64>(str_to_real64, "1.0e999");
    expect_refused<real32>(str_to_real32, "1.0e39");
    expect_refused<real32>(str_to_real32, "-1.0e39");
}

TEST(RealText, TheLocaleOfTheServerDoesNotMatter)
{
    const Comma_Locale comma;
    ASSERT_EQ(std::strtod("1.5", nullptr), 1.0) << "the locale is in force";
    expect_read<real64>(str_to_real64, "1.5", 1.5);
    expect_refused<real64>(str_to_real64, "1,5");
}

TEST(BooleanText, TheTwoWordsInAnyCase)
{
    expect_read<boolean>(str_to_boolean, "TRUE", true);
    boolean value = true;
    EXPECT_EQ(str_to_boolean("fAlse", value), 0);
    EXPECT_FALSE(value);
    for (const char* text : {"", "1", "0", "yes", "true ", "tru", static_cast<const char*>(nullptr)}) {
        value = true;
        EXPECT_EQ(str_to_boolean(text, value), -1);
        EXPECT_TRUE(value);
    }
}

TEST(IntegerToText, SmallAndLargeNumbersReadTheSame)
{
    for (uint64 value = 0; value < 300; ++value)
        EXPECT_EQ(text_of(value), std::to_string(value));
    EXPECT_EQ(text_of(std::numeric_limits<uint64>::max()), "18446744073709551615");
    for (sint64 value = -300; value < 300; ++value)
        EXPECT_EQ(signed_text_of(value), std::to_string(value));
    EXPECT_EQ(signed_text_of(std::numeric_limits<sint64>::min()), "-9223372036854775808");
    EXPECT_EQ(signed_text_of(std::numeric_limits<sint64>::max()), "9223372036854775807");
}

TEST(IntegerToText, ValuesBelow128ComeFromTheTable)
{
    Integer_Buffer buffer;
    std::size_t size;
    const char* const first = uint64_to_str(buffer, 127, size);
    EXPECT_EQ(uint64_to_str(buffer, 127, size), first);
    EXPECT_TRUE(first < buffer || first >= buffer + sizeof(buffer));
    const char* const large = uint64_to_str(buffer, 128, size);
    EXPECT_TRUE(large >= buffer && large < buffer + sizeof(buffer));
}

TEST(IntegerText, WhatIsWrittenIsReadBack)
{
    uint64 value = 0x9E3779B97F4A7C15u;
    for (int i = 0; i < 2000; ++i) {
        value ^= value << 13;
        value ^= value >> 7;
        value ^= value << 17;
        const uint64 some = value >> (i % 64);
        expect_read<uint64>(str_to_uint64, text_of(some).c_str(), some);
        expect_read<sint64>(str_to_sint64, signed_text_of(static_cast<sint64>(some)).c_str(),
                            static_cast<sint64>(some));
    }
}
