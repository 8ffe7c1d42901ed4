// The command's verbs for what people do with adapters, from end to end.
#include <gmock/gmock.h>

#include "tests/module/support/Command_Line.h"
#include "tests/module/support/Rig.h"

using namespace nvrtest;
using testing::HasSubstr;
using testing::Not;

namespace {

void expect(const std::string& arguments, int status, const std::string& output, const std::string& scenario = "small")
{
    const Ended_Command run = nvrcim(arguments, scenario);
    EXPECT_EQ(run.status, status) << arguments;
    EXPECT_EQ(run.output, output) << arguments;
}

} // namespace

TEST(Actions, ReadTheNamesOfTheOnlyPort)
{
    expect("wwn read", 0,
           "wwn read, port 10000000C9A00001: done (0)\n"
           "  WWPN = 10:00:00:00:c9:a0:00:01\n"
           "  WWNN = 20:00:00:00:c9:a0:00:01\n"
           "  WWNOperationStatus = 4 (non-volatile)\n");
    expect("wwn read --type configured", 0,
           "wwn read, port 10000000C9A00001: done (0)\n"
           "  WWNOperationStatus = 9 (there are none)\n");
}

TEST(Actions, TellWhichNamesCanBeChanged)
{
    expect("wwn capability", 0,
           "wwn capability, port 10000000C9A00001: done (0)\n"
           "  WWNCapability = 8204 (non-volatile names can be changed, volatile names can be changed, a reset of the "
           "adapter activates them)\n");
}

TEST(Actions, ChangeAndRestoreNamesWithoutAQuestionWhereToldSo)
{
    expect("wwn change 10:00:00:00:C9:A0:F0:01 2000-0000-c9a0-f001 --type volatile --yes", 0,
           "wwn change, port 10000000C9A00001: done (0)\n"
           "  WWNOperationStatus = 7 (volatile names are written, a reset of the adapter activates them)\n");
    expect("wwn restore -y", 0,
           "wwn restore, port 10000000C9A00001: done (0)\n"
           "  WWNOperationStatus = 1 (the names are active already)\n");
}

TEST(Actions, TellWhatAReturnValueMeansAndEndWithAStatusOfItsOwn)
{
    // The first virtual port of the first port has this name.
    expect("wwn change 10010000C9A00001 20000000C9A0F001 --port 10000000C9A00003 --yes", 66,
           "wwn change, port 10000000C9A00003: the name is that of a virtual port (91)\n"
           "  WWNOperationStatus = 1 (the name is the WWPN of a virtual port)\n",
           "typical");
    expect("wwn change 0000000000000000 20000000C9A0F001 --yes", 66,
           "wwn change, port 10000000C9A00001: the management library answered 5: no World Wide Name that can be used "
           "(40005)\n"
           "  WWNOperationStatus = 65535 (the library did not tell)\n");
}

TEST(Actions, SwitchABeacon)
{
    for (const host::Manner* manner : every_manner())
        expect(std::string("--manner ") + manner->name + " port beacon on --yes", 0,
               "port beacon, port 10000000C9A00001: done\n");
    expect("port beacon off -y --json", 0, "{\n  \"status\": 0,\n  \"port\": \"10000000C9A00001\"\n}\n");
}

TEST(Actions, ResetEnableAndDisable)
{
    expect("port reset --yes", 0, "port reset, port 10000000C9A00001: done (0)\n");
    expect("port disable --yes", 0, "port disable, port 10000000C9A00001: done (0)\n");
    expect("port enable --yes", 0, "port enable, port 10000000C9A00001: done (0)\n");
}

TEST(Actions, SwitchBootCode)
{
    expect("bootbios status", 0,
           "bootbios status, port 10000000C9A00001: done (0)\n  nBootBIOSStatus = 0 (disabled)\n");
    expect("bootbios enable --yes", 0, "bootbios enable, port 10000000C9A00001: done (0)\n");
    expect("bootbios disable --yes", 0, "bootbios disable, port 10000000C9A00001: done (0)\n");
}

TEST(Actions, AskBeforeAnythingChanges)
{
    for (const char* answer : {"echo |", "echo n |", "printf '' |", "echo no, never |", "echo maybe |"}) {
        const Ended_Command run = nvrcim("port beacon on", "small", answer);
        EXPECT_EQ(run.status, 65) << answer;
        EXPECT_THAT(run.output, HasSubstr("Switch the beacon of port 10000000C9A00001? [y/N] ")) << answer;
        EXPECT_THAT(run.output, HasSubstr("nvrcim: nothing was changed\n")) << answer;
        EXPECT_THAT(run.output, Not(HasSubstr("done"))) << answer;
    }
    for (const char* answer : {"echo y |", "echo Yes |"}) {
        const Ended_Command run = nvrcim("port beacon on", "small", answer);
        EXPECT_EQ(run.status, 0) << answer;
        EXPECT_THAT(run.output, HasSubstr("done\n")) << answer;
    }
    // What only reads does not ask.
    EXPECT_EQ(nvrcim("wwn read", "small", "printf '' |").status, 0);
}

TEST(Actions, FindTheirPortByItsNameInAnyForm)
{
    for (const char* name :
         {"10000000C9A00002", "10000000c9a00002", "10:00:00:00:c9:a0:00:02", "10-00-00-00-C9-A0-00-02"})
        EXPECT_THAT(nvrcim(std::string("bootbios status --port ") + name, "typical").output,
                    HasSubstr("port 10000000C9A00002: done (0)"));
    expect("bootbios status --port 1", 6,
           "nvrcim: wrong request: there is no port 1; there are 10000000C9A00001, 10000000C9A00002, 10000000C9A00003, "
           "10000000C9A00004\n",
           "typical");
    expect("bootbios status", 64,
           "nvrcim: wrong command: name a port with --port; there are 10000000C9A00001, 10000000C9A00002, "
           "10000000C9A00003, 10000000C9A00004\n",
           "typical");
}

TEST(Actions, AnswerInJson)
{
    expect("wwn read --json", 0,
           "{\n  \"status\": 0,\n  \"port\": \"10000000C9A00001\",\n  \"returnValue\": 0,\n  \"meaning\": \"done\",\n"
           "  \"out\": {\n    \"WWPN\": \"10:00:00:00:c9:a0:00:01\",\n    \"WWNN\": \"20:00:00:00:c9:a0:00:01\",\n"
           "    \"WWNOperationStatus\": 4\n  }\n}\n");
}

TEST(Actions, RefuseWhatIsNoInput)
{
    expect("wwn change 1000 20000000C9A0F001 --yes", 64,
           "nvrcim: wrong command: wwpn is a World Wide Name of sixteen hexadecimal digits, which 1000 is not\n");
    for (const char* arguments : {"port", "port beacon", "port beacon up", "wwn change 10000000C9A0F001",
                                  "wwn read --yes", "wwn read --type none", "port jump"})
        EXPECT_EQ(nvrcim(arguments).status, 64) << arguments;
}
