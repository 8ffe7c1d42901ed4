// nvrcim on logs and alerts, from end to end.
#include <cstdio>
#include <cstdlib>
#include <stdexcept>
#include <string>
#include <sys/wait.h>

#include <gmock/gmock.h>

#include "tests/module/support/Command_Line.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"

using namespace nvrtest;
using testing::HasSubstr;
using testing::StartsWith;

namespace {

constexpr char trace[] = "/var/log/command.trace";
constexpr char system_log[] = "/var/log/messages";

/// A listening nvrcim, and nvrsimctl on its hardware.
class Listening {
public:
    explicit Listening(const std::string& arguments, const std::string& scenario = NVRSIM_BUILD "/scenarios/small.toml")
        : m_socket(library_folder() + "/listen.sock")
    {
        remove(m_socket);
        const std::string command = "NVRSIM_SOCKET='" + m_socket +
                                    "' '" NVR_NVRCIM "' --module '" NVR_MODULE "' --scenario '" + scenario + "' " +
                                    arguments + " 2>&1";
        m_child = popen(command.c_str(), "r");
        if (!m_child) throw std::runtime_error("cannot start a shell");
    }
    ~Listening() { end(); }
    Listening(const Listening&) = delete;
    Listening& operator=(const Listening&) = delete;

    /// The next line of its output, without its end; empty behind the last.
    std::string line()
    {
        char buffer[8192];
        if (!m_child || !std::fgets(buffer, sizeof buffer, m_child)) return "";
        std::string text = buffer;
        if (!text.empty() && text.back() == '\n') text.pop_back();
        return text;
    }
    void control(const std::string& command)
    {
        EXPECT_EQ(std::system(("'" NVR_NVRSIMCTL "' -s '" + m_socket + "' " + command + " >/dev/null").c_str()), 0);
    }
    int end()
    {
        if (!m_child) return -1;
        const int status = pclose(m_child);
        m_child = nullptr;
        return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
    }

private:
    const std::string m_socket;
    FILE* m_child = nullptr;
};

class LogCommand : public testing::Test {
protected:
    LogCommand()
    {
        remove(dmp_path);
        remove(trace);
        remove(system_log);
    }
};
using ListenCommand = LogCommand;

} // namespace

TEST_F(LogCommand, ShowsTheLog)
{
    const Ended_Command run = nvrcim("log show");
    EXPECT_EQ(run.status, 0) << run.output;
    EXPECT_THAT(run.output, StartsWith("log         NVRHBA:ProviderLog:"));
    EXPECT_THAT(run.output, HasSubstr("\nstate       disabled\n"
                                      "level       0\n"
                                      "mode        0: records are taken by nobody\n"
                                      "trace file  none\n"
                                      "records     0 of 1024\n"));
    EXPECT_THAT(nvrcim("log show --json").output, HasSubstr("\"records\": []"));
}

TEST_F(LogCommand, WhatItSetsLasts)
{
    EXPECT_EQ(nvrcim(std::string("log trace ") + trace).output,
              std::string("level 5, mode 2: records are taken by the trace file, ") + trace +
                  "; logging is disabled\n");
    EXPECT_EQ(read_file(dmp_path), std::string("2,5,0\n") + trace);
    EXPECT_EQ(nvrcim("log enable").output, "logging is enabled\n");
    EXPECT_EQ(read_file(dmp_path), std::string("2,5,1\n") + trace);
    EXPECT_THAT(read_file(trace), HasSubstr("FC Record Logs enabled"));
    EXPECT_THAT(nvrcim("log show").output,
                HasSubstr(std::string("state       enabled\nlevel       5\nmode        2: records are taken by the "
                                      "trace file\ntrace file  ") +
                          trace + "\n"));
    EXPECT_EQ(nvrcim("log mode both").output,
              std::string("level 5, mode 4: records are taken by the record log and the trace file, ") + trace + "\n");
    EXPECT_EQ(nvrcim("log clear").output, "the log is empty\n");
    EXPECT_EQ(nvrcim("log disable").output, "logging is disabled\n");
    EXPECT_EQ(read_file(dmp_path), std::string("4,5,0\n") + trace);
}

TEST_F(LogCommand, TellsWhatTheLogRefuses)
{
    const Ended_Command level = nvrcim("log level 3");
    EXPECT_EQ(level.status, 66);
    EXPECT_THAT(level.output, StartsWith("nvrcim: the log refuses it (32968)"));
    EXPECT_EQ(nvrcim("log trace /var/log").status, 66);
    EXPECT_EQ(nvrcim("log mode loud").status, 64);
    EXPECT_EQ(nvrcim("log level 70000").status, 64);
    EXPECT_EQ(nvrcim("log").status, 64);
    EXPECT_EQ(nvrcim("log level 5").output,
              "level 5, mode 3: records are taken by neither the record log nor the trace file; logging is disabled\n");
}

TEST_F(LogCommand, ShowsTheDriversLinesNewestLastAndLeavesTheSwitch)
{
    EXPECT_EQ(nvrcim("driverlog").output, "the system's log has no line of the driver\n");
    write_file(system_log, "a tsfc one\nb other\nc tsfc two\n");
    const Ended_Command run = nvrcim("driverlog");
    EXPECT_EQ(run.status, 0);
    EXPECT_EQ(run.output, "a tsfc one\nc tsfc two\n");
    EXPECT_THAT(nvrcim("driverlog --json").output, HasSubstr("\"c tsfc two\",\n    \"a tsfc one\""));
    EXPECT_THAT(nvrcim("log show").output, HasSubstr("\nstate       disabled\n"));
}

TEST_F(LogCommand, AHostWithoutAdaptersHasNoDriversLog)
{
    write_file("/var/log/none.toml", "# no adapters\n");
    Listening run("driverlog", "/var/log/none.toml");
    EXPECT_EQ(run.line(), "nvrcim: the provider answers CMPI_RC_ERR_NOT_FOUND (6): there is no driver's log: no Fibre "
                          "Channel adapter is there");
    EXPECT_EQ(run.end(), 6);
    remove("/var/log/none.toml");
}

TEST_F(ListenCommand, PrintsAlertsAsTheyComeInEveryManner)
{
    for (const host::Manner* manner : every_manner()) {
        Listening run(std::string("--manner ") + manner->name + " listen --also root/cimv2 --count 4");
        ASSERT_EQ(run.line(), "nvrcim: listening in root/norvane, root/cimv2") << manner->name;
        run.control("link down 10000000C9A00001");
        EXPECT_THAT(run.line(), HasSubstr("  root/norvane  0  Port WWN 10000000C9A00001 status changed to LINK_DOWN."));
        EXPECT_THAT(run.line(), HasSubstr("  root/cimv2  0  Port WWN 10000000C9A00001 status changed to LINK_DOWN."));
        run.control("link up 10000000C9A00001");
        EXPECT_THAT(run.line(), HasSubstr("  root/norvane  1  Port WWN 10000000C9A00001 status changed to LINK_UP."));
        EXPECT_THAT(run.line(), HasSubstr("  root/cimv2  1  Port WWN 10000000C9A00001 status changed to LINK_UP."));
        EXPECT_EQ(run.line(), "");
        EXPECT_EQ(run.end(), 0);
    }
}

TEST_F(ListenCommand, PrintsALineOfJsonForEach)
{
    Listening run("--json listen --count 1");
    ASSERT_EQ(run.line(), "nvrcim: listening in root/norvane");
    run.control("event 0 515");
    run.control("event 0 513");
    const std::string line = run.line();
    EXPECT_THAT(line, StartsWith("{\"namespace\":\"root/norvane\",\"alert\":{"));
    EXPECT_THAT(line, HasSubstr("\"Message\":\"PORT LINK DOWN\""));
    EXPECT_EQ(line.back(), '}');
    EXPECT_EQ(run.end(), 0);
}

TEST_F(ListenCommand, PrintsARowOfCsvForEach)
{
    Listening run("--csv listen --count 1");
    EXPECT_EQ(run.line(), "time,namespace,number,description\r");
    ASSERT_EQ(run.line(), "nvrcim: listening in root/norvane");
    run.control("link down 10000000C9A00001");
    EXPECT_THAT(run.line(), HasSubstr(",root/norvane,0,Port WWN 10000000C9A00001 status changed to LINK_DOWN.\r"));
    EXPECT_EQ(run.end(), 0);
}

TEST_F(ListenCommand, CountsABurst)
{
    Listening run("listen --quiet --count 10000");
    ASSERT_EQ(run.line(), "nvrcim: listening in root/norvane");
    run.control("event 0 514 --times 10000");
    EXPECT_EQ(run.line(), "10000 alerts");
    EXPECT_EQ(run.end(), 0);
}

TEST_F(ListenCommand, TellsThatNotEveryPortIsWatched)
{
    write_file("/var/log/deaf.toml",
               "[[adapter]]\nports = 2\n[[fault]]\ncall = 'HBA_RegisterForAdapterPortEvents'\nfrom = 2\nstatus = 1\n");
    Listening run("listen --count 1", "/var/log/deaf.toml");
    EXPECT_THAT(run.line(), StartsWith("nvrcim: not every port is watched: "));
    EXPECT_EQ(run.line(), "nvrcim: listening in root/norvane");
    run.control("link down 0");
    EXPECT_THAT(run.line(), HasSubstr("LINK_DOWN"));
    EXPECT_EQ(run.end(), 0);
    remove("/var/log/deaf.toml");
}
