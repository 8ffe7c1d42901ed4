#include "runtime/associations.h"

#include <gtest/gtest.h>

#include "tests/runtime/Test_Classes.h"

using namespace cimple;

namespace {

/// Left ("a", 1) linked to Right ("b", 2).
class AssociationEnds : public ::testing::Test {
protected:
    AssociationEnds() : link(create_as<Test_Link>()), left(make_keyed("a", 1)), right(make_keyed<Test_Thing>("b", 2))
    {
        link->Left = clone_as(left.get());
        link->Right = clone_as(right.get());
    }

    int associators(const Instance* source, const char* result_class, const char* role, const char* result_role)
    {
        found.clear();
        return get_associators(source, link.get(), result_class, role, result_role, found);
    }

    Ref<Test_Link> link;
    Ref<Test_Base> left;
    Ref<Test_Thing> right;
    Array<Instance*> found;
};

} // namespace

TEST_F(AssociationEnds, ASourceIsHeldUnderItsRoleInAnyCase)
{
    EXPECT_TRUE(ref_of(left.get(), link.get(), ""));
    EXPECT_TRUE(ref_of(left.get(), link.get(), "lEFT"));
    EXPECT_FALSE(ref_of(left.get(), link.get(), "Right")) << "the far end's name is another role";
    EXPECT_TRUE(ref_of(right.get(), link.get(), "Right"));
    EXPECT_FALSE(ref_of(right.get(), link.get(), "Left"));
    EXPECT_FALSE(ref_of(nullptr, link.get(), ""));
    EXPECT_FALSE(ref_of(left.get(), nullptr, ""));
}

TEST_F(AssociationEnds, ASourceThatNoEndHoldsHasNoReferences)
{
    const Ref<Test_Base> other(make_keyed("c", 3));
    EXPECT_FALSE(ref_of(other.get(), link.get(), ""));
    EXPECT_EQ(associators(other.get(), "", "", ""), -1);
    EXPECT_EQ(found.size(), 0u);
}

TEST_F(AssociationEnds, ASubclassOfTheTargetMayBeTheSourceButNoSuperclass)
{
    const Ref<Test_Thing> thing(make_keyed<Test_Thing>("a", 1));
    EXPECT_TRUE(ref_of(thing.get(), link.get(), "Left"));
    const Ref<Test_Base> base(make_keyed("b", 2));
    EXPECT_FALSE(ref_of(base.get(), link.get(), "Right")) << "the target class is a subclass of the source's";
}

TEST_F(AssociationEnds, TheFarEndIsTheAssociator)
{
    EXPECT_EQ(associators(left.get(), "", "", ""), 1);
    ASSERT_EQ(found.size(), 1u);
    EXPECT_EQ(found[0], link->Right);
    EXPECT_EQ(associators(left.get(), "", "LEFT", "RIGHT"), 1);
    EXPECT_EQ(associators(right.get(), "", "", ""), 1);
    EXPECT_EQ(found[0], link->Left);
    EXPECT_EQ(link->Left->refs, 1u) << "the result is borrowed";
}

TEST_F(AssociationEnds, RolesFilterBothEnds)
{
    EXPECT_EQ(associators(left.get(), "", "Right", ""), -1) << "no near end of that role";
    EXPECT_EQ(associators(left.get(), "", "", "Left"), 0) << "the far end has another role";
    EXPECT_EQ(associators(left.get(), "", "", "Word"), 0);
}

TEST_F(AssociationEnds, AResultClassPassesItsSubclassesOnly)
{
    EXPECT_EQ(associators(left.get(), "test_base", "", ""), 1);
    EXPECT_EQ(associators(left.get(), "Test_Thing", "", ""), 1);
    EXPECT_EQ(associators(right.get(), "Test_Thing", "", ""), 0);
    EXPECT_EQ(associators(left.get(), "Other_Base", "", ""), 0);
}

TEST_F(AssociationEnds, TwoEndsThatHoldTheSourceGiveNothing)
{
    unref(link->Left);
    link->Left = make_keyed("b", 2);
    EXPECT_EQ(associators(right.get(), "", "", ""), 0);
    EXPECT_TRUE(ref_of(right.get(), link.get(), "Left"));
    EXPECT_TRUE(ref_of(right.get(), link.get(), "Right"));
}

TEST_F(AssociationEnds, NullEndsAndReferenceArraysAreNoEnds)
{
    unref(link->Right);
    link->Right = nullptr;
    EXPECT_EQ(associators(left.get(), "", "", ""), 0);
    EXPECT_EQ(associators(right.get(), "", "", ""), -1);
    EXPECT_EQ(associators(nullptr, "", "", ""), -1);
    const Ref<Test_Thing> thing(create_as<Test_Thing>());
    thing->Peers.value.append(make_keyed("a", 1));
    EXPECT_FALSE(ref_of(left.get(), thing.get(), ""));
}

TEST_F(AssociationEnds, WhatWasFoundBeforeStays)
{
    Instance* const before = left.get();
    found.append(before);
    EXPECT_EQ(get_associators(left.get(), link.get(), "", "", "", found), 1);
    ASSERT_EQ(found.size(), 2u);
    EXPECT_EQ(found[0], before);
}
