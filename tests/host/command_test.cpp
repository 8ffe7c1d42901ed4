// The parts of nvrcim: arguments by type, tables within a width, places, and words for statuses.
#include "host/command/Arguments.h"
#include "host/command/Graph.h"
#include "host/command/Places.h"
#include "host/command/Table.h"
#include "host/command/Verbs.h"
#include "host/command/Views.h"
#include "host/command/Walk.h"
#include "tests/host/Things.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <nlohmann/json.hpp>
#include <sstream>

using namespace host;
using testing::HasSubstr;

namespace {

Argument_Parse read(const std::string& name, const std::string& text)
{
    const Class_Record& record = *things::schema()->find("TEST_Thing");
    const Element_Record* element = record.property(name);
    if (!element) element = record.method("Double")->find_parameter(name);
    return parse_argument(*element, text, *things::schema(), "root/test");
}

TEST(CommandArguments, AreReadByTheirDeclaredType)
{
    EXPECT_EQ(Value::uint32(5), read("U32", "5").argument.value);
    EXPECT_EQ(CMPI_uint8, read("U8", "0xff").argument.value.type());
    EXPECT_EQ(-128, read("S8", "-128").argument.value.as_int());
    EXPECT_EQ(18446744073709551615ull, read("U64", "18446744073709551615").argument.value.as_uint());
    EXPECT_EQ(INT64_MIN, read("S64", "-9223372036854775808").argument.value.as_int());
    EXPECT_EQ(Value::boolean(true), read("Flag", "TRUE").argument.value);
    EXPECT_EQ("a = b", read("Text", "a = b").argument.value.as_text());
    EXPECT_EQ("a \"b\"", read("Text", "\"a \\\"b\\\"\"").argument.value.as_text());
    EXPECT_EQ("", read("Text", "").argument.value.as_text());
    EXPECT_EQ("{1, 2, 255}", read("Numbers", "[1, 2,0xff]").argument.value.to_text());
    EXPECT_EQ("{}", read("Numbers", "[]").argument.value.to_text());
    EXPECT_EQ("{a b, c,d, ]}", read("Texts", "[a b,\"c,d\",\"]\"]").argument.value.to_text());
    EXPECT_EQ(2u, read("State", "ok").argument.value.as_uint()) << "a word of the class";
    EXPECT_EQ(1.25, read("R64", "1.25").argument.value.as_real());
    Value target = read("Target", "TEST_Other.Id=1,Realm=\"r\"").argument.value;
    ASSERT_NE(nullptr, target.as_path());
    EXPECT_EQ("root/test", target.as_path()->name_space);
    EXPECT_TRUE(read("U32", "NULL").argument.value.is_null());
    EXPECT_EQ(CMPI_uint32, read("U32", "NULL").argument.value.type());
}

TEST(CommandArguments, ThatDoNotFitAreRefusedWithTheirName)
{
    const std::pair<const char*, const char*> bad[] = {{"U8", "256"},
                                                       {"U8", "-1"},
                                                       {"S8", "128"},
                                                       {"S8", "-129"},
                                                       {"U32", ""},
                                                       {"U32", "0x"},
                                                       {"U32", "1x"},
                                                       {"U32", "-"},
                                                       {"U64", "18446744073709551616"},
                                                       {"Flag", "yes"},
                                                       {"When", "now"},
                                                       {"R64", "fast"},
                                                       {"Numbers", "1"},
                                                       {"Numbers", "[1"},
                                                       {"Numbers", "[1,]"},
                                                       {"Texts", "[\"a]"},
                                                       {"State", "Splendid"},
                                                       {"Inner", "x"},
                                                       {"Target", "TEST_Thing.Id=1"},
                                                       {"Target", "("}};
    for (const auto& [name, text] : bad) {
        Argument_Parse parse = read(name, text);
        EXPECT_FALSE(parse.ok) << name << "=" << text;
        EXPECT_EQ(0u, parse.error.find(name)) << parse.error;
    }
    std::string name, value;
    EXPECT_FALSE(split_argument("=5", name, value));
    EXPECT_FALSE(split_argument("Number", name, value));
    EXPECT_TRUE(split_argument("a=b=c", name, value));
    EXPECT_EQ("b=c", value);
}

TEST(CommandTables, WideColumnsGiveWayFirst)
{
    Table table({"ID", "TEXT", "EMPTY"});
    table.add({"1", std::string(200, 'x'), ""});
    table.add({"22", "y", ""});
    std::istringstream lines(table.to_text(40));
    std::string header, first, second;
    std::getline(lines, header);
    std::getline(lines, first);
    std::getline(lines, second);
    EXPECT_EQ("ID  TEXT", header);
    EXPECT_EQ(" 1  " + std::string(33, 'x') + "...", first);
    EXPECT_EQ("22  y", second);
}

TEST(CommandTables, TextsAreCutBetweenCharactersAndBytesThatAreNoneShowAsQuestionMarks)
{
    EXPECT_EQ(4u, text_width("gr\xC3\xBC\xC3\x9F"));
    EXPECT_EQ("gr\xC3\xBC...", cut("gr\xC3\xBC\xC3\x9Fgott", 6));
    EXPECT_EQ("..", cut("abcdef", 2));
    EXPECT_EQ("a?b?c?", printable("a\nb\xFF"
                                  "c\xC3"));
    EXPECT_EQ("?[31m", printable("\x1b[31m")) << "no terminal is steered from inside a value";
}

TEST(CommandViews, NoTableIsWiderThanThePage)
{
    Instance instance;
    instance.path = things::thing(1);
    instance.set("Text", Value::string(std::string(500, 'w')));
    std::istringstream table(instance_table({instance}, *things::schema(), {"Id", "Realm", "Text"}));
    for (std::string line; std::getline(table, line);)
        EXPECT_LE(text_width(line), page_width);
    std::istringstream list(property_list(instance, *things::schema(), true));
    int count = 0;
    for (std::string line; std::getline(list, line); ++count)
        EXPECT_LE(text_width(line), page_width);
    EXPECT_GT(count, 20) << "null properties too";
}

TEST(CommandViews, SpeedsAndFabricAddressesReadAsInTheField)
{
    Element_Record property;
    property.name = "FCID";
    EXPECT_EQ("0x010100", value_text(&property, Value::uint32(65792)));
    property.name = "Speed";
    EXPECT_EQ("16 Gbit/s", value_text(&property, Value::uint64(16000000000)));
    EXPECT_EQ("-", value_text(&property, Value::uint64(0)));
    EXPECT_EQ("1234 bit/s", value_text(&property, Value::uint64(1234)));
}

TEST(CommandViews, JsonKeepsNumbersAndReplacesBrokenText)
{
    Instance instance;
    instance.path = things::thing(1);
    instance.set("U64", Value::uint64(18446744073709551615ull));
    instance.set("Text", Value::string("a\xFF"));
    instance.set("Gone", Value());
    std::string text = json_text(to_json(instance));
    EXPECT_THAT(text, HasSubstr("18446744073709551615"));
    EXPECT_THAT(text, HasSubstr("\"Gone\": null"));
    EXPECT_TRUE(nlohmann::json::accept(text));
}

TEST(CommandPlaces, AreFoundInABuildTreeAndInAnInstallation)
{
    namespace fs = std::filesystem;
    const fs::path root = fs::canonical(testing::TempDir()) / "nvrcim_places";
    fs::remove_all(root);
    for (const char* folder : {"tree/build/release/host", "tree/build/release/lib", "tree/build/release/simulator/lib",
                               "tree/classes/mof", "usr/bin", "usr/lib", "usr/share/norvane-fc-provider/mof"})
        fs::create_directories(root / folder);
    for (const char* file : {"tree/build/release/lib/libnorvane_fc_provider.so", "usr/lib/libnorvane_fc_provider.so"})
        std::ofstream(root / file) << "x";
    Places tree = find_places((root / "tree/build/release/host").string());
    EXPECT_EQ(root / "tree/build/release/lib/libnorvane_fc_provider.so", tree.module);
    EXPECT_EQ(root / "tree/classes/mof", tree.mof);
    EXPECT_EQ(root / "tree/build/release/simulator/lib", tree.simulator);
    Places installed = find_places((root / "usr/bin").string());
    EXPECT_EQ(root / "usr/lib/libnorvane_fc_provider.so", installed.module);
    EXPECT_EQ(root / "usr/share/norvane-fc-provider/mof", installed.mof);
    EXPECT_EQ("", installed.simulator);
    fs::remove_all(root);
}

TEST(CommandComplaints, BeginWithWhoseFaultItIs)
{
    EXPECT_EQ("nvrcim: the provider answers CMPI_RC_ERR_NOT_FOUND (6)", complaint({6, "", Fault::provider}));
    EXPECT_EQ("nvrcim: wrong request: the server has no class X",
              complaint({5, "the server has no class X", Fault::request}));
    EXPECT_EQ("nvrcim: the module fails: it cannot be loaded", complaint({1, "it cannot be loaded", Fault::module}));
}

std::string checked(Host& server)
{
    Options options;
    options.verb = "check";
    options.name_space = things::space;
    std::ostringstream out, complaints;
    run_verb(server, options, out, complaints);
    return out.str();
}

TEST(CommandCheck, NamesAnEndThatDoesNotExist)
{
    things::reset();
    auto server = things::make_host();
    Instance link;
    link.path.name_space = things::space;
    link.path.class_name = "TEST_Link";
    link.set("First", Value::reference(things::thing(7)));
    link.set("Second", Value::reference(things::thing(1, "TEST_Silent")));
    server->add_instance(link);
    const std::string told = checked(*server);
    EXPECT_THAT(told, HasSubstr("TEST_Link: First does not exist: root/test:TEST_Thing.Id=7"));
    EXPECT_THAT(told, HasSubstr("TEST_Link: Second is of a class that nobody serves: root/test:TEST_Silent.Id=1"));
    EXPECT_THAT(told, HasSubstr("1 instance; ends: 0 found"));
}

TEST(CommandWalk, IdentityLooksAtClassAndKeysAlone)
{
    Path one = things::thing(1), same = things::thing(1);
    std::reverse(same.keys.begin(), same.keys.end());
    same.name_space = "root/other";
    same.class_name = "test_thing";
    EXPECT_EQ(identity(one), identity(same));
    EXPECT_NE(identity(one), identity(things::thing(2)));
    Path split, joined;
    split.class_name = joined.class_name = "C";
    split.set("a", Value::string("1"));
    split.set("b", Value::string("2"));
    joined.set("a", Value::string("1,b=1:2"));
    EXPECT_NE(identity(split), identity(joined)) << "a value that looks like two";
}

TEST(CommandGraph, KeepsTextsFromBreakingTheDrawing)
{
    Walk walk;
    walk.hosts.emplace_back();
    walk.hosts.back().path.set("Name", Value::string("a<b>&\"c\"\n"));
    const std::string graph = dot_text(walk, *things::schema());
    EXPECT_THAT(graph, HasSubstr("<b>a&lt;b&gt;&amp;&quot;c&quot;?</b>"));
}

TEST(CommandGraph, DrawsATargetOnceWithTheDevicesOfAllRoutes)
{
    auto port = [](const char* fabric, const char* device) {
        Port_Node node;
        node.port.set("FabricName", Value::string(fabric));
        Unit_Node unit{"5", device, {}};
        unit.unit.set("ElementName", Value::string("Storage Volume: 3"));
        unit.unit.set("Capacity", Value::uint64(3ull << 29));
        node.targets.push_back({"50060E8005A10000", {}, {unit}});
        return node;
    };
    Walk walk;
    walk.hosts.emplace_back();
    walk.hosts.back().adapters.push_back({{}, {port("f1", "/dev/sda"), port("f2", "/dev/sdb")}});
    const std::string graph = dot_text(walk, *things::schema());
    const std::string title = "<b>target 50060E8005A10000</b>";
    ASSERT_NE(std::string::npos, graph.find(title));
    EXPECT_EQ(graph.find(title), graph.rfind(title));
    EXPECT_THAT(graph, HasSubstr("<b>LUN 5</b>"));
    EXPECT_THAT(graph, HasSubstr("  Storage Volume  1.5 GiB  /dev/sda  /dev/sdb</font>"));
    EXPECT_THAT(graph, HasSubstr("-> target3 [tailport=e, headport=w, color=\"#0072b2\"]"));
    EXPECT_THAT(graph, HasSubstr("-> target3 [tailport=e, headport=w, color=\"#d55e00\"]"));
}

} // namespace
