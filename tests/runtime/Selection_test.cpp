#include "runtime/Selection.h"

#include <thread>

#include <gtest/gtest.h>

using namespace cimple;

namespace {

const Selection* found(const void* data)
{
    return Selection::of({nullptr, const_cast<void*>(data)});
}

TEST(Selections, AreFoundByTheirHandlerWhileTheyLive)
{
    int outer_data = 0, inner_data = 0;
    EXPECT_EQ(found(&outer_data), nullptr);
    {
        const Selection outer(&outer_data, Selection::Values::keys);
        {
            const Selection inner(&inner_data, Selection::Values::all);
            EXPECT_EQ(found(&inner_data), &inner);
            EXPECT_EQ(found(&outer_data), &outer) << "a request inside a request";
        }
        EXPECT_EQ(found(&inner_data), nullptr);
        EXPECT_EQ(found(&outer_data), &outer);
        EXPECT_EQ(outer.values(), Selection::Values::keys);
    }
    EXPECT_EQ(found(&outer_data), nullptr);
}

TEST(Selections, BelongToTheirThread)
{
    int data = 0;
    const Selection selection(&data, Selection::Values::all);
    std::thread([&] { EXPECT_EQ(found(&data), nullptr); }).join();
}

TEST(Selections, WantAllUnlessTheySayOtherwise)
{
    int data = 0;
    Selection selection(&data, Selection::Values::all);
    EXPECT_EQ(selection.key(), nullptr);
    EXPECT_TRUE(selection.wants(nullptr));
    selection.asked_all();
}

} // namespace
