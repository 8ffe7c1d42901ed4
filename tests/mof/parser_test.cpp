// What well-formed text means.
#include "tests/mof/mof_testing.h"

#include <gmock/gmock.h>

using namespace mof;
using mof::testing::read_good;
using ::testing::ElementsAre;

namespace {

const Feature& feature(const Repository& repository, const char* class_name, const char* name)
{
    return *repository.find_class(class_name)->find_feature(name);
}

} // namespace

TEST(Mof, ClassesAreFoundByNameInAnyCase)
{
    const auto mof = read_good("class Base {}; class Derived : BASE { uint8 a; };");
    ASSERT_NE(mof->find_class("dERIVED"), nullptr);
    EXPECT_EQ(mof->find_class("DERIVED")->name, "Derived");
    EXPECT_EQ(mof->find_class("derived")->super, mof->find_class("base"));
    EXPECT_EQ(mof->find_class("derived")->super_name, "Base");
    EXPECT_EQ(mof->find_class("other"), nullptr);
    EXPECT_EQ(mof->classes().size(), 2u);
}

TEST(Mof, EveryTypeHasItsNumber)
{
    const char* const names[] = {"boolean", "uint8",  "sint8",  "uint16", "sint16", "uint32", "sint32",
                                 "uint64",  "sint64", "real32", "real64", "char16", "string", "datetime"};
    std::string text = "class C {";
    for (const char* name : names)
        text += std::string(" ") + name + " p_" + name + ";";
    const auto mof = read_good(text + "};");
    const auto& features = mof->find_class("C")->features;
    ASSERT_EQ(features.size(), 14u);
    for (unsigned i = 0; i < 14; ++i) {
        EXPECT_EQ(static_cast<unsigned>(features[i]->type), i);
        EXPECT_STREQ(type_name(features[i]->type), names[i]);
    }
}

TEST(Mof, TypesAndKeywordsComeInAnyCase)
{
    const auto mof = read_good("CLASS C { UInt16 a = 3; D REF d; Boolean b = TRUE; }; Class D {};");
    EXPECT_EQ(feature(*mof, "C", "a").type, Type::uint16);
    EXPECT_EQ(feature(*mof, "C", "d").type, Type::reference);
    EXPECT_TRUE(feature(*mof, "C", "b").default_value.items[0].boolean);
}

TEST(Mof, ArraysHaveALengthOrNone)
{
    const auto mof = read_good("class C { string a; string b[]; string c[7]; C REF d[]; };");
    EXPECT_EQ(feature(*mof, "C", "a").subscript, 0);
    EXPECT_EQ(feature(*mof, "C", "b").subscript, -1);
    EXPECT_EQ(feature(*mof, "C", "c").subscript, 7);
    EXPECT_EQ(feature(*mof, "C", "d").subscript, -1);
}

TEST(Mof, NumbersAreReadInAllFourBases)
{
    const auto mof =
        read_good("class C { uint32 d = 17; uint32 h = 0xfF; uint32 o = 017; uint32 b = 1011B; sint8 n = -128;"
                  " uint64 m = 18446744073709551615; sint64 l = -9223372036854775808; };");
    const auto value = [&mof](const char* name) { return feature(*mof, "C", name).default_value.items[0]; };
    EXPECT_EQ(value("d").magnitude, 17u);
    EXPECT_EQ(value("h").magnitude, 255u);
    EXPECT_EQ(value("o").magnitude, 15u);
    EXPECT_EQ(value("b").magnitude, 11u);
    EXPECT_TRUE(value("n").negative);
    EXPECT_EQ(value("n").magnitude, 128u);
    EXPECT_EQ(value("m").magnitude, UINT64_MAX);
    EXPECT_EQ(value("l").magnitude, std::uint64_t{1} << 63);
}

TEST(Mof, RealsCharactersAndDatesHaveValues)
{
    const auto mof =
        read_good("class C { real32 r = -1.5E2; real64 i = 3; char16 c = 'x'; char16 e = '\\n'; char16 u = '\xC3\xA9';"
                  " datetime d = \"00000000000500.000000:000\"; };");
    EXPECT_EQ(feature(*mof, "C", "r").default_value.items[0].real, -150.0);
    EXPECT_EQ(feature(*mof, "C", "i").default_value.items[0].real, 3.0);
    EXPECT_EQ(feature(*mof, "C", "c").default_value.items[0].magnitude, std::uint64_t{'x'});
    EXPECT_EQ(feature(*mof, "C", "e").default_value.items[0].magnitude, std::uint64_t{'\n'});
    EXPECT_EQ(feature(*mof, "C", "u").default_value.items[0].magnitude, 0xE9u);
    EXPECT_EQ(feature(*mof, "C", "d").default_value.text(), "00000000000500.000000:000");
}

TEST(Mof, NeighbouringStringsAreOne)
{
    const auto mof =
        read_good("[Description (\"one \"\n  \"two\" /* and */ \" three\")] class C { string s = \"a\" \"b\"; };");
    EXPECT_EQ(mof->find_class("C")->qualifiers.text("description"), "one two three");
    EXPECT_EQ(feature(*mof, "C", "s").default_value.text(), "ab");
}

TEST(Mof, EscapesStandForTheirCharacters)
{
    const auto mof = read_good(R"(class C { string s = "\b\t\n\f\r\"\'\\\x41\xE9\x20AC!"; };)");
    EXPECT_EQ(feature(*mof, "C", "s").default_value.text(), "\b\t\n\f\r\"'\\A\xC3\xA9\xE2\x82\xAC!");
}

TEST(Mof, CommentsAndBlanksMeanNothing)
{
    const auto mof = read_good("\xEF\xBB\xBF// first\n/* * / ** */class/**/C//x\n{\t}\r\n;// last");
    EXPECT_NE(mof->find_class("C"), nullptr);
}

TEST(Mof, QualifiersKeepNameValueAndOrder)
{
    const auto mof = read_good(
        "[Abstract, Version (\"2.6\"), Values { \"a\", \"b\" }] class C { [Key, Write (false), Max (3)] uint8 a; };");
    const Class& c = *mof->find_class("C");
    EXPECT_TRUE(c.is_abstract());
    EXPECT_FALSE(c.is_association());
    EXPECT_EQ(c.qualifiers.text("VERSION"), "2.6");
    ASSERT_EQ(c.qualifiers.size(), 3u);
    EXPECT_TRUE(c.qualifiers[2].value.is_array);
    EXPECT_EQ(c.qualifiers[2].value.items[1].text, "b");
    const Feature& a = feature(*mof, "C", "a");
    EXPECT_TRUE(a.is_key);
    EXPECT_FALSE(a.qualifiers.has("Write"));
    EXPECT_TRUE(a.qualifiers.has("Max"));
    EXPECT_EQ(a.qualifiers.find("Max")->value.items[0].magnitude, 3u);
}

TEST(Mof, FlavorsBehindAQualifierArePassedOver)
{
    const auto mof =
        read_good("class C { [Key : DisableOverride ToSubclass, Description (\"d\") : Translatable] uint8 a; };");
    EXPECT_TRUE(feature(*mof, "C", "a").is_key);
    EXPECT_EQ(feature(*mof, "C", "a").qualifiers.text("Description"), "d");
}

TEST(Mof, AParameterIsAnInputUnlessItSaysOtherwise)
{
    const auto mof = read_good(
        "class C { uint32 M(uint8 a, [In] uint8 b, [Out] uint8 c, [In (false), Out] C REF d[], [In, Out] string e[]); "
        "boolean N(); };");
    const Feature& m = feature(*mof, "C", "M");
    EXPECT_EQ(m.kind, Feature::Kind::method);
    EXPECT_EQ(m.type, Type::uint32);
    ASSERT_EQ(m.parameters.size(), 5u);
    const bool in[] = {true, true, true, false, true};
    const bool out[] = {false, false, true, true, true};
    for (unsigned i = 0; i < 5; ++i) {
        EXPECT_EQ(m.parameters[i].is_in, in[i]) << i;
        EXPECT_EQ(m.parameters[i].is_out, out[i]) << i;
    }
    EXPECT_EQ(m.parameters[3].target, "C");
    EXPECT_EQ(m.parameters[3].subscript, -1);
    EXPECT_TRUE(feature(*mof, "C", "N").parameters.empty());
    EXPECT_EQ(mof->find_class("C")->find_method("m"), &m);
    EXPECT_EQ(mof->find_class("C")->find_property("m"), nullptr);
}

TEST(Mof, PragmasOfOtherCompilersAreIgnored)
{
    const auto mof = read_good("#pragma namespace (\"root/cimv2\")\n#PRAGMA locale (\"en\" \"_US\")\nclass C {};");
    EXPECT_NE(mof->find_class("C"), nullptr);
}

TEST(Mof, AQualifierDeclarationTellsTypeScopeAndFlavor)
{
    const auto mof =
        read_good("Qualifier ValueMap : string[], Scope(property, method), Flavor(EnableOverride, ToSubclass);"
                  "Qualifier Min : uint32 = 7, Scope(reference); Qualifier Key : boolean = false, Scope(any);");
    const auto* map = mof->find_qualifier("valuemap");
    ASSERT_NE(map, nullptr);
    EXPECT_TRUE(map->is_array);
    EXPECT_FALSE(map->has_default);
    EXPECT_THAT(map->scopes, ElementsAre("property", "method"));
    EXPECT_THAT(map->flavors, ElementsAre("EnableOverride", "ToSubclass"));
    EXPECT_EQ(mof->find_qualifier("Min")->default_value.items[0].magnitude, 7u);
    EXPECT_EQ(mof->find_qualifier("Other"), nullptr);
}

TEST(Mof, ABareQualifierTakesTheDeclaredDefault)
{
    const auto mof = read_good("Qualifier Min : uint32 = 7, Scope(any); Qualifier Key : boolean = false, Scope(any);"
                               "class C { [Min, Key] uint8 a; };");
    EXPECT_EQ(feature(*mof, "C", "a").qualifiers.find("Min")->value.items.at(0).magnitude, 7u);
    EXPECT_TRUE(feature(*mof, "C", "a").is_key);
}
