#include "tests/host/Things.h"

using namespace host;

namespace {

TEST(SchemaRecords, PropertiesHaveTheirCmpiTypesAndTheSuperclassComesFirst)
{
    const Class_Record& record = *things::schema()->find("test_thing");
    EXPECT_EQ("Caption", record.properties.front().name);
    EXPECT_EQ(CMPI_uint32, record.property("id")->type);
    EXPECT_TRUE(record.property("Id")->key);
    EXPECT_EQ(CMPI_stringA, record.property("Texts")->type);
    EXPECT_EQ(CMPI_ref, record.property("Friend")->type);
    EXPECT_EQ("TEST_Other", record.property("Friend")->reference_class);
    EXPECT_TRUE(record.property("Inner")->embedded);
    EXPECT_FALSE(record.property("Text")->embedded);
    EXPECT_TRUE(record.property("State")->writable);
    EXPECT_EQ(nullptr, record.property("Nonsense"));
    EXPECT_EQ(-1, record.find_property(""));
}

TEST(SchemaRecords, WordsStandForValuesAndRanges)
{
    const Element_Record& state = *things::schema()->find("TEST_Thing")->property("State");
    EXPECT_EQ("OK", state.word_for(Value::uint16(2)));
    EXPECT_EQ("Stressed", state.word_for(Value::uint16(7)));
    EXPECT_EQ("Vendor", state.word_for(Value::uint16(65535)));
    EXPECT_EQ("", state.word_for(Value::uint16(3)));
    EXPECT_EQ("", state.word_for(Value()));
}

TEST(SchemaRecords, FamiliesAndAncestry)
{
    const Schema& schema = *things::schema();
    std::vector<std::string> names;
    for (const Class_Record* record : schema.family(*schema.find("TEST_Base")))
        names.push_back(record->name);
    EXPECT_THAT(names, testing::ElementsAre("TEST_Base", "TEST_Thing", "TEST_Other", "TEST_Silent"));
    EXPECT_TRUE(schema.is_a("test_thing", "cim_root"));
    EXPECT_FALSE(schema.is_a("TEST_Base", "TEST_Thing"));
    EXPECT_TRUE(schema.find("TEST_Link")->association);
    EXPECT_TRUE(schema.find("TEST_Alert")->indication);
}

TEST(SchemaRecords, BadMofNamesFileAndLine)
{
    std::string error;
    EXPECT_EQ(nullptr, Schema::from_text("class A {\n  nonsense\n};", error));
    EXPECT_THAT(error, testing::HasSubstr("text:"));
    EXPECT_EQ(nullptr, Schema::from_files({"/nowhere/at/all"}, error));
    EXPECT_THAT(error, testing::HasSubstr("/nowhere/at/all: no such file"));
}

TEST(Values, IntegersAreCutToTheirWidthAndCompareByNumber)
{
    EXPECT_EQ(44u, Value::integer(CMPI_uint8, 300).as_uint());
    EXPECT_EQ(-1, Value::integer(CMPI_sint16, 0xFFFF).as_int());
    EXPECT_EQ(Value::uint8(7), Value::sint64(7));
    EXPECT_NE(Value::uint8(1), Value::boolean(true));
    EXPECT_NE(Value::string("20240229120000.000000+060"), Value::datetime("20240229120000.000000+060"));
    EXPECT_EQ("-5", Value::sint32(-5).to_text());
    EXPECT_EQ("{1, 2}", Value::array(CMPI_uint8, {Value::uint8(1), Value::uint8(2)}).to_text());
}

TEST(Values, PathsCompareWithoutOrderHostAndCase)
{
    Path a = things::thing(1), b;
    b.host = "elsewhere";
    b.name_space = "ROOT/TEST";
    b.class_name = "test_thing";
    b.set("realm", Value::string("test \"realm\""));
    b.set("ID", Value::sint64(1));
    EXPECT_EQ(a, b);
    b.set("ID", Value::sint64(2));
    EXPECT_NE(a, b);
}

} // namespace
