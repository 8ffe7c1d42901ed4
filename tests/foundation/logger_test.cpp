#include "foundation/CLogger.h"

#include <atomic>
#include <thread>

#include <gmock/gmock.h>
#include <syslog.h>

#include "foundation/NVR_CIMLogger.h"
#include "foundation/NVR_SysLogger.h"
#include "tests/foundation/syslog_spy.h"
#include "tests/support/log_capture.h"

using namespace cimple;
using nvrtest::Log_Capture;
using nvrtest::logger;
using nvrtest::syslog_spy;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

void log(sint32 level, const char* text)
{
    logger().log("here.cpp", 7, level, "%s", text);
}

} // namespace

TEST(Levels, HaveTheNamesThatRecordsShow)
{
    const char* const names[] = {"NVR_INVALID", "NVR_CRIT", "NVR_WARN", "NVR_ERR", "NVR_INFO", "NVR_DBG"};
    for (sint32 level = 0; level < 6; level++)
        EXPECT_STREQ(logLevelName(level), names[level]);
    EXPECT_STREQ(logLevelName(-1), "NVR_INVALID");
    EXPECT_STREQ(logLevelName(6), "NVR_INVALID");
}

TEST(Dispatch, StartsWithModeLevelAndFlagAtZero)
{
    EXPECT_EQ(logger().getMode(), 0u);
    EXPECT_EQ(logger().getLevel(), 0);
    EXPECT_FALSE(logger().isEnabled());
}

TEST(Dispatch, ReachesEveryLoggerEvenWhileDisabled)
{
    Log_Capture first;
    Log_Capture second;
    const uint32 line = 42;
    logger().log("a.cpp", line, 3, "%d of %s", 1, "two");
    ASSERT_EQ(first.records().size(), 1u);
    EXPECT_EQ(first.records()[0].level, 3);
    EXPECT_EQ(first.records()[0].file, "a.cpp");
    EXPECT_EQ(first.records()[0].line, 42u);
    EXPECT_EQ(first.records()[0].text, "1 of two");
    EXPECT_THAT(second.words(), ElementsAre("1 of two"));
}

TEST(Dispatch, GoesInOrderOfAttachment)
{
    struct Numbered : NVR_LoggerInterface {
        Numbered(int number, std::vector<int>& order) : m_number(number), m_order(order) { logger().attach(this); }
        ~Numbered() override { logger().detach(this); }
        void logMessage(sint32, const char*, uint32, const char*) override { m_order.push_back(m_number); }
        void open() override {}
        void close() override {}
        void clear() override {}
        int m_number;
        std::vector<int>& m_order;
    };
    std::vector<int> order;
    Numbered one(1, order);
    Numbered two(2, order);
    Numbered three(3, order);
    log(1, "x");
    EXPECT_THAT(order, ElementsAre(1, 2, 3));
}

TEST(Dispatch, HasNoLimitOnTheMessage)
{
    Log_Capture capture;
    for (std::size_t size : {1022u, 1023u, 1024u, 1025u, 100000u}) {
        const std::string text(size, 'x');
        log(5, text.c_str());
        EXPECT_EQ(capture.words().back(), text);
    }
}

TEST(Dispatch, AttachesALoggerOnce)
{
    Log_Capture capture;
    EXPECT_EQ(logger().attach(&capture), 0);
    log(1, "once");
    EXPECT_THAT(capture.words(), ElementsAre("once"));
    EXPECT_EQ(logger().detach(&capture), 1);
    EXPECT_EQ(logger().detach(&capture), 0);
    log(1, "never");
    EXPECT_THAT(capture.words(), ElementsAre("once"));
}

TEST(Dispatch, WhileDisabledGoesToTheSystemLoggerAlone)
{
    Log_Capture capture;
    NVR_SysLogger system;
    log(NVR_ERR, "fault");
    EXPECT_THAT(capture.words(), IsEmpty());
    ASSERT_EQ(syslog_spy().entries.size(), 1u);
    EXPECT_EQ(syslog_spy().entries[0].text, "[fault]\n");
}

TEST(Dispatch, WhileEnabledGoesToAll)
{
    Log_Capture capture;
    NVR_SysLogger system;
    logger().enable();
    log(NVR_ERR, "fault");
    EXPECT_THAT(capture.words(), ElementsAre("fault"));
    EXPECT_EQ(syslog_spy().entries.size(), 1u);
}

TEST(Dispatch, DetachKeepsTheSystemLoggerAndDetachAllForgetsIt)
{
    Log_Capture capture;
    NVR_SysLogger system;
    EXPECT_EQ(logger().detach(&system), 1);
    log(NVR_ERR, "still the system log alone");
    EXPECT_THAT(capture.words(), IsEmpty());
    logger().detachAll();
    log(NVR_ERR, "nobody");
    logger().attach(&capture);
    log(NVR_ERR, "all");
    EXPECT_THAT(capture.words(), ElementsAre("all"));
    EXPECT_EQ(syslog_spy().entries.size(), 1u);
}

TEST(Dispatch, AnEndedSystemLoggerIsForgotten)
{
    Log_Capture capture;
    {
        NVR_SysLogger system;
    }
    log(NVR_ERR, "all");
    EXPECT_THAT(capture.words(), ElementsAre("all"));
}

TEST(Dispatch, DropsWhatALoggerLogsItself)
{
    struct Chatty : Log_Capture {
        void logMessage(sint32 level, const char* file, uint32 line, const char* text) override
        {
            Log_Capture::logMessage(level, file, line, text);
            log(1, "from inside");
        }
        void open() override { log(1, "opening"); }
    };
    Chatty chatty;
    log(1, "outer");
    logger().setMode(1);
    EXPECT_THAT(chatty.words(), ElementsAre("outer"));
}

TEST(Dispatch, LeavesErrnoAlone)
{
    Log_Capture capture;
    errno = 4711;
    log(5, std::string(5000, 'x').c_str());
    logger().setMode(2);
    logger().clearAll();
    EXPECT_EQ(errno, 4711);
}

TEST(Settings, TakeLevelsOneToFive)
{
    for (sint32 level = 1; level <= 5; level++) {
        logger().setLevel(level);
        EXPECT_EQ(logger().getLevel(), level);
    }
    for (sint32 level : {0, 6, -1}) {
        logger().setLevel(level);
        EXPECT_EQ(logger().getLevel(), 5);
    }
}

TEST(Settings, EnableAndDisable)
{
    logger().enable();
    logger().enable();
    EXPECT_TRUE(logger().isEnabled());
    logger().disable();
    logger().disable();
    EXPECT_FALSE(logger().isEnabled());
}

TEST(Settings, TheModeOpensOrClosesEveryLogger)
{
    Log_Capture capture;
    for (uint32 mode : {1u, 2u, 3u, 4u})
        logger().setMode(mode);
    EXPECT_EQ(capture.opened(), 4);
    EXPECT_EQ(capture.closed(), 0);
    logger().setMode(0);
    EXPECT_EQ(capture.closed(), 1);
    EXPECT_EQ(logger().getMode(), 0u);
}

TEST(Settings, ClearAllClearsEveryLogger)
{
    Log_Capture capture;
    log(1, "x");
    logger().clearAll();
    EXPECT_THAT(capture.words(), IsEmpty());
}

TEST(CallSite, GivesItsFileAndLineAtLevelFive)
{
    Log_Capture capture;
    NVR_LOG("n = %d", 3);
    const uint32 line = __LINE__ - 1;
    ASSERT_EQ(capture.records().size(), 1u);
    EXPECT_EQ(capture.records()[0].text, "n = 3");
    EXPECT_EQ(capture.records()[0].level, 5);
    EXPECT_EQ(capture.records()[0].line, line);
    EXPECT_THAT(capture.records()[0].file, testing::EndsWith("tests/foundation/logger_test.cpp"));
}

TEST(CallSite, FormatsNothingThatNobodyRecords)
{
    int formatted = 0;
    auto count = [&] { return ++formatted; };
    NVR_CIMLogger ring;
    NVR_SysLogger system;
    for (uint32 mode : {0u, 1u, 3u}) {
        logger().setMode(mode);
        logger().disable();
        NVR_LOG("%d", count());
        logger().enable();
        NVR_LOG("%d", count());
    }
    logger().disable();
    logger().setMode(2);
    NVR_LOG("%d", count());
    EXPECT_EQ(formatted, 0);
    EXPECT_TRUE(logger().wanted(4));
    Log_Capture capture;
    NVR_LOG("%d", count());
    EXPECT_EQ(formatted, 1) << "an attached logger of another kind may take anything";
}

TEST(SystemLog, IsOpenedUnderTheModulesNameAndClosed)
{
    {
        errno = 4711;
        NVR_SysLogger system;
        EXPECT_EQ(errno, 4711) << "though the connection failed";
        EXPECT_STREQ(syslog_spy().ident, "[NVR][CIM][FC]");
        EXPECT_EQ(syslog_spy().option, LOG_NDELAY | LOG_NOWAIT);
        EXPECT_EQ(syslog_spy().facility, LOG_USER);
    }
    EXPECT_EQ(syslog_spy().closed, 1);
    const char* ident = syslog_spy().ident;
    NVR_SysLogger again;
    EXPECT_EQ(syslog_spy().ident, ident) << "one name for the life of the process";
}

TEST(SystemLog, TakesLevelsOneToFourAtTheirPriorities)
{
    NVR_SysLogger system;
    for (sint32 level : {-1, 0, 1, 2, 3, 4, 5, 6})
        system.logMessage(level, "f", 1, "m");
    std::vector<int> priorities;
    for (const auto& entry : syslog_spy().entries)
        priorities.push_back(entry.priority);
    EXPECT_THAT(priorities, ElementsAre(LOG_CRIT, LOG_WARNING, LOG_ERR, LOG_INFO));
}

TEST(SystemLog, GetsTheTextInItsFormatArgument)
{
    NVR_SysLogger system;
    system.logMessage(1, "f", 1, "plain");
    EXPECT_EQ(syslog_spy().entries[0].format, "[plain]\n");
    system.logMessage(1, "f", 1, "100%% and %m");
    EXPECT_EQ(syslog_spy().entries[1].format, "[100%% and %m]\n");
}

TEST(SystemLog, WritesConversionsThatHaveNoArgumentAsTheyStand)
{
    NVR_SysLogger system;
    for (const char* text : {"50% done", "%n", "%s%s%s", "%", "a%5$n", "%%%n"})
        system.logMessage(1, "f", 1, text);
    std::vector<std::string> written;
    for (const auto& entry : syslog_spy().entries)
        written.push_back(entry.text);
    EXPECT_THAT(written, ElementsAre("[50% done]\n", "[%n]\n", "[%s%s%s]\n", "[%]\n", "[a%5$n]\n", "[%%n]\n"));
}

TEST(SystemLog, CutsARecordAtItsBuffer)
{
    NVR_SysLogger system;
    system.logMessage(1, "f", 1, std::string(1996, 'x').c_str());
    EXPECT_EQ(syslog_spy().entries[0].text, "[" + std::string(1996, 'x') + "]\n");
    system.logMessage(1, "f", 1, std::string(3000, 'x').c_str());
    EXPECT_EQ(syslog_spy().entries[1].text, "[" + std::string(1998, 'x'));
    std::string conversions;
    for (int i = 0; i < 1500; i++)
        conversions += "%n";
    system.logMessage(1, "f", 1, conversions.c_str());
    EXPECT_EQ(syslog_spy().entries[2].text, "[" + conversions.substr(0, 1998));
}

TEST(SystemLog, ComparesTheBracketedTextAndSoDropsNothing)
{
    NVR_SysLogger system;
    system.logMessage(1, "f", 1, "GetInterfaceState failed");
    system.logMessage(1, "f", 1, "GetIPAddressType failed");
    EXPECT_EQ(syslog_spy().entries.size(), 2u);
}

TEST(RecordRing, TakesLevelsUpToThreeInModesOneAndFour)
{
    NVR_CIMLogger ring;
    std::vector<NVR_CIMLogEntry> entries;
    for (uint32 mode : {0u, 1u, 2u, 3u, 4u}) {
        logger().setMode(mode);
        ring.clear();
        for (sint32 level = 0; level <= 6; level++)
            log(level, "m");
        ring.logMessage(1, "f", 1, nullptr);
        ring.getEntries(entries);
        EXPECT_EQ(entries.size(), mode == 1 || mode == 4 ? 4u : 0u) << mode;
    }
    EXPECT_EQ(entries[3].level, 3u);
    EXPECT_STREQ(entries[3].text, "[m]");
    EXPECT_TRUE(entries[3].timeStamp.is_timestamp());
}

TEST(RecordRing, KeepsTheLatest1024BySlot)
{
    NVR_CIMLogger ring;
    logger().setMode(1);
    for (int i = 0; i < 1025; i++)
        log(1, std::to_string(i).c_str());
    std::vector<NVR_CIMLogEntry> entries(7);
    ring.getEntries(entries);
    ASSERT_EQ(entries.size(), 1024u);
    EXPECT_STREQ(entries[0].text, "[1024]");
    EXPECT_STREQ(entries[1].text, "[1]");
    EXPECT_STREQ(entries[1023].text, "[1023]");
    ring.clear();
    log(1, "new");
    ring.getEntries(entries);
    ASSERT_EQ(entries.size(), 1u);
    EXPECT_STREQ(entries[0].text, "[new]");
}

TEST(RecordRing, CutsATextAtItsField)
{
    NVR_CIMLogger ring;
    logger().setMode(1);
    log(1, std::string(197, 'x').c_str());
    log(1, std::string(198, 'x').c_str());
    log(1, std::string(5000, 'x').c_str());
    std::vector<NVR_CIMLogEntry> entries;
    ring.getEntries(entries);
    EXPECT_EQ(std::string(entries[0].text), "[" + std::string(197, 'x') + "]");
    EXPECT_EQ(std::string(entries[1].text), "[" + std::string(198, 'x'));
    EXPECT_EQ(std::string(entries[2].text), "[" + std::string(198, 'x'));
}

TEST(Dispatch, ServesManyThreadsWhileItIsReset)
{
    NVR_CIMLogger ring;
    std::atomic<bool> done{false};
    std::vector<std::thread> threads;
    for (int t = 0; t < 3; t++)
        threads.emplace_back([&] {
            for (int i = 0; i < 2000; i++) {
                NVR_LOG("debug %d", i);
                log(2, "warning");
            }
        });
    std::thread reset([&] {
        for (unsigned i = 0; !done; i++) {
            logger().setMode(i % 5);
            logger().setLevel(static_cast<sint32>(i % 7));
            if (i % 2)
                logger().enable();
            else
                logger().disable();
            logger().clearAll();
            Log_Capture passing;
            std::vector<NVR_CIMLogEntry> entries;
            ring.getEntries(entries);
            EXPECT_LE(entries.size(), 1024u);
        }
    });
    for (auto& thread : threads)
        thread.join();
    done = true;
    reset.join();
    logger().setMode(1);
    ring.clear();
    log(1, "alive");
    std::vector<NVR_CIMLogEntry> entries;
    ring.getEntries(entries);
    EXPECT_EQ(entries.size(), 1u);
}
