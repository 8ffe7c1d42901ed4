#include "agent/port_tables.h"

#include <gmock/gmock.h>

#include <vector>

using namespace cimple;
using ::testing::ElementsAre;

namespace {

std::vector<unsigned> list(const Array<uint16>& array)
{
    return std::vector<unsigned>(array.begin(), array.end());
}

/// The FC-4 map with one bit per type.
std::vector<unsigned> types_of(std::initializer_list<unsigned> types)
{
    uint32 map[32] = {};
    for (const unsigned type : types)
        map[4 * (type / 32) + 3 - (type % 32) / 8] |= 1u << (type % 8);
    return list(fc4_types(map));
}

struct Expected_Status {
    uint32 state;
    unsigned status;
    const char* text;
};

} // namespace

TEST(PortStatus, ShowsEachStateOfThePortWithItsWord)
{
    const Expected_Status rows[] = {
        {0, 0, "Unknown"},
        {1, 0, "Unknown"},
        {2, 2, "OK"},
        {3, 10, "Stopped"},
        {4, 1, "Other"},
        {5, 11, "InService"},
        {6, 1, "Other"},
        {7, 6, "Error"},
        {8, 32776, "InService"},
        {9, 0, "Unknown"},
        {20, 32788, "Operational. Need RESET"},
        {21, 32789, "Link down. Need RESET"},
        {22, 32790, "Disable"},
        {4294967295u, 0, "Unknown"},
    };
    for (const Expected_Status& row : rows) {
        EXPECT_EQ(port_status(row.state).status, row.status) << row.state;
        EXPECT_STREQ(port_status(row.state).text, row.text) << row.state;
    }
}

TEST(PortStatus, OfAControllerKnowsLoopbackAsInServiceAndNoStatesOfTheLibrary)
{
    EXPECT_EQ(controller_status(2).status, 2);
    EXPECT_EQ(controller_status(8).status, 11);
    EXPECT_STREQ(controller_status(8).text, "InService");
    for (const uint32 state : {0u, 1u, 9u, 20u, 21u, 22u}) {
        EXPECT_EQ(controller_status(state).status, 0) << state;
        EXPECT_STREQ(controller_status(state).text, "Unknown") << state;
    }
}

TEST(PortType, ComesWithATextOnlyWhereCIMHasNoNumber)
{
    const struct {
        uint32 from;
        unsigned to;
        const char* text;
    } rows[] = {{1, 0, nullptr},   {2, 1, "Other"},  {3, 0, nullptr},         {5, 10, nullptr},
                {6, 11, nullptr},  {7, 16, nullptr}, {8, 15, nullptr},        {9, 14, nullptr},
                {10, 18, nullptr}, {11, 0, nullptr}, {20, 1, "Private Loop"}, {21, 1, "Point to Point"}};
    for (const auto& row : rows) {
        EXPECT_EQ(port_type(row.from).to, row.to) << row.from;
        EXPECT_STREQ(port_type(row.from).text, row.text) << row.from;
    }
}

TEST(PortSpeed, IsACodeAndNotAMask)
{
    EXPECT_EQ(port_speed(1), 1000000000u);
    EXPECT_EQ(port_speed(2), 2000000000u);
    EXPECT_EQ(port_speed(4), 10000000000u);
    EXPECT_EQ(port_speed(8), 4000000000u);
    EXPECT_EQ(port_speed(16), 8000000000u);
    EXPECT_EQ(port_speed(32), 16000000000u);
    for (const uint32 code : {0u, 3u, 5u, 64u, 0x8000u})
        EXPECT_EQ(port_speed(code), 0u) << code;
}

TEST(PortSpeed, OfAMaskIsItsFastest)
{
    EXPECT_EQ(max_port_speed(0), 0u);
    EXPECT_EQ(max_port_speed(64), 0u);
    EXPECT_EQ(max_port_speed(1 | 2), 2000000000u);
    EXPECT_EQ(max_port_speed(1 | 2 | 8), 4000000000u);
    EXPECT_EQ(max_port_speed(8 | 16), 8000000000u);
    EXPECT_EQ(max_port_speed(4 | 16), 10000000000u);
    EXPECT_EQ(max_port_speed(0xFFFFFFFFu), 16000000000u);
}

TEST(ClassesOfService, FollowTheBitsAndEndInZeroForNone)
{
    EXPECT_THAT(list(classes_of_service(0x08)), ElementsAre(3u));
    EXPECT_THAT(list(classes_of_service(0x4F | 0x10)), ElementsAre(7u, 1u, 2u, 3u, 4u, 5u));
    EXPECT_THAT(list(classes_of_service(0x20)), ElementsAre(0u));
    EXPECT_THAT(list(classes_of_service(0)), ElementsAre(0u));
}

TEST(Fc4Types, NoneIsZeroAlone)
{
    EXPECT_THAT(types_of({}), ElementsAre(0u));
}

TEST(Fc4Types, NamedTypesShowTheirNumberAndNothingElse)
{
    for (const unsigned type :
         {4u, 5u, 8u, 9u, 17u, 18u, 19u, 21u, 22u, 23u, 25u, 26u, 27u, 28u, 32u, 34u, 36u, 64u, 80u, 81u, 82u, 96u})
        EXPECT_THAT(types_of({type}), ElementsAre(type)) << type;
    EXPECT_THAT(types_of({32, 8, 5}), ElementsAre(5u, 8u, 32u));
}

TEST(Fc4Types, Type88IsShownAsItselfAndAsOther)
{
    EXPECT_THAT(types_of({88}), ElementsAre(88u, 1u));
}

TEST(Fc4Types, AllOthersAreOther)
{
    for (const unsigned type :
         {1u, 6u, 7u, 10u, 16u, 20u, 29u, 31u, 33u, 35u, 37u, 63u, 65u, 83u, 97u, 128u, 224u, 255u})
        EXPECT_THAT(types_of({type}), ElementsAre(1u)) << type;
    EXPECT_THAT(types_of({8, 255}), ElementsAre(8u, 1u));
}

TEST(AccessState, TellsActiveFromTheRest)
{
    EXPECT_EQ(access_state(1), 0);
    EXPECT_EQ(access_state(2), 1);
    EXPECT_EQ(access_state(3), 2);
    EXPECT_EQ(access_state(0), 2);
}
