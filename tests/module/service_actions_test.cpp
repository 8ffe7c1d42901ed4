// The command's verbs for dumps, driver parameters and frame tagging, from end to end.
#include <filesystem>

#include <gmock/gmock.h>

#include "tests/module/support/Command_Line.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"

using namespace nvrtest;
using testing::HasSubstr;
using testing::Not;
using testing::StartsWith;

namespace {

constexpr char directory[] = "/var/log/dumps";

/// Runs over a host whose dumps stay from process to process.
Ended_Command run(const std::string& arguments, const std::string& environment = "")
{
    static const std::string scenario = [] {
        make_folder(directory);
        write_file("/var/log/tagged.toml",
                   std::string("[[adapter]]\n[[adapter.port]]\ndump_directory = \"") + directory +
                       "\"\ndumps = [\"old.dmp\"]\nretention = 1\n[[adapter.tag]]\nsource = \"10000000C9A00001\"\n"
                       "target = \"50060E8005A10000\"\ntag = 5\n");
        return std::filesystem::relative("/var/log/tagged", NVRSIM_BUILD "/scenarios").string();
    }();
    return nvrcim(arguments, scenario, environment);
}

void expect(const std::string& arguments, int status, const std::string& output)
{
    const Ended_Command ended = run(arguments);
    EXPECT_EQ(ended.status, status) << arguments;
    EXPECT_EQ(ended.output, output) << arguments;
}

} // namespace

TEST(DumpActions, GenerateListAndDelete)
{
    expect("dump list", 0, "dump list, port 10000000C9A00001: done (0)\n  DumpFiles = old.dmp\n");
    expect("dump generate --yes", 0, "dump generate, port 10000000C9A00001: done (0)\n");
    EXPECT_TRUE(exists(std::string(directory) + "/NVR_10000000C9A00001_dump_0001.dmp"));
    expect("dump delete -y", 0, "dump delete, port 10000000C9A00001: done (0)\n");
    EXPECT_THAT(run("dump list --json").output, HasSubstr("\"DumpFiles\": [\n      \"old.dmp\"\n    ]"));
}

TEST(DumpActions, AskFirst)
{
    const Ended_Command ended = run("dump delete", "echo n |");
    EXPECT_EQ(ended.status, 65);
    EXPECT_THAT(ended.output, HasSubstr("Delete all dumps of port 10000000C9A00001? [y/N] "));
    EXPECT_EQ(run("dump generate", "echo |").status, 65);
}

TEST(ParamActions, ListThoseOfThePortOrOfAll)
{
    const std::string head = "PARAMETER        CURRENT  DEFAULT  LOW        HIGH  CHANGES";
    for (const host::Manner* manner : every_manner()) {
        const Ended_Command ended = run(std::string("param list --manner ") + manner->name);
        EXPECT_EQ(ended.status, 0);
        EXPECT_THAT(ended.output, StartsWith(head)) << ended.output;
        EXPECT_THAT(ended.output,
                    HasSubstr("\nlun-queue-depth       30       30    1         512  at once            Max number"))
            << ended.output;
        EXPECT_THAT(ended.output, HasSubstr("\nlink-speed             0        0    0          16  at its next start"))
            << ended.output;
    }
    const Ended_Command global = run("param list --global");
    EXPECT_EQ(global.status, 0);
    EXPECT_THAT(global.output, StartsWith("PARAMETER        CURRENT  GLOBAL")) << global.output;
    EXPECT_THAT(run("param list --json").output, HasSubstr("\"paramname\": \"lun-queue-depth\""));
}

TEST(ParamActions, ListThoseOfOnePortAlone)
{
    const Ended_Command ended = nvrcim("param list --port 10000000C9A00002 --json", "typical");
    EXPECT_THAT(ended.output, HasSubstr("\"InstanceID\": \"10000000C9A00002:lun-queue-depth\""));
    EXPECT_THAT(ended.output, Not(HasSubstr("10000000C9A00001")));
}

TEST(ParamActions, Set)
{
    expect("param set lun-queue-depth 64 --yes", 0, "param set, port 10000000C9A00001: done (0)\n");
    expect("param set nodev-tmo 64 --permanent --global --yes", 0, "param set, port 10000000C9A00001: done (0)\n");
    expect(
        "param set lun-queue-depth 5000 --yes", 66,
        "param set, port 10000000C9A00001: there is no such parameter, or the value is outside its limits (40004)\n");
    EXPECT_EQ(run("param set lun-queue-depth 64", "echo n |").status, 65);
    for (const char* arguments : {"param", "param set", "param set x", "param list --permanent"})
        EXPECT_EQ(run(arguments).status, 64) << arguments;
}

TEST(TagActions, SwitchTagging)
{
    expect("tag get", 0, "tag get, port 10000000C9A00001: done (0)\n  State = 0 (off)\n");
    expect("tag set on --yes", 0, "tag set, port 10000000C9A00001: done (0)\n");
    EXPECT_EQ(run("tag set on", "echo n |").status, 65);
    EXPECT_EQ(run("tag set 7 --yes").status, 64);
}

TEST(TagActions, SaveAndLoadTheTable)
{
    expect("tag save tags.xml", 0, "tag save, port 10000000C9A00001: done, unless the log tells otherwise (0)\n");
    EXPECT_THAT(read_file(std::string(directory) + "/tags.xml"), HasSubstr("<tag>5</tag>"));
    expect(std::string("tag load ") + directory + "/tags.xml --yes", 0, "tag load, port 10000000C9A00001: done (0)\n");
    expect("tag load nobody.xml --yes", 66, "tag load, port 10000000C9A00001: the file was not found (4107)\n");
    write_file(std::string(directory) + "/bad.xml", "no XML");
    expect(
        std::string("tag load ") + directory + "/bad.xml --yes", 66,
        "tag load, port 10000000C9A00001: the adapter or the file cannot be opened, or the file is no whole tag table "
        "(32968)\n");
    EXPECT_EQ(run("tag load x", "echo n |").status, 65);
}
