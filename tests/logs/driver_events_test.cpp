// The driver's lines: from the system's log into the store, and from there to clients.
#include <algorithm>
#include <sys/mount.h>
#include <sys/stat.h>
#include <unistd.h>

#include "logs/NVRHBA_DriverRecordLogManagesRecord_Provider.h"
#include "logs/NVRHBA_FCDriverLogEntry_Provider.h"
#include "logs/driver_log.h"
#include "tests/agent/expect_rows.h"
#include "tests/logs/Logs_Test.h"
#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

namespace {

constexpr const char* system_log = "/var/log/messages";
constexpr const char* offered = "Handlelog ---  Prior to Inserting into DeviceLog Vector";

std::string line(int number)
{
    return "Nov 21 12:00:00 storage1 kernel: tsfc 0000:05:00.0: message " + std::to_string(number);
}

class DriverEvents : public Logs_Test {
protected:
    DriverEvents()
    {
        remove(system_log);
        refresh();
        words();
    }
    ~DriverEvents() override { remove(system_log); }

    const Driver_Log_Store& store() { return agent().m_driverLogStore; }
    Instances entries() { return enumerate<NVRHBA_FCDriverLogEntry_Provider>(); }
    Instances ties() { return enumerate<NVRHBA_DriverRecordLogManagesRecord_Provider>(); }
    std::string shown(const char* property) { return value(log_of(driver_log()), property); }
    /// What a client sees who has the log read.
    std::vector<std::string> read()
    {
        EXPECT_EQ(request(driver_log(), 2), 0u);
        return store().lines;
    }
};

} // namespace

TEST_F(DriverEvents, TheStoreTakesLinesUntilItIsFull)
{
    Driver_Log_Store lines;
    EXPECT_EQ(lines.index, -1);
    EXPECT_EQ(lines.insert(""), 0);
    EXPECT_THAT(lines.lines, IsEmpty());
    EXPECT_THAT(words(), IsEmpty());
    for (int i = 0; i < 200; i++)
        EXPECT_EQ(lines.insert(line(i)), 0);
    EXPECT_EQ(lines.index, 199);
    words();
    EXPECT_EQ(lines.insert("one more"), 1);
    EXPECT_THAT(words(), ElementsAre(offered));
    EXPECT_EQ(lines.insert(""), 0); // never looked at
    EXPECT_THAT(lines.lines, SizeIs(200));
    lines.clear();
    EXPECT_EQ(lines.index, -1);
    EXPECT_THAT(lines.lines, IsEmpty());
    EXPECT_EQ(lines.insert("anew"), 0);
    EXPECT_EQ(lines.index, 0);
}

TEST_F(DriverEvents, NothingIsReadUntilAClientAsks)
{
    write_file(system_log, line(1) + "\n");
    refresh();
    EXPECT_THAT(entries(), IsEmpty());
    EXPECT_THAT(ties(), IsEmpty());
    EXPECT_THAT(read(), SizeIs(1));
    EXPECT_THAT(entries(), SizeIs(1));
}

TEST_F(DriverEvents, TheNewest200AreShownNewestFirst)
{
    std::string content;
    for (int i = 0; i < 500; i++)
        content += line(i) + "\nNov 21 12:00:00 storage1 systemd[1]: another matter\n\n";
    write_file(system_log, content);
    words();
    read();
    ASSERT_THAT(store().lines, SizeIs(200));
    for (int i = 0; i < 200; i++)
        ASSERT_EQ(store().lines[static_cast<unsigned>(i)], line(499 - i));
    const std::vector<std::string> told = words();
    EXPECT_EQ(std::count(told.begin(), told.end(), offered), 201); // the last one is refused
    EXPECT_THAT(told, contains_in_order({"Reading Events for tsfc", offered, "Finished reading Events for tsfc",
                                         "Logging of FC Driver Log Ends"}));
    EXPECT_EQ(shown("CurrentNumberOfRecords"), "200");
    EXPECT_EQ(shown("EnabledState"), "2");
    EXPECT_EQ(shown("RequestedState"), "2");
    const Instances all = entries();
    ASSERT_THAT(all, SizeIs(200));
    EXPECT_EQ(value(all[0].get(), "RecordData"), line(499));
    EXPECT_EQ(value(all[199].get(), "RecordData"), line(300));
}

TEST_F(DriverEvents, ALineIsOneInstance)
{
    write_file(system_log, line(1) + "\n" + line(2) + "\n");
    read();
    words();
    const Instances all = entries();
    ASSERT_THAT(all, SizeIs(2));
    expect_rows(all[1].get(), {
                                  {"RecordID", "1"},
                                  {"InstanceID", "NVR:HBA FC Driver Record:1"},
                                  {"RecordData", line(1)},
                                  {"LogInstanceID", driver_log()},
                                  {"LogName", driver_log()},
                                  {"ElementName", driver_log()},
                                  {"RecordFormat", "[string record]"},
                                  {"CreationTimeStamp", "null"},
                              });
    EXPECT_THAT(words(),
                contains_in_order({"Entering NVRHBA_FCDriverLogEntry::enum_instances", "NVRHBA_FCDriverLogEntry Entry",
                                   "Log Size 2", "NVRHBA_LogEntry returned instance 0",
                                   "NVRHBA_LogEntry returned instance 1", "NVRHBA_FCDriverLogEntry Exit"}));
}

TEST_F(DriverEvents, TheTiesKnowALineByAnotherKey)
{
    write_file(system_log, line(1) + "\n" + line(2) + "\n");
    read();
    words();
    const Instances all = ties();
    ASSERT_THAT(all, SizeIs(2));
    expect_rows(all[0].get(), {});
    EXPECT_EQ(end(all[0].get(), "Log", "InstanceID"), driver_log());
    EXPECT_EQ(end(all[0].get(), "Log", "CurrentNumberOfRecords"), "2");
    EXPECT_EQ(end(all[0].get(), "Record", "InstanceID"), "NVRHBA:FC Driver Record Log:0");
    EXPECT_EQ(end(all[0].get(), "Record", "RecordData"), line(2));
    EXPECT_EQ(end(all[1].get(), "Record", "InstanceID"), "NVRHBA:FC Driver Record Log:1");
    EXPECT_THAT(words(), contains_in_order({"Enter -- NVRHBA_DriverRecordLogManagesRecord",
                                            "Entering NVRHBA_DriverRecordLogManagesRecord::enum_instances",
                                            "NVRHBA_DriverRecordLogManagesRecord returned instance 0",
                                            "NVRHBA_DriverRecordLogManagesRecord returned instance 1",
                                            "Exit -- NVRHBA_DriverRecordLogManagesRecord"}));
}

TEST_F(DriverEvents, WithoutMemoryNothingIsHandedOut)
{
    write_file(system_log, line(1) + "\n" + line(2) + "\n");
    read();
    expect_all_or_nothing<NVRHBA_FCDriverLogEntry_Provider>("Could not create NVRVCNA_LogEntry instance", 2);
    expect_all_or_nothing<NVRHBA_DriverRecordLogManagesRecord_Provider>(
        "Could not create NVRHBA_FCDriverLogEntry instance", 2);
}

TEST_F(DriverEvents, WithoutMemoryTheLogShowsWhatWasRead)
{
    std::string content;
    for (int i = 0; i < 300; i++)
        content += line(i) + "\n";
    write_file(system_log, content);
    read();
    ASSERT_THAT(store().lines, SizeIs(200));
    const Ref<NVRHBA_RecordLog> log = target(driver_log());
    const Instance* shown_log = log_of(driver_log());
    const Driver_Log_Store& held = store();
    Property<uint16> enabled;
    enabled.set(uint16{2});
    CIM_ConcreteJob* job = nullptr;
    Property<uint32> answer = {0, 1};
    long thrown = 0;
    const long refused = refuse_each_allocation(
        [&] { provider.RequestStateChange(log.get(), enabled, job, {}, answer); },
        [&](bool has_thrown) {
            thrown += has_thrown;
            EXPECT_EQ(value(shown_log, "CurrentNumberOfRecords"), std::to_string(held.lines.size()));
        });
    EXPECT_GT(refused, 200);
    EXPECT_EQ(thrown, refused);
    EXPECT_THAT(held.lines, SizeIs(200));
    settle();
}

TEST_F(DriverEvents, ReadingAnewForgetsWhatWasThere)
{
    write_file(system_log, line(1) + "\n");
    read();
    write_file(system_log, line(2) + "\n");
    EXPECT_THAT(read(), ElementsAre(line(2)));
    remove(system_log);
    EXPECT_THAT(read(), IsEmpty());
    EXPECT_EQ(shown("CurrentNumberOfRecords"), "0");
}

TEST_F(DriverEvents, ARefreshLeavesTheLines)
{
    write_file(system_log, line(1) + "\n");
    read();
    refresh();
    EXPECT_THAT(entries(), SizeIs(1));
    EXPECT_EQ(shown("CurrentNumberOfRecords"), "0"); // made anew
}

TEST_F(DriverEvents, ClearingEmptiesTheStore)
{
    write_file(system_log, line(1) + "\n");
    read();
    words();
    EXPECT_EQ(clear(driver_log()), 0u);
    EXPECT_THAT(store().lines, IsEmpty());
    EXPECT_EQ(shown("CurrentNumberOfRecords"), "0");
    EXPECT_THAT(words(), Not(Contains("Cleared all the logs")));
}

TEST_F(DriverEvents, DisablingEmptiesTheStoreAndSilencesTheLogger)
{
    write_file(system_log, line(1) + "\n");
    read();
    remove("/etc/norvane_fc_provider.dmp");
    words();
    EXPECT_EQ(request(driver_log(), 3), 0u);
    EXPECT_FALSE(CLogger::instance()->isEnabled());
    CLogger::instance()->enable();
    EXPECT_THAT(words(), Contains("Logs disabled"));
    EXPECT_THAT(store().lines, IsEmpty());
    EXPECT_EQ(shown("EnabledState"), "3");
    EXPECT_EQ(shown("RequestedState"), "3");
    EXPECT_FALSE(exists("/etc/norvane_fc_provider.dmp")); // the provider's log alone stores its state
}

TEST_F(DriverEvents, HaveNoParameters)
{
    words();
    EXPECT_EQ(set_params(driver_log(), 5, 1, ""), unset);
    EXPECT_EQ(m_result, 131);
    EXPECT_THAT(words(), Contains("SetLogParams is not supported for Driver Record Log Instance"));
}

TEST_F(DriverEvents, WithoutTheLogsInstanceLinesHaveNoNamesAndNoTies)
{
    write_file(system_log, line(1) + "\n");
    read();
    agent().m_NVRHBA_RecordLog_map.clear();
    const Instances all = entries();
    ASSERT_THAT(all, SizeIs(1));
    expect_rows(all[0].get(), {{"LogInstanceID", "null"}, {"LogName", "null"}, {"ElementName", "null"}});
    EXPECT_THAT(ties(), IsEmpty());
}

TEST_F(DriverEvents, TheLastLineNeedsNoEnd)
{
    write_file(system_log, "first tsfc\n\nother\nlast tsfc");
    EXPECT_THAT(read(), ElementsAre("last tsfc", "first tsfc"));
    write_file(system_log, "tsfc");
    EXPECT_THAT(read(), ElementsAre("tsfc"));
    write_file(system_log, "");
    EXPECT_THAT(read(), IsEmpty());
}

TEST_F(DriverEvents, LinesThatSpanTheReadersPortionsAreWhole)
{
    std::string content;
    std::vector<std::string> wanted;
    for (int i = 0; i < 150; i++) {
        wanted.insert(wanted.begin(),
                      std::string(static_cast<unsigned>(i) * 37, 'a') + "ts" + "fc" + std::string(3000, 'b'));
        content += wanted.front() + "\n" + std::string(static_cast<unsigned>(i), 'x') + "\n";
    }
    write_file(system_log, content);
    EXPECT_EQ(read(), wanted);
}

TEST_F(DriverEvents, LongLinesAreLookedAtUpToOneMebibyte)
{
    const std::string longest = "tsfc" + std::string(1048572, 'a');
    write_file(system_log, "tsfc\n" + longest + "\n" + longest + "and more\n" + std::string(1048574, 'b') + "tsfc\n" +
                               std::string(3000000, 'c') + "\ntsfc end\n");
    const std::vector<std::string> lines = read();
    ASSERT_THAT(lines, SizeIs(4));
    EXPECT_EQ(lines[0], "tsfc end");
    EXPECT_TRUE(lines[1] == longest);
    EXPECT_TRUE(lines[2] == longest);
    EXPECT_EQ(lines[3], "tsfc");
}

TEST_F(DriverEvents, BytesOfAnyKindAreLines)
{
    std::string content = std::string("a\0tsfc\0b", 8) + "\n" + "\xFF\xFE\x01tsfc\x80\n";
    for (int i = 0; i < 100000; i++)
        content += static_cast<char>((i * 7919) >> 3);
    content += "\ntsfc\r\n";
    write_file(system_log, content);
    const std::vector<std::string> lines = read();
    ASSERT_GE(lines.size(), 3u);
    EXPECT_EQ(lines.front(), "tsfc\r");
    EXPECT_EQ(lines.back(), "a?tsfc?b");
    EXPECT_EQ(lines[lines.size() - 2], "\xFF\xFE\x01tsfc\x80");
    EXPECT_THAT(entries(), SizeIs(lines.size()));
}

TEST_F(DriverEvents, WhatIsNoRegularFileHasNoLines)
{
    const auto expect_nothing = [&](const char* what) {
        words();
        EXPECT_THAT(read(), IsEmpty()) << what;
        EXPECT_THAT(words(), contains_in_order({"Reading Events for tsfc", "Finished reading Events for tsfc",
                                                "Logging of FC Driver Log Ends"}))
            << what;
    };
    expect_nothing("absent");
    make_folder(system_log);
    expect_nothing("a directory");
    remove(system_log);
    ASSERT_EQ(mkfifo(system_log, 0600), 0);
    expect_nothing("a pipe");
    nvrtest::make_link("/dev/zero", system_log);
    expect_nothing("an endless device");
    nvrtest::make_link("/var/log/messages", system_log);
    expect_nothing("a link to itself");
    write_file(system_log, line(1));
    make_unopenable(system_log);
    expect_nothing("what cannot be opened");
    ASSERT_EQ(umount(system_log), 0);
}
