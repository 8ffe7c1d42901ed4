// Up-calls, and the contexts of threads that the module starts.
#include "cmpi/CMPI_Thread_Context.h"
#include "runtime/Thread.h"
#include "runtime/cimom.h"
#include "tests/cmpi/Bridge_Test.h"

namespace cimple {
namespace {

using testing::ElementsAre;
using testing::SizeIs;

// Runs the test's body inside an operation, where a thread context is in place.
class UpCalls : public Bridge_Test {
protected:
    void inside(std::function<void()> body)
    {
        auto* mi = instance_mi();
        provider.on[OP_ENUM_INSTANCES] = [&](void**) {
            body();
            return 0;
        };
        EXPECT_EQ(mi->ft->enumerateInstanceNames(mi, context, result, broker.path(class_path())).rc, CMPI_RC_OK);
    }

    static fake::Instance part(const char* id, const char* label)
    {
        return {{"root/far", "FAR_Part", {{"Id", fake::string(id)}}},
                {{"Id", fake::string(id)}, {"Label", fake::string(label)}, {"Unknown", fake::uint8(1)}}};
    }
};

TEST_F(UpCalls, AnEnumerationIsReadIntoTheClassThatWasAskedFor)
{
    broker.found = {part("a", "first"), part("b", "second")};
    std::vector<std::string> labels, name_spaces;
    inside([&] {
        Ref<TEST_Part> model(create_as<TEST_Part>());
        Instance_Enumerator enumerator;
        ASSERT_EQ(cimom::enum_instances("root/far", model.get(), enumerator), 0);
        for (; enumerator.more(); enumerator.next()) {
            Ref<Instance> got = enumerator.get();
            ASSERT_EQ(got->meta_class, &TEST_Part::meta);
            labels.push_back(static_cast<TEST_Part*>(got.get())->Label.value.c_str());
            name_spaces.push_back(got->__name_space.c_str());
        }
        EXPECT_EQ(enumerator.get().get(), nullptr);
        EXPECT_EQ(broker.alive(fake::enumerations), 1);
    });
    EXPECT_THAT(labels, ElementsAre("first", "second"));
    EXPECT_THAT(name_spaces, ElementsAre("root/far", "root/far"));
    EXPECT_EQ(broker.alive(fake::enumerations), 0); // released through the broker
    ASSERT_THAT(broker.up_calls, SizeIs(1));
    EXPECT_EQ(broker.up_calls[0].path.class_name, "TEST_Part");
}

TEST_F(UpCalls, AnEmptyEnumerationIsBornWithoutMore)
{
    inside([&] {
        Ref<TEST_Part> model(create_as<TEST_Part>());
        Instance_Enumerator enumerator;
        EXPECT_EQ(cimom::enum_instances("root/far", model.get(), enumerator), 0);
        EXPECT_FALSE(enumerator.more());
        EXPECT_EQ(cimom::enum_instances("root/far", model.get(), enumerator), 0); // the first one goes
        EXPECT_EQ(broker.alive(fake::enumerations), 1);
    });
}

TEST_F(UpCalls, AnEnumerationThatCannotBeOpened)
{
    inside([&] {
        Ref<TEST_Part> model(create_as<TEST_Part>());
        Instance_Enumerator enumerator;
        EXPECT_EQ(cimom::enum_instances(nullptr, model.get(), enumerator), -1);
        EXPECT_EQ(cimom::enum_instances("root/far", nullptr, enumerator), -1);
        broker.answer = CMPI_RC_ERR_ACCESS_DENIED;
        EXPECT_EQ(cimom::enum_instances("root/far", model.get(), enumerator), -1);
        EXPECT_FALSE(enumerator.more());
    });
}

TEST_F(UpCalls, AnElementThatIsNoInstanceEndsTheEnumeration)
{
    broker.found = {part("a", "first")};
    broker.enumeration_ft.getNext = [](const CMPIEnumeration*, CMPIStatus* rc) {
        if (rc) rc->rc = CMPI_RC_OK;
        return CMPIData{CMPI_uint32, CMPI_goodValue, {}};
    };
    inside([&] {
        Ref<TEST_Part> model(create_as<TEST_Part>());
        Instance_Enumerator enumerator;
        EXPECT_EQ(cimom::enum_instances("root/far", model.get(), enumerator), 0);
        EXPECT_FALSE(enumerator.more());
    });
}

TEST_F(UpCalls, SingleInstances)
{
    inside([&] {
        Ref<TEST_Part> model(new_part("a"));
        model->Label.set(String("sent"));
        EXPECT_EQ(cimom::get_instance("root/far", model.get()), nullptr);
        broker.found = {part("a", "there")};
        Ref<Instance> got(cimom::get_instance("root/far", model.get()));
        ASSERT_TRUE(got);
        EXPECT_STREQ(static_cast<TEST_Part*>(got.get())->Label.value.c_str(), "there");
        EXPECT_EQ(cimom::create_instance("root/far", model.get()), 0);
        EXPECT_EQ(cimom::modify_instance("root/far", model.get()), 0);
        EXPECT_EQ(cimom::delete_instance("root/far", model.get()), 0);
        EXPECT_EQ(cimom::create_instance(nullptr, model.get()), -1);
        broker.answer = CMPI_RC_ERR_FAILED;
        EXPECT_EQ(cimom::create_instance("root/far", model.get()), -1);
        EXPECT_EQ(cimom::modify_instance("root/far", model.get()), -1);
        EXPECT_EQ(cimom::delete_instance("root/far", model.get()), -1);
    });
    ASSERT_GE(broker.up_calls.size(), 5u);
    EXPECT_EQ(fake::find(broker.up_calls[2].instance.properties, "Label").text, "sent");
    EXPECT_EQ(broker.up_calls[3].path.name_space, "root/far");
}

TEST_F(UpCalls, AMethodsResultsComeBackIntoItsRecord)
{
    broker.method_answer = fake::uint32(7);
    broker.method_out = {{"Reply", fake::string("pong")}, {"Text", fake::string("not an Out parameter")}};
    inside([&] {
        Ref<TEST_Thing> target(new_thing("t", 1));
        Ref<Instance> record(cimple::create(&TEST_Thing_Echo::meta, true));
        auto* call = static_cast<TEST_Thing_Echo*>(record.get());
        call->Text.set(String("ping"));
        EXPECT_EQ(cimom::invoke_method("root/test", target.get(), call), 0);
        EXPECT_STREQ(call->Reply.value.c_str(), "pong");
        EXPECT_EQ(call->return_value.value, 7u);
        EXPECT_EQ(call->return_value.null, 0);
        EXPECT_STREQ(call->__name_space.c_str(), "root/test");
    });
    ASSERT_THAT(broker.up_calls, SizeIs(1));
    EXPECT_EQ(broker.up_calls[0].method, "Echo");
    EXPECT_EQ(fake::find(broker.up_calls[0].in, "Text").text, "ping");
    EXPECT_EQ(fake::find(broker.up_calls[0].path.keys, "Name").text, "t");
}

TEST_F(UpCalls, AStaticMethodIsCalledOnItsClass)
{
    const Meta_Method& echo = TEST_Thing_Echo::meta;
    const Meta_Method still = {{{{0}, META_FLAG_METHOD | META_FLAG_STATIC, "Still", nullptr, 0},
                                echo.meta_features,
                                echo.num_meta_features,
                                echo.size},
                               UINT32};
    broker.method_answer = fake::uint32(7);
    inside([&] {
        Ref<TEST_Thing> target(new_thing("t", 1));
        Ref<Instance> call(cimple::create(&still, true));
        EXPECT_EQ(cimom::invoke_method("root/test", target.get(), call.get()), 0);
    });
    ASSERT_THAT(broker.up_calls, SizeIs(1));
    EXPECT_EQ(broker.up_calls[0].path.class_name, "TEST_Thing");
    EXPECT_THAT(broker.up_calls[0].path.keys, SizeIs(0));
}

TEST_F(UpCalls, AClassThatIsInNoRepositoryHasNoMethods)
{
    inside([&] {
        Ref<Instance> target(cimple::create(&Instance::meta, true));
        Ref<Instance> call(cimple::create(&TEST_Thing_Echo::meta, true));
        EXPECT_EQ(cimom::invoke_method("root/test", target.get(), call.get()), -1);
    });
    EXPECT_THAT(broker.up_calls, SizeIs(0));
}

TEST_F(UpCalls, FaultsOfAMethodCall)
{
    Runtime_Log log;
    inside([&] {
        Ref<TEST_Thing> target(new_thing("t", 1));
        Ref<Instance> call(cimple::create(&TEST_Thing_Echo::meta, true));
        EXPECT_EQ(cimom::invoke_method(nullptr, target.get(), call.get()), -1);
        EXPECT_EQ(cimom::invoke_method("root/test", nullptr, call.get()), -1);
        EXPECT_EQ(cimom::invoke_method("root/test", target.get(), nullptr), -1);
        broker.answer = CMPI_RC_ERR_METHOD_NOT_AVAILABLE;
        EXPECT_EQ(cimom::invoke_method("root/test", target.get(), call.get()), -1);
        broker.answer = CMPI_RC_OK;
        broker.method_answer = fake::string("of another type");
        EXPECT_EQ(cimom::invoke_method("root/test", target.get(), call.get()), -1);
    });
    EXPECT_TRUE(log.has("WARN failed"));
    EXPECT_TRUE(log.has("WARN failed[16]"));
}

TEST_F(UpCalls, TheUsersName)
{
    String name("old");
    inside([&] { EXPECT_TRUE(cimom::get_username(name)); });
    EXPECT_STREQ(name.c_str(), "tester");
}

TEST_F(UpCalls, AUserWithoutCharactersIsTheEmptyName)
{
    context = broker.context({{"CMPIPrincipal", fake::string_without_chars()}});
    String name("old");
    inside([&] { EXPECT_TRUE(cimom::get_username(name)); });
    EXPECT_STREQ(name.c_str(), "");
}

TEST_F(UpCalls, ARequestWithoutAUser)
{
    Runtime_Log log;
    context = broker.context({});
    String name("old");
    inside([&] { EXPECT_FALSE(cimom::get_username(name)); });
    EXPECT_STREQ(name.c_str(), "old");
    EXPECT_TRUE(log.has("WARN username not OK cmpirc=12"));
}

// --- Threads
// -----------------------------------------------------------------------------------------------------------

struct Child {
    bool has_context = false;
    bool is_its_own = false;
    int enumerated = -2;
    const Thread_Context* creator = nullptr;

    static void* run(void* data)
    {
        auto& child = *static_cast<Child*>(data);
        child.has_context = Thread_Context::top() != nullptr;
        child.is_its_own = Thread_Context::top() != child.creator;
        Ref<TEST_Part> model(create_as<TEST_Part>());
        Instance_Enumerator enumerator;
        child.enumerated = cimom::enum_instances("root/far", model.get(), enumerator);
        return nullptr;
    }

    int run_here()
    {
        creator = Thread_Context::top();
        Thread thread;
        if (int error = Thread::create_joinable(thread, run, this)) return error;
        void* result = nullptr;
        return Thread::join(thread, result);
    }
};

TEST_F(UpCalls, AThreadIsAttachedForItsLife)
{
    Child child;
    inside([&] { EXPECT_EQ(child.run_here(), 0); });
    EXPECT_TRUE(child.has_context);
    EXPECT_TRUE(child.is_its_own);
    EXPECT_EQ(child.enumerated, 0);
    EXPECT_EQ(broker.prepared, 1);
    EXPECT_EQ(broker.attached, 1);
    EXPECT_EQ(broker.detached, 1);
    EXPECT_EQ(broker.contexts_released, 0); // the server freed it with the detach
}

TEST_F(UpCalls, AThreadOfAThreadIsAttachedToo)
{
    struct Parent {
        Child child;
        static void* run(void* data)
        {
            static_cast<Parent*>(data)->child.run_here();
            return nullptr;
        }
    } parent;
    inside([&] {
        Thread thread;
        ASSERT_EQ(Thread::create_joinable(thread, Parent::run, &parent), 0);
        void* result = nullptr;
        Thread::join(thread, result);
    });
    EXPECT_EQ(parent.child.enumerated, 0);
    EXPECT_EQ(broker.prepared, 2);
    EXPECT_EQ(broker.detached, 2);
}

TEST_F(UpCalls, AServerThatPreparesNothingLeavesTheThreadWithoutAContext)
{
    broker.refuse_prepare = true;
    Child child;
    inside([&] { EXPECT_EQ(child.run_here(), 0); });
    EXPECT_FALSE(child.has_context);
    EXPECT_EQ(child.enumerated, -1);
    broker.bft.prepareAttachThread = nullptr;
    Child second;
    inside([&] { EXPECT_EQ(second.run_here(), 0); });
    EXPECT_FALSE(second.has_context);
}

TEST_F(UpCalls, ARequestWithoutAContextPreparesNone)
{
    context = nullptr;
    Child child;
    inside([&] { EXPECT_EQ(child.run_here(), 0); });
    EXPECT_EQ(broker.prepared, 0);
    EXPECT_FALSE(child.has_context);
}

TEST_F(UpCalls, AThreadThatCouldNotAttachReleasesItsContextItself)
{
    broker.refuse_attach = true;
    Child child;
    inside([&] { EXPECT_EQ(child.run_here(), 0); });
    EXPECT_EQ(broker.prepared, 1);
    EXPECT_EQ(broker.detached, 0);
    EXPECT_EQ(broker.contexts_released, 1);
}

TEST_F(UpCalls, AContextThatNoThreadTookIsReleased)
{
    inside([&] { delete Thread_Context::top()->thread_create_hook(nullptr); });
    EXPECT_EQ(broker.prepared, 1);
    EXPECT_EQ(broker.contexts_released, 1);
    EXPECT_EQ(broker.attached, 0);
}

TEST_F(UpCalls, AThreadThatExitsIsDetachedOnce)
{
    inside([&] {
        Thread thread;
        ASSERT_EQ(Thread::create_joinable(
                      thread, [](void*) -> void* { Thread::exit(nullptr); }, nullptr),
                  0);
        void* result = nullptr;
        Thread::join(thread, result);
    });
    EXPECT_EQ(broker.attached, 1);
    EXPECT_EQ(broker.detached, 1);
    EXPECT_EQ(broker.contexts_released, 0);
}

} // namespace
} // namespace cimple
