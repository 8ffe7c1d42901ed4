#include "foundation/CLogger.h"

#include <cerrno>
#include <future>
#include <thread>

#include <gmock/gmock.h>
#include <sys/stat.h>
#include <unistd.h>

#include "foundation/NVR_FileLogger.h"
#include "tests/support/log_capture.h"
#include "tests/support/private_host.h"
#include "tests/support/short_memory.h"

using namespace cimple;
using namespace nvrtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

const std::string settings = "/etc/norvane_fc_provider.dmp";
const std::string trace = "/var/log/trace";

struct LogSettings : testing::Test {
    // The words of a load, and what it made of mode, level and flag.
    std::vector<std::string> load(const std::string& content)
    {
        write_file(settings, content);
        Log_Capture capture;
        logger().loadSettings();
        return capture.words();
    }
    void expect(uint32 mode, sint32 level, bool enabled)
    {
        EXPECT_EQ(logger().getMode(), mode);
        EXPECT_EQ(logger().getLevel(), level);
        EXPECT_EQ(logger().isEnabled(), enabled);
    }
    NVR_FileLogger file;
};

} // namespace

TEST_F(LogSettings, WithoutAFileNothingChangesAndNothingIsLogged)
{
    Log_Capture capture;
    errno = 4711;
    logger().loadSettings();
    EXPECT_EQ(errno, 4711);
    EXPECT_THAT(capture.words(), IsEmpty());
    expect(0, 0, false);
}

// What is not read at the start, or not written at the end, is lost.
TEST_F(LogSettings, AreReadAndWrittenWithLittleMemory)
{
    write_file(settings, "2,5,1\n" + trace);
    refuse_each_allocation([] { logger().loadSettings(); },
                           [](bool has_thrown) { EXPECT_TRUE(has_thrown) << "it was given up in silence"; });
    expect(2, 5, true);
    remove(settings);
    EXPECT_EQ(refuse_each_allocation([] { logger().saveSettings(); }, [](bool) {}), 0);
    EXPECT_EQ(read_file(settings), "2,5,1\n" + trace);
}

TEST_F(LogSettings, OfModeTwoOpenTheTraceFile)
{
    EXPECT_THAT(load("2,5,1\n" + trace), IsEmpty());
    expect(2, 5, true);
    NVR_LOG("words");
    EXPECT_THAT(trace_file_words(trace), ElementsAre("words"));
}

TEST_F(LogSettings, OfModeFourToo)
{
    EXPECT_THAT(load("4,3,0\n" + trace + "\n"), IsEmpty());
    expect(4, 3, false);
    EXPECT_EQ(file.getPath(), trace.c_str());
}

TEST_F(LogSettings, CutThePathAtTheLastLineEnd)
{
    EXPECT_THAT(load("2,5,1\n" + trace + "\r\nmore"), IsEmpty());
    EXPECT_EQ(file.getPath(), trace.c_str());
}

TEST_F(LogSettings, OfOtherModesSetTheFlagAlone)
{
    for (const char* mode : {"0", "1", "3"}) {
        logger().disable();
        EXPECT_THAT(load(std::string(mode) + ",5,1\n" + trace), IsEmpty());
        expect(0, 0, true);
        EXPECT_EQ(file.getPath(), "");
    }
}

TEST_F(LogSettings, RefuseAModeOutOfRange)
{
    EXPECT_THAT(load("5,5,1\n" + trace),
                ElementsAre("Invalid value for Log Mode from config data file -/etc/norvane_fc_provider.dmp-5"));
    EXPECT_THAT(
        load("-1,5,1\n" + trace),
        ElementsAre("Invalid value for Log Mode from config data file -/etc/norvane_fc_provider.dmp-4294967295"));
    expect(0, 0, false);
}

TEST_F(LogSettings, RefuseALevelOutOfRange)
{
    EXPECT_THAT(load("4,6,1\n" + trace),
                ElementsAre("Invalid value for Log Level from config data file -/etc/norvane_fc_provider.dmp-6"));
    EXPECT_THAT(
        load("4,-5,1\n" + trace),
        ElementsAre("Invalid value for Log Level from config data file -/etc/norvane_fc_provider.dmp-4294967291"));
    expect(0, 0, false);
}

TEST_F(LogSettings, KeepANegativeFlagAsEnabled)
{
    EXPECT_THAT(load("4,5,-1\n" + trace),
                ElementsAre("Invalid value for Log Enabled from config data file - /etc/norvane_fc_provider.dmp"));
    expect(0, 0, true);
}

TEST_F(LogSettings, TellWhichValueIsMissing)
{
    EXPECT_THAT(load(",,,"),
                ElementsAre("Unable to read Log Mode from config data file - /etc/norvane_fc_provider.dmp"));
    EXPECT_THAT(load("2"),
                ElementsAre("Unable to read Log Level from config data file - /etc/norvane_fc_provider.dmp"));
    EXPECT_THAT(load("2,,"),
                ElementsAre("Unable to read Log Level from config data file - /etc/norvane_fc_provider.dmp"));
    EXPECT_THAT(load("2,5"),
                ElementsAre("Unable to read Log Enabled from config data file - /etc/norvane_fc_provider.dmp"));
    expect(0, 0, false);
}

TEST_F(LogSettings, OfAnEmptyFileAreSilent)
{
    EXPECT_THAT(load(""), IsEmpty());
    expect(0, 0, false);
}

TEST_F(LogSettings, WithoutThePathOfTheirModeStopBehindTheFlag)
{
    EXPECT_THAT(load("2,5,1\n"), IsEmpty());
    EXPECT_THAT(load("2,5,1"), IsEmpty());
    expect(0, 0, true);
}

TEST_F(LogSettings, SkipEmptyValues)
{
    EXPECT_THAT(load("2,,,5,,1\n" + trace), IsEmpty());
    expect(2, 5, true);
}

TEST_F(LogSettings, WithWordsForNumbersReadZeroes)
{
    EXPECT_THAT(load("two,five,yes\n" + trace), IsEmpty());
    expect(0, 0, false);
}

TEST_F(LogSettings, AreReadNineteenCharactersFarAndTheRestIsTakenForThePath)
{
    ASSERT_EQ(::chdir("/var/log"), 0);
    EXPECT_THAT(load("2,5,000000000000000file\n" + trace), IsEmpty());
    expect(2, 5, false);
    EXPECT_EQ(file.getPath(), "file");
}

TEST_F(LogSettings, CutThePathAt255Characters)
{
    const std::string path = "/var/log/" + std::string(246, 'x');
    EXPECT_THAT(load("2,5,1\n" + path + "yyy"), IsEmpty());
    EXPECT_EQ(file.getPath(), path.c_str());
}

TEST_F(LogSettings, KeepTheirLevelOutOfOneToFive)
{
    logger().setLevel(4);
    EXPECT_THAT(load("2,0,1\n" + trace), IsEmpty());
    expect(2, 4, true);
}

TEST_F(LogSettings, WithARefusedPathApplyTheFlagAlone)
{
    write_file("/var/log/read_only", "");
    ASSERT_EQ(::chmod("/var/log/read_only", 0444), 0);
    EXPECT_THAT(load("2,5,1\n/var/log/read_only"), IsEmpty());
    expect(0, 0, true);
    EXPECT_THAT(load("2,5,1\n/missing/folder"), IsEmpty());
    expect(0, 0, true);
    EXPECT_EQ(file.getPath(), "");
}

TEST_F(LogSettings, OfBinaryRubbishAreHarmless)
{
    std::string rubbish;
    for (int i = 0; i < 4096; i++)
        rubbish += static_cast<char>(i * 7919 >> 3);
    load(rubbish);
    load(std::string("2\0005,1\n", 7) + trace);
    expect(0, 0, logger().isEnabled());
}

TEST_F(LogSettings, ThatCannotBeOpenedAreLogged)
{
    ASSERT_EQ(::mkfifo(settings.c_str(), 0600), 0);
    Log_Capture capture;
    logger().loadSettings();
    EXPECT_THAT(capture.words(), IsEmpty()) << "a FIFO reads as an empty file and blocks nobody";
    make_unopenable(settings);
    logger().loadSettings();
    EXPECT_THAT(capture.words(), ElementsAre("Unable to open config data file - /etc/norvane_fc_provider.dmp"));
}

TEST_F(LogSettings, AreSavedAsTheyAre)
{
    ASSERT_EQ(file.setPath(trace.c_str()), 0);
    logger().setMode(2);
    logger().setLevel(5);
    logger().saveSettings();
    EXPECT_EQ(read_file(settings), "2,5,0\n" + trace);
    logger().enable();
    logger().setMode(0);
    logger().saveSettings();
    EXPECT_EQ(read_file(settings), "0,5,1\n");
}

TEST_F(LogSettings, AreSavedOverThePreviousOnes)
{
    write_file(settings, std::string(1000, 'x'));
    logger().saveSettings();
    EXPECT_EQ(read_file(settings), "0,0,0\n");
}

TEST_F(LogSettings, ComeBackAsTheyWereSaved)
{
    load("4,5,1\n" + trace);
    logger().saveSettings();
    logger().setMode(0);
    logger().disable();
    logger().loadSettings();
    expect(4, 5, true);
    EXPECT_EQ(file.getPath(), trace.c_str());
}

TEST_F(LogSettings, ThatCannotBeSavedAreLogged)
{
    make_folder(settings);
    Log_Capture capture;
    errno = 4711;
    logger().saveSettings();
    EXPECT_EQ(errno, 4711);
    EXPECT_THAT(capture.words(), ElementsAre("Unable to open file for storing config data"));
}

TEST(LogSettingsWithoutTraceFile, ApplyModeAndLevel)
{
    write_file(settings, "1,5,1\n");
    logger().loadSettings();
    EXPECT_EQ(logger().getMode(), 1u);
    EXPECT_EQ(logger().getLevel(), 5);
    logger().saveSettings();
    EXPECT_EQ(read_file(settings), "1,5,1\n");
}

TEST_F(LogSettings, AreSavedAtExitWithoutAWord)
{
    load("2,5,1\n" + trace);
    remove(settings);
    logger().saveSettingsAtExit();
    EXPECT_EQ(read_file(settings), "2,5,1\n" + trace);

    remove(settings);
    make_folder(settings);
    Log_Capture capture;
    logger().saveSettingsAtExit();
    EXPECT_THAT(capture.words(), IsEmpty());
    remove(settings);
}

TEST_F(LogSettings, StayAsTheyAreAtTheEndIfTheyCouldNotBeRead)
{
    write_file(settings, "2,5,1\n" + trace);
    const auto load_without_descriptors = [] {
        const No_Descriptors none;
        logger().loadSettings();
    };
    load_without_descriptors();
    expect(0, 0, false);
    logger().saveSettingsAtEnd();
    EXPECT_EQ(read_file(settings), "2,5,1\n" + trace);
    logger().saveSettings(); // a client changed them
    EXPECT_EQ(read_file(settings), "0,0,0\n");
    logger().setLevel(5);
    logger().saveSettingsAtEnd();
    EXPECT_EQ(read_file(settings), "0,5,0\n") << "and so they are known again";

    write_file(settings, "2,5,1\n" + trace);
    load_without_descriptors();
    logger().saveSettingsAtExit();
    EXPECT_EQ(read_file(settings), "2,5,1\n" + trace);
}

TEST_F(LogSettings, ThatAClientSetAreSavedAtTheEndIfTheFileCouldNotBeWrittenBefore)
{
    write_file(settings, "0,1,1\n");
    logger().loadSettings();
    logger().setLevel(5);
    {
        const No_Descriptors none;
        logger().storeSettings();
    }
    EXPECT_EQ(read_file(settings), "0,1,1\n");
    logger().saveSettingsAtEnd();
    EXPECT_EQ(read_file(settings), "0,5,1\n");
}

TEST_F(LogSettings, AreSavedAtTheEndIfTheFileThatCouldNotBeReadIsGone)
{
    write_file(settings, "2,5,1\n" + trace);
    {
        const No_Descriptors none;
        logger().loadSettings();
    }
    remove(settings);
    logger().loadSettings(); // of the next life
    logger().saveSettingsAtEnd();
    EXPECT_EQ(read_file(settings), "0,0,0\n");
}

TEST_F(LogSettings, StayAsTheyAreAtExitIfAnotherThreadKeepsTheLogger)
{
    write_file(settings, "as it was");
    std::promise<void> holds, ends;
    std::thread keeper([&] {
        const CLogger::Hold hold;
        holds.set_value();
        ends.get_future().wait();
    });
    holds.get_future().wait();
    logger().saveSettingsAtExit();
    ends.set_value();
    keeper.join();
    EXPECT_EQ(read_file(settings), "as it was");
}
