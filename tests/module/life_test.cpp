// The module's life in a server: counters of factories and cleanups, what stays behind an unload, and what does not.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <set>
#include <sstream>
#include <string>
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
using testing::IsEmpty;
using testing::Not;

namespace {

constexpr char unloaded[] = "Norvane Provider Unloaded";

// Of this process alone: its children have left theirs there.
std::vector<std::string> shared_memory()
{
    return names_in("/dev/shm", '_' + std::to_string(getpid()));
}

// Result: the elements of string arrays in the answers.
std::size_t ask_all(Rig& rig)
{
    std::size_t elements = 0;
    for (const std::string& name : rig.classes()) {
        if (name == "NVRHBA_AlertIndication") continue;
        const host::Answer answer = rig.enumerate(name);
        EXPECT_THAT(answer, succeeded()) << name;
        for (const host::Instance& instance : answer.instances)
            for (const host::Named_Value& property : instance.properties)
                if (property.value.type() == CMPI_stringA) elements += property.value.elements().size();
    }
    return elements;
}

} // namespace

TEST(Life, FourFactoriesAndThreeCleanupsLeaveTheProviderLoaded)
{
    Rig rig;
    Entries entries;
    const std::string name = "NVRHBA_ControlledBy";
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        CMPIInstanceMI* instances = entries.instances(name, broker, context);
        CMPIMethodMI* methods = entries.methods(name, broker, context);
        CMPIAssociationMI* associations = entries.associations(name, broker, context);
        ASSERT_EQ(entries.instances(name, broker, context), instances);
        EXPECT_EQ(rig.count_words("ProviderAgent::addRef[0]"), 1u);

        EXPECT_EQ(instances->ft->cleanup(instances, context, 0).rc, CMPI_RC_OK);
        EXPECT_EQ(methods->ft->cleanup(methods, context, 0).rc, CMPI_RC_OK);
        EXPECT_EQ(associations->ft->cleanup(associations, context, 0).rc, CMPI_RC_OK);
        EXPECT_THAT(rig.words(), Not(Contains(unloaded)));
        EXPECT_EQ(rig.count_words(name + "_Provider::unload()"), 0u);

        EXPECT_EQ(instances->ft->cleanup(instances, context, 0).rc, CMPI_RC_OK);
        EXPECT_THAT(rig.words(), contains_in_order({name + "_Provider::unload()", "ProviderAgent::releaseRef[1]",
                                                    "Entering the function ~ProviderAgent()", unloaded}));
    });
}

// 119 providers are of one make; each speaks under its own name and that of its own file.
TEST(Life, EachProviderOfTheFamilySaysItsOwnNameInItsOwnFile)
{
    Rig rig({host::Manner::strict(), "small"});
    ask_all(rig);
    rig.stop();
    std::set<std::string> enumerated, gone;
    std::istringstream trace(read_file(trace_path));
    for (std::string line; std::getline(trace, line);) {
        const auto file = line.find("[derivedObjects/"), end = line.find(':', file);
        if (file == std::string::npos) continue;
        const std::string provider = line.substr(file + 16, end - file - 16); // <Class>_Provider
        const std::string words = line.substr(line.find("] ", end) + 2);
        if (words == provider + "::enum_instances()")
            enumerated.insert(provider);
        else if (words == provider + "::unload()")
            gone.insert(provider);
        else
            ADD_FAILURE() << line;
    }
    EXPECT_EQ(enumerated.size(), 119u);
    EXPECT_EQ(gone, enumerated);
    for (const std::string& provider : enumerated)
        EXPECT_TRUE(module_schema()->find(provider.substr(0, provider.rfind("_Provider")))) << provider;
}

TEST(Life, TheAgentLivesUntilTheLastProviderGoes)
{
    Rig rig;
    Entries entries;
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        CMPIInstanceMI* ports = entries.instances("NVRHBA_FCPort", broker, context);
        CMPIInstanceMI* products = entries.instances("NVRHBA_Product", broker, context);
        EXPECT_EQ(rig.count_words("ProviderAgent::addRef[0]"), 1u);
        EXPECT_EQ(rig.count_words("ProviderAgent::addRef[1]"), 1u);
        EXPECT_EQ(ports->ft->cleanup(ports, context, 0).rc, CMPI_RC_OK);
        EXPECT_EQ(rig.count_words("ProviderAgent::releaseRef[2]"), 1u);
        EXPECT_THAT(rig.words(), Not(Contains(unloaded)));
        EXPECT_EQ(products->ft->cleanup(products, context, 0).rc, CMPI_RC_OK);
        EXPECT_THAT(rig.words(), Contains(unloaded));
    });
}

TEST(Life, AFactoryAfterTheLastCleanupLoadsAnew)
{
    Rig rig;
    Entries entries;
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        for (int round = 0; round < 3; round++) {
            CMPIInstanceMI* mi = entries.instances("NVRHBA_FCPort", broker, context);
            ASSERT_TRUE(mi);
            EXPECT_EQ(mi->ft->cleanup(mi, context, round % 2).rc, CMPI_RC_OK);
        }
    });
    EXPECT_EQ(rig.count_words("Norvane Provider v2.5.19-1 Loaded[" + std::to_string(getpid()) + "]"), 3u);
    EXPECT_EQ(rig.count_words(unloaded), 3u);
}

TEST(Life, ACallAfterTheLastCleanupIsAnsweredPolitely)
{
    Rig rig;
    Entries entries;
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        CMPIInstanceMI* instances = entries.instances("NVRHBA_FCPort", broker, context);
        CMPIMethodMI* methods = entries.methods("NVRHBA_FCPort", broker, context);
        CMPIAssociationMI* associations = entries.associations("NVRHBA_ControlledBy", broker, context);
        EXPECT_EQ(instances->ft->cleanup(instances, context, 0).rc, CMPI_RC_OK);
        EXPECT_EQ(methods->ft->cleanup(methods, context, 0).rc, CMPI_RC_OK);
        EXPECT_EQ(associations->ft->cleanup(associations, context, 0).rc, CMPI_RC_OK);
        ASSERT_THAT(rig.words(), Contains(unloaded));

        CMPIStatus status;
        CMPIObjectPath* path = broker->eft->newObjectPath(broker, "root/norvane", "NVRHBA_FCPort", &status);
        EXPECT_EQ(instances->ft->enumerateInstances(instances, context, nullptr, path, nullptr).rc, CMPI_RC_ERR_FAILED);
        EXPECT_EQ(instances->ft->enumerateInstanceNames(instances, context, nullptr, path).rc, CMPI_RC_ERR_FAILED);
        EXPECT_EQ(instances->ft->getInstance(instances, context, nullptr, path, nullptr).rc, CMPI_RC_ERR_FAILED);
        EXPECT_EQ(instances->ft->deleteInstance(instances, context, nullptr, path).rc, CMPI_RC_ERR_FAILED);
        EXPECT_EQ(methods->ft->invokeMethod(methods, context, nullptr, path, "Reset", nullptr, nullptr).rc,
                  CMPI_RC_ERR_FAILED);
        EXPECT_EQ(associations->ft->referenceNames(associations, context, nullptr, path, nullptr, nullptr).rc,
                  CMPI_RC_ERR_FAILED);
        EXPECT_EQ(instances->ft->cleanup(instances, context, 0).rc, CMPI_RC_OK);
        EXPECT_EQ(instances->ft->cleanup(instances, context, 1).rc, CMPI_RC_OK);
        path->ft->release(path);
    });
    EXPECT_EQ(rig.count_words(unloaded), 1u);
}

TEST(Life, TheLastCleanupWaitsForARequest)
{
    Rig rig;
    Entries entries;
    const auto released = testing::StartsWith("ProviderAgent::releaseRef[");
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        CMPIInstanceMI* ports = entries.instances("NVRHBA_FCPort", broker, context);
        add_fault("call = \"HBA_GetNumberOfAdapters\", delay_ms = 300");
        host::Answer answer;
        std::thread request([&] { answer = rig.enumerate("NVRHBA_FCPort"); });
        while (calls("HBA_GetNumberOfAdapters") == 0)
            std::this_thread::yield();
        for (int of_ours_and_the_server = 0; of_ours_and_the_server < 5; of_ours_and_the_server++)
            EXPECT_EQ(ports->ft->cleanup(ports, context, 1).rc, CMPI_RC_OK);
        request.join();
        EXPECT_THAT(answer, succeeded());
        EXPECT_EQ(answer.instances.size(), 4u);
    });
    const std::vector<std::string> words = rig.words();
    const auto end = std::find(words.begin(), words.end(), "PERF: updateAdapterMaps: cleanExit");
    EXPECT_THAT(std::vector(words.begin(), end), Not(Contains(released)));
    EXPECT_THAT(std::vector(end, words.end()), Contains(released).Times(1));
    rig.stop();
    EXPECT_EQ(rig.count_words(unloaded), 1u);
    EXPECT_EQ(nvrsim_open_handles(), 0u);
}

class Lives : public Every_Manner {};
NVR_THREADS_IN_EVERY_MANNER(Lives);

TEST_P(Lives, TenRoundsInOneProcessLeaveNothingBehind)
{
    Rig rig({*GetParam()});
    [[maybe_unused]] std::size_t memory = 0;
    std::size_t files = 0, threads = 0;
    for (int round = 0; round < 10; round++) {
        rig.server().reset_report();
        const std::size_t elements = ask_all(rig) + ask_all(rig);
        EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
        // Beside what clients got, the module asks for profiles once a load, and ours have one such element each.
        EXPECT_LE(rig.server().report().of(host::Object_Kind::string).left, elements + 13);
        EXPECT_EQ(rig.server().report().clones_alive(), 0u);
        EXPECT_THAT(rig.server().report().violations, IsEmpty());
        rig.restart();
        EXPECT_EQ(nvrsim_open_handles(), 0u);
        if (round == 3) {
            memory = resident_kilobytes();
            files = open_files().size();
            threads = number_of_threads();
        }
    }
    rig.stop();
    EXPECT_EQ(rig.server().report().contexts_not_detached, 0u);
    EXPECT_LE(open_files().size(), files);
    EXPECT_TRUE(wait_for_threads(threads, std::chrono::seconds(20))) << number_of_threads() << " of " << threads;
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
    EXPECT_LE(resident_kilobytes(), memory + 2048);
#endif
}

TEST_P(Lives, AnIdleModuleIsUnloadedAndAnswersTheNextRequest)
{
    Rig rig({*GetParam()});
    ASSERT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
    for (int round = 0; round < 3; round++) {
        const host::Unload_Result result = rig.server().unload_idle();
        EXPECT_EQ(result.refused, 0);
        EXPECT_GE(result.cleanups, 1);
        for (const host::Status& status : result.statuses)
            EXPECT_TRUE(status.ok()) << status.message;
        EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
        EXPECT_EQ(rig.names("NVRHBA_Product").paths.size(), 4u);
    }
    const host::Unload_Result last = rig.server().stop();
    EXPECT_EQ(last.refused, 0);
}

TEST_P(Lives, FactoriesAndCleanupsWithoutAnyRequestTenTimes)
{
    Rig rig({*GetParam()});
    Entries entries;
    for (int round = 0; round < 10; round++) {
        rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
            CMPIInstanceMI* ports = entries.instances("NVRHBA_FCPort", broker, context);
            CMPIAssociationMI* ends = entries.associations("NVRHBA_Realizes", broker, context);
            ASSERT_TRUE(ports && ends);
            EXPECT_EQ(ends->ft->cleanup(ends, context, 1).rc, CMPI_RC_OK);
            EXPECT_EQ(ports->ft->cleanup(ports, context, 1).rc, CMPI_RC_OK);
        });
    }
    EXPECT_EQ(rig.count_words(unloaded), 10u);
    EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
    EXPECT_EQ(nvrsim_open_handles(), 0u);
}

TEST(Life, AnUnloadWritesTheSettingsInSixLines)
{
    Rig rig({host::Manner::strict(), "small", "# a comment that goes\nNVR_PROVIDER_CACHE_TIMEOUT = 20\n"});
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    EXPECT_EQ(read_file(conf_path), "# a comment that goes\nNVR_PROVIDER_CACHE_TIMEOUT = 20\n");
    rig.stop();
    EXPECT_EQ(read_file(conf_path), "##################################################\n"
                                    "# Norvane HBA CIM Provider Configuration Settings #\n"
                                    "##################################################\n"
                                    "NVR_PROVIDER_CACHE_TIMEOUT = 20\n"
                                    "NVR_PROVIDER_REFRESH_ADAPTERDATA = FALSE\n"
                                    "NVR_PROVIDER_REFRESH_SANDATA = TRUE\n");
}

TEST(Life, WhatAClientSetSurvivesTheUnload)
{
    Rig rig({host::Manner::strict(), "small"});
    host::Instance setting = rig.enumerate("NVRHBA_ProviderConfigSetting").instances.at(0);
    setting.set("current", host::Value::uint32(3));
    ASSERT_THAT(rig.server().modify(setting, std::vector<std::string>{"current"}), succeeded());
    rig.restart();
    EXPECT_EQ(rig.enumerate("NVRHBA_ProviderConfigSetting").instances.at(0).get("current").to_text(), "3");
    EXPECT_THAT(read_file(conf_path), testing::HasSubstr("NVR_PROVIDER_CACHE_TIMEOUT = 3\n"));
}

TEST(Life, AnUnloadWritesTheLogSettings)
{
    Rig rig({host::Manner::strict(), "small"});
    const std::string before = read_file(dmp_path);
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    remove(dmp_path);
    rig.stop();
    EXPECT_EQ(read_file(dmp_path), before);
}

TEST(Life, OneSemaphoreOfTheSessionOutlivesTheUnload)
{
    const std::string guard = "sem.NVR_RM_INIT_LIB_" + std::to_string(getpid());
    const std::string done = "sem.NVR_RM_INIT_LIB_DONE_" + std::to_string(getpid());
    Rig rig({host::Manner::strict(), "small"});
    EXPECT_THAT(shared_memory(), Not(Contains(guard)));
    ASSERT_THAT(rig.enumerate("NVRHBA_FCPort"), succeeded());
    EXPECT_THAT(shared_memory(), testing::UnorderedElementsAre(guard, done));
    rig.stop();
    EXPECT_THAT(shared_memory(), testing::ElementsAre(done));
}

TEST(Life, AStopWhileARefreshRunsWaitsForIt)
{
    Rig rig({host::Manner::strict(), "typical"}); // others stop without a clean-up
    add_fault("call = \"HBA_GetNumberOfAdapters\", delay_ms = 300");
    // The profiles come without waiting, and the settings' own question starts the thread.
    std::thread asks([&] { (void)rig.enumerate("NVRHBA_ProviderConfigSetting"); });
    while (calls("HBA_GetNumberOfAdapters") == 0)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    rig.stop();
    asks.join();
    EXPECT_THAT(rig.words(), contains_in_order({"PERF: DataFetch_Handler Thread END", unloaded}));
    EXPECT_EQ(nvrsim_open_handles(), 0u);
}
