// Servers that never clean up: their processes exit while the agent lives and threads of the module run.
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <functional>
#include <string>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

#include <gmock/gmock.h>

#include "foundation/management_api.h"
#include "simulator/nvrsim.h"
#include "tests/module/support/Rig.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::Contains;
using testing::HasSubstr;
using testing::Not;

// The leak sanitizer cannot stop threads that are still running at exit, and what they hold is no leak.
static bool exits_with_threads = false;
extern "C" __attribute__((visibility("default"))) int __lsan_is_turned_off();
int __lsan_is_turned_off()
{
    return exits_with_threads;
}

// Nobody joins the threads of a process that just exits.
extern "C" __attribute__((visibility("default"))) const char* __tsan_default_options();
const char* __tsan_default_options()
{
    return "report_thread_leaks=0";
}

namespace {

constexpr char six_lines[] = "##################################################\n"
                             "# Norvane HBA CIM Provider Configuration Settings #\n"
                             "##################################################\n"
                             "NVR_PROVIDER_CACHE_TIMEOUT = 17\n"
                             "NVR_PROVIDER_REFRESH_ADAPTERDATA = FALSE\n"
                             "NVR_PROVIDER_REFRESH_SANDATA = TRUE\n";
const Rig_Options in_sfcb = {host::Manner::sfcb(), "small"};

struct Ended {
    int status = -1;
    std::string guard; // the file of its session's name
};

// In a process of its own, which then exits. One that hangs is ended by a signal.
Ended exit_after(const std::function<void()>& act)
{
    const pid_t child = fork();
    if (child == 0) {
        exits_with_threads = true;
        alarm(100);
        act();
        std::exit(0);
    }
    Ended ended;
    ended.guard = "/dev/shm/sem.NVR_RM_INIT_LIB_" + std::to_string(child);
    EXPECT_EQ(waitpid(child, &ended.status, 0), child);
    return ended;
}

// What the process has to have done before it exits.
void demand(bool done)
{
    if (!done) std::_Exit(7);
}

void set_minutes(Rig& rig, unsigned minutes)
{
    const host::Answer settings = rig.enumerate("NVRHBA_ProviderConfigSetting");
    demand(settings.ok() && !settings.instances.empty());
    host::Instance setting = settings.instances.front();
    setting.set("current", host::Value::uint32(minutes));
    demand(rig.server().modify(setting, std::vector<std::string>{"current"}).ok());
}

void wait_for_call(const std::string& call)
{
    while (calls(call) == 0)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
}

// A client has set something, and nothing of it is written.
void prepare(Rig& rig)
{
    set_minutes(rig, 17);
    rig.settle();
    remove(conf_path);
    remove(dmp_path);
}

// It outlives the exit, as a server's module does.
Rig& lasting_rig(const Rig_Options& options)
{
    return *new Rig(options);
}

} // namespace

TEST(Exit, OfAServerThatNeverCleansUpWritesBothFilesAndLeavesNoName)
{
    const Ended ended = exit_after([] {
        Rig& rig = lasting_rig(in_sfcb);
        set_minutes(rig, 17);
        remove(conf_path);
        demand(exists("/dev/shm/sem.NVR_RM_INIT_LIB_" + std::to_string(getpid())));
        rig.settle();
        write_file(dmp_path, "lost");
    });
    EXPECT_EQ(ended.status, 0);
    EXPECT_EQ(read_file(conf_path), six_lines);
    EXPECT_EQ(read_file(dmp_path), std::string("2,5,1\n") + trace_path);
    EXPECT_FALSE(exists(ended.guard));
    const std::vector<std::string> words = trace_file_words(trace_path);
    EXPECT_THAT(words, Contains("RMLIB initialized"));
    EXPECT_THAT(words, Not(Contains("Entering the function ~ProviderAgent()")));
    EXPECT_THAT(words, Not(Contains("RMLIB uninitialzed")));
}

TEST(Exit, WhileARefreshRunsWaitsForNothing)
{
    const Ended ended = exit_after([] {
        Rig& rig = lasting_rig({host::Manner::sfcb(), "small", refreshing_settings});
        set_minutes(rig, 17);
        rig.settle();
        // Nobody would wait that long.
        add_fault("call = \"HBA_GetNumberOfAdapters\", delay_ms = 600000");
        const std::size_t before = calls("HBA_GetNumberOfAdapters");
        advance_clock(std::chrono::minutes(31));
        std::thread([&] { (void)rig.enumerate("NVRHBA_FCPort"); }).detach();
        while (calls("HBA_GetNumberOfAdapters") == before)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        remove(conf_path);
        remove(dmp_path);
    });
    EXPECT_EQ(ended.status, 0);
    EXPECT_THAT(read_file(conf_path),
                HasSubstr("NVR_PROVIDER_CACHE_TIMEOUT = 17\nNVR_PROVIDER_REFRESH_ADAPTERDATA = TRUE\n"));
    EXPECT_EQ(read_file(dmp_path), std::string("2,5,1\n") + trace_path);
    EXPECT_FALSE(exists(ended.guard));
}

TEST(Exit, WhileTheAgentIsBuiltKeepsTheSettingsThatWereRead)
{
    const Ended ended = exit_after([] {
        Rig& rig = lasting_rig({host::Manner::sfcb(), "small", "NVR_PROVIDER_CACHE_TIMEOUT = 17\n"});
        add_fault("call = \"RM_InitLib\", delay_ms = 600000");
        std::thread([&] { (void)rig.enumerate("NVRHBA_FCPort"); }).detach();
        wait_for_call("RM_InitLib");
    });
    EXPECT_EQ(ended.status, 0);
    EXPECT_EQ(read_file(conf_path), six_lines);
    EXPECT_EQ(read_file(dmp_path), std::string("2,5,1\n") + trace_path);
    EXPECT_FALSE(exists(ended.guard));
}

TEST(Exit, AfterTheLastCleanUpWritesNothingMore)
{
    const Ended ended = exit_after([] {
        Rig rig({host::Manner::strict(), "small"});
        set_minutes(rig, 17);
        rig.stop();
        demand(read_file(conf_path) == six_lines);
        remove(conf_path);
        remove(dmp_path);
    });
    EXPECT_EQ(ended.status, 0);
    EXPECT_FALSE(exists(conf_path));
    EXPECT_FALSE(exists(dmp_path));
}

TEST(Exit, WhileTheAgentLetsGoOfItsLibrariesFindsBothFilesWritten)
{
    const Ended ended = exit_after([] {
        Rig& rig = lasting_rig({host::Manner::strict(), "small"});
        prepare(rig);
        // The last that the agent's end does.
        add_fault("call = \"HBA_FreeLibrary\", delay_ms = 600000");
        std::thread([&] { rig.stop(); }).detach();
        wait_for_call("HBA_FreeLibrary");
    });
    EXPECT_EQ(ended.status, 0);
    EXPECT_EQ(read_file(conf_path), six_lines);
    EXPECT_EQ(read_file(dmp_path), std::string("2,5,1\n") + trace_path);
    EXPECT_FALSE(exists(ended.guard));
}

// Each finds the other's work not begun or done, so that no file is ever cut short; in each other round of the
// libraries that were opened anew.
TEST(Exit, AtAnyMomentOfTheAgentsEndLeavesWholeFiles)
{
    for (int round = 0; round < 20; round++) {
        const Ended ended = exit_after([round] {
            if (round % 2) {
                Rig& earlier = lasting_rig({host::Manner::strict(), "small"});
                earlier.settle();
                earlier.stop();
                remove(trace_path);
            }
            Rig& rig = lasting_rig({host::Manner::strict(), "small"});
            prepare(rig);
            std::thread([&] { rig.stop(); }).detach();
            while (rig.count_words("Entering the function ~ProviderAgent()") == 0)
                std::this_thread::yield();
            std::this_thread::sleep_for(std::chrono::microseconds(round * 50));
        });
        ASSERT_EQ(ended.status, 0) << round;
        ASSERT_EQ(read_file(conf_path), six_lines) << round;
        ASSERT_EQ(read_file(dmp_path), std::string("2,5,1\n") + trace_path) << round;
    }
}

TEST(Exit, AtAnyMomentOfAChangeOfTheLogLeavesOneOfItsStates)
{
    const std::string paths[] = {"/var/log/one.trace", "/var/log/another.trace"};
    for (int round = 0; round < 20; round++) {
        const Ended ended = exit_after([&, round] {
            Rig& rig = lasting_rig(in_sfcb);
            host::Path log;
            log.name_space = "root/norvane";
            log.class_name = "NVRHBA_RecordLog";
            log.set("InstanceID", host::Value::string("NVRHBA:ProviderLog:" + std::string(rig_host_name)));
            static std::atomic<int> changes{0};
            std::thread([&rig, log, paths] {
                for (unsigned i = 0;; i++) {
                    const host::Answer set = rig.server().call(log, "SetLogParams",
                                                               {{"LogLevel", host::Value::uint16(5)},
                                                                {"LogMode", host::Value::uint16(i % 2 ? 2 : 4)},
                                                                {"TracePath", host::Value::string(paths[i % 2])}});
                    if (set.ok() && set.value.as_uint() == 0) changes++;
                }
            }).detach();
            while (changes < 2)
                std::this_thread::yield();
            std::this_thread::sleep_for(std::chrono::microseconds(round * 30));
        });
        ASSERT_EQ(ended.status, 0) << round;
        // The path is set a moment before the mode.
        std::vector<std::string> states;
        for (const char* mode : {"2,5,1\n", "4,5,1\n"})
            for (const std::string& path : paths)
                states.push_back(mode + path);
        ASSERT_THAT(states, Contains(read_file(dmp_path))) << round;
    }
    for (const std::string& path : paths)
        remove(path);
}

#if !defined(NORVANE_COVERAGE) // which writes a file first, and is cancelled there
// The thread would leave the exit where it first waits, and the process live on without an end of its settings.
TEST(Exit, OfAThreadThatWasCancelledIsOne)
{
    const Ended ended = exit_after([] {
        Rig& rig = lasting_rig(in_sfcb);
        prepare(rig);
        std::thread([] {
            pthread_cancel(pthread_self());
            std::exit(0);
        }).join();
        std::_Exit(8);
    });
    EXPECT_EQ(ended.status, 0);
    EXPECT_EQ(read_file(conf_path), six_lines);
    EXPECT_EQ(read_file(dmp_path), std::string("2,5,1\n") + trace_path);
}

#endif

TEST(Exit, OfAProcessThatNeverLoadedWritesNothing)
{
    const Ended ended = exit_after([] {
        Rig& rig = lasting_rig(in_sfcb);
        demand(!rig.classes().empty());
        remove(dmp_path);
    });
    EXPECT_EQ(ended.status, 0);
    EXPECT_FALSE(exists(conf_path));
    EXPECT_FALSE(exists(dmp_path));
}

#ifndef __SANITIZE_THREAD__ // it does not follow a fork of a process that has threads
TEST(Exit, OfAChildOfTheServerLeavesTheServersFilesAndName)
{
    Rig rig({host::Manner::strict(), "small"});
    prepare(rig);
    EXPECT_EQ(exit_after([] {}).status, 0);
    EXPECT_FALSE(exists(conf_path));
    EXPECT_FALSE(exists(dmp_path));
    EXPECT_TRUE(exists("/dev/shm/sem.NVR_RM_INIT_LIB_" + std::to_string(getpid())));
    rig.stop();
    EXPECT_EQ(read_file(conf_path), six_lines);
}
#endif

TEST(Exit, WithFilesThatCannotBeWrittenIsClean)
{
    const Ended ended = exit_after([] {
        Rig& rig = lasting_rig(in_sfcb);
        prepare(rig);
        make_folder(conf_path);
        make_folder(dmp_path);
    });
    EXPECT_EQ(ended.status, 0);
    EXPECT_FALSE(exists(ended.guard));
    remove(conf_path);
    remove(dmp_path);
}

TEST(Exit, WhileAlertsAreOnIsClean)
{
    const Ended ended = exit_after([] {
        constexpr char port[] = "10000000C9A00001";
        static std::atomic<int> delivered{0};
        Rig& rig = lasting_rig({});
        int id = 0;
        demand(rig.server()
                   .subscribe(
                       "root/norvane", "NVRHBA_AlertIndication", [](const host::Indication&) { delivered++; }, id)
                   .ok());
        rig.server().settle();
        nvrsim_link(port, 0);
        while (delivered == 0)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        for (int i = 0; i < 1000; i++) // and some under way
            nvrsim_event(port, HBA_EVENT_PORT_ONLINE, 0);
    });
    EXPECT_EQ(ended.status, 0);
}

// The threads of the requests meet the exit at any point, also within the logger.
TEST(Exit, AtAnyMomentOfOtherThreadsIsClean)
{
    for (int round = 0; round < 20; round++) {
        const Ended ended = exit_after([round] {
            Rig& rig = lasting_rig(in_sfcb);
            set_minutes(rig, 17);
            for (int i = 0; i < 3; i++)
                std::thread([&] {
                    for (;;)
                        (void)rig.enumerate("NVRHBA_FCPort");
                }).detach();
            wait_for_call("HBA_GetNumberOfAdapters");
            std::this_thread::sleep_for(std::chrono::microseconds(round * 300));
        });
        ASSERT_EQ(ended.status, 0) << round;
        ASSERT_EQ(read_file(conf_path), six_lines) << round;
        ASSERT_EQ(read_file(dmp_path), std::string("2,5,1\n") + trace_path) << round;
    }
}
