// Link alerts: what they say, when they come, and how they are enabled and ended.
#include <thread>

#include "classes/CIM_ComputerSystem.h"
#include "classes/NVRHBA_FCPort.h"
#include "foundation/NVR_Common.h"
#include "foundation/management_binding.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"
#include "logs/Alert_Queue.h"
#include "logs/alert_instance.h"
#include "tests/agent/Other_Adapter.h"
#include "tests/agent/expect_rows.h"
#include "tests/logs/Alerts_Test.h"
#include "tests/support/short_memory.h"
#include "tests/support/simulator.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;
using testing::SizeIs;

namespace {

const std::string me = "NVRHBA_AlertIndication_Provider::";

HBA_WWN wwn_of(const char* text)
{
    HBA_WWN wwn;
    EXPECT_EQ(string2HBAName(&wwn, text), 1);
    return wwn;
}

class Alerts : public Alerts_Test {
protected:
    /// An event as a library thread brings it, also one that the simulated one would not.
    static void call_back(const char* wwpn, uint32 type)
    {
        NVRHBA_AlertIndication_Provider::hbaThreadProc(nullptr, wwn_of(wwpn), type, 77);
    }
    /// Waits until the log has this line.
    void wait_for_word(const std::string& word)
    {
        while (true) {
            for (const std::string& one : log->words())
                if (one == word) return;
            std::this_thread::yield();
        }
    }
    /// The next life takes over the two registrations that stayed. `alerts` have come by then.
    void live_again(std::size_t alerts)
    {
        nvrsim_clear_faults();
        provider.reset(new NVRHBA_AlertIndication_Provider);
        ASSERT_EQ(provider->load(), 0);
        refresh();
        ASSERT_EQ(enable(), 0);
        EXPECT_EQ(nvrsim_callbacks(), 2u);
        link("0", true);
        expect_rows(client.wait_for(alerts)[alerts - 1].get(), {{"Message", "PORT LINK UP"}, {"SequenceNumber", "0"}});
        EXPECT_EQ(disable(), 0);
        EXPECT_EQ(nvrsim_callbacks(), 0u);
    }
    std::size_t count_word(const std::string& word)
    {
        const std::vector<std::string> all = log->words();
        return static_cast<std::size_t>(std::count(all.begin(), all.end(), word));
    }
};

/// A delivery that does not return until it is let go.
struct Gate {
    std::mutex mutex;
    std::condition_variable changed;
    int arrived = 0;
    bool open = false;

    void pass()
    {
        std::unique_lock<std::mutex> lock(mutex);
        arrived++;
        changed.notify_all();
        changed.wait(lock, [this] { return open; });
    }
    void wait_for_arrival()
    {
        std::unique_lock<std::mutex> lock(mutex);
        changed.wait(lock, [this] { return arrived > 0; });
    }
    void let_go()
    {
        std::lock_guard<std::mutex> lock(mutex);
        open = true;
        changed.notify_all();
    }
};

} // namespace

TEST_F(Alerts, ALinkThatGoesDownIsTold)
{
    ASSERT_EQ(enable(), 0);
    link("0", false);
    const auto alerts = client.wait_for(1);
    const Instance* port = agent().m_NVRHBA_FCPort_map[0];
    String path;
    ASSERT_EQ(instance_to_model_path(port, path), 0);
    const std::string host = value(agent().m_CIM_ComputerSystem_map[0], "Name");
    expect_rows(alerts[0].get(), {
                                     {"IndicationIdentifier", "0"},
                                     {"CorrelatedIndications", "{}"},
                                     {"PerceivedSeverity", "2"},
                                     {"SequenceNumber", "0"},
                                     {"Description", "Port WWN 10000000C9A00001 status changed to LINK_DOWN."},
                                     {"AlertingManagedElement", path.c_str()},
                                     {"AlertingElementFormat", "2"},
                                     {"AlertType", "1"},
                                     {"OtherAlertType", "Link Status"},
                                     {"ProbableCause", "30"},
                                     {"ProbableCauseDescription", "Link Down"},
                                     {"Trending", "0"},
                                     {"EventID", "0"},
                                     {"SystemCreationClassName", "CIM_ComputerSystem"},
                                     {"SystemName", host},
                                     {"ProviderName", "NVRHBA_AlertIndication_Provider"},
                                     {"Message", "PORT LINK DOWN"},
                                     {"MessageID", "Norvane"},
                                     {"OtherSeverity", "null"},
                                     {"OwningEntity", "null"},
                                 });
    EXPECT_THAT(std::string(path.c_str()), testing::HasSubstr("DeviceID=\"10000000C9A00001\""));
    EXPECT_EQ(value(alerts[0].get(), "IndicationTime"), value(alerts[0].get(), "EventTime"));
    EXPECT_NE(value(alerts[0].get(), "EventTime"), "null");
    EXPECT_EQ(disable(), 0);
}

TEST_F(Alerts, ALinkThatComesUpIsTold)
{
    ASSERT_EQ(enable(), 0);
    link("1", true);
    expect_rows(client.wait_for(1)[0].get(),
                {
                    {"Description", "Port WWN 10000000C9A00002 status changed to LINK_UP."},
                    {"ProbableCause", "1"},
                    {"ProbableCauseDescription", "Link Up"},
                    {"Message", "PORT LINK UP"},
                });
    EXPECT_THAT(words(), Contains(testing::EndsWith("eventType std::string is Port Online (LINK_UP) .")));
}

TEST_F(Alerts, EventsOfABurstAreNumberedInTheirOrder)
{
    ASSERT_EQ(enable(), 0);
    link("0", false);
    link("1", false);
    link("0", true);
    const auto alerts = client.wait_for(3);
    const char* const messages[] = {"PORT LINK DOWN", "PORT LINK DOWN", "PORT LINK UP"};
    for (unsigned i = 0; i < 3; i++)
        expect_rows(alerts[i].get(), {{"IndicationIdentifier", std::to_string(i)},
                                      {"SequenceNumber", std::to_string(i)},
                                      {"EventID", std::to_string(i)},
                                      {"Message", messages[i]}});
    EXPECT_EQ(agent().m_indicationSequence, 3u);
}

TEST_F(Alerts, TheSequenceGoesOnAfterADisable)
{
    ASSERT_EQ(enable(), 0);
    link("0", false);
    client.wait_for(1);
    ASSERT_EQ(disable(), 0);
    ASSERT_EQ(enable(), 0);
    link("0", true);
    expect_rows(client.wait_for(2)[1].get(), {{"SequenceNumber", "1"}});
}

TEST_F(Alerts, TheLogTellsTheWholeWayOfAnEvent)
{
    ASSERT_EQ(enable(), 0);
    EXPECT_THAT(words(), contains_in_order({
                             me + "enable_indications()",
                             "Entered " + me + "setHBACallbacks(true)",
                             "Registered for link events, adapter 0 . reg_status=0",
                             "Registered for link events, adapter 0 . reg_status=0",
                         }));
    event("0", link_down);
    client.wait_for(1);
    ASSERT_EQ(disable(), 0);
    const std::vector<std::string> all = words();
    EXPECT_THAT(all, contains_in_order({
                         me + "hbaThreadProc",
                         "For link event, type= 0x201 fabricPortID= 0x66051, eventType std::string is Port Offline "
                         "(LINK_DOWN) .",
                         "sending the signal for thread to indicate",
                     }));
    EXPECT_THAT(all, contains_in_order({
                         "Popped from Queue: IndicationType 0x201",
                         me + "generateIndication",
                         "Waiting for m_IndicationProviderMutex lock...",
                         "m_IndicationProviderMutex lock acquired",
                         "m_IndicationProviderMutex lock released",
                         "Getting the Alerting Element",
                         "Creating the NVRHBA AlertIndication",
                         "Indication 0 WWN = 10000000C9A00001",
                         "Waiting for m_IndicationProviderMutex lock...",
                         "m_IndicationProviderMutex lock acquired",
                         "Calling Indication handler to deliver Indication to the specified client",
                         "Indication Delivered to the specified client",
                         "m_IndicationProviderMutex lock released",
                         "waiting for signal to occur",
                         me + "providerThreadProc() Received signal from cleanup()",
                         me + "providerThreadProc() finished",
                     }));
    EXPECT_THAT(all, contains_in_order({
                         me + "disable_indications()",
                         me + "cleanUp()",
                         "Entered " + me + "setHBACallbacks(false)",
                         "m_callbackHandles.size() is now 2 ",
                         "m_callbackHandles.size() is now 1 (should reach 0)",
                         "m_callbackHandles.size() is now 0 (should reach 0)",
                         me + "cleanUp():: Worker thread signalled for cancellation.",
                         "Waiting for Worker thread termination...",
                         me + "cleanUp():: Worker thread terminated successfully",
                         me + "cleanUp():: _indication_handler deleted.",
                         me + "cleanUp() finished",
                     }));
}

TEST_F(Alerts, EventsOfOtherTypesQueueNothing)
{
    ASSERT_EQ(enable(), 0);
    for (const uint32 type : {0u, 1u, 512u, 515u, 516u, 517u, 0x80000000u, 0xFFFFFFFFu}) {
        words();
        event("0", type);
        nvrsim_drain_events();
        const std::vector<std::string> all = words();
        EXPECT_THAT(all, Contains(testing::HasSubstr("eventType std::string is Unknown .")));
        EXPECT_THAT(all, Contains("Could not generate the indication as the event type is not supported"));
        EXPECT_THAT(all, Not(Contains("sending the signal for thread to indicate")));
    }
    link("0", false);
    expect_rows(client.wait_for(1)[0].get(), {{"SequenceNumber", "0"}});
}

TEST_F(Alerts, AnEventForAnUnknownPortCostsNoNumber)
{
    ASSERT_EQ(enable(), 0);
    words();
    for (const char* wwpn : {"0000000000000000", "FFFFFFFFFFFFFFFF", "10000000C9A00003"})
        call_back(wwpn, link_down);
    call_back(first_wwpn, link_down);
    const auto alerts = client.wait_for(1);
    EXPECT_THAT(alerts, SizeIs(1));
    expect_rows(alerts[0].get(), {{"SequenceNumber", "0"}});
    EXPECT_EQ(count_word("Could not find the required FCPort"), 3u);
}

TEST_F(Alerts, APortThatIsGoneFromTheMapIsNotTold)
{
    ASSERT_EQ(enable(), 0);
    agent().m_NVRHBA_FCPort_map.clear();
    call_back(first_wwpn, link_up);
    wait_for_word("Could not find the required FCPort");
    EXPECT_EQ(client.count(), 0u);
    EXPECT_EQ(agent().m_indicationSequence, 0u);
}

TEST_F(Alerts, WithoutAHostThereIsNoPortEither)
{
    ASSERT_EQ(enable(), 0);
    agent().m_CIM_ComputerSystem_map.clear();
    call_back(first_wwpn, link_up);
    wait_for_word("Could not find the required FCPort");
    EXPECT_EQ(client.count(), 0u);
}

TEST_F(Alerts, AnEventWaitsForTheMapsOnce)
{
    ProviderAgent& the_agent = agent(); // not to be asked for under a lock
    ASSERT_EQ(enable(), 0);
    settle();
    {
        Auto_Mutex lock(the_agent.m_AdapterMapsReadyMutex);
        the_agent.m_bIsAdapterMapsReady = false;
    }
    call_back(first_wwpn, link_up);
    wait_for_word("PERF: Waiting for m_bIsAdapterMapsReady");
    EXPECT_EQ(client.count(), 0u);
    {
        Auto_Mutex lock(the_agent.m_AdapterMapsReadyMutex);
        the_agent.m_bIsAdapterMapsReady = true;
        the_agent.m_AdapterMapsReadyCond.broadcast();
    }
    client.wait_for(1);
    EXPECT_EQ(count_word("PERF: Woken up from wait for m_bIsAdapterMapsReady"), 1u);
}

TEST_F(Alerts, EnablingWaitsForTheInventoryOnce)
{
    ProviderAgent& the_agent = agent(); // not to be asked for under a lock
    settle();
    {
        Auto_Mutex lock(the_agent.m_AdapterDataReadyMutex);
        the_agent.m_bIsAdapterDataReady = false;
    }
    std::thread enables([this] {
        Thread_Context::push(&context);
        EXPECT_EQ(enable(), 0);
        Thread_Context::pop();
    });
    wait_for_word("PERF: Waiting for m_bIsAdapterDataReady");
    {
        Auto_Mutex lock(the_agent.m_AdapterDataReadyMutex);
        the_agent.m_bIsAdapterDataReady = true;
        the_agent.m_AdapterDataReadyCond.broadcast();
    }
    enables.join();
    EXPECT_EQ(count_word("PERF: Woken up from wait for m_bIsAdapterDataReady"), 1u);
    EXPECT_EQ(nvrsim_callbacks(), 2u);
}

TEST_F(Alerts, TheSameHandlerAgainChangesNothing)
{
    ASSERT_EQ(enable(), 0);
    EXPECT_EQ(enable(), 0);
    EXPECT_EQ(nvrsim_callbacks(), 2u);
    link("0", false);
    client.wait_for(1);
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(client.count(), 1u);
    EXPECT_EQ(client.stops, 1);
}

TEST_F(Alerts, AnotherHandlerIsRefused)
{
    ASSERT_EQ(enable(), 0);
    Client other;
    EXPECT_EQ(provider->enable_indications(other.handler()), 140);
    auto same_data = client.handler();
    same_data->proc = [](Instance*, void*) { return false; };
    EXPECT_EQ(provider->enable_indications(std::move(same_data)), 140);
    link("0", false);
    client.wait_for(1);
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(other.count(), 0u);
    EXPECT_EQ(other.stops, 0);
    EXPECT_EQ(provider->enable_indications(other.handler()), 0);
    link("0", true);
    other.wait_for(1);
    EXPECT_EQ(disable(), 0);
}

TEST_F(Alerts, DisablingTwiceFindsNothingToDo)
{
    words();
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(words(), (std::vector<std::string>{me + "disable_indications()", me + "cleanUp()",
                                                 me + "cleanUp() Nothing to cleanUp, Exiting..."}));
    ASSERT_EQ(enable(), 0);
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(client.stops, 1);
    EXPECT_EQ(nvrsim_callbacks(), 0u);
}

TEST_F(Alerts, WhatIsQueuedAtADisableReachesNobody)
{
    Gate gate;
    client.during = [&] { gate.pass(); };
    ASSERT_EQ(enable(), 0);
    call_back(first_wwpn, link_down);
    gate.wait_for_arrival();
    for (int i = 0; i < 1000; i++)
        call_back(first_wwpn, link_up);
    std::thread disables([this] { EXPECT_EQ(disable(), 0); });
    // The clean-up is told before it can have the provider's mutex, which the delivery holds.
    wait_for_word(me + "cleanUp()");
    gate.let_go();
    disables.join();
    const std::string dropped =
        "Error: Failed to deliver indication as the indication handler is 0 or cleanUp signalled !";
    EXPECT_EQ(client.count() + count_word(dropped), 1001u);
    EXPECT_EQ(client.stops, 1);
    // All of them took a number.
    EXPECT_EQ(agent().m_indicationSequence, 1001u);
}

TEST_F(Alerts, WhatComesWhileAlertsAreOffIsDropped)
{
    words();
    call_back(first_wwpn, link_down);
    EXPECT_EQ(words(), (std::vector<std::string>{me + "hbaThreadProc",
                                                 "For link event, type= 0x201 fabricPortID= 0x77, eventType "
                                                 "std::string is Port Offline (LINK_DOWN) ."}));
    ASSERT_EQ(enable(), 0);
    ASSERT_EQ(disable(), 0);
    call_back(first_wwpn, link_down);
    ASSERT_EQ(enable(), 0);
    call_back(first_wwpn, link_up);
    expect_rows(client.wait_for(1)[0].get(), {{"Message", "PORT LINK UP"}, {"SequenceNumber", "0"}});
}

TEST_F(Alerts, ASubscriberThatTakesItsTimeHoldsUpNoLibrary)
{
    Gate gate;
    client.during = [&] { gate.pass(); };
    ASSERT_EQ(enable(), 0);
    link("0", false);
    gate.wait_for_arrival();
    // The libraries' thread goes on, and so do refreshes and enumerations.
    link("0", true);
    link("1", false);
    nvrsim_drain_events();
    refresh();
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(2));
    EXPECT_EQ(client.count(), 0u);
    gate.let_go();
    client.wait_for(3);
}

TEST_F(Alerts, AnUnloadWaitsForTheDeliveryUnderWay)
{
    Gate gate;
    client.during = [&] { gate.pass(); };
    ASSERT_EQ(enable(), 0);
    link("0", false);
    gate.wait_for_arrival();
    std::thread unloads([this] { unload_provider(); });
    wait_for_word(me + "cleanUp()");
    EXPECT_EQ(client.stops, 0);
    gate.let_go();
    unloads.join();
    EXPECT_EQ(m_unloaded, 0);
    EXPECT_EQ(client.count(), 1u);
    EXPECT_EQ(client.stops, 1);
    EXPECT_EQ(nvrsim_callbacks(), 0u);
    listenAgain();
}

TEST_F(Alerts, AnUnloadAndADisableAtOnceCleanUpOnce)
{
    ASSERT_EQ(enable(), 0);
    std::thread disables([this] { EXPECT_EQ(disable(), 0); });
    std::thread also([this] { EXPECT_EQ(disable(), 0); });
    disables.join();
    also.join();
    EXPECT_EQ(client.stops, 1);
    EXPECT_EQ(count_word(me + "cleanUp() Nothing to cleanUp, Exiting..."), 1u);
}

TEST_F(Alerts, ARegistrationThatFailsAtTheSecondPortLeavesTheFirst)
{
    fault("call = 'HBA_RegisterForAdapterPortEvents', from = 2, times = 1, status = 1");
    words();
    EXPECT_EQ(enable(), 140);
    EXPECT_THAT(words(), contains_in_order({"Registered for link events, adapter 0 . reg_status=0",
                                            "Failed to register the Indication notification"}));
    EXPECT_EQ(nvrsim_callbacks(), 1u);
    EXPECT_EQ(nvrsim_open_handles(), 0u);
    link("0", false);
    client.wait_for(1); // alerts are on
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(nvrsim_callbacks(), 0u);
}

TEST_F(Alerts, ARegistrationThatThrowsIsForgottenAndMadeAnew)
{
    const struct {
        const char* call;
        const char* words;
    } rows[] = {
        {"HBA_OpenAdapter", "Failed to Open Adapter, Skipping registration for Indication notification"},
        {"HBA_RegisterForAdapterPortEvents", "Failed to register the Indication notification"},
    };
    std::size_t told = 0;
    for (const auto& row : rows) {
        settle();
        const std::uint64_t removals = calls("HBA_RemoveCallback");
        fault(std::string("call = '") + row.call + "', times = 1, throws = true");
        words();
        EXPECT_EQ(enable(), 140) << row.call;
        EXPECT_THAT(words(), Contains(row.words));
        EXPECT_EQ(nvrsim_callbacks(), 0u);
        EXPECT_EQ(nvrsim_open_handles(), 0u);
        EXPECT_EQ(disable(), 0) << row.call;
        EXPECT_EQ(calls("HBA_RemoveCallback"), removals) << "for a port that was never registered";

        EXPECT_EQ(enable(), 0) << row.call;
        ASSERT_EQ(nvrsim_callbacks(), 2u) << row.call;
        event("0", link_down);
        event("1", link_down);
        client.wait_for(told += 2);
        EXPECT_EQ(disable(), 0) << row.call;
        EXPECT_EQ(nvrsim_callbacks(), 0u);
    }
}

TEST_F(Alerts, ARegistrationThatFailedAndWasMadeAllTheSameIsTakenBack)
{
    fault("call = 'HBA_RegisterForAdapterPortEvents', times = 1, status = 7, value = 1");
    EXPECT_EQ(enable(), 140);
    EXPECT_EQ(nvrsim_callbacks(), 0u);
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(enable(), 0);
    EXPECT_EQ(nvrsim_callbacks(), 2u);
    event("0", link_down);
    event("1", link_down);
    EXPECT_THAT(client.wait_for(2), SizeIs(2));
    EXPECT_EQ(disable(), 0);
}

TEST_F(Alerts, AnAdapterThatCannotBeOpenedEndsTheRegistration)
{
    fault("call = 'HBA_OpenAdapter', damage = 'null'");
    words();
    EXPECT_EQ(enable(), 140);
    EXPECT_THAT(words(), Contains("Failed to Open Adapter, Skipping registration for Indication notification"));
    nvrsim_clear_faults();
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(enable(), 0);
}

TEST_F(Alerts, AHostWithoutAdaptersHasNothingToRegister)
{
    scenario("# no adapters\n");
    refresh();
    EXPECT_EQ(enable(), 140);
    EXPECT_EQ(disable(), 0);
}

TEST_F(Alerts, AdaptersOfOtherKindsArePassedOver)
{
    auto& adapters = const_cast<std::vector<Adapter*>&>(agent().m_pData->getAdapters());
    adapters.insert(adapters.begin(), new Other_Adapter);
    words();
    EXPECT_EQ(enable(), 0);
    EXPECT_THAT(words(), contains_in_order({"Skippping Adapter [Other-0] since it is not an FC Adapter",
                                            "Registered for link events, adapter 1 . reg_status=0"}));
}

TEST_F(Alerts, ALoadThatIsRefusedIsGivenBack)
{
    unload_provider();
    install({});
    listenAgain();
    NVRHBA_AlertIndication_Provider other;
    EXPECT_EQ(other.load(), 30);
    EXPECT_EQ(other.unload(), 0);
    EXPECT_THAT(log->words(), contains_in_order({me + "cleanUp() Nothing to cleanUp, Exiting...",
                                                 "ProviderAgent::releaseRef[0]", "Norvane Provider Unloaded"}));
    listenAgain();
}

TEST_F(Alerts, APortThatCannotBeUnregisteredIsKeptAndTriedAgain)
{
    ASSERT_EQ(enable(), 0);
    fault("call = 'HBA_RemoveCallback', status = 1");
    words();
    EXPECT_EQ(disable(), 150);
    EXPECT_THAT(words(),
                contains_in_order({"m_callbackHandles.size() is now 2 ",
                                   "Failed to un-register the Indication notification", me + "cleanUp() finished"}));
    EXPECT_EQ(client.stops, 1);
    EXPECT_EQ(nvrsim_callbacks(), 2u);
    link("0", false); // nobody hears
    nvrsim_drain_events();

    // Still refused: the ports are not registered once more, and their events come once.
    EXPECT_EQ(enable(), 0);
    EXPECT_EQ(nvrsim_callbacks(), 2u);
    link("0", true);
    link("1", true);
    client.wait_for(2);
    EXPECT_EQ(disable(), 150);

    nvrsim_clear_faults();
    EXPECT_EQ(enable(), 0);
    EXPECT_EQ(nvrsim_callbacks(), 2u);
    link("0", false);
    client.wait_for(3);
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(nvrsim_callbacks(), 0u);
    EXPECT_EQ(client.count(), 3u);
}

TEST_F(Alerts, ARemovalThatThrowsIsOneThatIsRefused)
{
    ASSERT_EQ(enable(), 0);
    fault("call = 'HBA_RemoveCallback', throws = true");
    words();
    EXPECT_EQ(disable(), 150);
    EXPECT_THAT(words(),
                contains_in_order({"m_callbackHandles.size() is now 2 ",
                                   "Failed to un-register the Indication notification", me + "cleanUp() finished"}));
    EXPECT_EQ(client.stops, 1) << "alerts are off";
    EXPECT_EQ(enable(), 0);
    EXPECT_EQ(nvrsim_callbacks(), 2u);
    link("0", false);
    client.wait_for(1);

    unload_provider();
    EXPECT_EQ(m_unloaded, 40);
    EXPECT_EQ(client.stops, 2);
    EXPECT_EQ(nvrsim_callbacks(), 2u);
    listenAgain();

    // Each of the two is still known by its own handle.
    live_again(2);
}

TEST_F(Alerts, WhatRemainsIsTriedOnceMoreAtTheUnload)
{
    ASSERT_EQ(enable(), 0);
    fault("call = 'HBA_RemoveCallback', status = 1");
    EXPECT_EQ(disable(), 150);
    nvrsim_clear_faults();
    unload_provider();
    EXPECT_EQ(m_unloaded, 0);
    EXPECT_EQ(nvrsim_callbacks(), 0u);
    listenAgain();
}

TEST_F(Alerts, ACallbackThatOutlivesTheUnloadTouchesNothing)
{
    ASSERT_EQ(enable(), 0);
    fault("call = 'HBA_RemoveCallback', status = 1");
    unload_provider();
    EXPECT_EQ(m_unloaded, 40);
    EXPECT_EQ(client.stops, 1);
    EXPECT_EQ(nvrsim_callbacks(), 2u);
    listenAgain();
    link("0", false);
    nvrsim_drain_events();
    EXPECT_THAT(words(), Contains(me + "hbaThreadProc"));
    EXPECT_EQ(client.count(), 0u);

    // The next life takes the registrations over.
    live_again(1);
}

TEST_F(Alerts, WithoutAWorkerAlertsStayOff)
{
    settle();
    no_more_threads = true;
    EXPECT_EQ(enable(), 140);
    no_more_threads = false;
    EXPECT_EQ(nvrsim_callbacks(), 0u);
    EXPECT_EQ(client.stops, 0);
    words();
    EXPECT_EQ(disable(), 0);
    EXPECT_THAT(words(), Contains(me + "cleanUp() Nothing to cleanUp, Exiting..."));
    EXPECT_EQ(enable(), 0);
    link("0", false);
    client.wait_for(1);
}

TEST_F(Alerts, WithoutAContextForTheWorkerAlertsStayOff)
{
    context.hook = Fake_Context::Hook::none;
    EXPECT_EQ(enable(), 140);
    EXPECT_EQ(nvrsim_callbacks(), 0u);
    context.hook = Fake_Context::Hook::no_memory;
    EXPECT_EQ(enable(), 140);
    context.hook = Fake_Context::Hook::child;
    EXPECT_EQ(enable(), 0);
}

TEST_F(Alerts, ASubscriberThatDisablesOrEnablesFromWithinItsDeliveryIsRefused)
{
    int disabled = -1;
    int enabled = -1;
    client.during = [&] {
        disabled = disable();
        enabled = enable();
    };
    ASSERT_EQ(enable(), 0);
    link("0", false);
    client.wait_for(1);
    EXPECT_EQ(disabled, DISABLE_INDICATIONS_FAILED);
    EXPECT_EQ(enabled, ENABLE_INDICATIONS_FAILED);
    link("0", true);
    EXPECT_THAT(client.wait_for(2), SizeIs(2)) << "alerts are still on";
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(client.stops, 1);
}

TEST_F(Alerts, ASubscriberThatUnloadsFromWithinItsDeliveryIsRefused)
{
    int unloaded = -1;
    client.during = [&] { unloaded = provider->unload(); };
    ASSERT_EQ(enable(), 0);
    link("0", false);
    client.wait_for(1);
    EXPECT_EQ(unloaded, UNLOAD_FAILED);
    link("0", true);
    EXPECT_THAT(client.wait_for(2), SizeIs(2)) << "alerts are still on";
    EXPECT_EQ(disable(), 0);
}

TEST_F(Alerts, ADeliveryThatThrowsCostsOnlyItself)
{
    bool throws = true;
    client.during = [&] {
        if (std::exchange(throws, false)) throw 1;
    };
    ASSERT_EQ(enable(), 0);
    link("0", false);
    link("0", true);
    expect_rows(client.wait_for(1)[0].get(), {{"SequenceNumber", "1"}});
    EXPECT_EQ(disable(), 0);
}

TEST_F(Alerts, ADeliveryThatThrowsIsTold)
{
    client.during = [] { throw 1; };
    ASSERT_EQ(enable(), 0);
    link("0", false);
    wait_for_word("Error: Failed to generate or deliver the indication");
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(client.count(), 0u);
}

TEST_F(Alerts, AnEventOfAnotherTypeWouldBeToldAsUnknown)
{
    const Ref<NVRHBA_AlertIndication> alert = makeAlert(agent(), wwn_of(first_wwpn), 515);
    ASSERT_TRUE(alert);
    expect_rows(alert.get(), {{"Description", "Port WWN 10000000C9A00001 status changed to unknown."},
                              {"ProbableCause", "0"},
                              {"ProbableCauseDescription", "Unknown"},
                              {"Message", "null"},
                              {"MessageID", "Norvane"}});
}

TEST_F(Alerts, WithoutMemoryAnAlertIsNotMadeAndCostsNoNumber)
{
    Ref<NVRHBA_AlertIndication> alert;
    ProviderAgent& the_agent = agent();
    const HBA_WWN port = wwn_of(first_wwpn);
    words();
    int ports = 0, alerts = 0;
    refuse_each_allocation([&] { alert = makeAlert(the_agent, port, link_down); },
                           [&](bool has_thrown) {
                               EXPECT_FALSE(alert);
                               EXPECT_EQ(the_agent.m_indicationSequence, 0u);
                               const std::string last = words().back();
                               const bool is_port = last == "Could not create FCPort instance";
                               const bool is_alert = last == "Could not create the required AlertIndication instance";
                               EXPECT_NE(has_thrown, is_port || is_alert) << last;
                               ports += is_port;
                               alerts += is_alert;
                           });
    EXPECT_GT(ports, 5);
    EXPECT_GT(alerts, 5);
    ASSERT_TRUE(alert);
    expect_rows(alert.get(), {{"SequenceNumber", "0"}});
}

TEST_F(Alerts, WithoutMemoryEnablingLeavesNothingThatCannotBeTakenBack)
{
    settle();
    int status = -1;
    const long refused = refuse_each_allocation([&] { status = enable(); },
                                                [&](bool) {
                                                    EXPECT_EQ(disable(), 0);
                                                    EXPECT_EQ(nvrsim_callbacks(), 0u);
                                                });
    EXPECT_GT(refused, 5);
    EXPECT_EQ(status, 0);
    EXPECT_EQ(nvrsim_callbacks(), 2u) << "no port is taken for one that is registered";
    link("0", false);
    client.wait_for(1);
}

TEST_F(Alerts, APortThatTwoAdaptersListIsToldOnce)
{
    scenario("allow_twins = true\n"
             "[[adapter]]\n[[adapter.port]]\nwwpn = '10000000C9A00001'\n"
             "[[adapter]]\n[[adapter.port]]\nwwpn = '10000000C9A00001'\n");
    refresh();
    ASSERT_EQ(agent().m_pData->getAdapters().size(), 2u);
    ASSERT_EQ(enable(), 0);
    EXPECT_EQ(nvrsim_callbacks(), 1u);
    event("0", link_down);
    client.wait_for(1);
    nvrsim_drain_events();
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(client.count(), 1u);
    EXPECT_EQ(nvrsim_callbacks(), 0u);
}

TEST_F(Alerts, APortWhoseNameIsNoneEndsTheRegistration)
{
    struct Odd_Port : FCPort {
        explicit Odd_Port(Adapter* adapter) : FCPort(adapter, 0) { m_portName = "no name"; }
    };
    auto& adapters = agent().m_pData->getAdapters();
    adapters.front()->getPorts()->push_back(new Odd_Port(adapters.front()));
    words();
    EXPECT_EQ(enable(), 140);
    EXPECT_THAT(words(), Contains("INVALID WWN"));
    EXPECT_EQ(nvrsim_callbacks(), 2u) << "those before it";
    EXPECT_EQ(nvrsim_open_handles(), 0u);
    EXPECT_EQ(disable(), 0);
    EXPECT_EQ(nvrsim_callbacks(), 0u);
}
