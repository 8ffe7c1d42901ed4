#include "host/PathText.h"
#include "tests/host/Things.h"

#include <random>

using namespace host;

namespace {

Path_Parse parse(const std::string& text)
{
    return parse_path(text, things::schema().get(), "root/default");
}

TEST(PathText, ReadsHostNamespaceClassAndKeys)
{
    Path_Parse read = parse(R"(//server:5989/root/test:TEST_Thing.Id=7,Realm="a")");
    ASSERT_TRUE(read.ok) << read.error;
    EXPECT_EQ("server:5989", read.path.host);
    EXPECT_EQ("root/test", read.path.name_space);
    EXPECT_EQ("TEST_Thing", read.path.class_name);
    EXPECT_EQ(CMPI_uint32, read.path.find("Id")->type());
    EXPECT_EQ(7u, read.path.find("id")->as_uint());
    EXPECT_EQ("a", read.path.find("Realm")->as_text());
}

TEST(PathText, TakesTheGivenNamespaceWhereNoneIsSaid)
{
    Path_Parse read = parse("test_thing");
    ASSERT_TRUE(read.ok) << read.error;
    EXPECT_EQ("root/default", read.path.name_space);
    EXPECT_EQ("TEST_Thing", read.path.class_name) << "the spelling of the declaration";
    EXPECT_TRUE(read.path.keys.empty());
}

TEST(PathText, QuotesAndBackslashesComeBackAsTheyWere)
{
    Path path = things::thing(1);
    path.set("Realm", Value::string(R"(a "quoted" \ text, with=signs.and:colons//)"));
    Path_Parse read = parse(path.to_text());
    ASSERT_TRUE(read.ok) << read.error << " in " << path.to_text();
    EXPECT_EQ(path, read.path);
}

TEST(PathText, ReferencesAreQuotedPathsToAnyDepthThatIsSane)
{
    Path link;
    link.name_space = "root/test";
    link.class_name = "TEST_Link";
    link.set("First", Value::reference(things::thing(1)));
    link.set("Second", Value::reference(things::thing(2, "TEST_Other")));
    Path_Parse read = parse(link.to_text());
    ASSERT_TRUE(read.ok) << read.error << " in " << link.to_text();
    EXPECT_EQ(link, read.path);
    EXPECT_EQ(CMPI_ref, read.path.find("First")->type());
    EXPECT_EQ(2u, read.path.find("Second")->as_path()->find("Id")->as_uint());
}

TEST(PathText, WithoutASchemaTypesAreGuessed)
{
    Path_Parse read = parse_path(R"(X.a=1,b=-5,c=18446744073709551615,d="t",e=TRUE)", nullptr, "");
    ASSERT_TRUE(read.ok) << read.error;
    EXPECT_EQ(CMPI_sint64, read.path.find("a")->type());
    EXPECT_EQ(-5, read.path.find("b")->as_int());
    EXPECT_EQ(CMPI_uint64, read.path.find("c")->type());
    EXPECT_EQ(CMPI_string, read.path.find("d")->type());
    EXPECT_TRUE(read.path.find("e")->as_boolean());
}

struct Bad {
    const char* text;
    const char* reason;
};

class BadPaths : public testing::TestWithParam<Bad> {};

TEST_P(BadPaths, AreRefusedWithTheirReason)
{
    Path_Parse read = parse(GetParam().text);
    EXPECT_FALSE(read.ok);
    EXPECT_THAT(read.error, testing::HasSubstr(GetParam().reason));
}

INSTANTIATE_TEST_SUITE_P(
    All, BadPaths,
    testing::Values(Bad{"", "expected a class name"}, Bad{"//host", "without a host name"},
                    Bad{"root/test", "without ':'"}, Bad{"root te:TEST_Thing", "letters, digits"},
                    Bad{"TEST_Thing.", "a key's name"}, Bad{"TEST_Thing.Id", "'=' after the key Id"},
                    Bad{"TEST_Thing.Id=", "is no number"}, Bad{"TEST_Thing.Id=x", "is no number"},
                    Bad{"TEST_Thing.Id=4294967296", "does not fit into uint32"},
                    Bad{"TEST_Thing.Id=-1", "does not fit into uint32"},
                    Bad{"TEST_Thing.Id=99999999999999999999", "does not fit"}, Bad{"TEST_Thing.Id=\"1\"", "not a text"},
                    Bad{"TEST_Thing.Realm=1", "put its value in quotes"}, Bad{"TEST_Thing.Realm=TRUE", "not a boolean"},
                    Bad{"TEST_Thing.Realm=\"a", "closing quote"}, Bad{"TEST_Thing.Id=1,Id=2", "given twice"},
                    Bad{"TEST_Thing.Text=\"a\"", "its keys are Id, Realm"}, Bad{"TEST_Thing.Id=1;", "is no number"},
                    Bad{"TEST_Thing.Id=1 Realm", "a ',' or the end"}, Bad{"TEST_Thing Id", "a '.' before"},
                    Bad{"TEST_Link.First=\"TEST_Thing.Nix=1\"", "in the reference First"}));

TEST(PathText, HostileTextsEndInAnError)
{
    EXPECT_FALSE(parse(std::string(100 * 1024, 'a')).ok);
    EXPECT_FALSE(parse(std::string("TEST_Thing\0.Id=1", 16)).ok);
    std::string nested = "X";
    for (int i = 0; i < 12; ++i)
        nested = "TEST_Link.First=" + quote(nested);
    Path_Parse read = parse(nested);
    EXPECT_FALSE(read.ok);
    EXPECT_THAT(read.error, testing::HasSubstr("too deep"));
}

TEST(PathText, RandomBytesNeverDoHarm)
{
    std::mt19937 random(4711);
    const std::string pieces = "TEST_Thing.Id=1,Realm=\"\\\"/:,=.-0aZ\xff\x01 ";
    for (int round = 0; round < 20000; ++round) {
        std::string text;
        for (unsigned i = random() % 40; i > 0; --i)
            text += pieces[random() % pieces.size()];
        Path_Parse read = parse(text);
        if (read.ok) {
            EXPECT_EQ(read.path, parse(read.path.to_text()).path) << text;
        } else {
            EXPECT_FALSE(read.error.empty()) << text;
        }
    }
}

} // namespace
