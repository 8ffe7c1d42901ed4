// The command's verbs about diagnostic tests, from end to end.
#include <algorithm>
#include <sstream>
#include <string>

#include <pty.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gmock/gmock.h>

#include "host/command/Check.h"
#include "tests/module/support/Command_Line.h"
#include "tests/module/support/Quiet_Output.h"
#include "tests/module/support/Records.h"
#include "tests/module/support/Rig.h"

using namespace nvrtest;
using testing::HasSubstr;

namespace {

void expect(const std::string& arguments, int status, const std::string& output, const std::string& scenario = "small")
{
    const Ended_Command run = nvrcim(arguments, scenario);
    EXPECT_EQ(run.status, status) << arguments;
    EXPECT_EQ(run.output, output) << arguments;
}

} // namespace

TEST(DiagnosticCommand, ListsTheTests)
{
    for (const host::Manner* manner : every_manner()) {
        const Ended_Command run = nvrcim(std::string("--manner ") + manner->name + " diag list", "typical");
        EXPECT_EQ(run.status, 0);
        EXPECT_THAT(run.output, HasSubstr("TEST               LOOPS  PORTS  OPTIONS")) << run.output;
        for (const char* test : {"beacon ", "echo ", "external-loopback ", "host-loopback ", "internal-loopback ",
                                 "ping ", "status ", "reset ", "self "})
            EXPECT_THAT(run.output, HasSubstr(std::string("\n") + test));
        EXPECT_THAT(run.output, HasSubstr("Test verifies the FC HBA hostbus interface"));
    }
    EXPECT_THAT(nvrcim("diag list --json", "small").output,
                HasSubstr("\"test\": \"external-loopback\",\n      \"name\": \"NVR:FCHBA External Loopback Test\""));
}

TEST(DiagnosticCommand, RunsATestAndTellsItsOutcome)
{
    expect("diag run status", 0,
           "diag run status, port 10000000C9A00001: passed, carried out (0)\n"
           "  result = NVR:FCHBA Status Test Resulted with Success\n"
           "  job = NVR:FCHBA Status Test:1:65535\n");
    expect("diag run 'NVR:FCHBA Reset Test' 10:00:00:00:c9:a0:00:01", 0,
           "diag run reset, port 10000000C9A00001: passed, carried out (0)\n"
           "  result = NVR:FCHBA Reset Test Success\n"
           "  job = NVR:FCHBA Reset Test:1:65535\n");
    expect("diag run internal-loopback --loops 20 --pattern 5a5a --size 4 --halt-on-error", 0,
           "diag run internal-loopback, port 10000000C9A00001: passed, carried out (0)\n"
           "  result = NVR:FCHBA Internal Loopback Test Resulted with Success, 20 of 20 loops passed in 1 s\n"
           "  job = NVR:FCHBA Internal Loopback Test:1:1\n");
    EXPECT_THAT(nvrcim("diag run status --json").output, HasSubstr("\"outcome\": \"passed\""));
}

TEST(DiagnosticCommand, TellsFailuresInWordsAndByItsStatus)
{
    expect("diag run external-loopback", 66,
           "diag run external-loopback, port 10000000C9A00001: there is no loopback plug, or the target or the port is "
           "none, or the library refused (40001)\n");
    expect("diag run echo", 66,
           "diag run echo, port 10000000C9A00001: the test, its settings or its target are not possible (5)\n");
    expect("diag run ping --target 50060E8005FFFFFF", 67,
           "diag run ping, port 10000000C9A00001: failed, carried out (0)\n"
           "  result = NVR:FCHBA Ping Test Resulted with Failure, Result - Error: Target Unreachable , 99 of 100 loops "
           "passed in 1 s\n"
           "  job = NVR:FCHBA Ping Test:1:1\n");
}

TEST(DiagnosticCommand, RefusesSettingsThatATestDoesNotHave)
{
    const auto refused = [](const std::string& test, const std::string& option) {
        return "nvrcim: wrong command: the " + test + " test takes no " + option +
               "; diag list shows the options of each\n";
    };
    const struct {
        const char* test;
        const char* option;
        const char* value;
    } rows[] = {{"beacon", "--loops", " 3"},
                {"status", "--pattern", " 5a"},
                {"reset", "--size", " 4"},
                {"self", "--halt-on-error", ""},
                {"self", "--target", " 50060E8005A10000"},
                {"internal-loopback", "--target", " 50060E8005A10000"}};
    for (const auto& row : rows)
        expect(std::string("diag run ") + row.test + " " + row.option + row.value, 64, refused(row.test, row.option));
}

TEST(DiagnosticCommand, TellsOnATerminalThatTheTestRuns)
{
    int terminal = -1;
    const pid_t child = forkpty(&terminal, nullptr, nullptr, nullptr);
    ASSERT_GE(child, 0);
    if (child == 0) {
        execl(NVR_NVRCIM, NVR_NVRCIM, "--module", NVR_MODULE, "--scenario", NVRSIM_BUILD "/scenarios/small.toml",
              "diag", "run", "self", nullptr);
        _exit(127);
    }
    std::string output;
    char buffer[4096];
    for (ssize_t size; (size = read(terminal, buffer, sizeof buffer)) > 0;) // an error: the other side is closed
        output.append(buffer, static_cast<std::size_t>(size));
    int status = -1;
    waitpid(child, &status, 0);
    close(terminal);
    EXPECT_EQ(status, 0);
    EXPECT_THAT(output, HasSubstr("\r| running the self test, "));
    EXPECT_THAT(output, HasSubstr("\r\033[Kdiag run self, port 10000000C9A00001: passed, carried out (0)\r\n"));
}

TEST(DiagnosticCommand, NamesWhatIsMissing)
{
    EXPECT_EQ(nvrcim("diag").status, 64);
    EXPECT_EQ(nvrcim("diag run").status, 64);
    EXPECT_EQ(nvrcim("diag run self --loops 0").status, 64);
    EXPECT_EQ(nvrcim("diag run self --loops 4001").status, 64);
    EXPECT_EQ(nvrcim("diag run self --size 9").status, 64);
    expect("diag run self --pattern xy", 64,
           "nvrcim: wrong command: --pattern takes hexadecimal digits, which xy are not\n");
    expect("diag run ping --target 5006", 64,
           "nvrcim: wrong command: --target is a World Wide Name of sixteen hexadecimal digits, which 5006 is not\n");
    expect("diag run nothing", 6,
           "nvrcim: wrong request: there is no test nothing; there are beacon, echo, external-loopback, host-loopback, "
           "internal-loopback, ping, status, reset, self\n");
    expect("diag run status", 64,
           "nvrcim: wrong command: name a port; there are 10000000C9A00001, 10000000C9A00002, 10000000C9A00003, "
           "10000000C9A00004\n",
           "typical");
    expect("diag run status 1", 6,
           "nvrcim: wrong request: there is no port 1; there are 10000000C9A00001, 10000000C9A00002, "
           "10000000C9A00003, 10000000C9A00004\n",
           "typical");
}

TEST(DiagnosticCommand, ShowsAndClearsRecords)
{
    expect("diag results", 0, "no records of diagnostic tests: the module keeps them as long as it is loaded\n");
    expect("diag results --json", 0, "{\n  \"status\": 0,\n  \"records\": []\n}\n");
    expect("diag clear echo", 0, "log echo: cleared (0)\n");
    EXPECT_THAT(nvrcim("diag clear").output, HasSubstr("log beacon: cleared (0)\nlog echo: cleared (0)\n"));
    EXPECT_EQ(nvrcim("diag clear nothing").status, 6);
}

// The command's own process meets no records, which the module keeps only as long as it is loaded: its check runs here.
class AssociationsAfterUse : public Every_Manner {
protected:
    AssociationsAfterUse() { leave_records(rig); }

    /// What `nvrcim check` tells, a line for each class and a summary, with one blank between words.
    std::string checked()
    {
        host::Options options;
        options.all = true;
        std::ostringstream out, complaints;
        {
            const Quiet_Output quiet;
            EXPECT_EQ(host::check_associations(rig.server(), options, out, complaints), 0);
        }
        EXPECT_EQ(complaints.str(), "");
        std::string text = out.str();
        text.erase(std::unique(text.begin(), text.end(), [](char a, char b) { return a == ' ' && b == ' '; }),
                   text.end());
        return text;
    }

    Rig rig{{*GetParam()}};
};
NVR_IN_EVERY_MANNER(AssociationsAfterUse);

// Columns: instances, ends found, ends of other providers, loose ends, faults.
TEST_P(AssociationsAfterUse, AreWholeButForWhatIsLooseByDesign)
{
    const std::string with_records = checked();
    for (const char* line :
         {"NVRHBA_OwningJobElement 1 2 0 0 0\n", "NVRHBA_AffectedJobElement 1 2 0 0 0\n",
          "NVRHBA_LogManagesRecord 3 6 0 0 0\n", "NVRHBA_CorrespondingSettingDataRecord 2 4 0 0 0\n",
          "NVRHBA_RecordAppliesToElement 2 4 0 0 0\n", "NVRHBA_DriverRecordLogManagesRecord 2 2 0 2 0\n",
          "91 association classes, 84 with instances; ", " 2 loose by design; 0 faults\n"})
        EXPECT_THAT(with_records, HasSubstr(line));

    clear_test_log(rig);
    const std::string cleared = checked();
    for (const char* line : {"NVRHBA_LogManagesRecord 0 0 0 0 0\n", "NVRHBA_CorrespondingSettingDataRecord 2 2 0 2 0\n",
                             "NVRHBA_RecordAppliesToElement 0 0 0 0 0\n", " 4 loose by design; 0 faults\n"})
        EXPECT_THAT(cleared, HasSubstr(line));
}
