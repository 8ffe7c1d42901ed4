// The provider's own log: its records, the ties to them, and the methods that steer the logger.
#include <climits>
#include <sys/stat.h>
#include <unistd.h>

#include "logs/NVRHBA_DriverRecordLogManagesRecord_Provider.h"
#include "logs/NVRHBA_FCDriverLogEntry_Provider.h"
#include "logs/NVRHBA_LogEntry_Provider.h"
#include "logs/NVRHBA_RecordLogManagesRecord_Provider.h"
#include "tests/agent/expect_rows.h"
#include "tests/logs/Logs_Test.h"
#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

namespace {

constexpr const char* settings = "/etc/norvane_fc_provider.dmp";
constexpr const char* trace = "/var/log/norvane.trace";

class RecordLog : public Logs_Test {
protected:
    RecordLog()
    {
        refresh();
        words();
    }
    static void log_at(sint32 level, const std::string& text)
    {
        CLogger::instance()->log("source.cpp", 7, level, "%s", text.c_str());
    }
    Instances entries() { return enumerate<NVRHBA_LogEntry_Provider>(); }
    Instances ties() { return enumerate<NVRHBA_RecordLogManagesRecord_Provider>(); }
    std::string shown(const char* property) { return value(log_of(provider_log()), property); }
};

} // namespace

TEST_F(RecordLog, HasNoRecordsWhereEverythingIsLoggedAtTheLastLevel)
{
    EXPECT_EQ(set_params(provider_log(), 5, 1, ""), 0u);
    log_at(5, "not kept");
    log_at(4, "not kept");
    EXPECT_THAT(entries(), IsEmpty());
    EXPECT_THAT(ties(), IsEmpty());
}

TEST_F(RecordLog, ShowsTheRingsRecords)
{
    EXPECT_EQ(set_params(provider_log(), 5, 1, ""), 0u);
    log_at(1, "first");
    log_at(3, "second");
    words();
    const Instances all = entries();
    ASSERT_THAT(all, SizeIs(2));
    expect_rows(all[0].get(), {
                                  {"InstanceID", "NVRHBA:ProviderLog:0"},
                                  {"RecordID", "0"},
                                  {"RecordData", "[first]"},
                                  {"LogLevel", "1"},
                                  {"LogInstanceID", provider_log()},
                                  {"LogName", "Record logs for Norvane CIM Provider"},
                                  {"ElementName", "Record logs for Norvane CIM Provider"},
                                  {"RecordFormat", "[string fileName][uint32 lineNumber]:[string record]"},
                                  {"Caption", "null"},
                                  {"PerceivedSeverity", "null"},
                              });
    std::vector<NVR_CIMLogEntry> ring;
    agent().m_cimLogger.getEntries(ring);
    ASSERT_THAT(ring, SizeIs(2));
    char time[Datetime::text_size];
    ring[0].timeStamp.ascii(time);
    EXPECT_EQ(value(all[0].get(), "CreationTimeStamp"), time);
    expect_rows(
        all[1].get(),
        {{"InstanceID", "NVRHBA:ProviderLog:1"}, {"RecordID", "1"}, {"RecordData", "[second]"}, {"LogLevel", "3"}});
    EXPECT_THAT(words(),
                contains_in_order({"Entering NVRHBA_LogEntry::enum_instances", "Log Size 2",
                                   "NVRHBA_LogEntry returned instance 0", "NVRHBA_LogEntry returned instance 1",
                                   "NVRVCNA_LogEntry_Provider::enum_instances()"}));
}

TEST_F(RecordLog, TiesEachRecordToTheLog)
{
    set_params(provider_log(), 5, 4, trace);
    log_at(2, "one");
    log_at(2, "two");
    words();
    const Instances all = ties();
    ASSERT_THAT(all, SizeIs(2));
    for (unsigned i = 0; i < 2; i++) {
        expect_rows(all[i].get(), {});
        EXPECT_EQ(end(all[i].get(), "Log", "InstanceID"), provider_log());
        EXPECT_EQ(end(all[i].get(), "Log", "MaxNumberOfRecords"), "1024");
        EXPECT_EQ(end(all[i].get(), "Record", "InstanceID"), "NVRHBA:ProviderLog:" + std::to_string(i));
    }
    EXPECT_EQ(end(all[1].get(), "Record", "RecordData"), "[two]");
    EXPECT_THAT(words(), contains_in_order({"Entering NVRHBA_RecordLogManagesRecord::enum_instances", "Log Size 2",
                                            "NVRHBA_RecordLogManagesRecord returned instance 0",
                                            "NVRHBA_RecordLogManagesRecord returned instance 1"}));
}

TEST_F(RecordLog, ThreeThousandRecordsFillTheRingBySlot)
{
    set_params(provider_log(), 5, 1, "");
    for (int i = 0; i < 3000; i++)
        log_at(1 + i % 3, std::to_string(i));
    const Instances all = entries();
    ASSERT_THAT(all, SizeIs(1024));
    for (int slot = 0; slot < 1024; slot++) {
        // 3000 = 2 * 1024 + 952: the first 952 slots were written a third time.
        const int record = slot < 952 ? 2048 + slot : 1024 + slot;
        const Instance* entry = all[static_cast<unsigned>(slot)].get();
        ASSERT_EQ(value(entry, "RecordData"), "[" + std::to_string(record) + "]");
        ASSERT_EQ(value(entry, "LogLevel"), std::to_string(1 + record % 3));
        ASSERT_EQ(value(entry, "InstanceID"), "NVRHBA:ProviderLog:" + std::to_string(slot));
    }
    EXPECT_THAT(ties(), SizeIs(1024));
    EXPECT_EQ(clear(provider_log()), 0u);
    EXPECT_THAT(entries(), IsEmpty());
    log_at(3, "anew");
    EXPECT_THAT(entries(), SizeIs(1));
}

TEST_F(RecordLog, WithoutItsInstanceTheRecordsHaveNoNamesAndNoTies)
{
    set_params(provider_log(), 5, 1, "");
    log_at(1, "left");
    agent().m_NVRHBA_RecordLog_map.clear();
    words();
    const Instances all = entries();
    ASSERT_THAT(all, SizeIs(1));
    expect_rows(all[0].get(),
                {{"RecordData", "[left]"}, {"LogInstanceID", "null"}, {"LogName", "null"}, {"ElementName", "null"}});
    words();
    EXPECT_THAT(ties(), IsEmpty());
    EXPECT_THAT(words(), Not(Contains("NVRHBA_RecordLogManagesRecord returned instance 0")));
}

TEST_F(RecordLog, WithoutMemoryNothingIsHandedOut)
{
    set_params(provider_log(), 5, 1, "");
    for (const char* record : {"one", "two", "three"})
        log_at(1, record);
    expect_all_or_nothing<NVRHBA_LogEntry_Provider>("Could not create NVRVCNA_LogEntry instance", 3);
    expect_all_or_nothing<NVRHBA_RecordLogManagesRecord_Provider>("Could not create NVRVCNA_LogEntry instance", 3);
}

TEST_F(RecordLog, ParametersAreShownStoredAndReadBack)
{
    for (const uint16 mode : {uint16{2}, uint16{4}}) {
        remove(trace);
        words();
        EXPECT_EQ(set_params(provider_log(), 5, mode, trace), 0u);
        const std::string number = std::to_string(mode);
        EXPECT_THAT(words(), contains_in_order({"Changing the record log parameters 5-" + number + "-" + trace,
                                                std::string("Setting path as ") + trace}));
        EXPECT_EQ(read_file(settings), number + ",5,1\n" + trace);
        EXPECT_EQ(shown("LogMode"), number);
        EXPECT_EQ(shown("LogLevel"), "5");
        EXPECT_EQ(shown("TracePath"), trace);
        EXPECT_TRUE(exists(trace));
        CLogger::instance()->setMode(0);
        CLogger::instance()->loadSettings();
        EXPECT_EQ(CLogger::instance()->getMode(), mode);
        EXPECT_STREQ(agent().m_fileLogger.getPath().c_str(), trace);
    }
}

TEST_F(RecordLog, ModesWithoutATraceFileAreStoredAndNotReadBack)
{
    for (const uint16 mode : {uint16{1}, uint16{3}}) {
        words();
        EXPECT_EQ(set_params(provider_log(), 5, mode, ""), 0u);
        EXPECT_THAT(words(), Contains("Changing the record log parameters 5-" + std::to_string(mode) + "-"));
        EXPECT_EQ(read_file(settings), std::to_string(mode) + ",5,1\n");
        EXPECT_EQ(CLogger::instance()->getMode(), mode);
        EXPECT_EQ(shown("LogMode"), std::to_string(mode));
        EXPECT_EQ(shown("TracePath"), "null");
        CLogger::instance()->setMode(2);
        CLogger::instance()->loadSettings();
        EXPECT_EQ(CLogger::instance()->getMode(), 2u);
    }
}

TEST_F(RecordLog, APathInUseStaysShownInModesWithoutATraceFile)
{
    EXPECT_EQ(set_params(provider_log(), 5, 2, trace), 0u);
    words();
    EXPECT_EQ(set_params(provider_log(), 5, 3, ""), 0u);
    EXPECT_THAT(words(), Contains(std::string("Setting path as ") + trace));
    EXPECT_EQ(shown("TracePath"), trace);
    EXPECT_EQ(read_file(settings), std::string("3,5,1\n") + trace);
}

TEST_F(RecordLog, LevelsAndModesOutOfRangeChangeNothing)
{
    ASSERT_EQ(set_params(provider_log(), 5, 2, trace), 0u);
    const std::string before = read_file(settings);
    for (const uint16 level : {uint16{0}, uint16{1}, uint16{3}, uint16{4}, uint16{6}, uint16{0xFFFF}}) {
        words();
        EXPECT_EQ(set_params(provider_log(), level, 1, ""), 32968u);
        EXPECT_THAT(words(), Contains("Log level provided is out of range"));
    }
    for (const uint16 mode : {uint16{0}, uint16{5}, uint16{0xFFFF}}) {
        words();
        EXPECT_EQ(set_params(provider_log(), 5, mode, "/var/log/other"), 32968u);
        EXPECT_THAT(words(), Contains("Log mode provided is out of range"));
    }
    EXPECT_EQ(read_file(settings), before);
    EXPECT_EQ(CLogger::instance()->getMode(), 2u);
    EXPECT_EQ(shown("LogMode"), "2");
    EXPECT_FALSE(exists("/var/log/other"));
}

TEST_F(RecordLog, ArgumentsThatAreNotGivenAreOutOfRange)
{
    const Property<uint16> none = {0, 1};
    Property<uint16> given{};
    given.set(uint16{5});
    const auto ask = [&](const Property<uint16>& level, const Property<uint16>& mode) {
        return answered([&](Property<uint32>& value) {
            return provider.SetLogParams(target(provider_log()).get(), level, mode, {}, value);
        });
    };
    EXPECT_EQ(ask(none, given), 32968u);
    EXPECT_EQ(ask(given, none), 32968u);
    given.set(uint16{2});
    Property<uint16> level;
    level.set(uint16{5});
    EXPECT_EQ(ask(level, given), 32968u); // no path for a trace file
    EXPECT_EQ(request(target(provider_log()).get(), none), 32968u);
}

TEST_F(RecordLog, TracePathsThatCannotBeWrittenAreRefused)
{
    ASSERT_EQ(set_params(provider_log(), 5, 2, trace), 0u);
    write_file("/var/log/read-only", "");
    ASSERT_EQ(chmod("/var/log/read-only", 0444), 0);
    write_file("/var/log/plain", "");
    nvrtest::make_link("/var/log/nowhere/file", "/var/log/to-nowhere");
    const std::string long_name(4096, 'x');
    for (const std::string& path : {std::string(), std::string("/var/log"), std::string("/var/log/read-only"),
                                    std::string("/var/log/plain/below"), std::string("/nowhere/at/all"),
                                    "/var/log/" + long_name, std::string("/var/log/to-nowhere")}) {
        for (const uint16 mode : {uint16{2}, uint16{4}}) {
            words();
            EXPECT_EQ(set_params(provider_log(), 5, mode, path), 32968u) << path;
            EXPECT_THAT(words(), Contains("Setting the trace path failed"));
        }
        EXPECT_EQ(shown("TracePath"), trace);
        EXPECT_STREQ(agent().m_fileLogger.getPath().c_str(), trace);
    }
}

TEST_F(RecordLog, DevicesAndDanglingLinksCanBeTraceFiles)
{
    EXPECT_EQ(set_params(provider_log(), 5, 2, "/dev/null"), 0u);
    EXPECT_EQ(shown("TracePath"), "/dev/null");
    EXPECT_EQ(set_params(provider_log(), 5, 2, "/dev/full"), 0u); // its records are lost
    nvrtest::make_link("/var/log/made-by-the-link", "/var/log/dangling");
    EXPECT_EQ(set_params(provider_log(), 5, 2, "/var/log/dangling"), 0u);
    EXPECT_TRUE(exists("/var/log/made-by-the-link"));
    ASSERT_EQ(mkfifo("/var/log/fifo", 0600), 0);
    EXPECT_EQ(set_params(provider_log(), 5, 2, "/var/log/fifo"), 0u); // nobody reads, nobody waits
    for (int i = 0; i < 2000; i++)
        NVR_LOG("a record that no pipe has room for any more");
}

TEST_F(RecordLog, ClearingEmptiesTraceFileAndRing)
{
    set_params(provider_log(), 5, 4, trace);
    auto& logs = agent().m_NVRHBA_RecordLog_map;
    ASSERT_EQ(logs[0], log_of(provider_log()));
    logs[0]->CurrentNumberOfRecords.set(uint64{7});
    log_at(1, "record");
    ASSERT_THAT(read_file(trace), testing::HasSubstr("[NVR_CRIT] record"));
    words();
    EXPECT_EQ(clear(provider_log()), 0u);
    EXPECT_EQ(m_result, 0);
    EXPECT_THAT(words(), Contains("Cleared all the logs"));
    EXPECT_THAT(read_file(trace), Not(testing::HasSubstr("[NVR_CRIT] record")));
    EXPECT_THAT(entries(), IsEmpty());
    EXPECT_EQ(shown("CurrentNumberOfRecords"), "7") << "as it was";
}

TEST_F(RecordLog, IsDisabledAndEnabled)
{
    set_params(provider_log(), 5, 2, trace);
    words();
    EXPECT_EQ(request(provider_log(), 3), 0u);
    EXPECT_FALSE(CLogger::instance()->isEnabled());
    EXPECT_EQ(shown("EnabledState"), "3");
    EXPECT_EQ(shown("RequestedState"), "3");
    EXPECT_EQ(read_file(settings), std::string("2,5,0\n") + trace);
    EXPECT_EQ(trace_file_words(trace).back(), "Logs disabled");

    EXPECT_EQ(request(provider_log(), 2), 0u);
    EXPECT_TRUE(CLogger::instance()->isEnabled());
    EXPECT_EQ(shown("EnabledState"), "2");
    EXPECT_EQ(shown("RequestedState"), "2");
    EXPECT_EQ(read_file(settings), std::string("2,5,1\n") + trace);
    EXPECT_THAT(words(), Contains("FC Record Logs enabled"));
}

TEST_F(RecordLog, OtherStatesAreRefused)
{
    for (const uint16 state : {uint16{0}, uint16{1}, uint16{4}, uint16{11}, uint16{0xFFFF}}) {
        words();
        EXPECT_EQ(request(provider_log(), state), 32968u);
        EXPECT_EQ(request(driver_log(), state), 32968u);
        EXPECT_THAT(words(), Contains("Invalid input"));
    }
    EXPECT_EQ(shown("EnabledState"), "2");
}

TEST_F(RecordLog, ATargetOfAnotherClassIsForeign)
{
    Ref<Instance> other(create(&CIM_ComputerSystem::meta, false));
    const auto* foreign = static_cast<const NVRHBA_RecordLog*>(other.get());
    Property<uint16> number;
    number.set(uint16{5});
    Property<uint16> state;
    state.set(uint16{3});
    for (const NVRHBA_RecordLog* self : {foreign, static_cast<const NVRHBA_RecordLog*>(nullptr)}) {
        const auto expect_refused = [&](uint32 answer) {
            EXPECT_EQ(answer, 33068u);
            EXPECT_EQ(m_result, 0);
            EXPECT_THAT(words(), Contains("Invalid instance of Record Log"));
        };
        words();
        expect_refused(
            answered([&](Property<uint32>& value) { return provider.SetLogParams(self, number, number, {}, value); }));
        expect_refused(answered([&](Property<uint32>& value) { return provider.ClearLog(self, value); }));
        expect_refused(request(self, state));
    }
    EXPECT_TRUE(CLogger::instance()->isEnabled());
}

TEST_F(RecordLog, ALogThatTheMapDoesNotHaveIsSteeredButNotShown)
{
    agent().m_NVRHBA_RecordLog_map.clear();
    words();
    EXPECT_EQ(set_params(provider_log(), 5, 2, trace), 0u);
    EXPECT_THAT(words(), Not(Contains(std::string("Setting path as ") + trace)));
    EXPECT_EQ(CLogger::instance()->getMode(), 2u);
    EXPECT_EQ(clear(provider_log()), 0u);
    EXPECT_EQ(request(provider_log(), 2), 0u);
    EXPECT_EQ(request(driver_log(), 2), 0u);
    EXPECT_EQ(clear(driver_log()), 0u);
    EXPECT_THAT(agent().m_NVRHBA_RecordLog_map.size(), 0u);
}

TEST_F(RecordLog, OfAHostWithoutANameHasAnEmptyOne)
{
    agent().m_CIM_ComputerSystem_map.clear();
    EXPECT_EQ(set_params("NVR: FC Driver Record Log:", 5, 1, ""), unset);
    EXPECT_EQ(m_result, 131);
    EXPECT_THAT(entries(), IsEmpty());
}

// What a refused load leaves behind.
TEST(RecordLogWithoutAnAgent, HasNoRecordsAndSaysWhy)
{
    struct Refused : SimulatedHost {
        void TestBody() override
        {
            install({});
            NVRHBA_LogEntry_Provider entries;
            NVRHBA_RecordLogManagesRecord_Provider ties;
            NVRHBA_FCDriverLogEntry_Provider lines;
            NVRHBA_DriverRecordLogManagesRecord_Provider line_ties;
            EXPECT_EQ(entries.load(), 30);
            words();
            Instances all;
            EXPECT_EQ(entries.enum_instances(nullptr, {collect, &all}), 0);
            EXPECT_EQ(ties.enum_instances(nullptr, {collect, &all}), 0);
            EXPECT_EQ(lines.enum_instances(nullptr, {collect, &all}), 0);
            EXPECT_EQ(line_ties.enum_instances(nullptr, {collect, &all}), 0);
            EXPECT_THAT(all, IsEmpty());
            EXPECT_THAT(words(), testing::ElementsAre(
                                     "RM Init failed for logs/NVRHBA_LogEntry_Provider.cpp",
                                     "RM Init failed for logs/NVRHBA_RecordLogManagesRecord_Provider.cpp",
                                     "RM Init failed for logs/NVRHBA_FCDriverLogEntry_Provider.cpp",
                                     "RM Init failed for logs/NVRHBA_DriverRecordLogManagesRecord_Provider.cpp"));
            entries.unload();
        }
    };
    Refused().TestBody();
}
