#include <gtest/gtest.h>
#include <limits>
#include <string>

#include "runtime/Instance.h"
#include "tests/runtime/Comma_Locale.h"
#include "tests/runtime/Test_Classes.h"

using namespace cimple;

namespace {

std::string path_of(const Instance* instance)
{
    String text("rubbish of an earlier use");
    EXPECT_EQ(instance_to_model_path(instance, text), 0) << text.c_str();
    return text.c_str();
}

Ref<Instance> parse(const Meta_Class* meta_class, const std::string& text)
{
    return Ref<Instance>(model_path_to_instance(meta_class, text.c_str()));
}

bool is_read(const Meta_Class* meta_class, const std::string& text)
{
    return static_cast<bool>(parse(meta_class, text));
}

Ref<Test_Plain_Keys> make_plain_keys()
{
    Ref<Test_Plain_Keys> keys(create_as<Test_Plain_Keys>());
    keys->Boolean.set(true);
    keys->Uint8.set(uint8(255));
    keys->Sint8.set(sint8(-128));
    keys->Uint16.set(uint16(65535));
    keys->Sint16.set(sint16(-32768));
    keys->Uint32.set(4294967295u);
    keys->Sint32.set(std::numeric_limits<sint32>::min());
    keys->Uint64.set(std::numeric_limits<uint64>::max());
    keys->Sint64.set(std::numeric_limits<sint64>::min());
    keys->Text.set("a,b=c");
    return keys;
}

const char plain_path[] = "Test_Plain_Keys.Boolean=true,Uint8=255,Sint8=-128,Uint16=65535,Sint16=-32768,"
                          "Uint32=4294967295,Sint32=-2147483648,Uint64=18446744073709551615,"
                          "Sint64=-9223372036854775808,Text=\"a,b=c\"";

std::string printed(const Instance* instance, bool keys_only)
{
    char* text = nullptr;
    std::size_t size = 0;
    std::FILE* stream = open_memstream(&text, &size);
    print(stream, instance, keys_only);
    std::fclose(stream);
    const std::string result(text, size);
    std::free(text);
    return result;
}

} // namespace

TEST(ModelPath, KeysStandInListOrder)
{
    const Ref<Test_Base> base(make_keyed("10000000C9A00001", 4));
    base->Note.set("not a key");
    EXPECT_EQ(path_of(base.get()), "Test_Base.Name=\"10000000C9A00001\",Number=4");
    EXPECT_EQ(path_of(make_plain_keys().get()), plain_path);
}

TEST(ModelPath, AllReadableTypesComeBack)
{
    const auto keys = make_plain_keys();
    const auto back = parse(&Test_Plain_Keys::meta, plain_path);
    ASSERT_TRUE(back);
    EXPECT_TRUE(identical(back.get(), keys.get()));
    EXPECT_EQ(back->refs, 1u);
}

TEST(ModelPath, NonKeysComeBackNull)
{
    const auto back = parse(&Test_Thing::meta, "Test_Thing.Name=\"n\",Number=1");
    ASSERT_TRUE(back);
    auto* thing = static_cast<Test_Thing*>(back.get());
    EXPECT_EQ(thing->Name.null, 0);
    EXPECT_EQ(thing->Note.null, 1);
    EXPECT_EQ(thing->Peers.null, 1);
    EXPECT_EQ(thing->Peer, nullptr);
}

TEST(ModelPath, OddTypesAreWrittenAndRefused)
{
    const Ref<Test_Odd_Keys> odd(create_as<Test_Odd_Keys>());
    odd->Real32.set(1.5f);
    odd->Real64.set(-2.25);
    odd->Char16.set(u'x');
    odd->When.set(Datetime(300000000));
    const std::string text = "Test_Odd_Keys.Real32=1.500000,Real64=-2.250000,Char16='x',When=00000000000500.000000:000";
    EXPECT_EQ(path_of(odd.get()), text);
    EXPECT_FALSE(is_read(&Test_Odd_Keys::meta, text));
    const Comma_Locale comma;
    EXPECT_EQ(path_of(odd.get()), text) << "in every locale";
}

TEST(ModelPath, ReferencesNestBetweenEscapedQuotes)
{
    const Ref<Test_Link> link(create_as<Test_Link>());
    link->Left = make_keyed("l", 1);
    link->Right = make_keyed<Test_Thing>("r", 2);
    const std::string text = "Test_Link.Left=\"Test_Base.Name=\\\"l\\\",Number=1\","
                             "Right=\"Test_Thing.Name=\\\"r\\\",Number=2\"";
    EXPECT_EQ(path_of(link.get()), text);
    const auto back = parse(&Test_Link::meta, text);
    ASSERT_TRUE(back);
    EXPECT_TRUE(key_eq(link.get(), back.get()));
    EXPECT_EQ(static_cast<Test_Link*>(back.get())->Word.null, 1);
}

TEST(ModelPath, AnArrayKeyOrANullKeyEndsTheText)
{
    const Ref<Test_Array_Key> array(create_as<Test_Array_Key>());
    array->Name.set("n");
    array->Bytes.null = 0;
    String text;
    EXPECT_EQ(instance_to_model_path(array.get(), text), -1);
    EXPECT_STREQ(text.c_str(), "Test_Array_Key.Name=\"n\",Bytes=");
    const Ref<Test_Base> base(make_keyed("n", 1));
    base->Number.null = 1;
    EXPECT_EQ(instance_to_model_path(base.get(), text), -1);
    EXPECT_STREQ(text.c_str(), "Test_Base.Name=\"n\",Number=");
    const Ref<Test_Link> link(create_as<Test_Link>());
    EXPECT_EQ(instance_to_model_path(link.get(), text), -1);
    EXPECT_STREQ(text.c_str(), "Test_Link.Left=");
    EXPECT_FALSE(is_read(&Test_Array_Key::meta, "Test_Array_Key.Name=\"n\",Bytes=1"));
}

TEST(ModelPath, AClassWithoutKeysHasNoText)
{
    const Ref<Test_Node> node(create_as<Test_Node>());
    String text("rubbish");
    EXPECT_EQ(instance_to_model_path(node.get(), text), -1);
    EXPECT_TRUE(text.empty());
    EXPECT_EQ(instance_to_model_path(nullptr, text), -1);
}

TEST(ModelPath, ClassesAreFoundUpwardAndInTheRepository)
{
    const auto up = parse(&Test_Thing::meta, "test_BASE.name=\"n\",NUMBER=1");
    ASSERT_TRUE(up);
    EXPECT_EQ(up->meta_class, &Test_Base::meta);
    const auto down = parse(&Test_Base::meta, "Test_Thing.Number=1,Name=\"n\"");
    ASSERT_TRUE(down);
    EXPECT_EQ(down->meta_class, &Test_Thing::meta);
    EXPECT_FALSE(is_read(&Test_Base::meta, "Nobody.Name=\"n\",Number=1"));
    EXPECT_FALSE(is_read(nullptr, "Test_Base.Name=\"n\",Number=1"));
    EXPECT_EQ(model_path_to_instance(&Test_Base::meta, nullptr), nullptr);
    EXPECT_TRUE(is_read(&Instance::meta, "Instance.")) << "a class without a repository knows itself";
    EXPECT_FALSE(is_read(&Instance::meta, "Test_Base.Name=\"n\",Number=1"));
}

TEST(ModelPath, FaultyTextsGiveNothing)
{
    const char* const faulty[] = {
        "",
        "Test_Base",
        "Test_Base.",
        "Test_Base.Name=\"n\"",                     // a key is missing
        "Test_Base.Name=\"n\",Number=1,",           // a comma without a pair
        "Test_Base.,Name=\"n\",Number=1",           //
        "Test_Base.Name=\"n\",,Number=1",           //
        "Test_Base.Name=\"n\",Number=1,Note=\"x\"", // no key
        "Test_Base.Name=\"n\",Note=\"x\"",          //
        "Test_Base.Name=\"n\",Nothing=1",           //
        "Test_Base.Name=\"n\",Name=\"n\"",          // a key twice
        "Test_Base.Name=\"n\",Number=1,Number=1",   //
        "Test_Base.Name=n,Number=1",                // no quotes
        "Test_Base.Name=\"n,Number=1",              // one quote
        "Test_Base.Name=\"n\"x,Number=1",           //
        "Test_Base.Name=\"\\n\",Number=1",          // a backslash before another character
        "Test_Base.Name=\"n\\\",Number=1",          //
        "Test_Base.Name=\"n\\",                     //
        "Test_Base.Name=\"n\",Number=",             //
        "Test_Base.Name=\"n\",Number= 1",           //
        "Test_Base.Name=\"n\",Number=1 ",           //
        "Test_Base.Name=\"n\",Number=-1",           //
        "Test_Base.Name=\"n\",Number=--1",          //
        "Test_Base.Name=\"n\",Number=4294967296",   //
        "Test_Base.Name=\"n\",Number=1G",           //
        "Test_Base.Name=\"n\",Number=0x",           //
        "Test_Base.Name=\"n\",Number=\"1\"",        //
        "Test_Base.Name=\"n\",Number",              //
        " Test_Base.Name=\"n\",Number=1",           //
        "Test_Base .Name=\"n\",Number=1",           //
        "Test-Base.Name=\"n\",Number=1",            //
        "1Test_Base.Name=\"n\",Number=1",           //
        ".Name=\"n\",Number=1",                     //
        "Test_Base:Name=\"n\",Number=1",            //
        "Test_Base.Name\"n\",Number=1",             //
        "Test_Base.=\"n\",Number=1",                //
        "Test_Base.2Name=\"n\",Number=1",           //
        "Test_Thing.Name=\"n\",Number=1,Frob=1",    //
        "Test_Thing.Name=\"n\",Number=1,Peer=\"\"", //
        "Test_Leaf.Name=\"n\"",                     // a class without keys
    };
    for (const char* text : faulty)
        EXPECT_FALSE(is_read(&Test_Base::meta, text)) << text;
}

TEST(ModelPath, IntegersAreDecimalAndElseHexadecimal)
{
    const auto number = [](const std::string& digits) {
        const auto base = parse(&Test_Base::meta, "Test_Base.Name=\"n\",Number=" + digits);
        return base ? static_cast<long long>(static_cast<Test_Base*>(base.get())->Number.value) : -1;
    };
    EXPECT_EQ(number("16"), 16);
    EXPECT_EQ(number("+16"), 16);
    EXPECT_EQ(number("016"), 16);
    EXPECT_EQ(number("1F"), 0x1F);
    EXPECT_EQ(number("1f"), 0x1F);
    EXPECT_EQ(number("0x1f"), 0x1F);
    EXPECT_EQ(number("0XFFFFFFFF"), 0xFFFFFFFFll);
    EXPECT_EQ(number("0x100000000"), -1);
    EXPECT_EQ(number("99999999999999999999999"), -1);
    EXPECT_EQ(number("FFFFFFFFFFFFFFFFFFFFFF"), -1);
    EXPECT_EQ(number("0x-1"), -1);
    EXPECT_EQ(number("0x+1"), -1);
}

TEST(ModelPath, EachIntegerTypeHasItsLimits)
{
    const auto replaced = [](const std::string& from, const std::string& to) {
        std::string text = plain_path;
        const auto at = text.find(from);
        EXPECT_NE(at, std::string::npos);
        return is_read(&Test_Plain_Keys::meta, text.replace(at, from.size(), to));
    };
    EXPECT_TRUE(replaced("Boolean=true", "Boolean=FALSE"));
    EXPECT_FALSE(replaced("Boolean=true", "Boolean=1"));
    EXPECT_FALSE(replaced("Boolean=true", "Boolean="));
    EXPECT_FALSE(replaced("Uint8=255", "Uint8=256"));
    EXPECT_FALSE(replaced("Sint8=-128", "Sint8=-129"));
    EXPECT_TRUE(replaced("Sint8=-128", "Sint8=-7F"));
    EXPECT_FALSE(replaced("Sint8=-128", "Sint8=128"));
    EXPECT_FALSE(replaced("Uint16=65535", "Uint16=65536"));
    EXPECT_FALSE(replaced("Sint16=-32768", "Sint16=-32769"));
    EXPECT_FALSE(replaced("Sint32=-2147483648", "Sint32=2147483648"));
    EXPECT_FALSE(replaced("Uint64=18446744073709551615", "Uint64=18446744073709551616"));
    EXPECT_FALSE(replaced("Sint64=-9223372036854775808", "Sint64=-9223372036854775809"));
    EXPECT_TRUE(replaced("Uint64=18446744073709551615", "Uint64=0xFFFFFFFFFFFFFFFF"));
}

TEST(ModelPath, StringsTakeBackslashesBeforeBackslashAndQuote)
{
    const auto back = parse(&Test_Base::meta, "Test_Base.Name=\"a\\\\b\\\"c\",Number=1");
    ASSERT_TRUE(back);
    EXPECT_STREQ(static_cast<Test_Base*>(back.get())->Name.value.c_str(), "a\\b\"c");
    const auto empty = parse(&Test_Base::meta, "Test_Base.Name=\"\",Number=1");
    ASSERT_TRUE(empty);
    EXPECT_EQ(static_cast<Test_Base*>(empty.get())->Name.null, 0);
}

TEST(ModelPath, AReferenceEndsInItsOwnClass)
{
    const auto link = [](const char* right) {
        return is_read(&Test_Link::meta,
                       std::string("Test_Link.Left=\"Test_Base.Name=\\\"l\\\",Number=1\",Right=\"") + right + "\"");
    };
    EXPECT_TRUE(link("Test_Thing.Name=\\\"r\\\",Number=1"));
    EXPECT_FALSE(link("Test_Base.Name=\\\"r\\\",Number=1")) << "a superclass lacks what readers of the end expect";
    EXPECT_FALSE(link("Test_Leaf."));
    EXPECT_FALSE(link(""));
    EXPECT_FALSE(link("Test_Thing.Name=\\\"r\\\""));
    EXPECT_TRUE(is_read(&Test_Link::meta, "Test_Link.Left=\"Test_Thing.Name=\\\"l\\\",Number=1\","
                                          "Right=\"Test_Thing.Name=\\\"r\\\",Number=1\""))
        << "a subclass will do";
}

TEST(ModelPath, NestingHasAnEnd)
{
    const auto quoted = [](const std::string& text) {
        std::string result = "\"";
        for (const char c : text) {
            if (c == '"' || c == '\\') result += '\\';
            result += c;
        }
        return result + "\"";
    };
    std::string text = "Test_Leaf.";
    for (int nesting = 1; nesting <= 16; ++nesting)
        text = "Test_Chain.Next=" + quoted(text);
    EXPECT_TRUE(is_read(&Test_Node::meta, text));
    text = "Test_Chain.Next=" + quoted(text);
    EXPECT_FALSE(is_read(&Test_Node::meta, text));
}

TEST(ModelPath, NoDamagedTextIsHarmful)
{
    const std::string texts[] = {plain_path, "Test_Link.Left=\"Test_Base.Name=\\\"l\\\",Number=1\","
                                             "Right=\"Test_Thing.Name=\\\"r\\\",Number=2\""};
    const std::string damage = std::string("\"\\.,=x\x80-0") + '\xFF';
    int read = 0;
    for (const std::string& text : texts) {
        for (std::size_t at = 0; at <= text.size(); ++at) {
            read += is_read(&Test_Link::meta, text.substr(0, at));
            for (const char c : damage) {
                std::string changed = text;
                read += is_read(&Test_Link::meta, changed.insert(at, 1, c));
                if (at < text.size()) {
                    changed = text;
                    changed[at] = c;
                    read += is_read(&Test_Link::meta, changed);
                }
            }
        }
    }
    EXPECT_GT(read, 2) << "some damage only changes a value";
}

TEST(InstanceDump, ShowsEveryFeatureOfTheTopLevel)
{
    const Ref<Test_Thing> thing(make_full_thing());
    thing->Text.set("a\tb\nc\fd\re\"f");
    thing->Uint16.null = 1;
    thing->Sint16s.null = 1;
    thing->When.set(Datetime(300000000));
    EXPECT_EQ(printed(thing.get(), false), R"(Test_Thing
{
    string __name_space = "root/test";
    string Name = "a thing whose name outgrows the smallest rep";
    uint32 Number = 7;
    string Note = "note";
    boolean Boolean = true;
    uint8 Uint8 = 250;
    sint8 Sint8 = -120;
    uint16 Uint16 = NULL;
    sint16 Sint16 = -32000;
    uint32 Uint32 = 4000000000;
    sint32 Sint32 = -2000000000;
    uint64 Uint64 = 18000000000000000000;
    sint64 Sint64 = -9000000000000000000;
    real32 Real32 = 1.500000;
    real64 Real64 = -2.250000;
    char16 Char16 = 'x';
    string Text = "a\tb\nc\fd\re\"f";
    datetime When = 00000000000500.000000:000;
    boolean Booleans[] = { true, false};
    uint8 Uint8s[] = { 1, 2, 3};
    sint8 Sint8s[] = { -1};
    uint16 Uint16s[] = { 1, 65535};
    sint16 Sint16s[] = NULL;
    uint32 Uint32s[4] = { 1, 2, 3, 4};
    sint32 Sint32s[] = { -3};
    uint64 Uint64s[] = { 5};
    sint64 Sint64s[] = { -4};
    real32 Real32s[] = { 0.500000};
    real64 Real64s[] = { 0.250000};
    char16 Char16s[] = { 'a', 0x000A};
    string Texts[] = { "one", "two\twords", "a text of more than thirty-two characters"};
    datetime Times[] = { 00000000000000.000001:000, 00000000000000.000002:000};
    Test_Base Peer =
    {
        string Name = "peer";
        uint32 Number = 1;
    }
    Test_Base Inside =
    {
        string Name = "inside";
        uint32 Number = 2;
    }
    Instance Peers[] =
    {
        Test_Base
        {
            string Name = "one of many";
            uint32 Number = 0;
        }
        NULL;
        Test_Base
        {
            string Name = "one of many";
            uint32 Number = 2;
        }
    }
}
)");
}

TEST(InstanceDump, KeysAlone)
{
    const Ref<Test_Link> link(create_as<Test_Link>());
    link->Word.set("word");
    Test_Thing* right = make_full_thing();
    right->__name_space = "root/right";
    link->Right = right;
    EXPECT_EQ(printed(link.get(), true), R"(Test_Link
{
    Test_Base Left = NULL;
    Test_Thing Right =
    {
        string __name_space = "root/right";
        string Name = "a thing whose name outgrows the smallest rep";
        uint32 Number = 7;
    }
}
)");
}

TEST(InstanceDump, BelowTheTopEmbeddedInstancesAreShown)
{
    const Ref<Test_Thing> outer(create_as<Test_Thing>());
    nullify_properties(outer.get(), true, true, 1);
    Test_Thing* inner = make_keyed<Test_Thing>("inner", 1);
    inner->Text.set("not shown");
    inner->Inside = make_keyed("innermost", 2);
    inner->Peer = make_keyed("not shown", 3);
    outer->Inside = inner;
    const std::string text = printed(outer.get(), false);
    EXPECT_NE(text.find("    Test_Thing Inside =\n"
                        "    {\n"
                        "        string Name = \"inner\";\n"
                        "        uint32 Number = 1;\n"
                        "        Test_Base Inside =\n"
                        "        {\n"
                        "            string Name = \"innermost\";\n"
                        "            uint32 Number = 2;\n"
                        "        }\n"
                        "    }\n"),
              std::string::npos)
        << text;
    EXPECT_EQ(text.find("not shown"), std::string::npos);
    EXPECT_NE(text.find("    Instance Peers[] = NULL;\n"), std::string::npos);
}

TEST(InstanceDump, NothingIsPrintedForNothing)
{
    EXPECT_EQ(printed(nullptr, false), "");
    const Ref<Test_Node> node(create_as<Test_Node>());
    EXPECT_EQ(printed(node.get(), false), "Test_Node\n{\n}\n");
}
