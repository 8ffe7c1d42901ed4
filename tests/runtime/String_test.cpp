#include "runtime/String.h"

#include <gtest/gtest.h>
#include <string>
#include <thread>
#include <vector>

using namespace cimple;

TEST(StringValue, AppendingToACopyLeavesTheOtherUnchanged)
{
    String one("wwn");
    String two(one);
    two.append("-2");
    EXPECT_STREQ(one.c_str(), "wwn");
    EXPECT_STREQ(two.c_str(), "wwn-2");
    two = one;
    EXPECT_EQ(two.c_str(), one.c_str()) << "a copy shares the bytes";
    one.append('x');
    EXPECT_STREQ(two.c_str(), "wwn");
    EXPECT_STREQ(one.c_str(), "wwnx");
}

TEST(StringValue, EmptyStringsShareOneRep)
{
    const String a;
    const String b("");
    const String c(nullptr, 0);
    String d("something");
    d.clear();
    EXPECT_EQ(a.c_str(), b.c_str());
    EXPECT_EQ(a.c_str(), c.c_str());
    EXPECT_EQ(a.c_str(), d.c_str());
    EXPECT_EQ(a.size(), 0u);
    EXPECT_STREQ(a.c_str(), "");
    d.append('x');
    EXPECT_STREQ(a.c_str(), "") << "writing to an empty string writes to a rep of its own";
}

TEST(StringValue, CapacityIsAPowerOfTwoOfAtLeast32)
{
    EXPECT_EQ(String().capacity(), 32u);
    EXPECT_EQ(String("x").capacity(), 32u);
    EXPECT_EQ(String(std::string(32, 'x').c_str()).capacity(), 32u);
    EXPECT_EQ(String(std::string(33, 'x').c_str()).capacity(), 64u);
    EXPECT_EQ(String(std::string(1000, 'x').c_str()).capacity(), 1024u);
}

TEST(StringValue, NullTextCountsAsEmpty)
{
    String text(static_cast<const char*>(nullptr));
    EXPECT_TRUE(text.empty());
    text = "x";
    text = static_cast<const char*>(nullptr);
    EXPECT_TRUE(text.empty());
    text.append(static_cast<const char*>(nullptr));
    EXPECT_TRUE(text == static_cast<const char*>(nullptr));
    EXPECT_FALSE(String("x") == static_cast<const char*>(nullptr));
}

TEST(StringValue, GrowsByteByByteToAnyLength)
{
    String text;
    std::string expected;
    for (int i = 0; i < 3000; ++i) {
        text.append(static_cast<char>('a' + i % 26));
        expected += static_cast<char>('a' + i % 26);
        ASSERT_EQ(text.size(), expected.size());
        ASSERT_EQ(text.c_str()[text.size()], '\0');
    }
    EXPECT_EQ(expected, text.c_str());
}

TEST(StringValue, PartsOfItselfCanBeAppendedAndAssigned)
{
    String text("0123456789abcdef0123456789abcdef");
    text.append(text.c_str() + 16, 16);
    EXPECT_STREQ(text.c_str(), "0123456789abcdef0123456789abcdef0123456789abcdef");
    text.append(text);
    EXPECT_EQ(text.size(), 96u);
    text.append(text.c_str(), 4);
    EXPECT_STREQ(text.c_str() + 96, "0123");
    text = text.c_str() + 96;
    EXPECT_STREQ(text.c_str(), "0123");
    String shared(text);
    text.assign(text.c_str() + 1, 2);
    EXPECT_STREQ(text.c_str(), "12");
    EXPECT_STREQ(shared.c_str(), "0123");
    text.reserve(100);
    EXPECT_STREQ(text.c_str(), "12");
    EXPECT_EQ(text.capacity(), 128u);
    String& alias = text;
    text = alias;
    EXPECT_STREQ(text.c_str(), "12");
}

TEST(StringValue, ReserveTakesAShareOfItsOwn)
{
    String one("text");
    String two(one);
    two.reserve(0);
    EXPECT_NE(one.c_str(), two.c_str());
    EXPECT_STREQ(two.c_str(), "text");
}

TEST(StringValue, ZeroBytesAreKeptAndCompared)
{
    const String a("a\0b", 3);
    const String b("a\0c", 3);
    EXPECT_EQ(a.size(), 3u);
    EXPECT_TRUE(a != b);
    EXPECT_FALSE(a == "a");
    EXPECT_TRUE(a == String("a\0b", 3));
}

TEST(StringValue, MovingLeavesAnEmptyString)
{
    String from("text");
    String to(std::move(from));
    EXPECT_STREQ(to.c_str(), "text");
    String other;
    other = std::move(to);
    EXPECT_STREQ(other.c_str(), "text");
    EXPECT_TRUE(noexcept(String(other)));
    EXPECT_TRUE(noexcept(other = to));
}

TEST(StringValue, EqualityMindsCaseAndEqualiDoesNot)
{
    EXPECT_FALSE(String("Name") == "name");
    EXPECT_TRUE("name" == String("name"));
    EXPECT_TRUE(equali("Name", "nAME"));
    EXPECT_TRUE(equali(String("Name"), String("NAME")));
    EXPECT_TRUE(equali(String("Name"), "NAME"));
    EXPECT_TRUE(equali("", ""));
    EXPECT_FALSE(equali("Name", "Names"));
    EXPECT_FALSE(equali("Names", "Name"));
    EXPECT_FALSE(equali("Name", ""));
    EXPECT_FALSE(equali("", "Name"));
    EXPECT_FALSE(equali("[", "{")) << "only letters have a case";
    EXPECT_FALSE(equali("\xC4", "\xE4")) << "only ASCII letters have a case";
    EXPECT_FALSE(equali(static_cast<const char*>(nullptr), static_cast<const char*>(nullptr)));
    EXPECT_FALSE(equali("x", static_cast<const char*>(nullptr)));
    EXPECT_FALSE(equali(String("a\0b", 3), String("a\0cd", 4)));
}

TEST(StringValue, TheLowerCasingTableHoldsAllBytes)
{
    for (int c = 0; c < 256; ++c)
        EXPECT_EQ(lower_case[c], c >= 'A' && c <= 'Z' ? c + 32 : c);
}

TEST(StringValue, ThreadsMayShareOneRep)
{
    const String shared("a text that many threads copy, write to and drop");
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t)
        threads.emplace_back([mine = shared] {
            for (int i = 0; i < 2000; ++i) {
                String copy(mine);
                String empty;
                copy.append('x');
                empty = mine;
                ASSERT_EQ(copy.size(), mine.size() + 1);
                ASSERT_EQ(empty.c_str(), mine.c_str());
            }
        });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_STREQ(shared.c_str(), "a text that many threads copy, write to and drop");
}
