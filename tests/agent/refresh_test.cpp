#include <atomic>
#include <pthread.h>
#include <stdexcept>
#include <thread>
#include <unistd.h>

#include "agent/Agent_Wait.h"
#include "simulator/nvrsim.h"
#include "tests/agent/Simulated_Host.h"
#include "tests/runtime/Fake_Context.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::Not;
using testing::SizeIs;

namespace {

constexpr const char* no_timeout = "PERF: ---No timeout BuildCimpleInfo END---";
constexpr const char* already_running = "PERF: ---DataFetch_Handler thread already running -BuildCimpleInfo END---";
constexpr const char* building_adapters = "PERF: Building Adapter Data...";
constexpr const char* building_targets = "PERF: Building SAN Data...";

using Refresh = LoadedHost;

long count(const std::vector<std::string>& words, const char* word)
{
    return std::count(words.begin(), words.end(), word);
}

} // namespace

TEST_F(Refresh, TheFirstEnumerationStartsTheThreadAndBlocksUntilTheMapsAreReady)
{
    fault("call = \"HBA_GetAdapterAttributes\", delay_ms = 100");
    words();
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
    EXPECT_THAT(words(),
                contains_in_order({"PERF: ---BuildCimpleInfo BEGIN---", "Checking if TimeOut...", "PERF: TimeOut",
                                   "PERF: Creating DataFetch_Handler Thread.", building_adapters, "buildAdapterData",
                                   "PERF: Updating Adapter Maps...", "PERF: updateAdapterMaps: Entry",
                                   "PERF: updateAdapterMaps: cleanExit", building_targets, "PERF: Updating SAN Maps...",
                                   "PERF: updateSANMaps: Entry", "PERF: updateSANMaps: cleanExit",
                                   "PERF: DataFetch_Handler Thread END"}));
}

TEST_F(Refresh, ASecondEnumerationWithinTheTimeOutReadsTheMapsAlone)
{
    plain(agent().m_NVRHBA_FCPort_map);
    words();
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
    EXPECT_THAT(words(), contains_in_order({"PERF: Refresh Not yet required", no_timeout}));
}

TEST_F(Refresh, ByDefaultATimeOutRebuildsTheSANSideAlone)
{
    plain(agent().m_NVRHBA_FCPort_map);
    advance_clock(10 * minute);
    words();
    plain(agent().m_NVRHBA_FCPort_map);
    const auto said = words();
    EXPECT_THAT(said, contains_in_order({"PERF: TimeOut", "PERF: Clearing the previous thread...with join",
                                         "PERF: Creating DataFetch_Handler Thread.", building_targets}));
    EXPECT_THAT(said, Not(Contains(building_adapters)));
}

TEST_F(Refresh, TheTimeOutCountsFromTheEndOfTheLastRefresh)
{
    plain(agent().m_NVRHBA_FCPort_map);
    advance_clock(10 * minute - 1);
    words();
    agent().BuildCimpleInfo();
    EXPECT_THAT(words(), Contains(no_timeout));
    advance_clock(1);
    agent().BuildCimpleInfo();
    EXPECT_THAT(words(), Contains("PERF: TimeOut"));
}

TEST_F(Refresh, AnAdapterRefreshThatWasAskedForRunsAtTheNextCall)
{
    plain(agent().m_NVRHBA_FCPort_map);
    agent().m_bAdapterRefreshPending.ask();
    words();
    plain(agent().m_NVRHBA_FCPort_map);
    EXPECT_THAT(words(), contains_in_order({building_adapters, building_targets}));
    EXPECT_FALSE(agent().m_bAdapterRefreshPending);
}

TEST_F(Refresh, WithAdapterRefreshSetATimeOutRebuildsBothSides)
{
    plain(agent().m_NVRHBA_FCPort_map);
    agent().m_bRefreshAdapterData = true;
    words();
    agent().BuildCimpleInfo();
    EXPECT_THAT(words(), Not(Contains(building_adapters))); // not at once
    advance_clock(10 * minute);
    plain(agent().m_NVRHBA_FCPort_map);
    EXPECT_THAT(words(), contains_in_order({building_adapters, building_targets}));
}

TEST_F(Refresh, TheLimitIsComputedIn32Bits)
{
    plain(agent().m_NVRHBA_FCPort_map);
    ProviderAgent& held = agent();
    Auto_Mutex lock(held.m_DataFetchMutex);
    held.m_cacheTimeout = 30;
    advance_clock(30 * minute - 1);
    EXPECT_EQ(held.checkTimeOut(), 0);
    advance_clock(1);
    EXPECT_EQ(held.checkTimeOut(), 1);
    held.m_cacheTimeout = 72; // 4,320,000,000 wraps to 25,032,704
    EXPECT_EQ(held.checkTimeOut(), 1);
    held.m_cacheTimeout = 71;
    EXPECT_EQ(held.checkTimeOut(), 0);
    advance_clock(4294967296u - 30 * minute);
    EXPECT_EQ(held.checkTimeOut(), 1);
}

TEST_F(Refresh, AnEnumerationDuringARefreshStartsNothing)
{
    plain(agent().m_NVRHBA_FCPort_map);
    fault("call = \"HBA_GetAdapterAttributes\", delay_ms = 200");
    agent().m_bAdapterRefreshPending.ask();
    agent().BuildCimpleInfo();
    words();
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
    const auto said = words();
    EXPECT_EQ(count(said, already_running), 1);
    EXPECT_EQ(count(said, "PERF: Creating DataFetch_Handler Thread."), 0);
}

TEST_F(Refresh, ARequestDuringTheAdapterPhaseIsServedBeforeTheThreadEnds)
{
    plain(agent().m_NVRHBA_FCPort_map);
    words();
    fault("call = \"HBA_GetAdapterAttributes\", delay_ms = 200, times = 1");
    agent().m_bAdapterRefreshPending.ask();
    agent().BuildCimpleInfo();
    awaitWord(building_adapters);
    agent().m_bAdapterRefreshPending.ask();
    settle();
    EXPECT_EQ(count(words(), building_adapters), 2); // this one, and what was asked meanwhile
    EXPECT_FALSE(agent().m_bAdapterRefreshPending);
}

TEST_F(Refresh, ASANEnumerationAsksForItsPhaseThoughTheRefreshOfTargetsIsOff)
{
    agent().m_bRefreshSANData = false;
    plain(agent().m_NVRHBA_FCPort_map);
    words();
    san(agent().m_NVRHBA_StorageVolume_map);
    const auto said = words();
    EXPECT_EQ(count(said, building_targets), 1);
    EXPECT_EQ(count(said, building_adapters), 0);
    san(agent().m_NVRHBA_StorageVolume_map);
    EXPECT_EQ(count(words(), building_targets), 0);
}

TEST_F(Refresh, ASANEnumerationThatAnAdapterRefreshOvertakesIsServed)
{
    agent().m_bRefreshSANData = false;
    san(agent().m_NVRHBA_StorageVolume_map);
    for (int i = 0; i < 20; i++) {
        agent().m_bAdapterRefreshPending.ask();
        san(agent().m_NVRHBA_StorageVolume_map); // a lost request would block here for ever
    }
    // The last one may have gone before the flag fell; nobody is left behind, and the next one is served.
    EXPECT_EQ(agent().m_SANWaiters, 0u);
    san(agent().m_NVRHBA_StorageVolume_map);
    EXPECT_TRUE(agent().m_bIsSANMapsReady);
}

TEST_F(Refresh, AWaiterWithoutARequestIsServedToo)
{
    agent().m_bRefreshSANData = false;
    plain(agent().m_NVRHBA_FCPort_map);
    ProviderAgent& held = agent();
    Auto_Mutex lock(held.m_SANMapsReadyMutex);
    ASSERT_FALSE(held.m_bIsSANMapsReady);
    held.waitForSANMaps();
    EXPECT_TRUE(held.m_bIsSANMapsReady);
}

TEST_F(Refresh, AnExceptionInAnUpdateRaisesTheFlagsAndTheNextRefreshRecovers)
{
    on_driver_log = [](ProviderAgent&) { throw std::runtime_error("a builder"); };
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1)); // made before the builder threw
    EXPECT_THAT(words(), contains_in_order({"No FC card found", "Create the Diagnostic classes",
                                            "PERF: updateAdapterMaps: cleanExit", building_targets}));
    on_driver_log = nullptr;
    refresh();
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
    EXPECT_THAT(words(), Not(Contains("No FC card found")));
}

TEST_F(Refresh, AThreadThatIsEndedInsideARefreshLeavesNobodyWaiting)
{
    on_driver_log = [](ProviderAgent& held) {
        while (held.m_AdapterDataReadyMutex.try_lock() == 0) { // until the client has it, and waits for the maps
            held.m_AdapterDataReadyMutex.unlock();
            std::this_thread::yield();
        }
        pthread_exit(nullptr);
    };
    Instances all;
    enumerateActive<&ProviderAgent::GetFCPortStats>(agent(), agent().m_NVRHBA_FCPortStatistics_map, {collect, &all});
    EXPECT_THAT(all, SizeIs(1)); // the maps as far as they got
    while (agent().m_bDataFetchRunning)
        usleep(1000);
    EXPECT_THAT(words(), Not(Contains("PERF: DataFetch_Handler Thread END")));
    on_driver_log = nullptr;
    listenAgain();
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
    EXPECT_THAT(words(), contains_in_order({"PERF: Clearing the previous thread...with join", building_adapters,
                                            "PERF: updateAdapterMaps: cleanExit", building_targets}));
}

TEST_F(Refresh, AServerThatThrowsAtANewThreadLeavesNobodyWaiting)
{
    struct Server : Fake_Context {
        Thread_Context* thread_create_hook(void*) override { throw 1; }
    } server;
    Thread_Context::push(&server);
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(0));
    Thread_Context::pop();
    EXPECT_FALSE(agent().m_bDataFetchRunning);
    // The flags are up: the next call may still read what the last refresh left.
    agent().BuildCimpleInfo();
    settle();
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
}

TEST_F(Refresh, AClientThatIsCancelledWhileItWaitsIsNotServedForEver)
{
    agent().m_bRefreshSANData = false;
    plain(agent().m_NVRHBA_FCPort_map);
    fault("call = \"HBA_GetFcpTargetMapping\", delay_ms = 300, times = 1");
    pthread_t client;
    ASSERT_EQ(pthread_create(
                  &client, nullptr,
                  [](void* held) -> void* {
                      auto& agent = *static_cast<ProviderAgent*>(held);
                      enumerateSAN(agent, agent.m_NVRHBA_StorageVolume_map, {collect, nullptr});
                      return nullptr;
                  },
                  &agent()),
              0);
    while (agent().m_SANWaiters == 0)
        usleep(1000);
    ASSERT_EQ(pthread_cancel(client), 0);
    void* result = nullptr;
    ASSERT_EQ(pthread_join(client, &result), 0);
    EXPECT_EQ(result, PTHREAD_CANCELED);
    EXPECT_EQ(agent().m_SANWaiters, 0u);
    settle();
    words();
    refresh();
    EXPECT_THAT(words(), Not(Contains(building_targets)));
}

TEST_F(Refresh, EveryClientSeesACompleteListWhileRefreshesRun)
{
    scenario("[[adapter]]\ncount = 6\n[[target]]\nluns = 2\n");
    ASSERT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(6));
    std::atomic<bool> stop{false};
    std::atomic<int> incomplete{0};
    std::vector<std::thread> clients;
    for (int i = 0; i < 8; i++)
        clients.emplace_back([&] {
            while (!stop) {
                std::vector<Ref<Instance>> all;
                enumeratePlain(agent(), agent().m_NVRHBA_FCPort_map, {collect, &all});
                if (all.size() != 6) incomplete++;
                all.clear();
                enumerateActive<&ProviderAgent::GetFCPortStats>(agent(), agent().m_NVRHBA_FCPortStatistics_map,
                                                                {collect, &all});
                if (all.size() != 6) incomplete++;
                all.clear();
                enumerateSAN(agent(), agent().m_NVRHBA_StorageVolume_map, {collect, &all});
            }
        });
    for (int i = 0; i < 20; i++) {
        agent().m_bAdapterRefreshPending.ask();
        agent().BuildCimpleInfo();
        usleep(5000);
    }
    stop = true;
    for (std::thread& client : clients)
        client.join();
    EXPECT_EQ(incomplete, 0);
}

TEST_F(Refresh, TheLocksSayWhatTheyWaitFor)
{
    ProviderAgent& held = agent();
    words();
    std::thread client([&] { Agent_Locks locks(held, Words::spoken); });
    const auto raise = [&](std::atomic<bool>& ready, Mutex& mutex, Cond& condition, const char* waiting) {
        while (count(log->words(), waiting) == 0)
            usleep(1000);
        Auto_Mutex lock(mutex);
        ready = true;
        condition.broadcast();
    };
    raise(held.m_bIsAdapterDataReady, held.m_AdapterDataReadyMutex, held.m_AdapterDataReadyCond,
          "PERF: Waiting for m_AdapterDataReadyMutex");
    raise(held.m_bIsAdapterMapsReady, held.m_AdapterMapsReadyMutex, held.m_AdapterMapsReadyCond,
          "PERF: Waiting for m_AdapterMapsReadyMutex");
    client.join();
    EXPECT_EQ(words(), (std::vector<std::string>{"PERF: Waiting for m_AdapterDataReadyMutex",
                                                 "PERF: Woken up from wait for m_AdapterDataReadyMutex",
                                                 "PERF: Waiting for m_AdapterMapsReadyMutex",
                                                 "PERF: Woken up from wait for m_AdapterMapsReadyMutex"}));
}

TEST_F(Refresh, TheAgentWaitHoldsItsLocksAndIsSilentOnceTheMapsAreReady)
{
    ProviderAgent& held = agent();
    {
        Agent_Wait wait(held);
        EXPECT_TRUE(held.m_bIsAdapterMapsReady);
        EXPECT_EQ(held.m_DataMutex.try_lock(), 16);
    }
    settle();
    words();
    {
        Agent_Wait wait(agent());
    }
    EXPECT_THAT(words(), Not(Contains("PERF: Waiting for m_AdapterDataReadyMutex")));
}

TEST_F(Refresh, ARefusedCopyHandsNothingOut)
{
    plain(agent().m_NVRHBA_FCPort_map);
    // Two equal keys: what insert forbids, a careless writer can still make.
    auto& ports = agent().m_NVRHBA_FCPort_map;
    Ref<Instance> second(clone(static_cast<Instance_Map&>(ports)[0]));
    static_cast<Instance_Map&>(ports)[0]->__name_space = "root/norvane";
    const Meta_Property* id = as_property(find_feature(second->meta_class, "DeviceID", META_FLAG_PROPERTY));
    auto* text = static_cast<String*>(feature_at(second.get(), id->offset));
    const String kept = *text;
    *text = "another";
    ASSERT_EQ(ports.insert(second.get()), 1);
    *text = kept;
    second.release();
    words();
    EXPECT_TRUE(plain(ports).empty());
    EXPECT_THAT(words(), Contains("Insert failed for 1"));
}

TEST_F(Refresh, AHandlerThatThrowsEndsTheEnumerationWithItsWords)
{
    const Enum_Handler handler{[](Instance* instance, int, void*) -> bool {
                                   unref(instance);
                                   throw std::runtime_error("handler");
                               },
                               nullptr};
    plain(agent().m_NVRHBA_FCPort_map);
    words();
    enumeratePlain(agent(), agent().m_NVRHBA_FCPort_map, handler);
    EXPECT_EQ(words().back(), "Exception in CIM Provider Enumeration - do nothing");
    enumerateActive<&ProviderAgent::GetFCPortStats>(agent(), agent().m_NVRHBA_FCPortStatistics_map, handler);
    EXPECT_EQ(words().back(), "Exception in Active CIM Provider Enumeration - do nothing");
    enumerateSAN(agent(), agent().m_NVRHBA_SCSIProtocolEndpoint_map, handler);
    EXPECT_EQ(words().back(), "Exception in SAN CIM Provider Enumeration - do nothing");
    Mutex& data = agent().m_DataMutex;
    EXPECT_EQ(data.try_lock(), 0); // no lock is left behind
    data.unlock();
}
