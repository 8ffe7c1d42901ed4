// Alerts as a server's subscribers see them, through the bridge, in every manner.
#include <atomic>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <mutex>
#include <string>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/module/support/Entries.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"
#include "tests/support/process_state.h"
#include "tests/support/simulator.h"
#include "tests/support/trace.h"

using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

namespace {

constexpr char alert_class[] = "NVRHBA_AlertIndication";
constexpr char first_port[] = "10000000C9A00001";
constexpr std::uint32_t link_down = 513, link_up = 514;

/// Where indications go.
class Sink {
public:
    host::Indication_Sink to_here()
    {
        return [this](const host::Indication& indication) {
            if (during) during();
            std::lock_guard<std::mutex> lock(m_mutex);
            m_seen.push_back(indication);
            m_came.notify_all();
        };
    }
    std::vector<host::Indication> wait_for(std::size_t count)
    {
        std::unique_lock<std::mutex> lock(m_mutex);
        m_came.wait(lock, [&] { return m_seen.size() >= count; });
        return m_seen;
    }
    std::size_t count()
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        return m_seen.size();
    }
    /// Runs inside each delivery.
    std::function<void()> during;

private:
    std::mutex m_mutex;
    std::condition_variable m_came;
    std::vector<host::Indication> m_seen;
};

/// Holds up whoever passes until it is opened.
class Gate {
public:
    void pass()
    {
        std::unique_lock<std::mutex> lock(m_mutex);
        m_arrived = true;
        m_changed.notify_all();
        m_changed.wait(lock, [this] { return m_open; });
    }
    void wait_for_arrival()
    {
        std::unique_lock<std::mutex> lock(m_mutex);
        m_changed.wait(lock, [this] { return m_arrived; });
    }
    void open()
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_open = true;
        m_changed.notify_all();
    }

private:
    std::mutex m_mutex;
    std::condition_variable m_changed;
    bool m_arrived = false, m_open = false;
};

/// The class is registered in two more namespaces, as an administrator may do.
void register_everywhere(Rig& rig)
{
    for (host::Registration registration : rig.server().registrations()) {
        if (registration.class_name != alert_class) continue;
        registration.name_spaces = {"root/one", "root/two"};
        rig.server().add(registration);
        return;
    }
}

int subscribe(Rig& rig, Sink& sink, const std::string& name_space = "root/norvane")
{
    int id = 0;
    const host::Status status = rig.server().subscribe(name_space, alert_class, sink.to_here(), id);
    EXPECT_TRUE(status.ok()) << status.message;
    rig.server().settle(); // enabled, also where the manner asks for it on a thread of its own
    return id;
}

void unsubscribe(Rig& rig, int id)
{
    const host::Status status = rig.server().unsubscribe(id);
    EXPECT_TRUE(status.ok()) << status.message;
}

void wait_for_word(Rig& rig, const std::string& word)
{
    while (rig.count_words(word) == 0)
        std::this_thread::yield();
}

/// False where the server ends with providers that it never cleaned up, since its processes end with it.
bool cleans_up_all(const host::Manner& manner)
{
    return manner.cleanup != host::Manner::Cleanup::newest_of_each_kind;
}

class Alerts : public Every_Manner {};
NVR_THREADS_IN_EVERY_MANNER(Alerts);

} // namespace

TEST_P(Alerts, ALinkThatGoesDownAndUpReachesEachNamespaceOnce)
{
    Rig rig({*GetParam()});
    register_everywhere(rig);
    Sink one, two, both;
    const int first = subscribe(rig, one, "root/one");
    const int again = subscribe(rig, both, "root/one");
    const int second = subscribe(rig, two, "root/two");
    ASSERT_EQ(nvrsim_callbacks(), 4u);
    ASSERT_EQ(nvrsim_link(first_port, 0), 0);
    ASSERT_EQ(nvrsim_link(first_port, 1), 0);
    for (Sink* sink : {&one, &both, &two}) {
        const auto seen = sink->wait_for(2);
        ASSERT_THAT(seen, SizeIs(2));
        EXPECT_EQ(seen[0].name_space, sink == &two ? "root/two" : "root/one");
        EXPECT_EQ(seen[0].instance.get("Message").as_text(), "PORT LINK DOWN");
        EXPECT_EQ(seen[1].instance.get("Message").as_text(), "PORT LINK UP");
        EXPECT_EQ(seen[1].instance.get("SequenceNumber").as_uint(), 1u);
        EXPECT_THAT(seen[0].instance.get("AlertingManagedElement").as_text(),
                    HasSubstr("DeviceID=\"10000000C9A00001\""));
        EXPECT_EQ(seen[0].instance.properties.size(), seen[1].instance.properties.size());
    }
    // A namespace whose filters are all gone hears nothing more; the bridge forgets one filter after the other.
    unsubscribe(rig, first);
    ASSERT_EQ(nvrsim_link(first_port, 0), 0);
    both.wait_for(3);
    two.wait_for(3);
    unsubscribe(rig, again);
    ASSERT_EQ(nvrsim_link(first_port, 1), 0);
    two.wait_for(4);
    EXPECT_EQ(one.count(), 2u);
    EXPECT_EQ(both.count(), 3u);
    unsubscribe(rig, second);
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
    rig.stop();
    EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
    if (!cleans_up_all(*GetParam())) return;
    EXPECT_EQ(nvrsim_callbacks(), 0u);
    EXPECT_EQ(rig.server().report().contexts_not_detached, 0u);
}

TEST_P(Alerts, ThousandDeliveriesLeaveNothingOnAThreadThatStays)
{
    Rig rig({*GetParam()});
    Sink sink;
    const int id = subscribe(rig, sink);
    ASSERT_EQ(nvrsim_link(first_port, 0), 0);
    sink.wait_for(1);
    rig.wait_for_refreshes(1); // whose up-calls make objects too
    rig.server().reset_report();
    const auto alive = rig.server().report().peak_objects; // the refresh may not have given back its own yet
    for (int i = 0; i < 1000; i++)
        ASSERT_EQ(nvrsim_event(first_port, link_up, 0), 1);
    const auto seen = sink.wait_for(1001);
    for (unsigned i = 0; i < 1001; i++)
        ASSERT_EQ(seen[i].instance.get("SequenceNumber").as_uint(), i);
    // While it is still attached; what a thread holds at its end a server would free anyway.
    EXPECT_LT(rig.server().report().peak_objects, alive + 200);
    unsubscribe(rig, id);
    rig.stop();
    EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(Alerts, ASubscriberThatBlocksHoldsUpNoRequest)
{
    Rig rig({*GetParam()});
    Gate gate;
    Sink sink;
    sink.during = [&] { gate.pass(); };
    const int id = subscribe(rig, sink);
    ASSERT_EQ(nvrsim_link(first_port, 0), 0);
    gate.wait_for_arrival();
    ASSERT_EQ(nvrsim_link(first_port, 1), 0);
    nvrsim_drain_events(); // the library's thread is free
    EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
    rig.refresh();
    // Another subscription comes and goes beside it.
    Sink other;
    int beside = 0;
    ASSERT_TRUE(rig.server().subscribe("root/norvane", alert_class, other.to_here(), beside).ok());
    unsubscribe(rig, beside);
    EXPECT_EQ(sink.count(), 0u);
    gate.open();
    sink.wait_for(2);
    unsubscribe(rig, id);
}

TEST_P(Alerts, AStopWaitsForTheDeliveryUnderWay)
{
    Rig rig({*GetParam()});
    Gate gate;
    Sink sink;
    sink.during = [&] { gate.pass(); };
    subscribe(rig, sink);
    ASSERT_EQ(nvrsim_event(first_port, link_down, 0), 1);
    gate.wait_for_arrival();
    ASSERT_EQ(nvrsim_event(first_port, link_up, 0), 1);
    rig.settle(); // a server that cleans up little waits for no refresh, whose thread is attached too
    std::atomic<bool> stopped{false};
    std::thread stops([&] {
        rig.stop();
        stopped = true;
    });
    wait_for_word(rig, "NVRHBA_AlertIndication_Provider::cleanUp()");
    EXPECT_FALSE(stopped);
    gate.open();
    stops.join();
    const std::size_t count = sink.count();
    EXPECT_GE(count, 1u);
    EXPECT_THAT(rig.words(), Contains("NVRHBA_AlertIndication_Provider::cleanUp() finished"));
    EXPECT_EQ(nvrsim_event(first_port, link_up, 0), 0) << "nobody is called any more";
    EXPECT_EQ(sink.count(), count);
    EXPECT_EQ(rig.server().report().contexts_not_detached, 0u);
}

TEST_P(Alerts, TenLivesLeaveNothingBehind)
{
    Rig rig({*GetParam()});
    const unsigned lives = cleans_up_all(*GetParam()) ? 10 : 1;
    for (unsigned life = 0; life < lives; life++) {
        Sink sink;
        const int id = subscribe(rig, sink);
        ASSERT_EQ(nvrsim_callbacks(), 4u);
        ASSERT_EQ(nvrsim_link(first_port, 0), 0);
        const auto seen = sink.wait_for(1);
        EXPECT_EQ(seen[0].instance.get("SequenceNumber").as_uint(), 0u) << "each life counts from 0";
        unsubscribe(rig, id);
        if (lives == 1) return;
        rig.stop(); // which waits for the refresh, whose handles these may be
        EXPECT_EQ(nvrsim_open_handles(), 0u);
        EXPECT_EQ(nvrsim_callbacks(), 0u);
        rig.restart();
    }
}

TEST(AlertsOfOneServer, APortThatCannotBeRegisteredIsTold)
{
    Rig rig({host::Manner::strict(), "typical"}); // others refuse the subscription
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    add_fault("call = \"HBA_RegisterForAdapterPortEvents\", from = 2, status = 1");
    Sink sink;
    const int id = subscribe(rig, sink);
    EXPECT_THAT(rig.server().log(),
                Contains(testing::AllOf(HasSubstr("enableIndications"), HasSubstr("CMPI_RC_ERR_FAILED"))));
    EXPECT_EQ(nvrsim_callbacks(), 1u);
    ASSERT_EQ(nvrsim_link(first_port, 0), 0);
    sink.wait_for(1);
    unsubscribe(rig, id);
}

// It is ended like one that refuses, and the next life has alerts.
TEST(AlertsOfOneServer, ALibraryThatThrowsWhereAlertsEndIsOutlived)
{
    const std::size_t threads = number_of_threads_from_the_start();
    std::vector<std::vector<std::string>> ends; // words and calls; the worker has some of the words
    for (const char* failure : {"status = 1", "throws = true"}) {
        SCOPED_TRACE(failure);
        Rig rig({host::Manner::strict(), "typical"});
        {
            Sink sink;
            subscribe(rig, sink);
            ASSERT_EQ(nvrsim_event(first_port, link_down, 0), 1);
            sink.wait_for(1);
            rig.settle();
            while (rig.count_words("waiting for signal to occur") < 2) // the worker's last words of the delivery
                std::this_thread::sleep_for(std::chrono::milliseconds(1));
            rig.forget_words();
            add_fault("call = \"HBA_RemoveCallback\", " + std::string(failure));
            rig.restart();
        }
        EXPECT_TRUE(wait_for_threads(threads + nvrsim_threads(), std::chrono::seconds(20)));
        EXPECT_EQ(nvrsim_open_handles(), 0u);
        EXPECT_EQ(nvrsim_callbacks(), 4u);
        ends.push_back(rig.words());
        EXPECT_THAT(ends.back(), Contains("Norvane Provider Unloaded"));
        for (const std::string& name : called_operations())
            ends.back().push_back(name + ' ' + std::to_string(calls(name)));

        clear_faults();
        Sink sink;
        const int id = subscribe(rig, sink);
        EXPECT_EQ(nvrsim_callbacks(), 4u);
        ASSERT_EQ(nvrsim_event(first_port, link_up, 0), 1);
        EXPECT_EQ(sink.wait_for(1)[0].instance.get("SequenceNumber").as_uint(), 0u);
        unsubscribe(rig, id);
        EXPECT_EQ(nvrsim_callbacks(), 0u);
    }
    EXPECT_THAT(ends[1], testing::UnorderedElementsAreArray(ends[0]));
}

TEST(AlertsOfOneServer, WithoutTheLibraryTheyCannotBeEnabled)
{
    Rig rig({host::Manner::strict(), "typical", "", {"lrmapi", "tssdm"}});
    Sink sink;
    const int id = subscribe(rig, sink);
    EXPECT_THAT(rig.server().log(),
                Contains(testing::AllOf(HasSubstr("enableIndications"), HasSubstr("CMPI_RC_ERR_FAILED"))));
    unsubscribe(rig, id);
}

// A server without the call that makes a context for a module's thread.
TEST(AlertsOfOneServer, WithoutAContextForAThreadTheyCannotBeEnabled)
{
    Rig rig;
    Entries entries;
    CMPIBroker poor{};
    CMPIBrokerFT few{};
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        poor = *broker;
        few = *broker->bft;
        few.prepareAttachThread = nullptr;
        poor.bft = &few;
        CMPIIndicationMI* mi = entries.indications(alert_class, &poor, context);
        ASSERT_TRUE(mi);
        EXPECT_EQ(mi->ft->enableIndications(mi, context).rc, CMPI_RC_ERR_FAILED);
        EXPECT_EQ(nvrsim_callbacks(), 0u);
        EXPECT_EQ(mi->ft->disableIndications(mi, context).rc, CMPI_RC_OK);
        EXPECT_EQ(mi->ft->cleanup(mi, context, 1).rc, CMPI_RC_OK);
    });
}

TEST(AlertsOfOneServer, ABurstWithSubscriptionsComingAndGoing)
{
    Rig rig;
    std::vector<std::thread> senders;
    Sink steady;
    const int id = subscribe(rig, steady);
    for (unsigned sender = 0; sender < 4; sender++)
        senders.emplace_back([sender] {
            for (unsigned i = 0; i < 250; i++)
                nvrsim_event(std::to_string(sender).c_str(), i % 2 ? link_up : link_down, sender);
        });
    for (int round = 0; round < 20; round++) {
        Sink passing;
        unsubscribe(rig, subscribe(rig, passing));
    }
    for (std::thread& sender : senders)
        sender.join();
    const auto seen = steady.wait_for(1000);
    for (unsigned i = 0; i < 1000; i++)
        ASSERT_EQ(seen[i].instance.get("SequenceNumber").as_uint(), i);
    unsubscribe(rig, id);
    EXPECT_EQ(steady.count(), 1000u);
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}
