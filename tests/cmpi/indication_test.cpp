// Filters, and indications that a provider raises from a thread of its own.
#include <thread>

#include "cmpi/indication.h"
#include "runtime/Thread.h"
#include "tests/cmpi/Bridge_Test.h"

namespace cimple {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

class Indications : public Bridge_Test {
protected:
    Indications() : Bridge_Test(&TEST_Event::meta)
    {
        provider.on[OP_ENABLE_INDICATIONS] = [this](void** words) {
            handler = {reinterpret_cast<Indication_Handler_Proc>(words[1]), words[2]};
            return enable_status;
        };
        provider.on[OP_DISABLE_INDICATIONS] = [this](void**) { return disable_status; };
    }

    CMPIrc activate(const char* name_space)
    {
        return mi->ft->activateFilter(mi, context, nullptr, "", broker.path({name_space, "TEST_Event", {}}), 1).rc;
    }
    CMPIrc deactivate(const char* name_space)
    {
        return mi->ft->deActivateFilter(mi, context, nullptr, "", broker.path({name_space, "TEST_Event", {}}), 1).rc;
    }
    CMPIrc enable() { return mi->ft->enableIndications(mi, context).rc; }
    CMPIrc disable() { return mi->ft->disableIndications(mi, context).rc; }

    /// Raises one on this thread, as a thread of the provider's would.
    bool raise(const char* text)
    {
        auto* event = create_as<TEST_Event>();
        event->Text.set(String(text));
        bool answer = false;
        with_context([&] { answer = handler.handle(event); });
        return answer;
    }

    /// Runs `body` with a thread context: inside a disable that the provider answers. Enables again.
    void with_context(std::function<void()> body)
    {
        provider.on[OP_DISABLE_INDICATIONS] = [this, body](void**) {
            body();
            return disable_status;
        };
        disable();
        provider.on[OP_DISABLE_INDICATIONS] = [this](void**) { return disable_status; };
        enable();
    }

    std::vector<std::string> delivered()
    {
        std::vector<std::string> texts;
        for (const auto& [name_space, instance] : broker.deliveries)
            texts.push_back(name_space + " " + fake::find(instance.properties, "Text").text);
        broker.deliveries.clear();
        return texts;
    }

    CMPIIndicationMI* mi = indication_mi();
    Indication_Handler handler{};
    int enable_status = 0;
    int disable_status = 0;
};

TEST_F(Indications, OnePerNamespaceWithAFilter)
{
    enable();
    EXPECT_TRUE(raise("nobody"));
    EXPECT_THAT(delivered(), IsEmpty());
    EXPECT_EQ(activate("root/a"), CMPI_RC_OK);
    EXPECT_EQ(activate("root/a"), CMPI_RC_OK);
    EXPECT_EQ(activate("root/b"), CMPI_RC_OK);
    EXPECT_TRUE(raise("both"));
    EXPECT_THAT(delivered(), ElementsAre("root/a both", "root/b both"));
    deactivate("root/a");
    raise("still");
    EXPECT_THAT(delivered(), SizeIs(2));
    deactivate("root/a");
    raise("one");
    EXPECT_THAT(delivered(), ElementsAre("root/b one"));
    EXPECT_EQ(deactivate("root/a"), CMPI_RC_OK); // unknown by now
    EXPECT_EQ(deactivate("root/c"), CMPI_RC_OK);
}

TEST_F(Indications, NullStopsAndDeliversNothing)
{
    enable();
    activate("root/a");
    with_context([this] { EXPECT_FALSE(handler.handle(nullptr)); });
    EXPECT_THAT(delivered(), IsEmpty());
}

TEST_F(Indications, ASecondEnableDoesNotReachTheProvider)
{
    EXPECT_EQ(enable(), CMPI_RC_OK);
    EXPECT_EQ(enable(), CMPI_RC_OK);
    EXPECT_EQ(provider.calls(OP_ENABLE_INDICATIONS), 1);
    EXPECT_EQ(disable(), CMPI_RC_OK);
    EXPECT_EQ(disable(), CMPI_RC_OK);
    EXPECT_EQ(provider.calls(OP_DISABLE_INDICATIONS), 1);
}

TEST_F(Indications, Statuses)
{
    enable_status = 140;
    EXPECT_EQ(enable(), CMPI_RC_ERR_FAILED);
    EXPECT_EQ(enable(), CMPI_RC_OK); // enabled all the same
    disable_status = 150;
    EXPECT_EQ(disable(), CMPI_RC_ERR_FAILED);
    enable_status = disable_status = 4711;
    EXPECT_EQ(enable(), CMPI_RC_OK);
    EXPECT_EQ(disable(), CMPI_RC_OK);
}

TEST_F(Indications, FiltersAreAlwaysWelcome)
{
    EXPECT_EQ(mi->ft->authorizeFilter(mi, context, nullptr, "", broker.path(class_path()), "").rc, CMPI_RC_OK);
    EXPECT_EQ(mi->ft->mustPoll(mi, context, nullptr, "", broker.path(class_path())).rc, CMPI_RC_OK);
}

TEST_F(Indications, AFilterWithoutANamespaceCountsAsTheEmptyOne)
{
    EXPECT_EQ(mi->ft->activateFilter(mi, context, nullptr, nullptr, nullptr, 1).rc, CMPI_RC_OK);
    EXPECT_THAT(tables.adapter->filters, SizeIs(1));
    EXPECT_EQ(mi->ft->deActivateFilter(mi, context, nullptr, nullptr, nullptr, 1).rc, CMPI_RC_OK);
    EXPECT_THAT(tables.adapter->filters, SizeIs(0));
}

TEST_F(Indications, AConversionThatFailsPassesOverItsNamespace)
{
    enable();
    activate("root/a");
    auto make = broker.eft.newInstance;
    broker.eft.newInstance = nullptr;
    EXPECT_TRUE(raise("lost"));
    broker.eft.newInstance = make;
    EXPECT_THAT(delivered(), IsEmpty());
    EXPECT_TRUE(raise("kept"));
    EXPECT_THAT(delivered(), SizeIs(1));
}

class IndicationLog : public Runtime_Log, public Indications {};

TEST_F(IndicationLog, NamesEachOperation)
{
    const std::size_t before = lines().size();
    CMPIObjectPath* path = broker.path(class_path());
    mi->ft->authorizeFilter(mi, context, nullptr, "", path, "");
    mi->ft->mustPoll(mi, context, nullptr, "", path);
    activate("root/a");
    deactivate("root/a");
    enable_status = 140;
    enable();
    enable();
    disable();
    auto all = lines();
    all.erase(all.begin(), all.begin() + static_cast<std::ptrdiff_t>(before));
    EXPECT_THAT(all,
                ElementsAre("DBG enter: authorizeFilter()", "DBG return: authorizeFilter(): CMPI_RC_OK",
                            "DBG enter: mustPoll()", "DBG return: mustPoll(): CMPI_RC_OK",
                            "DBG enter: activateFilter()", "DBG return: activateFilter(): CMPI_RC_OK",
                            "DBG enter: deActivateFilter()", "DBG return: deActivateFilter(): CMPI_RC_OK",
                            "DBG enter: enableIndications()", "DBG return: enableIndications(): CMPI_RC_ERR_FAILED",
                            "DBG enter: enableIndications()", "DBG return: enableIndications(): CMPI_RC_OK",
                            "DBG enter: disableIndications()", "DBG return: disableIndications(): CMPI_RC_OK"));
}

// The provider's thread, as its enable starts it and its disable ends it.
struct Worker {
    Indication_Handler handler;
    std::atomic<bool> stop{false};
    std::atomic<int> raised{0};
    Thread thread;

    static void* run(void* data)
    {
        auto& worker = *static_cast<Worker*>(data);
        while (!worker.stop) {
            auto* event = create_as<TEST_Event>();
            event->Text.set(String("tick"));
            worker.handler.handle(event);
            ++worker.raised;
            std::this_thread::yield();
        }
        return nullptr;
    }
};

TEST_F(Indications, ADisableMayWaitForTheThreadThatDelivers)
{
    Worker worker;
    provider.on[OP_ENABLE_INDICATIONS] = [&](void** words) {
        worker.handler = {reinterpret_cast<Indication_Handler_Proc>(words[1]), words[2]};
        return Thread::create_joinable(worker.thread, Worker::run, &worker) == 0 ? 0 : 140;
    };
    provider.on[OP_DISABLE_INDICATIONS] = [&](void**) {
        worker.stop = true;
        void* ignored = nullptr;
        return Thread::join(worker.thread, ignored) == 0 ? 0 : 150;
    };
    activate("root/a");
    ASSERT_EQ(enable(), CMPI_RC_OK);
    while (worker.raised < 20) { // filters come and go meanwhile
        activate("root/b");
        deactivate("root/b");
    }
    EXPECT_EQ(disable(), CMPI_RC_OK);
    EXPECT_GE(delivered().size(), 20u);
    EXPECT_EQ(broker.attached, 1);
    EXPECT_EQ(broker.detached, 1);
}

TEST_F(Indications, ADeliveryMayWaitForARequestToTheSameProvider)
{
    enable();
    activate("root/a");
    broker.on_up_call = [&](const std::string& name) {
        if (name != "deliverIndication") return;
        // The server asks this provider while it takes the indication.
        std::thread asks([this] { EXPECT_EQ(activate("root/b"), CMPI_RC_OK); });
        asks.join();
    };
    Worker one;
    one.handler = handler;
    struct Deliver {
        static void* run(void* data)
        {
            static_cast<Worker*>(data)->handler.handle(create_as<TEST_Event>());
            return nullptr;
        }
    };
    provider.on[OP_DISABLE_INDICATIONS] = [&](void**) {
        return Thread::create_joinable(one.thread, Deliver::run, &one);
    };
    disable();
    void* ignored = nullptr;
    ASSERT_EQ(Thread::join(one.thread, ignored), 0);
    EXPECT_THAT(broker.deliveries, SizeIs(1));
}

TEST_F(Indications, AThreadWithoutAContextEndsTheProcess)
{
    enable();
    activate("root/a");
    EXPECT_DEATH(handler.handle(create_as<TEST_Event>()), "thread_context != 0");
}

} // namespace
} // namespace cimple
