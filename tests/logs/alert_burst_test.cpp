// Bursts of events from many threads, with alerts going on and off.
#include <array>
#include <cstring>
#include <thread>

#include "foundation/NVR_Common.h"
#include "tests/logs/Alerts_Test.h"

using namespace cimple;
using namespace nvrtest;

namespace {

constexpr unsigned senders = 4;
constexpr unsigned events = 10000;

/// Counts what becomes of events, by the words of the log.
class Counts : public NVR_LoggerInterface {
public:
    Counts() { CLogger::instance()->attach(this); }
    ~Counts() override { CLogger::instance()->detach(this); }

    void logMessage(sint32, const char*, uint32, const char* text) override
    {
        const auto begins = [text](const char* words) { return std::strncmp(text, words, std::strlen(words)) == 0; };
        queued += begins("sending the signal for thread to indicate");
        popped += begins("Popped from Queue: ");
        delivered += begins("Indication Delivered to the specified client");
        refused += begins("Error: Failed to deliver indication as ");
    }
    void open() override {}
    void close() override {}
    void clear() override {}

    std::atomic<std::size_t> queued{0}, popped{0}, delivered{0}, refused{0};
};

class AlertBurst : public Alerts_Test {
protected:
    AlertBurst()
    {
        // Many thousand lines are nobody's business here.
        log.reset();
        CLogger::instance()->enable();
    }
    ~AlertBurst() override { listenAgain(); }

    /// Runs `body(sender)` on four threads at once.
    template <class Body>
    static void from_many_threads(Body body)
    {
        std::array<std::thread, senders> threads;
        for (unsigned i = 0; i < senders; i++)
            threads[i] = std::thread([=] { body(i); });
        for (std::thread& thread : threads)
            thread.join();
    }
    static HBA_WWN port(unsigned number)
    {
        HBA_WWN wwn;
        string2HBAName(&wwn, number % 2 ? "10000000C9A00002" : "10000000C9A00001");
        return wwn;
    }
    /// While alerts are off: each event that was queued was taken once, and then delivered or refused; the client has
    /// what was delivered.
    static void expect_each_accounted_for(const Counts& counts, std::size_t at_client)
    {
        EXPECT_EQ(counts.popped, counts.queued);
        EXPECT_EQ(counts.delivered + counts.refused, counts.popped);
        EXPECT_EQ(at_client, counts.delivered);
    }
    /// Each with a number of its own, in the order of delivery.
    static void expect_own_numbers(const std::vector<Ref<NVRHBA_AlertIndication>>& alerts)
    {
        sint64 last = -1;
        for (const auto& alert : alerts) {
            EXPECT_GT(alert->SequenceNumber.value, last);
            last = alert->SequenceNumber.value;
        }
    }
    /// No number twice, none left out.
    static void expect_each_once(const std::vector<Ref<NVRHBA_AlertIndication>>& alerts)
    {
        sint64 expected = alerts.empty() ? 0 : alerts.front()->SequenceNumber.value;
        for (const auto& alert : alerts)
            ASSERT_EQ(alert->SequenceNumber.value, expected++);
    }
};

} // namespace

TEST_F(AlertBurst, NoneIsLostWhileAlertsAreOn)
{
    const Counts counts;
    ASSERT_EQ(enable(), 0);
    from_many_threads([](unsigned sender) {
        for (unsigned i = 0; i < events / senders; i++)
            NVRHBA_AlertIndication_Provider::hbaThreadProc(nullptr, port(sender), i % 2 ? link_up : link_down, sender);
    });
    const auto alerts = client.wait_for(events);
    EXPECT_EQ(disable(), 0);
    ASSERT_EQ(client.count(), events);
    EXPECT_EQ(counts.queued, events);
    expect_each_accounted_for(counts, events);
    expect_each_once(alerts);
    std::size_t downs = 0;
    for (const auto& alert : alerts)
        downs += alert->Message.value == String("PORT LINK DOWN");
    EXPECT_EQ(downs, events / 2);
}

TEST_F(AlertBurst, ThroughTheLibraryNoneIsLostEither)
{
    ASSERT_EQ(enable(), 0);
    from_many_threads([](unsigned sender) {
        for (unsigned i = 0; i < events / senders; i++)
            nvrsim_event(sender % 2 ? "1" : "0", link_down, sender);
    });
    expect_each_once(client.wait_for(events));
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(client.count(), events);
}

TEST_F(AlertBurst, WithAlertsGoingOnAndOffEachIsDeliveredAtMostOnce)
{
    const Counts counts;
    std::atomic<bool> goes_on{true}, is_on{false};
    std::atomic<int> rounds{0};
    std::thread switches([&] {
        Fake_Context mine;
        Thread_Context::push(&mine);
        while (goes_on || rounds < 3) {
            EXPECT_EQ(enable(), 0);
            is_on = true;
            const std::size_t before = counts.queued;
            while (goes_on && counts.queued == before)
                std::this_thread::yield();
            EXPECT_EQ(disable(), 0);
            // Nothing comes behind a disable.
            const std::size_t count = client.count();
            std::this_thread::yield();
            EXPECT_EQ(client.count(), count);
            rounds++;
        }
        Thread_Context::pop();
    });
    while (!is_on)
        std::this_thread::yield();
    from_many_threads([](unsigned sender) {
        for (unsigned i = 0; i < events / senders; i++)
            nvrsim_event(sender % 2 ? "1" : "0", link_up, sender);
    });
    nvrsim_drain_events();
    goes_on = false;
    switches.join();
    EXPECT_EQ(client.stops, rounds);
    const auto alerts = client.wait_for(0);
    EXPECT_GT(counts.queued, 0u);
    EXPECT_LE(counts.queued, events);
    expect_own_numbers(alerts);
    expect_each_accounted_for(counts, alerts.size());

    // And on again, none is lost.
    ASSERT_EQ(enable(), 0);
    const std::size_t before = client.count();
    nvrsim_event("0", link_down, 0);
    nvrsim_event("1", link_down, 0);
    EXPECT_EQ(client.wait_for(before + 2).size(), before + 2);
    EXPECT_EQ(disable(), 0);
}

TEST_F(AlertBurst, CallbacksFromManyThreadsMeetAChangeOfState)
{
    const Counts counts;
    std::atomic<bool> goes_on{true}, is_on{false};
    std::thread switches([&] {
        Fake_Context mine;
        Thread_Context::push(&mine);
        while (goes_on) {
            EXPECT_EQ(enable(), 0);
            is_on = true;
            const std::size_t before = counts.queued;
            while (goes_on && counts.queued == before)
                std::this_thread::yield();
            EXPECT_EQ(disable(), 0);
        }
        Thread_Context::pop();
    });
    while (!is_on)
        std::this_thread::yield();
    from_many_threads([](unsigned sender) {
        for (unsigned i = 0; i < events / senders; i++)
            NVRHBA_AlertIndication_Provider::hbaThreadProc(nullptr, port(sender), link_down, i);
    });
    goes_on = false;
    switches.join();
    EXPECT_GT(counts.queued, 0u);
    EXPECT_LE(counts.queued, events);
    expect_own_numbers(client.wait_for(0));
    expect_each_accounted_for(counts, client.count());
}

TEST_F(AlertBurst, RefreshesGoOnBetweenDeliveries)
{
    ASSERT_EQ(enable(), 0);
    std::atomic<bool> goes_on{true};
    std::thread refreshes([&] {
        while (goes_on) {
            agent().m_bAdapterRefreshPending.ask();
            agent().BuildCimpleInfo();
            std::this_thread::yield();
        }
    });
    from_many_threads([](unsigned sender) {
        for (unsigned i = 0; i < events / 10 / senders; i++)
            nvrsim_event(sender % 2 ? "1" : "0", link_down, 0);
    });
    client.wait_for(events / 10);
    goes_on = false;
    refreshes.join();
    listenAgain();
    while (agent().m_bDataFetchRunning)
        std::this_thread::yield();
    EXPECT_EQ(disable(), 0);
    expect_each_once(client.wait_for(events / 10));
}
