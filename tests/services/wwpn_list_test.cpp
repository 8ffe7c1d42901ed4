// Names seen before, and what becomes of them when memory runs out. Replaces operator new for the whole program.
#include "services/WWPN_List.h"

#include <cstdlib>
#include <new>
#include <string>

#include <gtest/gtest.h>

namespace {

long allocations_left = -1; // off below zero

} // namespace

void* operator new(std::size_t size)
{
    if (allocations_left == 0) throw std::bad_alloc();
    if (allocations_left > 0) --allocations_left;
    if (void* block = std::malloc(size ? size : 1)) return block;
    throw std::bad_alloc();
}

void operator delete(void* block) noexcept
{
    std::free(block);
}

void operator delete(void* block, std::size_t) noexcept
{
    std::free(block);
}

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

/// Adds a name with so many allocations left; gives what it wrote.
std::string add_with(WWPN_List& list, const HBA_WWN& wwn, long allocations)
{
    testing::internal::CaptureStdout();
    allocations_left = allocations;
    const bool seen = list.isDuplicateEntryInWWPNList(wwn);
    allocations_left = -1;
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
    EXPECT_EQ(add_with(list, named(2), 0), "\nERROR: isDuplicateEntryInWWPNList: realloc failed");
    EXPECT_EQ(list.size(), 0u);
    EXPECT_FALSE(list.isDuplicateEntryInWWPNList(named(1)));
    EXPECT_TRUE(list.isDuplicateEntryInWWPNList(named(1)));
}

TEST(WWPNList, IsGivenUpWithoutMemoryForAName)
{
    WWPN_List list;
    EXPECT_FALSE(list.isDuplicateEntryInWWPNList(named(1)));
    EXPECT_EQ(add_with(list, named(2), 1), "\nERROR: isDuplicateEntryInWWPNList: malloc failed");
    EXPECT_EQ(list.size(), 0u);
    EXPECT_FALSE(list.isDuplicateEntryInWWPNList(named(2)));
}
