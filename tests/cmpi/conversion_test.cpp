// Values between CMPI and the runtime, both ways.
#include <cstring>

#include "cmpi/CMPI_Containers.h"
#include "cmpi/Converter.h"
#include "cmpi/cmpi_data.h"
#include "cmpi/xml_text.h"
#include "runtime/log.h"
#include "tests/cmpi/Bridge_Test.h"

namespace cimple {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::Not;
using testing::SizeIs;

class Conversion : public testing::Test {
protected:
    ~Conversion() override
    {
        EXPECT_EQ(broker.alive(), elements_left);
        EXPECT_THAT(broker.faults, testing::IsEmpty());
    }

    /// The CMPI instance that `thing` becomes.
    fake::Instance out(const Instance* thing, const char** properties = nullptr)
    {
        Made<CMPIInstance> made;
        EXPECT_EQ(make_CMPI_instance(&broker.cmpi, thing, "root/test", nullptr, properties, made), 0);
        if (made) {
            CMPIResult* result = broker.result();
            result->ft->returnInstance(result, made.get());
            return broker.returned(result).instances.at(0);
        }
        return {};
    }

    /// The instance that a CMPI instance with these properties becomes.
    Ref<TEST_Thing> in(const fake::Values& properties)
    {
        fake::Path path{"root/test", "TEST_Thing", {}};
        Instance* read = nullptr;
        EXPECT_EQ(make_cimple_instance(&broker.cmpi, &TEST_Thing::meta, broker.path(path),
                                       broker.instance({path, properties}), read),
                  0);
        return Ref<TEST_Thing>(static_cast<TEST_Thing*>(read));
    }

    Ref<TEST_Thing> keys(const fake::Values& keys)
    {
        Instance* read = nullptr;
        EXPECT_EQ(make_cimple_reference(&broker.cmpi, &TEST_Thing::meta, broker.path({"root/test", "TEST_Thing", keys}),
                                        read),
                  0);
        return Ref<TEST_Thing>(static_cast<TEST_Thing*>(read));
    }

    fake::Broker broker;
    int elements_left = 0;
};

Ref<TEST_Thing> full_thing()
{
    Ref<TEST_Thing> thing(new_thing("full", 200));
    thing->Flag.set(true);
    thing->Tiny.set<sint8>(-8);
    thing->Speed.set<uint16>(65535);
    thing->Offset.set<sint16>(-32768);
    thing->Count.set<uint32>(4294967295u);
    thing->Delta.set<sint32>(-2147483647);
    thing->Total.set<uint64>(18446744073709551615ull);
    thing->Balance.set<sint64>(-9000000000000000000ll);
    thing->Ratio.set<real32>(0.5f);
    thing->Precise.set<real64>(-0.25);
    thing->Letter.set<char16>(u'\u00e9');
    thing->Text.set(String("text"));
    thing->When.set(Datetime(uint64(300000000)));
    thing->Words.value.append(String("a"));
    thing->Words.value.append(String(""));
    thing->Words.null = 0;
    thing->Codes.value.append(2);
    thing->Codes.value.append(5);
    thing->Codes.null = 0;
    thing->Flags.null = 0; // empty, not null
    thing->Part = new_part("embedded");
    thing->Part->Label.set(String("label"));
    thing->Other = new_part("referenced");
    thing->Other->Label.set(String("not in a path"));
    thing->Parts.value.append(new_part("p1"));
    thing->Parts.null = 0;
    thing->Others.value.append(new_part("r1"));
    thing->Others.value.append(new_part("r2"));
    thing->Others.null = 0;
    return thing;
}

// --- Out
// ---------------------------------------------------------------------------------------------------------------

TEST_F(Conversion, EveryTypeGoesOutAsItsOwn)
{
    Ref<TEST_Thing> thing = full_thing();
    fake::Values properties = out(thing.get()).properties;
    elements_left = 2 /* words */ + 1 /* Part */ + 1 /* Parts */ + 2 /* Others */;

    const std::pair<const char*, CMPIType> types[] = {
        {"Name", CMPI_string},    {"Number", CMPI_uint8},  {"Flag", CMPI_boolean},
        {"Tiny", CMPI_sint8},     {"Speed", CMPI_uint16},  {"Offset", CMPI_sint16},
        {"Count", CMPI_uint32},   {"Delta", CMPI_sint32},  {"Total", CMPI_uint64},
        {"Balance", CMPI_sint64}, {"Ratio", CMPI_real32},  {"Precise", CMPI_real64},
        {"Letter", CMPI_char16},  {"Text", CMPI_string},   {"When", CMPI_dateTime},
        {"Words", CMPI_stringA},  {"Codes", CMPI_uint16A}, {"Flags", CMPI_booleanA},
        {"Part", CMPI_instance},  {"Other", CMPI_ref},     {"Parts", CMPI_ARRAY | CMPI_instance},
        {"Others", CMPI_refA}};
    EXPECT_THAT(properties, SizeIs(std::size(types))); // Times is null
    for (const auto& [name, type] : types)
        EXPECT_EQ(fake::find(properties, name).type, type) << name;

    EXPECT_EQ(fake::find(properties, "Flag").number.boolean, 1);
    EXPECT_EQ(fake::find(properties, "Tiny").number.sint8, -8);
    EXPECT_EQ(fake::find(properties, "Speed").number.uint16, 65535);
    EXPECT_EQ(fake::find(properties, "Offset").number.sint16, -32768);
    EXPECT_EQ(fake::find(properties, "Count").number.uint32, 4294967295u);
    EXPECT_EQ(fake::find(properties, "Delta").number.sint32, -2147483647);
    EXPECT_EQ(fake::find(properties, "Total").number.uint64, 18446744073709551615ull);
    EXPECT_EQ(fake::find(properties, "Balance").number.sint64, -9000000000000000000ll);
    EXPECT_EQ(fake::find(properties, "Ratio").number.real32, 0.5f);
    EXPECT_EQ(fake::find(properties, "Precise").number.real64, -0.25);
    EXPECT_EQ(fake::find(properties, "Letter").number.char16, 0xe9);
    EXPECT_EQ(fake::find(properties, "When").text, "00000000000500.000000:000");
    ASSERT_THAT(fake::find(properties, "Words").elements, SizeIs(2));
    EXPECT_EQ(fake::find(properties, "Words").elements[0].text, "a");
    EXPECT_EQ(fake::find(properties, "Codes").elements.at(1).number.uint16, 5);
    EXPECT_THAT(fake::find(properties, "Flags").elements, SizeIs(0));
    EXPECT_FALSE(fake::find(properties, "Flags").null());
}

TEST_F(Conversion, AnEmbeddedInstanceIsWholeAndAReferenceIsItsKeys)
{
    Ref<TEST_Thing> thing = full_thing();
    fake::Values properties = out(thing.get()).properties;
    elements_left = 6;
    auto part = fake::find(properties, "Part").instance;
    ASSERT_NE(part, nullptr);
    EXPECT_EQ(part->path.class_name, "TEST_Part");
    EXPECT_EQ(part->path.name_space, "root/test");
    EXPECT_EQ(fake::find(part->properties, "Label").text, "label");
    auto other = fake::find(properties, "Other").path;
    ASSERT_NE(other, nullptr);
    EXPECT_THAT(other->keys, SizeIs(1));
    EXPECT_EQ(fake::find(other->keys, "Id").text, "referenced");
    EXPECT_EQ(fake::find(properties, "Parts").elements.at(0).instance->path.class_name, "TEST_Part");
    EXPECT_EQ(fake::find(fake::find(properties, "Others").elements.at(1).path->keys, "Id").text, "r2");
}

TEST_F(Conversion, AReferenceKeepsItsOwnNamespace)
{
    Ref<TEST_Thing> thing(new_thing("a", 1));
    thing->Other = new_part("p");
    thing->Other->__name_space = "root/elsewhere";
    EXPECT_EQ(fake::find(out(thing.get()).properties, "Other").path->name_space, "root/elsewhere");
}

TEST_F(Conversion, NullFeaturesAreLeftOut)
{
    Ref<TEST_Thing> thing(new_thing("a", 1));
    fake::Values properties = out(thing.get()).properties;
    EXPECT_THAT(properties, SizeIs(2));
}

TEST_F(Conversion, ANullElementDropsTheArrayAndNothingElse)
{
    Ref<TEST_Thing> thing(new_thing("a", 1));
    thing->Others.value.append(new_part("r1"));
    thing->Others.value.append(nullptr);
    thing->Others.null = 0;
    thing->Text.set(String("kept"));
    fake::Values properties = out(thing.get()).properties;
    elements_left = 1;
    EXPECT_EQ(fake::find(properties, "Others").type, CMPI_null);
    EXPECT_EQ(fake::find(properties, "Text").text, "kept");
}

TEST_F(Conversion, BytesThatXmlCannotCarryBecomeQuestionMarks)
{
    Ref<TEST_Thing> thing(new_thing("n\x01me", 1));
    thing->Text.set(String("tab\t bell\a cut\xC3 ok\xC3\xA9 lone\x80 high\xED\xA0\x80 last\xEF\xBF\xBF"));
    thing->Words.value.append(String("z\0ero", 5));
    thing->Words.null = 0;
    fake::Instance made = out(thing.get());
    elements_left = 1;
    EXPECT_EQ(fake::find(made.properties, "Text").text, "tab\t bell? cut? ok\xC3\xA9 lone? high??? last???");
    EXPECT_EQ(fake::find(made.properties, "Words").elements.at(0).text, "z?ero");
    EXPECT_EQ(fake::find(made.path.keys, "Name").text, "n?me");
    EXPECT_STREQ(thing->Name.value.c_str(), "n\x01me"); // on the way out only
}

// Plain text is looked at eight bytes at a time.
TEST(XmlText, EachByteCountsWhereverItStands)
{
    for (std::size_t at = 0; at < 20; at++)
        for (int byte = 0; byte < 256; byte++) {
            std::string text(20, 'x');
            text[at] = static_cast<char>(byte);
            const bool is_carried = byte < 0x80 && (byte >= 0x20 || byte == '\t' || byte == '\n' || byte == '\r');
            EXPECT_EQ(carried_by_xml(text.data(), text.size()), is_carried ? text.size() : at) << byte << " at " << at;
        }
    for (std::size_t at = 0; at < 12; at++) { // and beside what is more than a byte
        const std::string text = std::string(at, 'x') + "\xC3\xA9" + std::string(9, 'y') + '\x01';
        EXPECT_EQ(carried_by_xml(text.data(), text.size()), at + 2 + 9) << at;
    }
}

TEST(XmlText, WellFormedTextIsSharedAndNotCopied)
{
    String text("caf\xC3\xA9 \xF0\x9F\x98\x80\r\n");
    EXPECT_EQ(as_xml_text(text).c_str(), text.c_str());
}

TEST(XmlText, OverlongAndTruncatedFormsAreBroken)
{
    EXPECT_STREQ(as_xml_text(String("\xC0\xAF")).c_str(), "??");
    EXPECT_STREQ(as_xml_text(String("\xE2\x82")).c_str(), "??");
    EXPECT_STREQ(as_xml_text(String("\xF5\x80\x80\x80")).c_str(), "????");
    EXPECT_STREQ(as_xml_text(String("\xF4\x90\x80\x80")).c_str(), "????");
    EXPECT_STREQ(as_xml_text(String("\x1F\x7F")).c_str(), "?\x7F");
}

TEST_F(Conversion, WithoutAPathOneIsBuilt)
{
    Runtime_Log log;
    Ref<TEST_Thing> thing(new_thing("a", 1));
    fake::Instance made = out(thing.get());
    EXPECT_EQ(fake::find(made.path.keys, "Name").text, "a");
    EXPECT_TRUE(log.has("WARN No ObjectPath built before call to make_CMPI_instance"));
}

TEST_F(Conversion, NothingComesOutOfNothing)
{
    Made<CMPIInstance> made;
    Made<CMPIObjectPath> path;
    EXPECT_EQ(make_CMPI_instance(&broker.cmpi, nullptr, "root/test", nullptr, nullptr, made), 1);
    EXPECT_EQ(make_cmpi_object_path(&broker.cmpi, nullptr, "root/test", path), 1);
    EXPECT_EQ(CMPIInstance_Container(&broker.cmpi, nullptr, "root/test", nullptr).convert(nullptr, 0), -1);
}

/// The instances of one answer, whose texts a server is asked to make a string of.
class Answers : public Conversion {
protected:
    Answers()
    {
        made_strings = 0;
        real_new_string = broker.eft.newString;
        broker.eft.newString = [](const CMPIBroker* of, const char* text, CMPIStatus* status) -> CMPIString* {
            made_strings++;
            if (refused && std::strcmp(text, refused) == 0) return nullptr;
            return real_new_string(of, text, status);
        };
    }
    ~Answers() override { refused = nullptr; }

    /// What `thing` becomes as the next of the answer, keys first.
    fake::Instance next(const Instance* thing, Answer_Features& features)
    {
        Made<CMPIObjectPath> path;
        Made<CMPIInstance> made;
        EXPECT_EQ(make_cmpi_object_path(&broker.cmpi, thing, "root/test", path, &features), 0);
        EXPECT_EQ(make_CMPI_instance(&broker.cmpi, thing, "root/test", path.get(), nullptr, made, &features), 0);
        if (!made) return {};
        CMPIResult* result = broker.result();
        result->ft->returnInstance(result, made.get());
        return broker.returned(result).instances.at(0);
    }
    Ref<TEST_Thing> thing_of(const String& text)
    {
        Ref<TEST_Thing> thing(new_thing("same", 1));
        thing->Name.set(name);
        thing->Text.set(text);
        return thing;
    }

    const String name{"same"};
    static inline int made_strings;
    static inline const char* refused = nullptr;
    static inline CMPIString* (*real_new_string)(const CMPIBroker*, const char*, CMPIStatus*);
};

TEST_F(Answers, MakeOneStringOfATextThatInstancesShare)
{
    const String text("shared");
    Answer_Features features;
    for (int i = 0; i < 10; i++) {
        const fake::Instance made = next(thing_of(text).get(), features);
        EXPECT_EQ(fake::find(made.path.keys, "Name").text, "same");
        EXPECT_EQ(fake::find(made.properties, "Name").text, "same");
        EXPECT_EQ(fake::find(made.properties, "Text").text, "shared");
    }
    EXPECT_EQ(made_strings, 2 * 3) << "of a key, of its property and of another one, the first time and the second";
}

TEST_F(Answers, TellTextsApartThatComeToThePlaceOfAnother)
{
    Answer_Features features;
    for (int i = 0; i < 40; i++) { // a pair each, freed before the next
        const std::string text = "text " + std::to_string(i / 2);
        const Ref<TEST_Thing> thing = thing_of(String(text.c_str()));
        EXPECT_EQ(fake::find(next(thing.get(), features).properties, "Text").text, text);
    }
    const String first("first"), second("second");
    for (const String* text : {&first, &first, &second, &first, &second, &second, &first, &first, &first})
        EXPECT_EQ(fake::find(next(thing_of(*text).get(), features).properties, "Text").text, text->c_str());
}

TEST_F(Answers, MendATextThatXmlCannotCarryEachTime)
{
    const String text("\x01 and \xFF");
    Answer_Features features;
    for (int i = 0; i < 4; i++)
        EXPECT_EQ(fake::find(next(thing_of(text).get(), features).properties, "Text").text, "? and ?");
}

TEST_F(Answers, LeaveOutATextThatTheServerMakesNoStringOf)
{
    const String text("refused"), other("other");
    refused = "refused";
    Answer_Features features;
    Runtime_Log log;
    for (std::size_t i = 0; i < 4; i++) {
        EXPECT_TRUE(fake::find(next(thing_of(text).get(), features).properties, "Text").null());
        EXPECT_THAT(log.lines(), SizeIs(2 * (i + 1)));
    }
    EXPECT_TRUE(log.has("WARN conversion error: TEST_Thing.Text"));
    for (int i = 0; i < 3; i++)
        EXPECT_EQ(fake::find(next(thing_of(other).get(), features).properties, "Text").text, "other");
}

TEST_F(Answers, MayHoldInstancesOfSeveralClasses)
{
    Answer_Features features;
    for (int i = 0; i < 3; i++) {
        EXPECT_EQ(fake::find(next(thing_of("t").get(), features).properties, "Text").text, "t");
        const Ref<TEST_Part> part(new_part("p"));
        EXPECT_EQ(fake::find(next(part.get(), features).path.keys, "Id").text, "p");
    }
}

TEST_F(Conversion, EachCallThatFailsHasItsWords)
{
    Runtime_Log log;
    Ref<TEST_Thing> thing(new_thing("a", 1));
    thing->Text.set(String("text"));
    thing->When.set(Datetime(uint64(1)));
    thing->Codes.set(Array<uint16>{1});
    thing->Other = new_part("p");
    thing->Part = new_part("p");
    Made<CMPIObjectPath> path;
    ASSERT_EQ(make_cmpi_object_path(&broker.cmpi, thing.get(), "root/test", path), 0);

    const auto words_of = [&](const char* name_space, auto& slot) {
        const std::size_t before = log.lines().size();
        auto kept = slot;
        slot = nullptr;
        CMPIInstance* made = broker.instance({{"root/test", "TEST_Thing", {}}, {}});
        CMPIInstance_Container(&broker.cmpi, nullptr, name_space, made).convert(thing.get(), 0);
        slot = kept;
        auto lines = log.lines();
        lines.erase(lines.begin(), lines.begin() + static_cast<std::ptrdiff_t>(before));
        return lines;
    };
    EXPECT_THAT(words_of("root/test", broker.eft.newDateTimeFromChars),
                ElementsAre("WARN _to_cmpi_data() failed: feature=When", "WARN conversion error: TEST_Thing.When"));
    EXPECT_THAT(words_of("root/test", broker.array_ft.setElementAt),
                ElementsAre("WARN CMSetArrayElementAt() failed", "WARN _to_cmpi_data() failed: feature=Codes",
                            "WARN conversion error: TEST_Thing.Codes"));
    EXPECT_THAT(words_of("root/test", broker.eft.newInstance),
                ElementsAre("WARN CMNewInstance() failed", "WARN _to_cmpi_data() failed: feature=Part",
                            "WARN conversion error: TEST_Thing.Part"));
    EXPECT_THAT(words_of("root/test", broker.eft.newObjectPath),
                ElementsAre("WARN CMNewObjectPath() failed", "WARN _to_cmpi_data() failed: feature=Part",
                            "WARN conversion error: TEST_Thing.Part", "WARN CMNewObjectPath() failed",
                            "WARN _to_cmpi_data() failed: feature=Other", "WARN conversion error: TEST_Thing.Other"));
    EXPECT_THAT(words_of("root/test", broker.path_ft.addKey),
                testing::IsSupersetOf({"WARN CMAddKey() failed", "WARN conversion error: TEST_Part.Id"}));
    EXPECT_THAT(words_of("root/test", broker.instance_ft.setProperty),
                testing::IsSupersetOf({"WARN CMSetProperty() failed: Name", "WARN conversion error: TEST_Thing.Name"}));
    for (const char* none : {static_cast<const char*>(nullptr), ""})
        EXPECT_THAT(words_of(none, broker.args_ft.addArg),
                    ElementsAre("WARN null namespace", "WARN _to_cmpi_data() failed: feature=Part",
                                "WARN conversion error: TEST_Thing.Part", "WARN null namespace",
                                "WARN _to_cmpi_data() failed: feature=Other",
                                "WARN conversion error: TEST_Thing.Other"));
    elements_left = broker.alive() - 1; // embedded instances; the path is still ours
}

TEST_F(Conversion, AMethodWithoutAReturnValueIsNone)
{
    const Meta_Method bare = {{{{0}, META_FLAG_METHOD, "Bare", nullptr, 0}, nullptr, 0, sizeof(Instance)}, UINT32};
    Ref<Instance> record(create(&bare, true));
    Value value;
    EXPECT_DEATH(make_method_out(&broker.cmpi, "root/test", record.get(), broker.args(), value),
                 "mm->num_meta_features > 0");
}

// --- In
// ----------------------------------------------------------------------------------------------------------------

TEST_F(Conversion, WhatGoesOutComesBackTheSame)
{
    Ref<TEST_Thing> thing = full_thing();
    fake::Instance made = out(thing.get());
    elements_left = 6;
    Ref<TEST_Thing> back = in(made.properties);
    set_name_space_recursive(thing.get(), "root/test", true);
    thing->Other->Label = {String(), 1}; // a reference brings its keys alone
    EXPECT_TRUE(identical(thing.get(), back.get()));
}

TEST_F(Conversion, WhatIsMissingOrNullIsNull)
{
    Ref<TEST_Thing> thing = in({{"Text", fake::null_value(CMPI_string)},
                                {"Words", fake::null_value(CMPI_stringA)},
                                {"Part", fake::null_value(CMPI_instance)},
                                {"Parts", fake::null_value(CMPI_ARRAY | CMPI_instance)}});
    EXPECT_EQ(thing->Text.null, 1);
    EXPECT_EQ(thing->Words.null, 1);
    EXPECT_EQ(thing->Parts.null, 1);
    EXPECT_EQ(thing->Others.null, 1);
    EXPECT_EQ(thing->Part, nullptr);
    EXPECT_EQ(thing->Name.null, 1);
}

TEST_F(Conversion, AnUnknownPropertyIsLoggedAndDropped)
{
    Runtime_Log log;
    Ref<TEST_Thing> thing =
        in({{"Nothing", fake::uint16(1)}, {"text", fake::string("kept")}, {"Echo", fake::uint16(1)}});
    EXPECT_STREQ(thing->Text.value.c_str(), "kept");
    EXPECT_TRUE(log.has("WARN unknown feature: TEST_Thing.Nothing"));
    EXPECT_TRUE(log.has("WARN unknown feature: TEST_Thing.Echo"));
}

TEST_F(Conversion, APropertyOfAnotherTypeIsLoggedAndLeftNull)
{
    Runtime_Log log;
    Ref<TEST_Thing> thing = in({{"Speed", fake::uint32(16)}, {"Words", fake::string("one")}});
    EXPECT_EQ(thing->Speed.null, 1);
    EXPECT_EQ(thing->Words.null, 1);
    EXPECT_THAT(log.lines(),
                ElementsAre("WARN type mismatch on Speed: uint32/uint16", "WARN conversion error: TEST_Thing.Speed",
                            "WARN type mismatch on Words: string/string_array",
                            "WARN conversion error: TEST_Thing.Words"));
}

TEST_F(Conversion, TypesThatNoFeatureHasAreRefused)
{
    Runtime_Log log;
    fake::Value strange = fake::uint16(1);
    strange.type = CMPI_chars;
    EXPECT_EQ(in({{"Text", strange}})->Text.null, 1);
    EXPECT_TRUE(log.has("WARN unknown type"));
}

TEST_F(Conversion, AStringWithoutCharactersIsNull)
{
    Runtime_Log log;
    EXPECT_EQ(in({{"Text", fake::string_without_chars()}})->Text.null, 1);
    EXPECT_THAT(log.lines(), ElementsAre("INFO ignored null CMPI string"));
}

TEST_F(Conversion, ADatetimeThatCannotBeReadIsNull)
{
    Runtime_Log log;
    EXPECT_EQ(in({{"When", fake::datetime("yesterday")}})->When.null, 1);
    EXPECT_THAT(log.lines(), Contains("WARN conversion error"));
}

TEST_F(Conversion, AnArrayWithANullElementIsNull)
{
    Runtime_Log log;
    Ref<TEST_Thing> thing = in({{"Words", fake::array(CMPI_string, {fake::string("a"), fake::null_value(CMPI_string)})},
                                {"Others", fake::array(CMPI_ref, {fake::null_value(CMPI_ref)})},
                                {"Codes", fake::array(CMPI_uint16, {fake::uint32(1)})}});
    EXPECT_EQ(thing->Words.null, 1);
    EXPECT_EQ(thing->Words.value.size(), 0u);
    EXPECT_EQ(thing->Others.null, 1);
    EXPECT_EQ(thing->Codes.null, 1);
    EXPECT_TRUE(log.has("WARN encountered null array element"));
    EXPECT_TRUE(log.has("WARN encountered null instance element"));
    EXPECT_TRUE(log.has("WARN type mismatch"));
}

TEST_F(Conversion, InstancesOfUnknownOrForeignClassesAreDropped)
{
    Runtime_Log log;
    Ref<TEST_Thing> thing =
        in({{"Other", fake::reference({"root/test", "TEST_Nothing", {}})},
            {"Part", fake::embedded({{"root/test", "TEST_Base", {}}, {}})},
            {"Parts", fake::array(CMPI_instance, {fake::embedded({{"root/test", "TEST_Base", {}}, {}})})}});
    EXPECT_EQ(thing->Other, nullptr);
    EXPECT_EQ(thing->Part, nullptr);
    EXPECT_EQ(thing->Parts.null, 1);
    EXPECT_TRUE(log.has("WARN failed to find meta class: TEST_Nothing"));
    EXPECT_TRUE(log.has("WARN failed to assign instance of TEST_Base to TEST_Thing.Part"));
    EXPECT_TRUE(log.has("WARN failed to assign instance of TEST_Base to TEST_Thing.Parts"));
}

TEST_F(Conversion, InstancesWithinInstancesHaveALimit)
{
    fake::Instance nest{{"root/test", "TEST_Thing", {}}, {}};
    for (int i = 0; i < 1000; ++i)
        nest = fake::Instance{{"root/test", "TEST_Thing", {}}, {{"Part", fake::embedded(nest)}}};
    Ref<TEST_Thing> thing = in(nest.properties); // Part cannot hold a TEST_Thing, but each is read
    EXPECT_EQ(thing->Part, nullptr);
}

TEST_F(Conversion, TheNamespaceIsFilledWhereThereIsNone)
{
    Ref<TEST_Thing> thing = in({{"Other", fake::reference({"", "TEST_Part", {}})},
                                {"Part", fake::embedded({{"root/own", "TEST_Part", {}}, {}})}});
    EXPECT_STREQ(thing->__name_space.c_str(), "root/test");
    EXPECT_STREQ(thing->Other->__name_space.c_str(), "root/test");
    EXPECT_STREQ(thing->Part->__name_space.c_str(), "root/own");
}

TEST_F(Conversion, WarningsCanBeTurnedOff)
{
    Runtime_Log log;
    log_enable_warnings(false);
    in({{"Nothing", fake::uint16(1)}});
    EXPECT_THAT(log.lines(), SizeIs(0));
}

// --- Keys
// --------------------------------------------------------------------------------------------------------------

TEST_F(Conversion, AKeyOf64BitsIsTruncated)
{
    Ref<TEST_Thing> thing = keys({{"Name", fake::string("a")}, {"Number", fake::uint64(300)}});
    EXPECT_EQ(thing->Number.null, 0);
    EXPECT_EQ(thing->Number.value, 44);
}

TEST_F(Conversion, KeysOf64BitsFitWhatTheFeatureWants)
{
    const auto counter = [this](const fake::Values& values) {
        Instance* read = nullptr;
        EXPECT_EQ(make_cimple_reference(&broker.cmpi, &TEST_Counter::meta,
                                        broker.path({"root/test", "TEST_Counter", values}), read),
                  0);
        return Ref<TEST_Counter>(static_cast<TEST_Counter*>(read));
    };
    Ref<TEST_Counter> read = counter({{"Value", fake::sint64(4294967303ll)}, {"Balance", fake::uint64(~0ull)}});
    EXPECT_EQ(read->Value.null, 0);
    EXPECT_EQ(read->Value.value, 7u) << "truncated";
    EXPECT_EQ(read->Balance.null, 0);
    EXPECT_EQ(read->Balance.value, -1);
    EXPECT_EQ(counter({{"Value", fake::sint64(-1)}})->Value.value, 4294967295u);
    EXPECT_EQ(counter({{"Value", fake::sint32(7)}})->Value.null, 1) << "narrower types are not taken";
}

TEST_F(Conversion, ASignedKeyIsTakenForUint32Only)
{
    EXPECT_EQ(keys({{"Number", fake::sint64(7)}})->Number.null, 1);
    EXPECT_EQ(keys({{"Number", fake::uint16(7)}})->Number.null, 1);
}

TEST_F(Conversion, OnlyKeysComeOutOfAPath)
{
    Ref<TEST_Thing> thing = keys({{"Text", fake::string("x")}, {"Name", fake::string("a")}});
    EXPECT_EQ(thing->Text.null, 1);
    EXPECT_STREQ(thing->Name.value.c_str(), "a");
}

TEST_F(Conversion, BoundsAreTold)
{
    Runtime_Log log;
    CMPIArgs_Container container(&broker.cmpi, &test_repository, "root/test", broker.args({{"a", fake::uint8(1)}}));
    const char* name = nullptr;
    Value value;
    EXPECT_EQ(container.get_size(), 1u);
    EXPECT_EQ(container.get_name(1, name), -1);
    EXPECT_EQ(container.get_value(7, UINT8, value), -1);
    EXPECT_THAT(log.lines(), Contains("WARN bounds error").Times(2));
}

TEST_F(Conversion, AReadThatFailsSpoilsNoOther)
{
    CMPIArgs_Container container(&broker.cmpi, &test_repository, "root/test",
                                 broker.args({{"a", fake::uint8(1)}, {"b", fake::uint8(2)}}));
    const char* name = nullptr;
    Value value;
    EXPECT_EQ(container.get_name(0, name), 0);
    auto kept = broker.args_ft.getArgAt;
    broker.args_ft.getArgAt = [](const CMPIArgs*, CMPICount, CMPIString**, CMPIStatus* status) {
        status->rc = CMPI_RC_ERR_FAILED;
        return CMPIData{CMPI_uint16, CMPI_goodValue, {}};
    };
    EXPECT_EQ(container.get_name(1, name), -1);
    broker.args_ft.getArgAt = kept;
    EXPECT_EQ(container.get_value(0, UINT8, value), 0);
    ASSERT_NE(value.get<uint8>(), nullptr);
    EXPECT_EQ(*value.get<uint8>(), 1);
}

TEST_F(Conversion, ABrokenObjectOfTheServersIsCaught)
{
    Runtime_Log log;
    broker.instance_ft.getPropertyAt = [](const CMPIInstance*, CMPICount, CMPIString**, CMPIStatus*) -> CMPIData {
        throw 1;
    };
    EXPECT_EQ(in({{"Text", fake::string("a")}})->Text.null, 1);
    EXPECT_TRUE(log.has("WARN CMGetPropertyAt() threw exception: index=0 size=1"));
    EXPECT_TRUE(log.has("WARN get_name() failed: class=TEST_Thing, index=0"));
}

// --- Values
// ------------------------------------------------------------------------------------------------------------

TEST(Values, AClearedValueIsNoneAndNull)
{
    Value value;
    value.set(String("x"));
    EXPECT_EQ(value.type(), STRING);
    EXPECT_FALSE(value.null());
    value.clear();
    EXPECT_EQ(value.type(), NONE_VALUE);
    EXPECT_TRUE(value.null());
}

TEST(Values, TagsHaveNames)
{
    EXPECT_STREQ(value_type_name(-1), "none");
    EXPECT_STREQ(value_type_name(0), "boolean");
    EXPECT_STREQ(value_type_name(13), "datetime");
    EXPECT_STREQ(value_type_name(14), "instance");
    EXPECT_STREQ(value_type_name(128), "boolean_array");
    EXPECT_STREQ(value_type_name(142), "instance_array");
    EXPECT_STREQ(value_type_name(15), "none");
    EXPECT_STREQ(value_type_name(143), "none");
}

TEST(Values, AValueOwnsWhatAViewOnlySees)
{
    Ref<TEST_Thing> thing(new_thing("a", 1));
    thing->Part = new_part("p");
    Value view, copy;
    const Meta_Feature* part = find_feature(&TEST_Thing::meta, "Part", META_FLAG_REFERENCE);
    EXPECT_EQ(view.view(thing.get(), part), 0);
    EXPECT_EQ(thing->Part->refs, 1u);
    EXPECT_EQ(copy.get(thing.get(), part), 0);
    EXPECT_EQ(thing->Part->refs, 2u);
    copy = Value();
    EXPECT_EQ(thing->Part->refs, 1u);
    view.clear();
    EXPECT_EQ(thing->Part->refs, 1u);
}

TEST(Values, ANullValueKeepsItsTag)
{
    for (int tag = 0; tag <= 142; ++tag) {
        if (tag == 15) tag = 128;
        Value value;
        value.set_null(tag);
        EXPECT_EQ(value.type(), tag);
        EXPECT_TRUE(value.null());
        Value copy(value);
        EXPECT_EQ(copy.type(), tag);
        EXPECT_TRUE(copy.null());
    }
}

TEST(Values, SetRefusesWhatDoesNotFit)
{
    Runtime_Log log;
    Ref<TEST_Thing> thing(new_thing("a", 1));
    const Meta_Feature* text = find_feature(&TEST_Thing::meta, "Text", META_FLAG_PROPERTY);
    Value number;
    number.set<uint16>(5);
    EXPECT_EQ(number.set(thing.get(), text), -1);
    EXPECT_EQ(number.set(nullptr, text), -1);
    EXPECT_EQ(number.set(thing.get(), &TEST_Thing_Echo::meta), -1);
    EXPECT_THAT(log.lines(), ElementsAre("WARN type mismatch: TEST_Thing.Text", "WARN null instance argument"));
}

TEST(Values, AnArrayOfInstancesMayHoldNulls)
{
    Ref<TEST_Thing> thing(new_thing("a", 1));
    const Meta_Feature* others = find_feature(&TEST_Thing::meta, "Others", META_FLAG_REFERENCE);
    Ref<TEST_Part> part(new_part("p"));
    Array<Instance*> array = {part.get(), nullptr};
    Value value;
    value.set(array);
    EXPECT_EQ(value.set(thing.get(), others), 0);
    EXPECT_EQ(value.set(thing.get(), others), 0); // the old elements are given back
    EXPECT_EQ(part->refs, 3u);
    EXPECT_EQ(thing->Others.value[1], nullptr);
    EXPECT_EQ(thing->Others.null, 0);
}

} // namespace
} // namespace cimple
