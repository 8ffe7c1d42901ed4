#include "foundation/AttributeBlock.h"

#include <cstring>

#include <gmock/gmock.h>

#include "foundation/ask_again.h"
#include "tests/foundation/fakes/fake_libraries.h"
#include "tests/support/log_capture.h"

using namespace cimple;
using nvrtest::Log_Capture;
using testing::ElementsAre;

namespace {

// A block of 64 bytes whose bytes count up, and a library that points wherever a test says.
struct Block : testing::Test {
    Block() : block(64)
    {
        fake::install({"lrmapi"});
        loadLibraries();
        fake::operations().RM_GetPortAttributes = [this](HBA_WWN, void* buffer, uint32_t* size) {
            start = static_cast<unsigned char*>(buffer);
            given = *size;
            for (unsigned i = 0; i < 64; i++)
                start[i] = static_cast<unsigned char>(i + 1);
            *size = 0xFFFFFFFF;
            return 0u;
        };
        block.fill(cimple::RM_GetPortAttributes, HBA_WWN{});
        answer(0, 4, 0);
    }
    ~Block() override { unloadLibraries(); }

    void answer(std::ptrdiff_t place, uint16 length, uint32 status) { answer_pointer(start + place, length, status); }
    void answer_pointer(const void* pointer, uint16 length, uint32 status)
    {
        fake::operations().RM_GetAttributeValue = [=](void*, uint16_t, uint16_t* l, uint32_t* s) {
            EXPECT_EQ(*s, 1u);
            *l = length;
            *s = status;
            return const_cast<void*>(pointer);
        };
    }

    AttributeBlock block;
    unsigned char* start = nullptr;
    uint32 given = 0;
    uint32 value = 7;
    uint32 status = 7;
    std::string text = "before";
};

const void* anywhere(std::uintptr_t address)
{
    return reinterpret_cast<const void*>(address);
}

} // namespace

TEST_F(Block, TellsTheLibraryItsSizeAndIsZeroBefore)
{
    EXPECT_EQ(given, 64u);
    AttributeBlock fresh(16);
    fake::operations().RM_GetPortStatistics = [](HBA_WWN, void* buffer, uint32_t* size) {
        const char zero[16] = {};
        EXPECT_EQ(std::memcmp(buffer, zero, *size), 0);
        return 9u;
    };
    EXPECT_EQ(fresh.fill(cimple::RM_GetPortStatistics, HBA_WWN{}), 9u);
    Local_Attribute_Block<16> local;
    EXPECT_TRUE(local.valid());
    EXPECT_EQ(local.fill(cimple::RM_GetPortStatistics, HBA_WWN{}), 9u);
}

TEST_F(Block, GivesNumbersUpToItsEnd)
{
    for (int place : {0, 1, 4, 60}) {
        answer(place, 4, 0);
        EXPECT_TRUE(block.number(1, value, status));
        uint32 expected;
        std::memcpy(&expected, start + place, 4);
        EXPECT_EQ(value, expected);
    }
}

TEST_F(Block, RefusesNumbersThatAreNotWhollyInside)
{
    for (int place : {61, 63, 64, 65, 100000, -1, -4}) {
        answer(place, 4, 0);
        EXPECT_FALSE(block.number(1, value, status)) << place;
        EXPECT_EQ(value, 0u);
    }
    for (const void* pointer : {anywhere(0), anywhere(1), anywhere(~std::uintptr_t{0}), anywhere(1u << 20)}) {
        answer_pointer(pointer, 4, 0);
        EXPECT_FALSE(block.number(1, value, status));
        uint64 wide;
        EXPECT_FALSE(block.wide(1, wide));
        EXPECT_FALSE(block.text(1, text, status));
    }
}

TEST_F(Block, RefusesNumbersWithAStatus)
{
    answer(0, 4, 64);
    EXPECT_FALSE(block.number(1, value, status));
    EXPECT_EQ(status, 64u);
    EXPECT_EQ(value, 0u);
}

TEST_F(Block, LogsNumbersByName)
{
    Log_Capture log;
    EXPECT_TRUE(block.number(1, "_DeviceID", value));
    answer(0, 4, 5);
    EXPECT_FALSE(block.number(1, "_DeviceID", value));
    EXPECT_EQ(value, 0u);
    EXPECT_THAT(log.words(),
                ElementsAre("_DeviceID: [ 67305985 ]", "ERROR: RM_GetHBAAttributeValue HA__DeviceID call failed (5)"));
}

TEST_F(Block, GivesTextsUpToTheirLengthOrZeroByteOrItsEnd)
{
    std::memcpy(start, "firmware", 9);
    answer(0, 4, 0);
    EXPECT_TRUE(block.text(1, text, status));
    EXPECT_EQ(text, "firm");
    answer(0, 60, 0);
    EXPECT_TRUE(block.text(1, text, status));
    EXPECT_EQ(text, "firmware");
    std::memset(start, 'x', 64);
    answer(60, 0xFFFF, 0);
    EXPECT_TRUE(block.text(1, text, status));
    EXPECT_EQ(text, "xxxx");
    answer(0, 0, 0);
    EXPECT_TRUE(block.text(1, text, status));
    EXPECT_EQ(text, "");
    answer(0, 4, 1);
    text = "before";
    EXPECT_FALSE(block.text(1, text, status));
    EXPECT_EQ(text, "");
}

TEST_F(Block, CutsTextsAt255Bytes)
{
    AttributeBlock large(2864);
    fake::operations().RM_GetHBAAttributes = [](HBA_WWN, void* buffer, uint32_t* size) {
        std::memset(buffer, 'x', *size);
        fake::operations().RM_GetAttributeValue = [=](void*, uint16_t, uint16_t* length, uint32_t* status) {
            *length = 1000;
            *status = 0;
            return buffer;
        };
        return 0u;
    };
    EXPECT_EQ(large.fill(cimple::RM_GetHBAAttributes, HBA_WWN{}), 0u);
    EXPECT_TRUE(large.text(1, text, status));
    EXPECT_EQ(text, std::string(255, 'x'));
}

TEST_F(Block, LogsTextsAndAddressesByName)
{
    Log_Capture log;
    std::memcpy(start, "abc", 4);
    EXPECT_TRUE(block.text(1, "_KERNEL_VERSION", text));
    EXPECT_TRUE(block.address(1, "_IEEE_ADDRESS", text));
    EXPECT_EQ(text, "61:62:63:00:05:06");
    answer(0, 4, 5);
    EXPECT_FALSE(block.text(1, "_KERNEL_VERSION", text));
    EXPECT_FALSE(block.address(1, "_IEEE_ADDRESS", text));
    EXPECT_EQ(text, "");
    answer(59, 6, 0);
    EXPECT_FALSE(block.address(1, "_IEEE_ADDRESS", text));
    EXPECT_THAT(log.words(), ElementsAre("_KERNEL_VERSION : [ abc ]", "_IEEE_ADDRESS : [ 61:62:63:00:05:06 ]",
                                         "ERROR: _KERNEL_VERSION: RM_GetHBAAttributes call failed (5)",
                                         "ERROR: _IEEE_ADDRESS: RM_GetHBAAttributes call failed (5)",
                                         "ERROR: _IEEE_ADDRESS: RM_GetHBAAttributes call failed (0)"));
}

TEST_F(Block, GivesWideNumbersWhateverTheStatus)
{
    uint64 wide = 0;
    answer(56, 8, 99);
    EXPECT_TRUE(block.wide(1, wide));
    EXPECT_EQ(wide, 0x403F3E3D3C3B3A39u);
    answer(57, 8, 0);
    EXPECT_FALSE(block.wide(1, wide));
}

namespace {

struct Record {
    uint32 value;
};

} // namespace

TEST(AskAgain, TakesWhatTheFirstCallGives)
{
    std::vector<Record> records;
    const Asked asked = ask_again(records, 4, 100, [](Record* room, uint32* count) {
        EXPECT_EQ(*count, 4u);
        room[0].value = 7;
        *count = 2;
        return 0u;
    });
    EXPECT_EQ(asked.status, 0u);
    EXPECT_EQ(asked.calls, 1);
    ASSERT_EQ(records.size(), 2u);
    EXPECT_EQ(records[0].value, 7u);
    EXPECT_EQ(records[1].value, 0u);
}

TEST(AskAgain, AsksOnceMoreWithTheRoomThatIsNamed)
{
    for (uint32 more : {7u, 191u}) {
        std::vector<Record> records;
        const Asked asked = ask_again(records, 1, 100, [&](Record* room, uint32* count) {
            if (*count == 1) {
                *count = 3;
                return more;
            }
            EXPECT_EQ(*count, 3u);
            room[2].value = 9;
            return 0u;
        });
        EXPECT_EQ(asked.status, 0u);
        EXPECT_EQ(asked.calls, 2);
        ASSERT_EQ(records.size(), 3u);
        EXPECT_EQ(records[2].value, 9u);
    }
}

TEST(AskAgain, GivesUpAfterTheSecondCallOrAnotherStatus)
{
    std::vector<Record> records(1);
    Asked asked = ask_again(records, 1, 100, [](Record*, uint32*) { return 7u; });
    EXPECT_EQ(asked.status, 7u);
    EXPECT_EQ(asked.calls, 2);
    EXPECT_TRUE(records.empty());
    asked = ask_again(records, 1, 100, [](Record*, uint32*) { return 1u; });
    EXPECT_EQ(asked.status, 1u);
    EXPECT_EQ(asked.calls, 1);
}

TEST(AskAgain, BelievesNoCount)
{
    std::vector<Record> records;
    Asked asked = ask_again(records, 2, 100, [](Record*, uint32* count) {
        *count = 0xFFFFFFFF;
        return 0u;
    });
    EXPECT_EQ(records.size(), 2u) << "no more than there was room for";
    for (const uint32 need : {101u, 0xFFFFFFFFu}) {
        asked = ask_again(records, 2, 100, [need](Record*, uint32* count) {
            *count = need;
            return 7u;
        });
        EXPECT_EQ(asked.status, 7u);
        EXPECT_EQ(asked.calls, 1) << "a need beyond the limit is not asked for";
        EXPECT_TRUE(records.empty());
    }
    asked = ask_again(records, 2, 100, [](Record*, uint32* count) {
        const bool first = *count == 2;
        *count = 100;
        return first ? 7u : 0u;
    });
    EXPECT_EQ(records.size(), 100u);
    asked = ask_again(records, 2, 100, [](Record*, uint32* count) {
        const bool first = *count == 2;
        *count = 0;
        return first ? 7u : 0u;
    });
    EXPECT_EQ(asked.status, 0u);
    EXPECT_TRUE(records.empty());
}
