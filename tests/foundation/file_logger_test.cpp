#include "foundation/NVR_FileLogger.h"

#include <atomic>
#include <fstream>
#include <thread>

#include <fcntl.h>
#include <gmock/gmock.h>
#include <pthread.h>
#include <sys/stat.h>
#include <unistd.h>

#include "foundation/CLogger.h"
#include "foundation/NVR_CIMLogger.h"
#include "tests/support/log_capture.h"
#include "tests/support/private_host.h"
#include "tests/support/short_memory.h"
#include "tests/support/trace.h"

using namespace cimple;
using namespace nvrtest;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::MatchesRegex;

namespace {

// Files of the test's own live where the private host's do.
const std::string path = "/var/log/trace";

struct TraceFile : testing::Test {
    NVR_FileLogger file;
};

} // namespace

TEST_F(TraceFile, HasOneLineForEachRecord)
{
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(2);
    logger().log("dir/source.cpp", 12, 5, "a %s", "message");
    EXPECT_THAT(
        read_file(path),
        MatchesRegex("\\[threadid =[0-9]+l\\] \\[[0-9]+/[0-9]+/[0-9]+ [0-9]+:[0-9]+:[0-9]+\\.[0-9]+[+-][0-9]+\\] "
                     "\\[dir/source.cpp:12\\]\\[NVR_DBG\\] a message\n"));
    EXPECT_THAT(trace_file_words(path), ElementsAre("a message"));
}

// Destructors log, also while memory is short.
TEST_F(TraceFile, NeedsNoMemoryForARecord)
{
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(2);
    EXPECT_EQ(refuse_each_allocation([] { logger().log("f", 1, 5, "a %s", "message"); }, [](bool) {}), 0);
    EXPECT_THAT(trace_file_words(path), ElementsAre("a message"));
}

TEST_F(TraceFile, HasTheRecordThatAnotherLoggerHasNoMemoryFor)
{
    NVR_CIMLogger ring; // keeps it too, in memory of its own
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(4);
    const long pieces =
        refuse_each_allocation([] { logger().log("f", 1, 3, "x"); }, [](bool has_thrown) { EXPECT_FALSE(has_thrown); });
    EXPECT_GT(pieces, 0);
    EXPECT_EQ(trace_file_words(path), std::vector<std::string>(static_cast<std::size_t>(pieces) + 1, "x"));
    std::vector<NVR_CIMLogEntry> kept;
    ring.getEntries(kept);
    EXPECT_EQ(kept.size(), 1u);
}

TEST_F(TraceFile, RecordsInModesTwoAndFourUpToLevelFive)
{
    for (uint32 mode = 0; mode <= 4; mode++) {
        remove(path);
        ASSERT_EQ(file.setPath(path.c_str()), 0);
        logger().setMode(mode);
        for (sint32 level = 1; level <= 6; level++)
            logger().log("f", 1, level, "%d", level);
        if (mode == 2 || mode == 4)
            EXPECT_THAT(trace_file_words(path), ElementsAre("1", "2", "3", "4", "5")) << mode;
        else
            EXPECT_THAT(trace_file_words(path), IsEmpty()) << mode;
    }
}

TEST_F(TraceFile, IsAppendedTo)
{
    write_file(path, "before\n");
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(4);
    logger().log("f", 1, 5, "x");
    EXPECT_EQ(read_file(path).rfind("before\n[threadid", 0), 0u);
}

TEST_F(TraceFile, ModeZeroClosesItAndForgetsThePath)
{
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(0);
    EXPECT_EQ(file.getPath(), "");
    logger().setMode(2);
    logger().log("f", 1, 5, "x");
    EXPECT_EQ(read_file(path), "");
}

TEST_F(TraceFile, IsOpenedAgainWhenTheModeIsSet)
{
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(2);
    remove(path);
    logger().setMode(4);
    logger().log("f", 1, 5, "x");
    EXPECT_THAT(trace_file_words(path), ElementsAre("x"));
    logger().setMode(3);
    EXPECT_EQ(file.getPath(), path.c_str()) << "other modes leave it alone";
}

TEST_F(TraceFile, ClearTruncatesItAndGoesOn)
{
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(2);
    logger().log("f", 1, 5, "old");
    logger().clearAll();
    EXPECT_EQ(read_file(path), "");
    logger().log("f", 1, 5, "new");
    EXPECT_THAT(trace_file_words(path), ElementsAre("new"));
}

TEST_F(TraceFile, ClearOfNoFileDoesNothing)
{
    write_file(path, "kept");
    file.clear();
    EXPECT_EQ(read_file(path), "kept");
}

TEST_F(TraceFile, ARefusedPathLeavesTheOldOneInUse)
{
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(2);
    write_file("/var/log/read_only", "");
    ASSERT_EQ(::chmod("/var/log/read_only", 0444), 0);
    errno = 4711;
    EXPECT_EQ(file.setPath(nullptr), -1);
    EXPECT_EQ(file.setPath(""), -1);
    EXPECT_EQ(file.setPath("/var/log/read_only"), -1) << "root, too, minds the owner's write permission";
    EXPECT_EQ(file.setPath("/var/log/read_only/below_a_file"), -1);
    EXPECT_EQ(file.setPath("/var/log/missing/folder"), -1);
    EXPECT_EQ(file.setPath("/var/log"), -1);
    EXPECT_EQ(file.setPath(std::string(5000, 'x').c_str()), -1);
    EXPECT_EQ(errno, 4711);
    EXPECT_EQ(file.getPath(), path.c_str());
    logger().log("f", 1, 5, "x");
    EXPECT_THAT(trace_file_words(path), ElementsAre("x"));
}

TEST_F(TraceFile, CanBeGivenItsOwnPathAgain)
{
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    const String same = file.getPath();
    ASSERT_EQ(file.setPath(same.c_str()), 0);
    EXPECT_EQ(file.getPath(), path.c_str());
}

TEST_F(TraceFile, AFifoWithoutReaderBlocksNobody)
{
    ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0);
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(2);
    const std::string text(1000, 'x');
    for (int i = 0; i < 1000; i++)
        logger().log("f", 1, 5, "%d %s", i, text.c_str()); // far more than a pipe holds
    logger().clearAll();
    logger().log("f", 1, 5, "y");
    logger().setMode(0);
}

TEST_F(TraceFile, AFullPipeLosesWholeRecords)
{
    ASSERT_EQ(::mkfifo(path.c_str(), 0600), 0);
    const int reader = ::open(path.c_str(), O_RDONLY | O_NONBLOCK);
    ASSERT_GE(reader, 0);
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(2);
    const std::string text(2000, 'x');
    for (int i = 0; i < 100; i++)
        logger().log("f", 1, 5, "%s", text.c_str());
    std::string received;
    char part[4096];
    while (const ssize_t got = ::read(reader, part, sizeof part)) {
        if (got < 0) break;
        received.append(part, static_cast<std::size_t>(got));
    }
    EXPECT_GT(received.size(), 2000u);
    EXPECT_LT(received.size(), 200000u);
    logger().log("f", 1, 5, "after");
    const ssize_t got = ::read(reader, part, sizeof part);
    ASSERT_GT(got, 0);
    EXPECT_THAT(std::string(part, static_cast<std::size_t>(got)), MatchesRegex("\\[threadid.*\\] after\n"));
    std::size_t lines = 0;
    for (std::size_t from = 0; (from = received.find("xxx\n", from)) != std::string::npos; from++)
        lines++;
    std::size_t heads = 0;
    for (std::size_t from = 0; (from = received.find("[threadid", from)) != std::string::npos; from++)
        heads++;
    EXPECT_EQ(lines, heads) << "no record is torn";
    ::close(reader);
}

TEST_F(TraceFile, AFullDiskLosesRecordsOnly)
{
    ASSERT_EQ(file.setPath("/dev/full"), 0);
    logger().setMode(2);
    for (int i = 0; i < 100; i++)
        logger().log("f", 1, 5, "x");
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().log("f", 1, 5, "y");
    EXPECT_THAT(trace_file_words(path), ElementsAre("y"));
}

TEST_F(TraceFile, TakesRecordsOfManyThreadsWhole)
{
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(2);
    std::atomic<bool> done{false};
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; t++)
        threads.emplace_back([] {
            for (int i = 0; i < 500; i++)
                NVR_LOG("0123456789");
        });
    std::thread reset([&] {
        while (!done) {
            logger().setMode(4);
            EXPECT_EQ(file.setPath(path.c_str()), 0);
            EXPECT_EQ(file.getPath(), path.c_str());
        }
    });
    for (auto& thread : threads)
        thread.join();
    done = true;
    reset.join();
    const auto words = trace_file_words(path);
    EXPECT_EQ(words.size(), 2000u);
    EXPECT_THAT(words, testing::Each("0123456789"));
}

TEST_F(TraceFile, LetsACancelledThreadFinishWhatItMayNotLeave)
{
    ASSERT_EQ(file.setPath(path.c_str()), 0);
    logger().setMode(2);
    bool cancelled = true;
    std::thread([&] {
        ::pthread_cancel(::pthread_self());
        [&]() noexcept { NVR_LOG("from a destructor"); }(); // unwinding out of it would end the process
        ::pthread_testcancel();
        cancelled = false;
    }).join();
    EXPECT_TRUE(cancelled) << "afterwards";
    EXPECT_THAT(trace_file_words(path), ElementsAre("from a destructor"));
}

TEST(EndedTraceFile, IsLetGoAndNoLongerCalled)
{
    {
        NVR_FileLogger file;
        ASSERT_EQ(file.setPath(path.c_str()), 0);
        logger().setMode(2);
    }
    logger().log("f", 1, 5, "x");
    EXPECT_EQ(read_file(path), "");
}
