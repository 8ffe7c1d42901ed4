// When the module looks at the hardware again, what clients see meanwhile, and what it says of it.
#include <atomic>
#include <chrono>
#include <cstdio>
#include <functional>
#include <set>
#include <string>
#include <thread>
#include <unistd.h>
#include <vector>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/module/support/Expected.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Rig.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/simulator.h"
#include "tests/support/trace.h"

using namespace nvrtest;
using testing::Contains;
using testing::IsEmpty;
using testing::Not;
using namespace std::chrono_literals;

namespace {

constexpr char scan[] = "HBA_GetNumberOfAdapters";
constexpr char settings_class[] = "NVRHBA_ProviderConfigSetting";

std::vector<std::string> port_names(const host::Answer& answer)
{
    std::vector<std::string> names;
    for (const host::Instance& port : answer.instances)
        names.push_back(port.get("DeviceID").as_text());
    return names;
}

// A host of so many adapters of one port each, told apart from others by the first port's number.
std::string host_of(unsigned ports, unsigned first)
{
    std::string text = "# a host\n";
    char name[32];
    for (unsigned i = 0; i < ports; i++) {
        std::snprintf(name, sizeof name, "%016X", 0xC9B00000u + first + i);
        text += "[[adapter]]\n[[adapter.port]]\nwwpn = \"" + std::string(name) + "\"\n";
    }
    return text;
}

/// A call that lasts until the faults are cleared.
void hold(const std::string& call)
{
    add_fault("call = \"" + call + "\", delay_ms = 3600000");
}

void await_call(const char* call)
{
    while (calls(call) == 0)
        std::this_thread::yield();
}

void await_word(const Rig& rig, const char* word)
{
    while (rig.count_words(word) == 0)
        std::this_thread::yield();
}

void set_current(Rig& rig, std::size_t place, std::uint32_t value)
{
    host::Instance setting = rig.enumerate(settings_class).instances.at(place);
    setting.set("current", host::Value::uint32(value));
    ASSERT_THAT(rig.server().modify(setting, std::vector<std::string>{"current"}), succeeded());
}

} // namespace

TEST(Refresh, TheFirstQuestionStartsTheThreadAndWaitsForIt)
{
    Rig rig;
    hold(scan);
    std::thread client([&] { EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u); });
    await_call(scan);
    await_word(rig, "PERF: ---Created DataFetch_Handler thread -- BuildCimpleInfo END---");
    clear_faults();
    client.join();
    EXPECT_EQ(calls(scan), 1u);
}

TEST(Refresh, ProfilesAreThereBeforeTheFirstOneEnds)
{
    Rig rig;
    hold(scan);
    std::thread client([&] { EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u); });
    await_call(scan);
    EXPECT_EQ(rig.enumerate("NVRHBA_RegisteredProfile").instances.size(), 13u);
    EXPECT_THAT(rig.words(), Not(Contains("PERF: Updating Adapter Maps...")));
    clear_faults();
    client.join();
}

TEST(Refresh, IsAnnouncedByTheQuestionThatStartsIt)
{
    Rig rig({host::Manner::strict(), "small"});
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    rig.wait_for_refreshes(1);
    EXPECT_THAT(rig.words(), contains_in_order({
                                 "Initializing RM API ",
                                 "Constructor",
                                 "Setting Up for FIFO.. ",
                                 "RMLIB initialized",
                                 "Initializing Data Pointer ",
                                 "Data Pointer Constructed.",
                                 "Norvane Provider v2.5.19-1 Loaded[" + std::to_string(getpid()) + "]",
                                 "ProviderAgent::addRef[0]",
                                 "PERF: ---BuildCimpleInfo BEGIN---",
                                 "Checking if TimeOut...",
                                 "PERF: TimeOut",
                                 "PERF: Creating DataFetch_Handler Thread.",
                             }));
}

// All that the thread says of a host with one port, which sees two targets.
TEST(Refresh, SaysEachWordInItsOrder)
{
    Rig rig({host::Manner::strict(), "small"});
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    rig.wait_for_refreshes(1);
    std::string thread, found;
    for (const Trace_Line& line : rig.lines_from(0)) {
        if (line.words == "PERF: DataFetch_Handler Thread BEGIN") thread = line.thread;
        if (line.thread == thread) found += line.words + '\n';
    }
    for (char& c : found)
        if (static_cast<unsigned char>(c) >= 0x80) c = '?';
    EXPECT_EQ(difference(expected_text("refresh_words.txt"), found), "");
}

TEST(Refresh, DoesNotHappenWithinTheTimeOut)
{
    Rig rig;
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    rig.wait_for_refreshes(1);
    rig.forget_words();
    advance_clock(9min);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
    EXPECT_EQ(rig.enumerate("NVRHBA_PortController").instances.size(), 4u);
    EXPECT_EQ(rig.count_words("PERF: ---No timeout BuildCimpleInfo END---"), 2u);
    EXPECT_THAT(rig.words(), Not(Contains("PERF: DataFetch_Handler Thread BEGIN")));
    EXPECT_EQ(calls(scan), 1u);
}

TEST(Refresh, OfATimeOutReadsTheSanAndNotTheAdaptersUnlessToldTo)
{
    Rig rig;
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    rig.wait_for_refreshes(1);
    const std::uint64_t mappings = calls("HBA_GetFcpTargetMapping");
    EXPECT_EQ(mappings, 4u);
    rig.forget_words();
    rig.refresh();
    EXPECT_EQ(calls(scan), 1u);
    EXPECT_EQ(calls("HBA_GetFcpTargetMapping"), 2 * mappings);
    EXPECT_THAT(rig.words(), Not(Contains("PERF: Building Adapter Data...")));
    EXPECT_THAT(rig.words(), contains_in_order({"PERF: TimeOut", "PERF: Clearing the previous thread...with join",
                                                "PERF: Creating DataFetch_Handler Thread."}));
}

TEST(Refresh, OfTheAdaptersCanBeSwitchedOnByAClientAndComesWithTheNextTimeOut)
{
    Rig rig;
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    rig.wait_for_refreshes(1);
    set_current(rig, 1, 1);
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    EXPECT_EQ(calls(scan), 1u);
    rig.refresh();
    EXPECT_EQ(calls(scan), 2u);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
}

TEST(Refresh, OfTheSanCanBeSwitchedOffByAClient)
{
    Rig rig;
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    rig.wait_for_refreshes(1);
    set_current(rig, 2, 0);
    const std::uint64_t mappings = calls("HBA_GetFcpTargetMapping");
    rig.refresh();
    EXPECT_EQ(calls("HBA_GetFcpTargetMapping"), mappings);
    EXPECT_EQ(calls(scan), 1u);
}

TEST(Refresh, ComesAfterTheTimeOutThatAClientSet)
{
    Rig rig;
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    rig.wait_for_refreshes(1);
    set_current(rig, 0, 3);
    advance_clock(2min);
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    EXPECT_EQ(rig.refreshes(), 1u);
    advance_clock(61s);
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    rig.wait_for_refreshes(2);
}

TEST(Refresh, OfAHostSwitchedOffForTimeOutsStillHappensForASanQuestion)
{
    Rig rig({host::Manner::strict(), "typical", "NVR_PROVIDER_REFRESH_SANDATA = FALSE\n"});
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    rig.wait_for_refreshes(1);
    EXPECT_EQ(calls("HBA_GetFcpTargetMapping"), 0u);
    EXPECT_THAT(rig.enumerate("NVRHBA_LogicalDisk"), succeeded());
    EXPECT_EQ(calls("HBA_GetFcpTargetMapping"), 4u);
}

TEST(Refresh, ASecondQuestionWhileOneRunsStartsNothing)
{
    Rig rig;
    hold(scan);
    std::thread first([&] { EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u); });
    await_call(scan);
    std::thread second([&] { EXPECT_EQ(rig.enumerate("NVRHBA_Product").instances.size(), 4u); });
    await_word(rig, "PERF: ---DataFetch_Handler thread already running -BuildCimpleInfo END---");
    clear_faults();
    first.join();
    second.join();
    rig.wait_for_refreshes(1);
    EXPECT_EQ(rig.count_words("PERF: DataFetch_Handler Thread BEGIN"), 1u);
    EXPECT_EQ(calls(scan), 1u);
}

TEST(Refresh, AdaptersThatCameAndWentAreSeenByTheNextOne)
{
    Rig rig({host::Manner::strict(), "typical", refreshing_settings});
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
    ASSERT_EQ(nvrsim_set("1", "present", 0), 0);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u) << "before the time-out";
    rig.refresh();
    EXPECT_THAT(port_names(rig.enumerate("NVRHBA_FCPort")),
                testing::ElementsAre("10000000C9A00001", "10000000C9A00003", "10000000C9A00004"));
    ASSERT_EQ(nvrsim_set("1", "present", 1), 0);
    rig.refresh();
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
}

TEST(Refresh, StatusOfPortsIsReadAgainAfterTenSeconds)
{
    Rig rig;
    const auto status = [&] {
        return rig.enumerate("NVRHBA_FCPort").instances.at(0).get("StatusDescriptions").to_text();
    };
    EXPECT_EQ(status(), "{OK}");
    ASSERT_EQ(nvrsim_set("0", "state", 7), 0);
    EXPECT_EQ(status(), "{OK}") << "within ten seconds";
    advance_clock(11s);
    EXPECT_EQ(status(), "{Error}");
    EXPECT_EQ(calls(scan), 1u) << "without a walk of the adapters";
}

TEST(Refresh, StatisticsAreLive)
{
    Rig rig;
    const auto packets = [&] {
        return rig.enumerate("NVRHBA_FCPortStatistics").instances.at(0).get("PacketsTransmitted").to_text();
    };
    EXPECT_EQ(packets(), "5000");
    ASSERT_EQ(nvrsim_set("0", "statistic:1030", 77), 0);
    EXPECT_EQ(packets(), "77");
    // A counter that the hardware does not have reads as all ones of 32 bits.
    ASSERT_EQ(nvrsim_set("0", "statistic:1030", ~std::uint64_t{0}), 0);
    EXPECT_EQ(packets(), "4294967295");
}

TEST(Refresh, CountersThatCannotBeReadKeepTheirValues)
{
    Rig rig;
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPortStatistics"), succeeded());
    rig.forget_words();
    add_fault("call = \"RM_GetPortStatistics\", port = 1, status = 1");
    ASSERT_EQ(nvrsim_set("0", "statistic:1030", 77), 0);
    ASSERT_EQ(nvrsim_set("1", "statistic:1030", 77), 0);
    ASSERT_EQ(nvrsim_set("2", "statistic:1030", 77), 0);
    const host::Answer answer = rig.enumerate("NVRHBA_FCPortStatistics");
    ASSERT_EQ(answer.instances.size(), 4u);
    EXPECT_EQ(answer.instances[0].get("PacketsTransmitted").to_text(), "77");
    EXPECT_EQ(answer.instances[1].get("PacketsTransmitted").to_text(), "5001");
    EXPECT_EQ(answer.instances[2].get("PacketsTransmitted").to_text(), "77");
    EXPECT_THAT(rig.words(), contains_in_order({"ERROR: RM_GetPortStatistics call failed (1)",
                                                "FC Port statistics error occurred,retain the old statistics !!!",
                                                "Error occurred while retrieving FCPort Statistics..."}));
}

using Seen = std::vector<std::string>;

class Refreshes : public Every_Manner {
protected:
    /// Two hosts take turns, `rounds` times, while eight clients ask one of the questions each. `sizes`: how much there
    /// is to see of each host. Whoever asks sees one of them whole.
    void expect_one_of_both(const std::string (&hosts)[2], const std::size_t (&sizes)[2], int rounds,
                            const std::vector<std::function<Seen(Rig&)>>& questions)
    {
        Rig rig({*GetParam(), hosts[0], refreshing_settings});
        std::vector<Seen> whole[2];
        for (int i = 0; i < 2; i++) {
            if (i != 0) load_scenario(hosts[i]);
            rig.refresh();
            for (const auto& question : questions) {
                whole[i].push_back(question(rig));
                ASSERT_EQ(whole[i].back().size(), sizes[i]) << "question " << whole[i].size();
            }
        }
        std::atomic<bool> over{false};
        std::atomic<unsigned> answers{0}, wrong{0};
        std::vector<std::thread> clients;
        for (std::size_t i = 0; i < 8; i++)
            clients.emplace_back([&, which = i % questions.size()] {
                while (!over) {
                    const Seen seen = questions[which](rig);
                    wrong += seen != whole[0][which] && seen != whole[1][which];
                    answers++;
                }
            });
        for (int round = 0; round < rounds; round++) {
            const unsigned before = answers;
            load_scenario(hosts[round % 2]);
            rig.refresh();
            while (answers == before)
                std::this_thread::yield();
        }
        over = true;
        for (std::thread& client : clients)
            client.join();
        EXPECT_EQ(wrong, 0u);
        EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
        EXPECT_THAT(rig.server().report().violations, IsEmpty());
    }
};
NVR_THREADS_IN_EVERY_MANNER(Refreshes);

TEST_P(Refreshes, EachOfEightClientsSeesAllOldOrAllNew)
{
    std::vector<std::function<Seen(Rig&)>> questions;
    for (const char* name :
         {"NVRHBA_FCPort", "NVRHBA_PortController", "NVRHBA_SCSIProtocolController", "NVRHBA_FCPort"})
        questions.push_back([=](Rig& rig) { return port_names(rig.enumerate(name)); });
    expect_one_of_both({host_of(25, 0x100), host_of(35, 0x200)}, {25, 35}, 12, questions);
}

// The same for what stands behind the ports: volumes, endpoints, and the associations that hold both.
TEST_P(Refreshes, EachOfEightClientsSeesAllOfOneSan)
{
    const auto san = [](unsigned first, unsigned units) {
        return host_of(2, first) + "[[target]]\nluns = " + std::to_string(units) + "\n[[target]]\nluns = 3\n";
    };
    std::vector<std::function<Seen(Rig&)>> questions;
    for (const char* name : {"NVRHBA_StorageVolume", "NVRHBA_SCSIProtocolEndpoint", "NVRHBA_StorageVolumeSystemDevice",
                             "NVRHBA_SCSIInitiatorTargetStorageVolumePath"})
        questions.push_back([=](Rig& rig) {
            Seen names;
            for (const host::Path& path : rig.names(name).paths)
                names.push_back(path.to_text());
            return names;
        });
    expect_one_of_both({san(0x100, 97), san(0x200, 147)}, {200, 300}, 12, questions);
}

TEST_P(Refreshes, ASecondOneLeavesTheSameInstances)
{
    Rig rig({*GetParam(), "typical", refreshing_settings});
    const auto everything = [&] {
        std::string all;
        for (const std::string& class_name : rig.classes())
            all += to_lines(class_name, rig.enumerate(class_name).instances);
        return all;
    };
    const std::string before = everything();
    EXPECT_GT(before.size(), 100000u);
    const std::uint64_t scans = calls(scan);
    rig.refresh();
    EXPECT_EQ(calls(scan), scans + 1);
    EXPECT_EQ(difference(before, everything()), "");
}

TEST(Refresh, OfASlowLibraryLeavesEachAnswerWhole)
{
    Rig rig({host::Manner::strict(), "typical", refreshing_settings});
    ASSERT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
    rig.wait_for_refreshes(1);
    add_fault("call = \"HBA_GetAdapterName\", delay_ms = 50");
    advance_clock(31min);
    const host::Answer answer = rig.enumerate("NVRHBA_PortController");
    EXPECT_THAT(answer, succeeded());
    EXPECT_EQ(answer.instances.size(), 4u);
    rig.wait_for_refreshes(2);
}

TEST(Refresh, OfAThousandPortsIsWhole)
{
    std::string text(nvrsim_generate(1000, 0, 0, nullptr, 0) + 1, '\0');
    text.resize(nvrsim_generate(1000, 0, 0, text.data(), text.size()));
    Rig rig({host::Manner::strict(), text});
    const std::vector<std::string> names = port_names(rig.enumerate("NVRHBA_FCPort"));
    EXPECT_EQ(std::set<std::string>(names.begin(), names.end()).size(), 1000u);
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPortConformsToProfile").instances.size(), 4000u);
}
