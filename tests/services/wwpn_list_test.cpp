// Names seen before, and what becomes of them when memory runs out.
#include "services/WWPN_List.h"

#include <string>

#include <gtest/gtest.h>

#include "tests/support/short_memory.h"

using namespace cimple;

namespace {

HBA_WWN named(unsigned number)
{
    HBA_WWN wwn = {};
    wwn.wwn[0] = 0x10;
    wwn.wwn[6] = static_cast<HBA_UINT8>(number >> 8);
    wwn.wwn[7] = static_cast<HBA_UINT8>(number);
    return wwn;
}

/// Adds a name without memory for the allocation of that number; gives what it wrote.
std::string add_without(WWPN_List& list, const HBA_WWN& wwn, long allocation)
{
    testing::internal::CaptureStdout();
    nvrtest::refuse_allocation(allocation);
    const bool seen = list.isDuplicateEntryInWWPNList(wwn);
    EXPECT_TRUE(nvrtest::forget_refusal());
    EXPECT_FALSE(seen);
    return testing::internal::GetCapturedStdout();
}

} // namespace

TEST(WWPNList, KnowsWhatItHasSeen)
{
    WWPN_List list;
    for (unsigned i = 0; i < 1024; i++)
        EXPECT_FALSE(list.isDuplicateEntryInWWPNList(named(i)));
    EXPECT_EQ(list.size(), 1024u);
    for (unsigned i = 0; i < 1024; i++)
        EXPECT_TRUE(list.isDuplicateEntryInWWPNList(named(i)));
    EXPECT_EQ(list.size(), 1024u);
}

TEST(WWPNList, IsGivenUpWithoutMemoryForItsSlots)
{
    WWPN_List list;
    EXPECT_FALSE(list.isDuplicateEntryInWWPNList(named(1)));
    EXPECT_EQ(add_without(list, named(2), 1), "\nERROR: isDuplicateEntryInWWPNList: realloc failed");
    EXPECT_EQ(list.size(), 0u);
    EXPECT_FALSE(list.isDuplicateEntryInWWPNList(named(1)));
    EXPECT_TRUE(list.isDuplicateEntryInWWPNList(named(1)));
}

TEST(WWPNList, IsGivenUpWithoutMemoryForAName)
{
    WWPN_List list;
    EXPECT_FALSE(list.isDuplicateEntryInWWPNList(named(1)));
    EXPECT_EQ(add_without(list, named(2), 2), "\nERROR: isDuplicateEntryInWWPNList: malloc failed");
    EXPECT_EQ(list.size(), 0u);
    EXPECT_FALSE(list.isDuplicateEntryInWWPNList(named(2)));
}
