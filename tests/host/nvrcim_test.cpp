// The command as people run it: output, complaints and exit status, with the test provider for a module.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <string>
#include <sys/wait.h>

using testing::HasSubstr;

namespace {

struct Outcome {
    int status = -1;
    std::string out;
};

/// Runs nvrcim by the shell; what it complains of comes with its output.
Outcome run(const std::string& arguments, const std::string& environment = "TEST_count=2")
{
    const std::string command =
        environment + " " NVRCIM " --module " THINGS_MODULE " --mof " THINGS_MOF " -n root/test " + arguments + " 2>&1";
    Outcome outcome;
    std::FILE* pipe = popen(command.c_str(), "r");
    if (!pipe) return outcome;
    std::array<char, 4096> buffer;
    while (std::size_t size = fread(buffer.data(), 1, buffer.size(), pipe))
        outcome.out.append(buffer.data(), size);
    int status = pclose(pipe);
    outcome.status = WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    return outcome;
}

void expect(const std::string& arguments, int status, const std::string& out)
{
    Outcome outcome = run(arguments);
    EXPECT_EQ(status, outcome.status) << arguments;
    EXPECT_EQ(out, outcome.out) << arguments;
}

TEST(Nvrcim, ListsClasses)
{
    expect("classes", 0,
           "CLASS       SUPERCLASS  SERVED AS                    NAMESPACES\n"
           "TEST_Thing  TEST_Base   instance method              root/test\n"
           "TEST_Other  TEST_Base   instance                     root/test\n"
           "TEST_Link               instance association method  root/test\n"
           "TEST_Alert  CIM_Signal  method indication            root/test\n");
    expect("classes silent --all", 0, "CLASS        SUPERCLASS\nTEST_Silent  TEST_Base\n");
    expect("classes nix", 0, "no class has \"nix\" in its name\n");
}

TEST(Nvrcim, EnumeratesATable)
{
    expect("enum TEST_Other", 0,
           "Id  Realm         Name\n"
           " 1  test \"realm\"  other\n"
           " 2  test \"realm\"  other\n");
    expect("enum test_thing --properties Id,State,Friend", 0,
           "Id  State  Friend\n"
           " 1  1      TEST_Other 1,test \"realm\"\n"
           " 2  OK     TEST_Other 2,test \"realm\"\n");
    expect("enum TEST_Base", 0,
           "CLASS       OBJECT          Name\n"
           "TEST_Thing  1,test \"realm\"\n"
           "TEST_Thing  2,test \"realm\"\n"
           "TEST_Other  1,test \"realm\"  other\n"
           "TEST_Other  2,test \"realm\"  other\n");
}

TEST(Nvrcim, AnEmptyClassIsToldAsSuch)
{
    Outcome outcome = run("enum TEST_Other", "TEST_count=0");
    EXPECT_EQ(0, outcome.status);
    EXPECT_EQ("no instances of TEST_Other in root/test\n", outcome.out);
}

TEST(Nvrcim, ShowsOneInstanceWithTheWordsOfItsNumbers)
{
    expect("get 'TEST_Thing.Id=2,Realm=\"x\"' -p State,Texts,Inner", 0,
           "root/test:TEST_Thing.Id=2,Realm=\"test \\\"realm\\\"\"\n"
           "  Id     2\n"
           "  Realm  test \"realm\"\n"
           "  Texts  one, two\n"
           "  Inner  TEST_Other {Name = inner}\n"
           "  State  2 (OK)\n");
}

TEST(Nvrcim, NamesReadBackAsPaths)
{
    Outcome names = run("names TEST_Other");
    EXPECT_EQ("root/test:TEST_Other.Id=1,Realm=\"test \\\"realm\\\"\"\nroot/test:TEST_Other.Id=2,Realm=\"test "
              "\\\"realm\\\"\"\n",
              names.out);
    std::string first = names.out.substr(0, names.out.find('\n'));
    EXPECT_EQ(0, run("get '" + first + "'").status);
}

TEST(Nvrcim, SetsPropertiesByNumberOrWord)
{
    expect("set 'TEST_Thing.Id=1,Realm=\"x\"' State=ok", 0, "TEST_Thing.State = 2 (OK)\n");
    expect("set 'TEST_Thing.Id=1,Realm=\"x\"' State=77", 4,
           "nvrcim: the provider answers CMPI_RC_ERR_INVALID_PARAMETER (4): a state is 0 to 12\n");
    expect("set 'TEST_Thing.Id=1,Realm=\"x\"' State=70000", 64,
           "nvrcim: wrong command: State is uint16: 70000 does not fit\n");
    expect("set 'TEST_Thing.Id=1,Realm=\"x\"' Id=2", 64,
           "nvrcim: wrong command: Id is a key, and keys cannot change\n");
}

TEST(Nvrcim, CallsMethods)
{
    expect("call 'TEST_Thing.Id=1,Realm=\"x\"' double Number=21 'Words=[a,\"b,c\"]'", 0,
           "Double returned 0 (Done)\n  Result = 42\n  Back = b, a\n");
    expect("call TEST_Thing Hello", 0, "Hello returned hello\n");
    expect(
        "call TEST_Thing Double", 64,
        "nvrcim: wrong command: an object path of TEST_Thing also needs Id, Realm (nvrcim names TEST_Thing shows whole "
        "paths)\n");
    expect("call TEST_Thing Nix", 64, "nvrcim: wrong command: TEST_Thing has no method Nix; it has Double, Hello\n");
    expect("call 'TEST_Thing.Id=1,Realm=\"x\"' Double Result=1", 64,
           "nvrcim: wrong command: Result is an output of Double\n");
}

TEST(Nvrcim, PrintsJson)
{
    expect("--json enum TEST_Other -p Name", 0,
           "{\n  \"status\": 0,\n  \"instances\": [\n"
           "    {\n      \"path\": \"root/test:TEST_Other.Id=1,Realm=\\\"test \\\\\\\"realm\\\\\\\"\\\"\",\n"
           "      \"class\": \"TEST_Other\",\n      \"properties\": {\n        \"Id\": 1,\n"
           "        \"Realm\": \"test \\\"realm\\\"\",\n        \"Name\": \"other\"\n      }\n    },\n"
           "    {\n      \"path\": \"root/test:TEST_Other.Id=2,Realm=\\\"test \\\\\\\"realm\\\\\\\"\\\"\",\n"
           "      \"class\": \"TEST_Other\",\n      \"properties\": {\n        \"Id\": 2,\n"
           "        \"Realm\": \"test \\\"realm\\\"\",\n        \"Name\": \"other\"\n      }\n    }\n  ]\n}\n");
    expect("call TEST_Thing Hello --json", 0, "{\n  \"status\": 0,\n  \"returnValue\": \"hello\",\n  \"out\": {}\n}\n");
}

TEST(Nvrcim, ExitsWithTheStatusAndSaysWhoseFaultItIs)
{
    expect("get 'TEST_Thing.Id=9,Realm=\"x\"'", 6,
           "nvrcim: the provider answers CMPI_RC_ERR_NOT_FOUND (6): no such thing\n");
    expect("enum Nix", 5, "nvrcim: wrong request: there is no class Nix\n");
    expect("enum root/nowhere:TEST_Thing", 3, "nvrcim: wrong request: the server has no namespace root/nowhere\n");
    expect("enum TEST_Silent", 7,
           "nvrcim: wrong request: no instance provider is registered for TEST_Silent in root/test\n");
    expect("get 'TEST_Thing.Id='", 64,
           "nvrcim: wrong command: \"TEST_Thing.Id=\": the key Id: '' is no number, text or boolean\n");
    Outcome failing = run("enum TEST_Other", "TEST_factory_null=1");
    EXPECT_EQ(1, failing.status);
    EXPECT_EQ(0u, failing.out.find("nvrcim: the module fails: the factory TEST_Other_Provider_Create_InstanceMI"));
}

TEST(Nvrcim, ResultsBeforeAFailureAreShown)
{
    Outcome outcome = run("enum TEST_Other", "TEST_count=3 TEST_stop_after=1");
    EXPECT_EQ(1, outcome.status);
    EXPECT_THAT(outcome.out, HasSubstr(" 1  test \"realm\"  other\n"));
    EXPECT_THAT(outcome.out, HasSubstr("nvrcim: the provider answers CMPI_RC_ERR_FAILED (1): stopped early\n"));
}

TEST(Nvrcim, CommandsThatCannotBeUnderstoodExitWith64)
{
    EXPECT_EQ(64, run("").status);
    EXPECT_EQ(64, run("enum").status);
    EXPECT_EQ(64, run("enum TEST_Other --nonsense").status);
    Outcome manner = run("--manner windows classes");
    EXPECT_EQ(64, manner.status);
    EXPECT_THAT(manner.out, HasSubstr("the manners are strict, sfcb, sfcb-1.3.7, pegasus"));
    Outcome scenario = run("--scenario /nowhere.toml classes");
    EXPECT_EQ(64, scenario.status);
    EXPECT_THAT(scenario.out, HasSubstr("nvrcim: your scenario /nowhere.toml: No such file or directory\n"));
    EXPECT_EQ(0, run("--help").status);
}

TEST(Nvrcim, AScenarioReachesTheModulesEnvironmentBeforeItStarts)
{
    const std::string folder = testing::TempDir(), file = folder + "some.toml";
    std::ofstream(file) << "# a host\n";
    Outcome outcome =
        run("--scenario " + file + " --server-log - enum TEST_Other", "TEST_count=1 NVRCIM_SIMULATOR=" + folder);
    EXPECT_EQ(0, outcome.status) << outcome.out;
    EXPECT_THAT(outcome.out, HasSubstr(" 1  test \"realm\"  other\n"));
    std::remove(file.c_str());
}

TEST(Nvrcim, TheServersLogTellsOfTheModulesLife)
{
    Outcome outcome = run("--manner pegasus --server-log - names TEST_Other");
    for (const char* part : {"dlopen (lazy, global)", "factory TEST_Other_Provider_Create_InstanceMI: OK",
                             "enumerateInstanceNames TEST_Other: CMPI_RC_OK, 0 instances, 2 paths",
                             "cleanup (terminating true) of TEST_Other_Provider Instance: CMPI_RC_OK", "dlclose"})
        EXPECT_THAT(outcome.out, HasSubstr(part));
}

TEST(Nvrcim, ShowsWhatAssociationsTieToAnInstance)
{
    const std::string thing = " 'TEST_Thing.Id=1,Realm=\"test \\\"realm\\\"\"'";
    expect("associators" + thing, 0, "Id  Realm         Name\n 1  test \"realm\"  other\n");
    expect("associators" + thing + " --names --class TEST_Link --result-class TEST_Other --result-role second", 0,
           "root/test:TEST_Other.Id=1,Realm=\"test \\\"realm\\\"\"\n");
    expect("references" + thing, 0,
           "First                      Second\nTEST_Thing 1,test \"realm\"  TEST_Other 1,test \"realm\"\n");
    expect("references" + thing + " --names --json", 0,
           "{\n  \"status\": 0,\n  \"paths\": [\n    "
           "\"root/test:TEST_Link.First=\\\"root/test:TEST_Thing.Id=1,Realm=\\\\\\\"test "
           "\\\\\\\\\\\\\\\"realm\\\\\\\\\\\\\\\"\\\\\\\"\\\",Second=\\\"root/test:TEST_Other.Id=1,Realm=\\\\\\\"test "
           "\\\\\\\\\\\\\\\"realm\\\\\\\\\\\\\\\"\\\\\\\"\\\"\"\n  ]\n}\n");
    expect("references" + thing + " --role Second", 0, "no association holds it\n");
    expect(
        "associators TEST_Thing", 64,
        "nvrcim: wrong command: an object path of TEST_Thing also needs Id, Realm (nvrcim names TEST_Thing shows whole "
        "paths)\n");
    expect("associators" + thing + " --class Nix", 4, "nvrcim: wrong request: the server has no class Nix\n");
}

// The test provider answers a traversal for its first thing alone, and not back from the other end.
TEST(Nvrcim, ChecksThatBothEndsOfAnAssociationFindEachOther)
{
    Outcome outcome = run("check --all");
    EXPECT_EQ(1, outcome.status);
    EXPECT_THAT(outcome.out, HasSubstr("TEST_Link            2           4          0      0       5\n"));
    EXPECT_THAT(outcome.out,
                HasSubstr("TEST_Link: associators of the Second root/test:TEST_Other.Id=1,Realm=\"test \\\"realm\\\"\" "
                          "lack root/test:TEST_Thing.Id=1,Realm=\"test \\\"realm\\\"\"\n"));
    EXPECT_THAT(outcome.out, HasSubstr("TEST_Link: references of the First root/test:TEST_Thing.Id=2,"));
    EXPECT_THAT(outcome.out, HasSubstr("; ends: 4 found, 0 of other providers, 0 loose by design; 5 faults\n"));
    EXPECT_THAT(run("check", "TEST_count=0").out,
                HasSubstr("1 association class, 0 with instances; 0 instances; ends: 0 found, 0 of other providers, 0 "
                          "loose by design; 0 faults\n"));
    EXPECT_THAT(run("check", "TEST_count=2 TEST_stop_after=1").out,
                HasSubstr("TEST_Link: enumeration ends with CMPI_RC_ERR_FAILED (stopped early)\n"));
}

TEST(Nvrcim, TellsWhyItCannotDraw)
{
    expect("graph picture.gif", 64,
           "nvrcim: wrong command: a picture's name ends in .svg, .png or .dot: picture.gif\n");
    EXPECT_EQ(64, run("graph").status);
    // A module without the classes of adapters has no tree.
    expect("tree", 5, "nvrcim: wrong request: the server has no class NVRHBA_SystemPackaging\n");
}

} // namespace
