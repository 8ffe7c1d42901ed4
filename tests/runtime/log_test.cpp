#include "runtime/log.h"

#include <cerrno>
#include <cstdlib>
#include <dirent.h>
#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <pthread.h>
#include <string>
#include <sys/stat.h>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

using namespace cimple;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

namespace {

/// A home directory for one test. The log opens once a process, so what logs runs in a child of its own.
class RuntimeLog : public ::testing::Test {
protected:
    RuntimeLog()
    {
        char name[] = "/tmp/runtime_log_XXXXXX";
        home = mkdtemp(name);
        setenv("CIMPLE_HOME", home.c_str(), 1);
    }
    ~RuntimeLog() override
    {
        for (const char* file : {"/.cimplerc", "/.cimple/messages", "/.cimple/messages.lock"})
            unlink((home + file).c_str());
        rmdir((home + "/.cimple/messages").c_str());
        rmdir((home + "/.cimple").c_str());
        rmdir(home.c_str());
    }

    void configure(const std::string& text) const { std::ofstream(home + "/.cimplerc") << text; }

    template <class Action>
    static pid_t start(Action action)
    {
        const pid_t child = fork();
        if (child == 0) {
            action();
            _exit(::testing::Test::HasFailure() ? 1 : 0);
        }
        return child;
    }
    static void expect_success(pid_t child)
    {
        int status = 0;
        ASSERT_EQ(waitpid(child, &status, 0), child);
        EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status;
    }
    template <class Action>
    static void in_child(Action action)
    {
        expect_success(start(action));
    }
    static void log_all_levels()
    {
        for (int level = LL_FATAL; level <= LL_DBG; ++level)
            log_write(static_cast<Log_Level>(level), "file.cpp", level, "message %d", level);
    }

    bool exists(const char* file) const { return access((home + file).c_str(), F_OK) == 0; }

    /// The log's lines behind their time stamps.
    std::vector<std::string> lines() const
    {
        std::vector<std::string> result;
        std::ifstream file(home + "/.cimple/messages");
        for (std::string line; std::getline(file, line);) {
            std::string stamp = line.substr(0, 20);
            for (char& c : stamp)
                if (c >= '0' && c <= '9') c = '0';
            result.push_back(stamp == "0000/00/00 00:00:00 " ? line.substr(20) : "odd line: " + line);
        }
        return result;
    }

    std::string home;
};

} // namespace

TEST_F(RuntimeLog, WithoutAHomeNoFileIsMade)
{
    configure("LOG_LEVEL=DBG\n");
    unsetenv("CIMPLE_HOME");
    in_child([] {
        log_all_levels();
        EXPECT_FALSE(log_wanted(LL_FATAL));
    });
    EXPECT_FALSE(exists("/.cimple"));
}

TEST_F(RuntimeLog, WithoutAConfigurationNoFileIsMade)
{
    in_child(log_all_levels);
    EXPECT_FALSE(exists("/.cimple"));
}

TEST_F(RuntimeLog, DbgLogsAllFiveLevels)
{
    configure("# LOG_LEVEL=FATAL\n\n   \nOTHER=1\nLOG_LEVELS=ERR\nLOG_LEVEL \t=  dbg  \r\nLOG_LEVEL=FATAL\n");
    in_child(log_all_levels);
    EXPECT_THAT(lines(), ElementsAre("FATAL: file.cpp(0): message 0", "ERR: file.cpp(1): message 1",
                                     "WARN: file.cpp(2): message 2", "INFO: file.cpp(3): message 3",
                                     "DBG: file.cpp(4): message 4"));
    struct stat lock;
    ASSERT_EQ(stat((home + "/.cimple/messages.lock").c_str(), &lock), 0);
    EXPECT_EQ(lock.st_mode & 0777, 0600u);
}

TEST_F(RuntimeLog, WarnDropsInfoAndDbg)
{
    configure("LOG_LEVEL=WARN");
    in_child([] {
        log_all_levels();
        EXPECT_TRUE(log_wanted(LL_WARN));
        EXPECT_FALSE(log_wanted(LL_INFO));
    });
    EXPECT_THAT(lines(), ElementsAre("FATAL: file.cpp(0): message 0", "ERR: file.cpp(1): message 1",
                                     "WARN: file.cpp(2): message 2"));
}

TEST_F(RuntimeLog, AConfigurationWithoutALevelLogsFatalOnly)
{
    configure("# nothing\n");
    in_child(log_all_levels);
    EXPECT_THAT(lines(), ElementsAre("FATAL: file.cpp(0): message 0"));
}

TEST_F(RuntimeLog, AConfigurationWithoutAnEndOrAWriterHoldsNobodyUp)
{
    const std::string file = home + "/.cimplerc";
    for (const bool is_pipe : {false, true}) {
        ASSERT_EQ(is_pipe ? mkfifo(file.c_str(), 0600) : symlink("/dev/zero", file.c_str()), 0);
        in_child([] {
            alarm(20);
            log_all_levels();
        });
        unlink(file.c_str());
    }
}

TEST_F(RuntimeLog, AnotherLevelNameClosesTheMatter)
{
    for (const char* text : {"LOG_LEVEL=LOUD\nLOG_LEVEL=DBG\n", "LOG_LEVEL=\n", "LOG_LEVEL=DBG x\n"}) {
        configure(text);
        in_child(log_all_levels);
        EXPECT_FALSE(exists("/.cimple")) << text;
    }
}

TEST_F(RuntimeLog, AnOverlongLineIsOneLine)
{
    configure("#" + std::string(5000, 'x') + "LOG_LEVEL=ERR\n" + std::string(1024, 'y') + "\nLOG_LEVEL=INFO\n");
    in_child([] { EXPECT_TRUE(log_wanted(LL_INFO)); });
}

TEST_F(RuntimeLog, AMessageEndsInOneNewline)
{
    configure("LOG_LEVEL=DBG\n");
    in_child([] {
        log_write(LL_DBG, "f.cpp", 1, "with\n");
        log_write(LL_DBG, "f.cpp", 2, "without");
        log_write(LL_DBG, "f.cpp", 3, "%s", "");
    });
    EXPECT_THAT(lines(), ElementsAre("DBG: f.cpp(1): with", "DBG: f.cpp(2): without", "DBG: f.cpp(3): "));
}

TEST_F(RuntimeLog, MessagesOfAnyLengthComeWhole)
{
    configure("LOG_LEVEL=DBG\n");
    std::vector<std::string> expected;
    for (std::size_t size : {511u, 512u, 513u, 100000u})
        expected.push_back("DBG: f.cpp(1): " + std::string(size, 'x'));
    in_child([] {
        for (std::size_t size : {511u, 512u, 513u, 100000u})
            log_write(LL_DBG, "f.cpp", 1, "%s", std::string(size, 'x').c_str());
    });
    EXPECT_EQ(lines(), expected);
}

TEST_F(RuntimeLog, TheCallSiteIsNamedByItsPlaceInTheRepository)
{
    configure("LOG_LEVEL=WARN\n");
    in_child([] {
        int evaluated = 0;
        CIMPLE_INFO("%d", ++evaluated);
        EXPECT_EQ(evaluated, 0) << "a message that is not wanted costs nothing";
        CIMPLE_WARN("%d", ++evaluated);
    });
    ASSERT_EQ(lines().size(), 1u);
    EXPECT_THAT(lines()[0], ::testing::MatchesRegex("WARN: tests/runtime/log_test.cpp\\([0-9]+\\): 1"));
}

TEST_F(RuntimeLog, ErrnoStaysAsItWas)
{
    configure("LOG_LEVEL=DBG\n");
    in_child([] {
        errno = 77;
        CIMPLE_DBG("first %s", "message");
        EXPECT_EQ(errno, 77);
    });
    unlink((home + "/.cimplerc").c_str());
    in_child([] {
        errno = 77;
        CIMPLE_DBG("closed");
        EXPECT_EQ(errno, 77);
    });
}

TEST_F(RuntimeLog, AThreadIsNotCancelledInAMessage)
{
    configure("LOG_LEVEL=DBG\n");
    in_child([] {
        bool came_back = false;
        std::thread([&came_back] {
            pthread_cancel(pthread_self());
            for (int i = 0; i < 2; ++i) // opens the log, then writes to it
                CIMPLE_DBG("message %d", i);
            came_back = true;
            pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, nullptr); // a std::thread cannot be cancelled
        }).join();
        EXPECT_TRUE(came_back);
    });
    EXPECT_EQ(lines().size(), 2u);
}

TEST_F(RuntimeLog, FilesThatCannotBeOpenedKeepItOff)
{
    configure("LOG_LEVEL=DBG\n");
    mkdir((home + "/.cimple").c_str(), 0777);
    mkdir((home + "/.cimple/messages").c_str(), 0777);
    in_child([] {
        CIMPLE_ERR("nowhere to go");
        EXPECT_FALSE(log_wanted(LL_FATAL));
    });
    setenv("CIMPLE_HOME", (home + std::string(8000, 'x')).c_str(), 1);
    in_child(log_all_levels);
}

TEST_F(RuntimeLog, AFullDiskCostsNothingButTheLine)
{
    configure("LOG_LEVEL=DBG\n");
    mkdir((home + "/.cimple").c_str(), 0777);
    ASSERT_EQ(symlink("/dev/full", (home + "/.cimple/messages").c_str()), 0);
    in_child([] {
        errno = 77;
        for (int i = 0; i < 100; ++i)
            CIMPLE_DBG("%s", std::string(1000, 'x').c_str());
        EXPECT_EQ(errno, 77);
    });
}

TEST_F(RuntimeLog, ThreadsAndProcessesWriteWholeLines)
{
    configure("LOG_LEVEL=DBG\n");
    std::vector<pid_t> children;
    for (int p = 0; p < 3; ++p)
        children.push_back(start([p] {
            std::vector<std::thread> threads;
            for (int t = 0; t < 3; ++t)
                threads.emplace_back([p, t] {
                    const std::string text(static_cast<std::size_t>(100 + 700 * t), static_cast<char>('a' + p));
                    for (int i = 0; i < 30; ++i)
                        log_write(LL_DBG, "f.cpp", t, "%s", text.c_str());
                });
            for (std::thread& thread : threads)
                thread.join();
        }));
    for (const pid_t child : children)
        expect_success(child);
    const auto all = lines();
    EXPECT_EQ(all.size(), 270u);
    for (const std::string& line : all) {
        const std::size_t head = std::string("DBG: f.cpp(0): ").size();
        ASSERT_GT(line.size(), head) << line;
        const int thread = line[head - 4] - '0';
        EXPECT_EQ(line, "DBG: f.cpp(" + std::to_string(thread) +
                            "): " + std::string(static_cast<std::size_t>(100 + 700 * thread), line[head]));
    }
}

TEST(RuntimeLogSwitch, WarningsOfTheConversionAreOnFromTheStart)
{
    EXPECT_TRUE(log_warnings_enabled());
    log_enable_warnings(false);
    EXPECT_FALSE(log_warnings_enabled());
    log_enable_warnings(true);
    EXPECT_TRUE(log_warnings_enabled());
}

TEST(RuntimeTrace, GoesToStandardError)
{
    ::testing::internal::CaptureStderr();
    __cimple_trace("file.cpp", 12, "a message");
    EXPECT_EQ(::testing::internal::GetCapturedStderr(), "TRACE: file.cpp(12): a message\n");
}

TEST(RuntimeTraceDeathTest, AnAssertionTellsItsPlaceAndAborts)
{
    EXPECT_EXIT(__cimple_assert("file.cpp", 12, "function", "a == b"), ::testing::KilledBySignal(SIGABRT),
                "file.cpp\\(12\\): function\\(\\): assert: a == b\n\n");
}
