// The life of an adapter: factories, clean-ups, what is thrown, what runs at the same time.
#include <cerrno>
#include <cstring>
#include <future>
#include <stdexcept>
#include <thread>

#include "runtime/Thread.h"
#include "runtime/cimom.h"
#include "tests/cmpi/Bridge_Test.h"

namespace cimple {
namespace {

using testing::ElementsAre;
using testing::IsSupersetOf;

class Adapter : public Bridge_Test {
public:
    CMPIrc names(CMPIInstanceMI* mi)
    {
        return mi->ft->enumerateInstanceNames(mi, context, result, broker.path(class_path())).rc;
    }
};

TEST_F(Adapter, OneAdapterStandsBehindAllKinds)
{
    auto* instance = instance_mi();
    auto* method = method_mi();
    auto* association = association_mi();
    auto* indication = indication_mi();
    EXPECT_EQ(provider.created, 1);
    EXPECT_EQ(provider.loaded, 1);
    EXPECT_EQ(tables.magic, 0x5DE2B131u);
    EXPECT_EQ(instance->hdl, &tables);
    EXPECT_EQ(instance->ft, &tables.instance_table);
    EXPECT_EQ(method->ft, &tables.method_table);
    EXPECT_EQ(association->ft, &tables.association_table);
    EXPECT_EQ(indication->ft, &tables.indication_table);
    EXPECT_EQ(instance->ft->ftVersion, 100);
    EXPECT_EQ(association->ft->miVersion, 100);
    EXPECT_STREQ(instance->ft->miName, "instanceTEST_Provider");
    EXPECT_STREQ(method->ft->miName, "methodTEST_Provider");
    EXPECT_STREQ(indication->ft->miName, "indicationTEST_Provider");
    EXPECT_STREQ(association->ft->miName, "associationTEST_Provider");
    EXPECT_EQ(tables.adapter->load_count, 4u);
}

TEST_F(Adapter, ASecondFactoryCallOfAKindGivesTheSameRecord)
{
    EXPECT_EQ(instance_mi(), instance_mi());
}

TEST_F(Adapter, AnUnknownKindLeavesTheResultAlone)
{
    int mine = 0;
    void* mi = &mine;
    EXPECT_EQ(cimple_cmpi_adapter('C', &tables, &provider, &broker.cmpi, context, "TEST_Provider", 'X', &mi), 0);
    EXPECT_EQ(mi, &mine);
    EXPECT_EQ(tables.adapter->load_count, 1u);
}

TEST_F(Adapter, OnlyTheLastCleanUpUnloads)
{
    for (char kind : {'I', 'M', 'A', 'N'})
        create(kind);
    for (int i = 0; i < 3; ++i)
        EXPECT_EQ(clean(), CMPI_RC_OK);
    EXPECT_EQ(tables.adapter->load_count, 1u);
    EXPECT_EQ(provider.unloaded, 0);
    EXPECT_EQ(clean(), CMPI_RC_OK);
    EXPECT_EQ(provider.unloaded, 1);
    EXPECT_EQ(provider.destroyed, 1);
    EXPECT_EQ(tables.adapter, nullptr);
    EXPECT_EQ(tables.magic, 0xDDDDDDDDu);
}

TEST_F(Adapter, EveryKindOfCleanUpCounts)
{
    auto* instance = instance_mi();
    auto* method = method_mi();
    auto* association = association_mi();
    auto* indication = indication_mi();
    EXPECT_EQ(instance->ft->cleanup(instance, context, 0).rc, CMPI_RC_OK);
    EXPECT_EQ(method->ft->cleanup(method, context, 0).rc, CMPI_RC_OK);
    EXPECT_EQ(association->ft->cleanup(association, context, 0).rc, CMPI_RC_OK);
    EXPECT_EQ(provider.unloaded, 0);
    EXPECT_EQ(indication->ft->cleanup(indication, context, 0).rc, CMPI_RC_OK);
    EXPECT_EQ(provider.unloaded, 1);
}

TEST_F(Adapter, AVetoHoldsUntilTheServerStops)
{
    create('I');
    provider.on[OP_ENUM_INSTANCES] = [](void**) {
        cimom::allow_unload(false);
        return 0;
    };
    EXPECT_EQ(names(instance_mi()), CMPI_RC_OK);
    EXPECT_EQ(clean(false), CMPI_RC_DO_NOT_UNLOAD);
    EXPECT_EQ(tables.adapter->load_count, 2u);
    EXPECT_EQ(clean(true), CMPI_RC_OK);
    EXPECT_EQ(clean(true), CMPI_RC_OK);
    EXPECT_EQ(provider.unloaded, 1);
}

TEST_F(Adapter, AFactoryAfterTheLastCleanUpStartsAnew)
{
    for (int round = 1; round <= 10; ++round) {
        auto* mi = instance_mi();
        EXPECT_EQ(tables.magic, 0x5DE2B131u);
        EXPECT_EQ(names(mi), CMPI_RC_OK);
        EXPECT_EQ(clean(), CMPI_RC_OK);
        EXPECT_EQ(provider.created, round);
        EXPECT_EQ(provider.loaded, round);
        EXPECT_EQ(provider.unloaded, round);
        EXPECT_EQ(provider.destroyed, round);
    }
}

TEST_F(Adapter, ACallAfterTheLastCleanUpIsAnsweredPolitely)
{
    auto* instance = instance_mi();
    auto* method = method_mi();
    auto* indication = indication_mi();
    auto* association = association_mi();
    for (int i = 0; i < 4; ++i)
        clean();
    CMPIObjectPath* path = broker.path(class_path());
    EXPECT_EQ(names(instance), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(instance->ft->enumerateInstances(instance, context, result, path, nullptr).rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(method->ft->invokeMethod(method, context, result, path, "Echo", broker.args(), broker.args()).rc,
              CMPI_RC_ERR_FAILED);
    EXPECT_EQ(association->ft->references(association, context, result, path, nullptr, nullptr, nullptr).rc,
              CMPI_RC_ERR_FAILED);
    EXPECT_EQ(indication->ft->enableIndications(indication, context).rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(indication->ft->activateFilter(indication, context, nullptr, "", path, 1).rc, CMPI_RC_ERR_FAILED);
    EXPECT_EQ(clean(), CMPI_RC_OK);
    EXPECT_EQ(provider.unloaded, 1);
    EXPECT_EQ(provider.calls(OP_ENUM_INSTANCES), 0);
}

TEST_F(Adapter, ALongProviderNameIsCutWithItsTerminator)
{
    const std::string name(250, 'p');
    void* mi = nullptr;
    cimple_cmpi_adapter('C', &tables, &provider, &broker.cmpi, context, name.c_str(), 'A', &mi);
    const char* mi_name = static_cast<CMPIAssociationMI*>(mi)->ft->miName;
    EXPECT_EQ(std::strlen(mi_name), 255u);
    EXPECT_EQ(mi_name, "association" + std::string(244, 'p'));
}

TEST_F(Adapter, TheProvidersNameIsCopied)
{
    char name[] = "Temporary";
    void* mi = nullptr;
    cimple_cmpi_adapter('C', &tables, &provider, &broker.cmpi, context, name, 'I', &mi);
    std::strcpy(name, "Gone");
    EXPECT_STREQ(static_cast<CMPIInstanceMI*>(mi)->ft->miName, "instanceTemporary");
}

TEST_F(Adapter, LoadRunsWithAThreadContext)
{
    bool has_context = false, has_name = false;
    String name;
    provider.on[OP_LOAD] = [&](void**) {
        has_context = Thread_Context::top() != nullptr;
        has_name = cimom::get_username(name);
        return 0;
    };
    create('I');
    EXPECT_TRUE(has_context);
    EXPECT_TRUE(has_name);
    EXPECT_STREQ(name.c_str(), "tester");
    EXPECT_EQ(Thread_Context::top(), nullptr);
}

TEST_F(Adapter, ARefusedLoadIsNotLookedAt)
{
    provider.on[OP_LOAD] = [](void**) { return LOAD_FAILED; };
    EXPECT_NE(create('I'), nullptr);
    clean();
    EXPECT_EQ(provider.unloaded, 1);
}

TEST_F(Adapter, LoadFindsTheServersErrno)
{
    int seen = 0;
    provider.on[OP_CREATE_PROVIDER] = [&](void** words) {
        *static_cast<void**>(words[0]) = nullptr;
        ++provider.created;
        errno = EBADF;
        return 0;
    };
    provider.on[OP_LOAD] = [&](void**) {
        seen = errno;
        return 0;
    };
    errno = ENOTTY;
    create('I');
    EXPECT_EQ(seen, ENOTTY);
}

TEST_F(Adapter, WhatAnOperationThrowsBecomesAFailure)
{
    auto* mi = instance_mi();
    provider.on[OP_ENUM_INSTANCES] = [](void**) -> int { throw std::runtime_error("provider"); };
    EXPECT_EQ(names(mi), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(Thread_Context::top(), nullptr);
    provider.on.clear();
    EXPECT_EQ(names(mi), CMPI_RC_OK); // the lock was given back
}

TEST_F(Adapter, WhatLoadThrowsLeavesNothingBehind)
{
    provider.on[OP_LOAD] = [](void**) -> int { throw 42; };
    int mine = 0;
    void* mi = &mine;
    EXPECT_EQ(cimple_cmpi_adapter('C', &tables, &provider, &broker.cmpi, context, "TEST_Provider", 'I', &mi), 0);
    EXPECT_EQ(mi, nullptr);
    EXPECT_EQ(tables.adapter, nullptr);
    EXPECT_EQ(provider.destroyed, 1);
    EXPECT_EQ(Thread_Context::top(), nullptr);
    provider.on.clear();
    EXPECT_NE(create('I'), nullptr);
}

TEST_F(Adapter, WhatTheProvidersConstructorThrowsLeavesNothingBehind)
{
    provider.on[OP_CREATE_PROVIDER] = [](void**) -> int { throw std::bad_alloc(); };
    void* mi = &mi;
    cimple_cmpi_adapter('C', &tables, &provider, &broker.cmpi, context, "TEST_Provider", 'I', &mi);
    EXPECT_EQ(mi, nullptr);
    EXPECT_EQ(tables.adapter, nullptr);
    EXPECT_EQ(provider.calls(OP_DESTROY_PROVIDER), 0);
}

TEST_F(Adapter, WhatUnloadThrowsStillEndsTheProvider)
{
    create('I');
    provider.on[OP_UNLOAD] = [](void**) -> int { throw 1; };
    EXPECT_EQ(clean(), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(provider.destroyed, 1);
    EXPECT_EQ(tables.adapter, nullptr);
}

TEST_F(Adapter, ACancelledThreadUnwindsThroughAnOperation)
{
    auto* mi = instance_mi();
    provider.on[OP_ENUM_INSTANCES] = [](void**) -> int { pthread_exit(nullptr); };
    std::atomic<bool> came_back{false};
    struct Call {
        Adapter* test;
        CMPIInstanceMI* mi;
        std::atomic<bool>* came_back;
    } call{this, mi, &came_back};
    pthread_t thread;
    pthread_create(
        &thread, nullptr,
        [](void* data) -> void* {
            auto& call = *static_cast<Call*>(data);
            call.test->names(call.mi);
            *call.came_back = true;
            return nullptr;
        },
        &call);
    pthread_join(thread, nullptr);
    EXPECT_FALSE(came_back);
    provider.on.clear();
    EXPECT_EQ(names(mi), CMPI_RC_OK); // the lock was given back
}

TEST_F(Adapter, OneRequestAtATime)
{
    auto* mi = instance_mi();
    std::atomic<int> inside{0}, most{0};
    provider.on[OP_ENUM_INSTANCES] = [&](void**) {
        most = std::max(most.load(), ++inside);
        std::this_thread::sleep_for(std::chrono::milliseconds(2));
        --inside;
        return 0;
    };
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back([&] { names(mi); });
    for (auto& thread : threads)
        thread.join();
    EXPECT_EQ(most, 1);
    EXPECT_EQ(provider.calls(OP_ENUM_INSTANCES), 4);
}

TEST_F(Adapter, ARequestMayComeBackOnTheSameThread)
{
    auto* mi = instance_mi();
    int depth = 0;
    CMPIrc inner = CMPI_RC_ERROR;
    provider.on[OP_ENUM_INSTANCES] = [&](void**) {
        if (++depth == 1) inner = names(mi);
        return 0;
    };
    EXPECT_EQ(names(mi), CMPI_RC_OK);
    EXPECT_EQ(inner, CMPI_RC_OK);
}

TEST_F(Adapter, TheProviderOutlivesACleanUpWhileARequestRuns)
{
    auto* mi = instance_mi();
    std::promise<void> started, go;
    provider.on[OP_ENUM_INSTANCES] = [&](void** words) {
        started.set_value();
        go.get_future().wait();
        *static_cast<int*>(words[0]) = 1; // the provider object must still be there
        return 0;
    };
    std::thread request([&] { EXPECT_EQ(names(mi), CMPI_RC_OK); });
    started.get_future().wait();
    std::thread last([&] { EXPECT_EQ(clean(), CMPI_RC_OK); });
    const auto in_table = [&] {
        Auto_Mutex locked(tables.mutex);
        return tables.adapter != nullptr;
    };
    while (in_table())
        std::this_thread::yield();
    create('I'); // a new one, beside the old
    EXPECT_EQ(provider.created, 2);
    EXPECT_EQ(provider.unloaded, 0); // under the request that runs in it
    EXPECT_EQ(provider.destroyed, 0);
    go.set_value();
    request.join();
    last.join();
    EXPECT_EQ(provider.unloaded, 1);
    EXPECT_EQ(provider.destroyed, 1);
    EXPECT_EQ(tables.magic, 0x5DE2B131u);
}

TEST_F(Adapter, TheProviderOutlivesACleanUpWhileAThreadOfItsRuns)
{
    std::promise<void> go, ended;
    struct Work {
        std::promise<void>*go, *ended;
    } work{&go, &ended};
    provider.on[OP_LOAD] = [&](void**) {
        Thread thread;
        return Thread::create_detached(
            thread,
            [](void* data) -> void* {
                auto& work = *static_cast<Work*>(data);
                work.go->get_future().wait();
                cimom::allow_unload(true); // writes to the adapter
                work.ended->set_value();
                return nullptr;
            },
            &work);
    };
    create('I');
    EXPECT_EQ(clean(), CMPI_RC_OK);
    EXPECT_EQ(provider.unloaded, 1);
    EXPECT_EQ(provider.destroyed, 0);
    go.set_value();
    ended.get_future().wait();
    for (int i = 0; i < 1000 && provider.destroyed == 0; ++i)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    EXPECT_EQ(provider.destroyed, 1);
    EXPECT_EQ(broker.detached, 1);
}

TEST_F(Adapter, FactoriesCallsAndCleanUpsMayComeFromAnyThread)
{
    provider.instances = [] { return std::vector<Instance*>{new_thing("a", 1)}; };
    auto* kept = instance_mi();
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i)
        threads.emplace_back([&] {
            for (int round = 0; round < 100; ++round) {
                void* made = nullptr;
                cimple_cmpi_adapter('C', &tables, &provider, &broker.cmpi, context, "TEST_Provider", 'I', &made);
                EXPECT_EQ(made, kept);
                auto* mi = static_cast<CMPIInstanceMI*>(made);
                CMPIResult* mine = broker.result();
                mi->ft->enumerateInstanceNames(mi, context, mine, broker.path(class_path()));
                EXPECT_EQ(mi->ft->cleanup(mi, context, 0).rc, CMPI_RC_OK);
            }
        });
    EXPECT_EQ(clean(), CMPI_RC_OK); // from now on each thread may be the last
    for (auto& thread : threads)
        thread.join();
    EXPECT_EQ(tables.adapter, nullptr);
    EXPECT_EQ(provider.loaded, provider.unloaded);
}

TEST_F(Adapter, TheLogTellsTheLifeOfAnAdapter)
{
    Runtime_Log log;
    create('I');
    create('N');
    auto* indication = &tables.indication_mi;
    indication->ft->cleanup(indication, context, 0);
    clean();
    EXPECT_THAT(log.lines(), ElementsAre("DBG enter: CMPI_Adapter()", "DBG return: CMPI_Adapter()",
                                         "DBG enter: cimple_cmpi_adapter()", "DBG return: cimple_cmpi_adapter()",
                                         "DBG enter: cimple_cmpi_adapter()", "DBG return: cimple_cmpi_adapter()",
                                         "DBG enter: indicationCleanup()", "DBG enter: cleanup()",
                                         "DBG return: cleanup decrement(): CMPI_RC_OK", "DBG enter: cleanup()",
                                         "DBG return: cleanup unload(): CMPI_RC_OK", "DBG enter: ~CMPI_Adapter()",
                                         "DBG return: ~CMPI_Adapter()"));
}

TEST_F(Adapter, AnAdapterThatWasNeverBuiltHasNoEndInTheLog)
{
    Runtime_Log log;
    provider.on[OP_LOAD] = [](void**) -> int { throw 42; };
    create('I');
    EXPECT_EQ(provider.destroyed, 1);
    EXPECT_THAT(log.lines(), ElementsAre("DBG enter: CMPI_Adapter()"));
}

TEST_F(Adapter, TheLogNamesTheVeto)
{
    Runtime_Log log;
    create('I');
    tables.adapter->allow_unload = false;
    clean(false);
    EXPECT_TRUE(log.has("DBG return: cleanup do not unload(): CMPI_RC_DO_NOT_UNLOAD"));
}

} // namespace
} // namespace cimple
