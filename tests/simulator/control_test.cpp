// nvrsimctl against a live process: this one has the core and its socket, the command runs beside it.
#include "Sim.h"

#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <atomic>
#include <cstdio>
#include <fstream>

namespace {

/// The core opened it when this program was loaded; "%p" in the environment's name stands for the process.
std::string socket_path()
{
    std::string path = std::getenv("NVRSIM_SOCKET");
    return path.replace(path.find("%p"), 2, std::to_string(getpid()));
}

struct Answer {
    int status;
    std::string output; // both streams
};

Answer run(const std::string& arguments)
{
    Answer answer{-1, ""};
    std::FILE* pipe = popen(("NVRSIM_SOCKET=" + socket_path() + " " NVRSIMCTL " " + arguments + " 2>&1").c_str(), "r");
    if (!pipe) return answer;
    std::array<char, 4096> piece;
    for (size_t got; (got = std::fread(piece.data(), 1, piece.size(), pipe)) > 0;)
        answer.output.append(piece.data(), got);
    answer.status = WEXITSTATUS(pclose(pipe));
    return answer;
}

std::atomic<int> heard{0};
std::atomic<uint64_t> heard_count{0};
void hear(void*, HBA_WWN, HBA_UINT32 type, HBA_UINT32)
{
    heard = static_cast<int>(type);
    ++heard_count;
}

} // namespace

class Control : public Simulated {
protected:
    void SetUp() override
    {
        ASSERT_NE(nullptr, std::getenv("NVRSIM_SOCKET"));
        Simulated::SetUp();
    }
    static void TearDownTestSuite() { unlink(socket_path().c_str()); }
};

TEST_F(Control, SocketBelongsToItsOwnerAlone)
{
    struct stat status;
    ASSERT_EQ(0, stat(socket_path().c_str(), &status));
    EXPECT_TRUE(S_ISSOCK(status.st_mode));
    EXPECT_EQ(0600u, status.st_mode & 0777u);
}

TEST_F(Control, ShowTellsPortsAndStates)
{
    nvrsim_link("0", 0);
    const Answer table = run("show");
    EXPECT_EQ(0, table.status) << table.output;
    EXPECT_NE(std::string::npos, table.output.find("10000000C9A00001  Norvane-FC2162-0     link down")) << table.output;
    EXPECT_NE(std::string::npos, run("show --json").output.find("\"wwpn\": \"10000000C9A00001\""));
}

TEST_F(Control, FaultIsInjectedListedAndCleared)
{
    const Answer set = run("fault RM_GetDriverType --port 10000000C9A00001 --status 64 --from 2 --times 1");
    EXPECT_EQ(0, set.status) << set.output;
    uint32_t type;
    EXPECT_EQ(0u, nvrsim_RM_GetDriverType(wire(port0), &type));
    EXPECT_EQ(64u, nvrsim_RM_GetDriverType(wire(port0), &type));
    EXPECT_EQ(0u, nvrsim_RM_GetDriverType(wire(port0), &type));
    EXPECT_EQ("1 RM_GetDriverType port=10000000C9A00001 status=64 from=2 times=1 seen=3 hits=1 changed=1\n",
              run("faults").output);
    EXPECT_EQ(0, run("clear-faults").status);
    EXPECT_EQ("", run("faults").output);
    EXPECT_EQ(0, run("fault 'RM_*' --value 18446744073709551615 --damage truncated --keep 3 --delay 1 --absent "
                     "--throws --vanish")
                     .status);
    EXPECT_NE(std::string::npos,
              run("faults").output.find("value=18446744073709551615 damage=truncated absent throws vanish"));
}

TEST_F(Control, LinkAndEventsReachCallbacks)
{
    HBA_CALLBACKHANDLE callback;
    ASSERT_EQ(0u, nvrsim_HBA_RegisterForAdapterPortEvents(hear, nullptr, open(), wire(port0), &callback));
    EXPECT_EQ(0, run("link down 10000000C9A00001").status);
    nvrsim_drain_events();
    EXPECT_EQ(513, heard);
    EXPECT_EQ("callbacks called: 1\n", run("event 0 515 7").output);
    nvrsim_drain_events();
    EXPECT_EQ(515, heard);
    const uint64_t before = heard_count;
    EXPECT_EQ("callbacks called: 1000\n", run("event 0 514 --times 1000").output);
    nvrsim_drain_events();
    EXPECT_EQ(before + 1000, heard_count);
    EXPECT_EQ(0u, nvrsim_HBA_RemoveCallback(callback));
}

TEST_F(Control, ValuesCountersAndLog)
{
    EXPECT_EQ(0, run("set 0 beacon 3").status);
    EXPECT_EQ("3\n", run("get 0 beacon").output);
    uint32_t state;
    nvrsim_RM_DiagBeaconState(wire(port0), &state);
    EXPECT_EQ(unsigned(RM_BEACON_ON), state);
    EXPECT_EQ("         1  RM_DiagBeaconState\n", run("counters").output);
    EXPECT_EQ("RM_DiagBeaconState 10000000C9A00001 0\n", run("log").output);
    EXPECT_EQ(0, run("log --clear").status);
    EXPECT_EQ("", run("log").output);
    EXPECT_EQ(0, run("reset").status);
    EXPECT_EQ("2\n", run("get 0 beacon").output);
}

TEST_F(Control, RefusalsHaveWordsAndStatus)
{
    Answer answer = run("link up 9");
    EXPECT_EQ(1, answer.status);
    EXPECT_EQ("nvrsimctl: there is no port 9\n", answer.output);
    answer = run("fault X --damage fire");
    EXPECT_EQ(2, answer.status);
    EXPECT_EQ(2, run("nonsense").status);
    EXPECT_EQ(1, run("get 0 colour").status);
    EXPECT_EQ(1, run("load /no/such/file").status);
    answer = run("--socket /no/such/socket show");
    EXPECT_EQ(3, answer.status);
    EXPECT_NE(std::string::npos, answer.output.find("no process answers at /no/such/socket"));
}

TEST_F(Control, GenerateAndCheckWorkAlone)
{
    const std::string path = socket_path() + ".toml";
    EXPECT_EQ(0, run("generate --ports 3 --targets 2 --luns 5 -o " + path).status);
    const Answer good = run("check " + path);
    EXPECT_EQ(0, good.status) << good.output;
    EXPECT_NE(std::string::npos, good.output.find("3 adapters"));
    EXPECT_EQ(0, run("load " + path).status);
    EXPECT_EQ("10", sim_value("2", "paths"));
    std::ofstream(path) << "[[adapter]]\nx = 1\n";
    const Answer bad = run("check " + path);
    EXPECT_EQ(1, bad.status);
    EXPECT_EQ("nvrsimctl: " + path + ":2: unknown key \"x\"\n", bad.output);
    unlink(path.c_str());
}

TEST_F(Control, FirmwareImagesAreMade)
{
    const std::string path = socket_path() + ".fw";
    EXPECT_EQ(0, run("firmware --version 3.00a0 --size 100 " + path).status);
    EXPECT_EQ(0u, nvrsim_RM_VerifyFirmwareA(wire(0), wire(port0), path.c_str()));
    unlink(path.c_str());
}

TEST_F(Control, CommandsAreRefusedWhenTheyMakeNoSense)
{
    char answer[300];
    for (const char* line :
         {"", "link", "link sideways 0", "event 0", "event 0 x", "event 0 1 y", "event 0 1 0 0", "event 0 1 0 1000001",
          "event 0 1 0 x", "set 0 beacon", "set 0 beacon -1", "get 0", "fault", "fault call", "bogus"}) {
        nvrsim_command(line, answer, sizeof answer);
        EXPECT_EQ(0, std::strncmp(answer, "error ", 6)) << line << ": " << answer;
    }
    nvrsim_command("ping", answer, sizeof answer);
    EXPECT_STREQ("ok\n", answer);
}
