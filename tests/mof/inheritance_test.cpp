// What a class has when its superclasses are counted in.
#include "tests/mof/mof_testing.h"

#include <gmock/gmock.h>

using namespace mof;
using mof::testing::read_good;
using ::testing::ElementsAre;

namespace {

std::vector<std::string> names(const Class& target)
{
    std::vector<std::string> result;
    for (const auto& feature : target.features)
        result.push_back(feature->name);
    return result;
}

} // namespace

TEST(Inheritance, TheSuperclassComesFirstAndAnOverrideKeepsItsPlace)
{
    const auto mof = read_good("class B { uint8 a; uint8 b; uint8 c; };"
                               "class D : B { uint8 d; [Override (\"b\")] uint8 b; uint8 e; };");
    EXPECT_THAT(names(*mof->find_class("D")), ElementsAre("a", "b", "c", "d", "e"));
    const Class& b = *mof->find_class("B");
    const Class& d = *mof->find_class("D");
    EXPECT_EQ(d.features[0], b.features[0]);
    EXPECT_NE(d.features[1], b.features[1]);
    EXPECT_EQ(d.features[1]->overridden, b.features[1].get());
    EXPECT_EQ(d.features[1]->origin, "D");
    EXPECT_EQ(d.features[2]->origin, "B");
}

TEST(Inheritance, TheOrderOfTheTextDoesNotMatter)
{
    const auto mof = read_good("class Z : Y { uint8 z; }; class Y : X { uint8 y; Z REF r; }; class X { uint8 x; };");
    EXPECT_THAT(names(*mof->find_class("Z")), ElementsAre("x", "y", "r", "z"));
    EXPECT_TRUE(mof->find_class("Z")->derives_from("x"));
    EXPECT_TRUE(mof->find_class("Z")->derives_from("Z"));
    EXPECT_FALSE(mof->find_class("X")->derives_from("Z"));
}

TEST(Inheritance, ANameThatTheSuperclassHasIsAnOverrideAlsoWithoutSayingSo)
{
    const auto mof = read_good("class B { string a; string b; }; class D : B { string A; };");
    EXPECT_THAT(names(*mof->find_class("D")), ElementsAre("A", "b"));
}

TEST(Inheritance, AKeyStaysAKey)
{
    const auto mof = read_good("class B { [Key] string a; string b; };"
                               "class C : B { [Override (\"a\")] string a; [Key, Override (\"b\")] string b; };"
                               "class D : C { [Override (\"a\")] string a; [Override (\"b\")] string b; };");
    for (const char* name : {"a", "b"})
        EXPECT_TRUE(mof->find_class("D")->find_feature(name)->is_key) << name;
    EXPECT_FALSE(mof->find_class("B")->find_feature("b")->is_key);
}

TEST(Inheritance, OtherFlagsStandOnlyWhereTheyAreSaid)
{
    const auto mof =
        read_good("class B { [Write, Required] string a; }; class D : B { [Override (\"a\")] string a; };");
    EXPECT_FALSE(mof->find_class("D")->find_feature("a")->qualifiers.has("Write"));
    EXPECT_FALSE(mof->find_class("D")->find_feature("a")->qualifiers.has("Required"));
}

TEST(Inheritance, AnOverrideWithoutADefaultKeepsTheInheritedOne)
{
    const auto mof = read_good("class B { uint16 a = 5; uint16 b = 5; uint16 c = 5; };"
                               "class C : B { uint16 a; uint16 b = 6; uint16 c = NULL; }; class D : C { uint16 a; };");
    const auto value = [&mof](const char* class_name, const char* name) {
        return mof->find_class(class_name)->find_feature(name)->default_value.items.at(0);
    };
    EXPECT_EQ(value("D", "a").magnitude, 5u);
    EXPECT_EQ(value("D", "b").magnitude, 6u);
    EXPECT_EQ(value("D", "c").kind, Literal::Kind::null);
}

TEST(Inheritance, TextsForReadersAreLookedUpThroughTheOverridden)
{
    const auto mof = read_good("class B { [Description (\"base\"), Values { \"x\" }] uint8 a; };"
                               "class C : B { [Description (\"own\")] uint8 a; }; class D : C { uint8 a; };");
    const Feature& a = *mof->find_class("D")->find_feature("a");
    EXPECT_EQ(a.inherited_qualifier("description")->value.text(), "own");
    EXPECT_EQ(a.inherited_qualifier("Values")->value.items.at(0).text, "x");
    EXPECT_EQ(a.inherited_qualifier("Units"), nullptr);
}

TEST(Inheritance, AReferenceIsNarrowedAndSpelledAsItsClass)
{
    const auto mof = read_good(
        "class E {}; class Port : E {}; class A { [Key] E REF r; }; class B : A { [Override (\"r\")] PORT REF r; };");
    EXPECT_EQ(mof->find_class("B")->find_feature("r")->target, "Port");
    EXPECT_TRUE(mof->find_class("B")->find_feature("r")->is_key);
}

TEST(Inheritance, SubclassesAreListedInOrder)
{
    const auto mof = read_good("class D2 : B {}; class B {}; class D1 : B {}; class E : D1 {};");
    std::vector<std::string> found;
    for (const Class* target : mof->subclasses("b"))
        found.push_back(target->name);
    EXPECT_THAT(found, ElementsAre("D2", "D1"));
}
