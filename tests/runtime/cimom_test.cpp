#include "runtime/cimom.h"

#include <csignal>
#include <gtest/gtest.h>
#include <unistd.h>

#include "tests/runtime/Fake_Context.h"
#include "tests/runtime/Test_Classes.h"

using namespace cimple;

TEST(UpCalls, WithoutAContextEachFailsPolitely)
{
    ASSERT_EQ(Thread_Context::top(), nullptr);
    const Ref<Test_Base> model(make_keyed("model", 1));
    Instance_Enumerator enumerator;
    EXPECT_EQ(cimom::enum_instances("root/x", model.get(), enumerator), -1);
    EXPECT_FALSE(enumerator.more());
    enumerator.next();
    EXPECT_FALSE(enumerator.get());
    EXPECT_EQ(cimom::get_instance("root/x", model.get()), nullptr);
    EXPECT_EQ(cimom::create_instance("root/x", model.get()), -1);
    EXPECT_EQ(cimom::delete_instance("root/x", model.get()), -1);
    EXPECT_EQ(cimom::modify_instance("root/x", model.get()), -1);
    EXPECT_EQ(cimom::invoke_method("root/x", model.get(), nullptr), -1);
    cimom::allow_unload(true);
    String name("unchanged");
    EXPECT_FALSE(cimom::get_username(name));
    EXPECT_STREQ(name.c_str(), "unchanged");
}

TEST(UpCalls, GoToTheTopContext)
{
    Fake_Context below;
    Fake_Context context;
    const Pushed hold_below(below);
    const Pushed hold(context);
    const Ref<Test_Base> model(make_keyed("model", 1));
    const Ref<Instance> got(cimom::get_instance("root/x", model.get()));
    EXPECT_TRUE(identical(got.get(), model.get()));
    EXPECT_EQ(cimom::create_instance("root/x", model.get()), 1);
    EXPECT_EQ(cimom::delete_instance("root/x", model.get()), 2);
    EXPECT_EQ(cimom::modify_instance("root/x", model.get()), 3);
    EXPECT_EQ(cimom::invoke_method("root/x", model.get(), nullptr), 4);
    cimom::allow_unload(true);
    String name;
    EXPECT_TRUE(cimom::get_username(name));
    EXPECT_STREQ(name.c_str(), "somebody");
    EXPECT_EQ(context.calls, "get_instance create_instance delete_instance modify_instance invoke_method "
                             "allow_unload:1 get_username ");
    EXPECT_EQ(below.calls, "");
}

TEST(UpCalls, AnEnumerationIsWalkedAndGivenBack)
{
    Fake_Context context;
    const Pushed hold(context);
    const Ref<Test_Base> model(make_keyed("model", 1));
    context.to_enumerate = 3;
    {
        Instance_Enumerator enumerator;
        ASSERT_EQ(cimom::enum_instances("root/x", model.get(), enumerator), 0);
        int seen = 0;
        for (; enumerator.more(); enumerator.next()) {
            const Ref<Instance> one = enumerator.get();
            ASSERT_TRUE(one);
            EXPECT_TRUE(key_eq(one.get(), model.get()));
            ++seen;
        }
        EXPECT_EQ(seen, 3);
        EXPECT_FALSE(enumerator.get());
        EXPECT_EQ(context.open_enumerations, 1);
    }
    EXPECT_EQ(context.open_enumerations, 0);
}

TEST(UpCalls, AnEmptyEnumerationHasNoMore)
{
    Fake_Context context;
    const Pushed hold(context);
    const Ref<Test_Base> model(make_keyed("model", 1));
    Instance_Enumerator enumerator;
    EXPECT_EQ(cimom::enum_instances("root/x", model.get(), enumerator), 0);
    EXPECT_FALSE(enumerator.more());
}

TEST(UpCalls, ASecondEnumerationReleasesTheFirst)
{
    Fake_Context context;
    const Pushed hold(context);
    const Ref<Test_Base> model(make_keyed("model", 1));
    context.to_enumerate = 1;
    Instance_Enumerator enumerator;
    ASSERT_EQ(cimom::enum_instances("root/x", model.get(), enumerator), 0);
    ASSERT_EQ(cimom::enum_instances("root/x", model.get(), enumerator), 0);
    EXPECT_EQ(context.open_enumerations, 1);
    EXPECT_TRUE(enumerator.more());
    EXPECT_EQ(cimom::enum_instances("root/x", nullptr, enumerator), -1);
    EXPECT_EQ(context.open_enumerations, 0) << "also where no new one could be opened";
    EXPECT_FALSE(enumerator.more());
}

TEST(UpCallsDeathTest, TheArrayFormIsNotThere)
{
    Array<Instance*> some;
    auto& instances = reinterpret_cast<Array<Instance>&>(some); // nothing looks at it
    EXPECT_DEATH(cimom::enum_instances("root/x", nullptr, instances), "Assertion `false' failed");
    EXPECT_EXIT(
        {
            dup2(STDERR_FILENO, STDOUT_FILENO);
            cimom::enum_instances("root/x", nullptr, instances);
        },
        ::testing::KilledBySignal(SIGABRT), "NOT IMPLEMENTED\\.");
}
