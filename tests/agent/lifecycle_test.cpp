#include <atomic>
#include <future>
#include <thread>
#include <unistd.h>

#include "agent/Agent_Wait.h"
#include "foundation/Management_Session.h"
#include "inventory/NVR_Data.h"
#include "simulator/nvrsim.h"
#include "tests/agent/Simulated_Host.h"
#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::Not;

namespace {

class Lifecycle : public SimulatedHost {};

/// Said by a last release before it waits for a refresh.
constexpr const char* joining = "PERF: Clearing the previous thread...with join";

std::string guard_name()
{
    return "/dev/shm/sem.NVR_RM_INIT_LIB_" + std::to_string(getpid());
}

} // namespace

TEST_F(Lifecycle, TheFirstLoadBuildsTheAgentAndTheLastUnloadEndsIt)
{
    ASSERT_EQ(load(), 0);
    EXPECT_TRUE(agent().m_bLoaded);
    const std::string loaded = "Norvane Provider v2.5.19-1 Loaded[" + std::to_string(getpid()) + "]";
    EXPECT_THAT(words(), contains_in_order({"Initializing RM API ", "Constructor", "RMLIB initialized",
                                            "Initializing Data Pointer ", "Data Pointer Constructed.", loaded,
                                            "ProviderAgent::addRef[0]"}));
    ASSERT_EQ(load(), 0);
    unload();
    EXPECT_TRUE(exists(guard_name()));
    EXPECT_THAT(words(), Not(Contains("Entering the function ~ProviderAgent()")));
    unload();
    EXPECT_THAT(words(),
                contains_in_order({"ProviderAgent::releaseRef[1]", "Entering the function ~ProviderAgent()",
                                   "Deleting Data pointer", "Data Pointer deleted.", "MethodWrapper", "Destructor",
                                   "RMLIB uninitialzed", "Entered ClearMaps()", "PERF: Entered clearAdapterMaps()",
                                   "Exiting clearAdapterMaps()", "PERF: Entered clearDriverMaps: Entry",
                                   "PERF: Entered clearSANMaps()", "Exiting clearSANMaps()", "Exiting ClearMaps()",
                                   "Norvane Provider Unloaded"}));
    EXPECT_FALSE(exists(guard_name()));
    EXPECT_THAT(read_file("/etc/norvane_fc_provider.conf"), testing::HasSubstr("NVR_PROVIDER_CACHE_TIMEOUT = 10"));
}

TEST_F(Lifecycle, TheDestructorWaitsForNothingWhereNoRefreshRan)
{
    ASSERT_EQ(load(), 0);
    unload();
    EXPECT_THAT(words(), Not(Contains("PERF: Waiting for m_bIsAdapterDataReady")));
}

TEST_F(Lifecycle, SettingsComeFromTheFileAndGoBackToIt)
{
    write_file("/etc/norvane_fc_provider.conf", "NVR_PROVIDER_CACHE_TIMEOUT = 7\nNVR_PROVIDER_REFRESH_SANDATA = FALSE\n"
                                                "NVR_PROVIDER_REFRESH_ADAPTERDATA = TRUE\n");
    errno = 0;
    ASSERT_EQ(load(), 0);
    EXPECT_EQ(agent().m_cacheTimeout, 7u);
    EXPECT_FALSE(agent().m_bRefreshSANData);
    EXPECT_TRUE(agent().m_bRefreshAdapterData);
    agent().m_config.setCacheTimeout(8);
    unload();
    EXPECT_THAT(read_file("/etc/norvane_fc_provider.conf"), testing::HasSubstr("NVR_PROVIDER_CACHE_TIMEOUT = 8"));
}

TEST_F(Lifecycle, OnlyTheCallersStaleErrnoDecidesAboutTheSettingsFile)
{
    write_file("/etc/norvane_fc_provider.conf", "NVR_PROVIDER_CACHE_TIMEOUT = 7\n");
    errno = ENOENT;
    ASSERT_EQ(load(), 0);
    EXPECT_EQ(agent().m_cacheTimeout, 10u);
    unload();
    EXPECT_EQ(read_file("/etc/norvane_fc_provider.conf"), "NVR_PROVIDER_CACHE_TIMEOUT = 7\n") << "it was not read";
}

TEST_F(Lifecycle, AMissingManagementLibraryRefusesEveryLoadAndTheNextAgentRecovers)
{
    install({"HBAAPI", "tssdm"});
    EXPECT_EQ(load(), 30);
    EXPECT_THAT(words(), Contains("Norvane CIM Provider load failure"));
    EXPECT_FALSE(agent().m_bLoaded);
    EXPECT_EQ(load(), 30);
    unload();
    EXPECT_THAT(words(), Not(Contains("Entering the function ~ProviderAgent()")));
    install();
    EXPECT_EQ(load(), 30); // the same agent, since one provider still holds it
    unload();
    unload();
    EXPECT_THAT(words(), contains_in_order({"ProviderAgent::releaseRef[0]", "Entering the function ~ProviderAgent()",
                                            "Norvane Provider Unloaded"}));
    listenAgain();
    EXPECT_EQ(load(), 0);
    EXPECT_EQ(plain(agent().m_NVRHBA_FCPort_map).size(), 1u);
    unload();
}

TEST_F(Lifecycle, AnAgentThatFailedToLoadEnumeratesNothingAndHangsNobody)
{
    install({"HBAAPI", "tssdm"});
    ASSERT_EQ(load(), 30);
    EXPECT_TRUE(plain(agent().m_NVRHBA_FCPort_map).empty());
    EXPECT_TRUE(san(agent().m_NVRHBA_StorageVolume_map).empty());
    EXPECT_THAT(words(),
                contains_in_order({"PERF: ---BuildCimpleInfo BEGIN---",
                                   "Norvane Provider dependent library load has failed..do nothing is the only option",
                                   "PERF: DataFetch_Handler Thread BEGIN", "PERF: Building Adapter Data...",
                                   "PERF: DataFetch_Handler Thread END"}));
    unload();
}

TEST_F(Lifecycle, AnUnloadWithoutALoadNeverCountsBelowZero)
{
    unload();
    unload();
    EXPECT_EQ(words(), (std::vector<std::string>{"ProviderAgent::releaseRef[0]", "ProviderAgent::releaseRef[0]"}));
    ASSERT_EQ(load(), 0);
    unload();
    EXPECT_THAT(words(), Contains("Norvane Provider Unloaded"));
}

TEST_F(Lifecycle, TenRoundsEachLoadBindAndShowThePortAgain)
{
    for (int round = 0; round < 10; round++) {
        ASSERT_EQ(load(), 0);
        EXPECT_EQ(plain(agent().m_NVRHBA_FCPort_map).size(), 1u);
        EXPECT_EQ(san(agent().m_NVRHBA_SCSIProtocolEndpoint_map).size(), 2u);
        unload();
        EXPECT_EQ(nvrsim_open_handles(), 0u);
        EXPECT_FALSE(exists(guard_name()));
        listenAgain();
    }
}

TEST_F(Lifecycle, TheLastReleaseWaitsForARunningRefresh)
{
    fault("call = \"HBA_GetAdapterAttributes\", delay_ms = 200");
    ASSERT_EQ(load(), 0);
    agent().BuildCimpleInfo();
    unload();
    EXPECT_THAT(words(), contains_in_order({joining, "PERF: DataFetch_Handler Thread END",
                                            "Entering the function ~ProviderAgent()", "Norvane Provider Unloaded"}));
}

TEST_F(Lifecycle, ALoadDuringTheLastReleaseKeepsTheAgent)
{
    std::atomic<bool> goes_on{false};
    on_driver_log = [&](ProviderAgent&) {
        while (!goes_on)
            std::this_thread::yield();
    };
    ASSERT_EQ(load(), 0);
    agent().BuildCimpleInfo();
    ProviderAgent* before = &agent();
    std::thread last([this] { unload(); });
    awaitWord(joining);
    const int loaded = load(); // not held up by the release that waits
    goes_on = true;
    last.join();
    ASSERT_EQ(loaded, 0);
    EXPECT_EQ(&agent(), before);
    EXPECT_THAT(words(), Not(Contains("Entering the function ~ProviderAgent()")));
    EXPECT_EQ(plain(agent().m_NVRHBA_FCPort_map).size(), 1u);
    unload();
    EXPECT_THAT(words(), Contains("Norvane Provider Unloaded"));
}

TEST_F(Lifecycle, AnUpCallThatLoadsAProviderDuringTheLastReleaseIsNotHeldUp)
{
    on_driver_log = [this](ProviderAgent&) {
        awaitWord(joining); // the last release waits for this thread by now
        EXPECT_EQ(ProviderAgent::load(), 0);
        ProviderAgent::unload();
    };
    ASSERT_EQ(load(), 0);
    agent().BuildCimpleInfo();
    unload();
    EXPECT_THAT(words(), contains_in_order({"ProviderAgent::releaseRef[1]", "ProviderAgent::addRef[0]",
                                            "ProviderAgent::releaseRef[1]", "PERF: DataFetch_Handler Thread END",
                                            "Entering the function ~ProviderAgent()", "Norvane Provider Unloaded"}));
}

TEST_F(Lifecycle, ALastReleaseOnTheFetchThreadLeavesTheAgentToTheNextOne)
{
    on_driver_log = [](ProviderAgent&) { ProviderAgent::unload(); };
    ASSERT_EQ(load(), 0);
    ProviderAgent* before = &agent();
    before->BuildCimpleInfo();
    settle();
    EXPECT_THAT(words(), Not(Contains("Entering the function ~ProviderAgent()")));
    on_driver_log = nullptr;
    ASSERT_EQ(load(), 0);
    EXPECT_EQ(&agent(), before);
    unload();
    EXPECT_THAT(words(), Contains("Norvane Provider Unloaded"));
}

TEST_F(Lifecycle, ManyThreadsLoadAndUnloadAtOnce)
{
    std::atomic<int> refused{0};
    std::vector<std::thread> threads;
    for (int i = 0; i < 8; i++)
        threads.emplace_back([&] {
            for (int round = 0; round < 5; round++) {
                if (load() != 0) refused++;
                std::vector<Ref<Instance>> all;
                enumeratePlain(agent(), agent().m_NVRHBA_FCPort_map, {collect, &all});
                EXPECT_EQ(all.size(), 1u);
                unload();
            }
        });
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(refused, 0);
    EXPECT_EQ(nvrsim_open_handles(), 0u);
    EXPECT_FALSE(exists(guard_name()));
}

TEST_F(Lifecycle, AHostWithoutAnIssueOrTheHardwaresConsentIsLoadedAllTheSame)
{
    remove("/etc/issue");
    fault("call = \"CPQFC_LoadLibrary\", status = 5");
    ASSERT_EQ(load(), 0);
    EXPECT_THAT(words(), contains_in_order({"getOSInformation() failed", "Initializing RM API ",
                                            "Provider Agent::CPQFC_LoadLibrary() Failed:5 ", "Constructor"}));
    EXPECT_EQ(plain(agent().m_NVRHBA_FCPort_map).size(), 1u);
    unload();
}

TEST_F(Lifecycle, WithoutItsDataTheUpdateSaysSoAndEnds)
{
    ASSERT_EQ(load(), 0);
    plain(agent().m_NVRHBA_FCPort_map);
    words();
    agent().m_pData.reset();
    EXPECT_EQ(agent().updateAdapterMaps(), 32769u);
    EXPECT_EQ(words().back(), "Could not locate the data pointer - Serious issue");
    EXPECT_TRUE(agent().m_NVRHBA_FCPort_map.empty());
    unload();
}

TEST_F(Lifecycle, AThreadThatCannotBeCreatedLeavesEmptyAnswersAndTheNextCallTriesAgain)
{
    ASSERT_EQ(load(), 0);
    no_more_threads = true;
    EXPECT_TRUE(plain(agent().m_NVRHBA_FCPort_map).empty());
    EXPECT_TRUE(san(agent().m_NVRHBA_StorageVolume_map).empty());
    EXPECT_FALSE(agent().m_bDataFetchRunning);
    no_more_threads = false;
    agent().BuildCimpleInfo();
    settle();
    EXPECT_EQ(plain(agent().m_NVRHBA_FCPort_map).size(), 1u);
    unload();
}

// A service holds the adapters' locks and the data when it asks for a refresh at its end; a SAN enumeration beside it
// holds the SAN maps' lock and waits for the data.
TEST_F(Lifecycle, AThreadThatCannotBeCreatedKeepsTheOrderOfTheLocks)
{
    ASSERT_EQ(load(), 0);
    ProviderAgent& the_agent = agent(); // to ask for it takes a lock too
    the_agent.m_bRefreshSANData = false;
    refresh();
    ASSERT_FALSE(the_agent.m_bIsSANMapsReady);
    std::promise<void> has_maps;
    std::thread enumeration;
    {
        const Agent_Locks locks(the_agent, cimple::Words::silent);
        enumeration = std::thread([&] {
            Auto_Mutex maps(the_agent.m_SANMapsReadyMutex);
            has_maps.set_value();
            Auto_Mutex data(the_agent.m_DataMutex);
        });
        has_maps.get_future().wait();
        no_more_threads = true;
        the_agent.m_bAdapterRefreshPending.ask();
        EXPECT_EQ(the_agent.BuildCimpleInfo(), 0);
        EXPECT_FALSE(the_agent.m_bDataFetchRunning);
    }
    enumeration.join();
    // Once the lock is free, the flag goes up, and whoever waited would not wait on.
    the_agent.BuildCimpleInfo();
    EXPECT_TRUE(the_agent.m_bIsSANMapsReady);
    no_more_threads = false;
    settle();
    unload();
}
