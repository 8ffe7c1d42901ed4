#include "runtime/Thread.h"

#include <atomic>
#include <cerrno>
#include <gtest/gtest.h>
#include <memory>
#include <stdexcept>

#include "runtime/Immortal.h"
#include "runtime/Mutex.h"
#include "runtime/Thread_Context.h"
#include "runtime/Time.h"
#include "tests/runtime/Fake_Context.h"
#include "tests/runtime/System_Faults.h"

using namespace cimple;

namespace {

using Proc = Thread::Proc;

void* run_joined(Proc proc, void* arg)
{
    Thread thread;
    void* result = &thread;
    EXPECT_EQ(Thread::create_joinable(thread, proc, arg), 0);
    EXPECT_FALSE(thread.empty());
    EXPECT_EQ(Thread::join(thread, result), 0);
    EXPECT_TRUE(thread.empty()) << "a join empties the handle";
    return result;
}

void* return_top(void*)
{
    return Thread_Context::top();
}

class ThreadsUnderAContext : public ::testing::Test {
protected:
    ThreadsUnderAContext() : m_pushed(std::make_unique<Pushed>(context))
    {
        Fake_Context::started = 0;
        Fake_Context::exited = 0;
    }
    ~ThreadsUnderAContext() override
    {
        m_pushed.reset();
        EXPECT_EQ(Fake_Context::alive, 1) << "only the test's own context is left";
    }
    static void expect_attached_once()
    {
        EXPECT_EQ(Fake_Context::started, 1);
        EXPECT_EQ(Fake_Context::exited, 1);
        EXPECT_EQ(Fake_Context::alive, 1);
    }

    Fake_Context context;
    std::unique_ptr<Pushed> m_pushed;
};

} // namespace

TEST(ContextStack, PushAndPopLinkThroughPrev)
{
    EXPECT_EQ(Thread_Context::top(), nullptr);
    Fake_Context one;
    Fake_Context two;
    Thread_Context::push(&one);
    Thread_Context::push(&two);
    EXPECT_EQ(Thread_Context::top(), &two);
    EXPECT_EQ(two.prev, &one);
    EXPECT_EQ(pthread_getspecific(_thread_context_key), &two) << "the exported key is the one in use";
    Thread_Context::pop();
    EXPECT_EQ(Thread_Context::top(), &one);
    EXPECT_EQ(two.prev, nullptr);
    Thread_Context::pop();
    EXPECT_EQ(Thread_Context::top(), nullptr);
    Thread_Context::pop();
    EXPECT_EQ(Thread_Context::top(), nullptr);
}

TEST(ThreadsWithoutAContext, RunWithoutHooks)
{
    EXPECT_EQ(run_joined(return_top, nullptr), nullptr);
    EXPECT_EQ(Fake_Context::started, 0);
}

TEST(ThreadsWithoutAContext, GiveBackTheirResult)
{
    int value = 0;
    EXPECT_EQ(run_joined([](void* arg) { return arg; }, &value), &value);
    EXPECT_EQ(run_joined([](void* arg) -> void* { Thread::exit(arg); }, &value), &value);
}

TEST(ThreadsWithoutAContext, AnExceptionEndsTheThreadQuietly)
{
    EXPECT_EQ(run_joined([](void*) -> void* { throw std::runtime_error("nobody listens"); }, nullptr), nullptr);
}

TEST(ThreadsWithoutAContext, AnEmptyHandleCannotBeJoined)
{
    Thread thread;
    void* result = &thread;
    EXPECT_TRUE(thread.empty());
    EXPECT_EQ(Thread::join(thread, result), ESRCH);
    EXPECT_EQ(result, nullptr);
    EXPECT_TRUE(pthread_equal(Thread::self().id(), pthread_self()));
    Thread self = Thread::self();
    self.reset();
    EXPECT_TRUE(self.empty());
}

TEST_F(ThreadsUnderAContext, SeeOneOfTheirOwn)
{
    void* const seen = run_joined(return_top, nullptr);
    EXPECT_NE(seen, nullptr);
    EXPECT_NE(seen, &context);
    EXPECT_EQ(context.hooks_called, 1);
    expect_attached_once();
}

TEST_F(ThreadsUnderAContext, MayOutliveTheirCreatorsContext)
{
    static std::atomic<bool> go;
    go = false;
    auto creator = std::make_unique<Fake_Context>();
    Thread thread;
    {
        const Pushed hold(*creator);
        ASSERT_EQ(Thread::create_joinable(
                      thread,
                      [](void*) -> void* {
                          while (!go)
                              Time::sleep(1000);
                          return Thread_Context::top();
                      },
                      nullptr),
                  0);
    }
    creator.reset();
    go = true;
    void* result = nullptr;
    ASSERT_EQ(Thread::join(thread, result), 0);
    EXPECT_NE(result, nullptr);
    expect_attached_once();
}

TEST_F(ThreadsUnderAContext, MayGetNone)
{
    context.hook = Fake_Context::Hook::none;
    EXPECT_EQ(run_joined(return_top, nullptr), nullptr);
    EXPECT_EQ(Fake_Context::started, 0);
}

TEST_F(ThreadsUnderAContext, AreNotMadeWithoutOneThatTheyNeed)
{
    Thread thread;
    for (const auto hook : {Fake_Context::Hook::none, Fake_Context::Hook::no_memory}) {
        context.hook = hook;
        EXPECT_NE(Thread::create_attached(thread, return_top, nullptr), 0);
        EXPECT_TRUE(thread.empty());
    }
    context.hook = Fake_Context::Hook::child;
    ASSERT_EQ(Thread::create_attached(thread, return_top, nullptr), 0);
    void* top = nullptr;
    EXPECT_EQ(Thread::join(thread, top), 0);
    EXPECT_NE(top, nullptr);
    EXPECT_NE(top, &context);
}

TEST_F(ThreadsUnderAContext, PassItOnToTheirOwnThreads)
{
    EXPECT_NE(run_joined([](void*) { return run_joined(return_top, nullptr); }, nullptr), nullptr);
    EXPECT_EQ(Fake_Context::started, 2);
    EXPECT_EQ(Fake_Context::exited, 2);
}

TEST_F(ThreadsUnderAContext, AreDetachedOnceAfterExit)
{
    struct Guard {
        ~Guard() { EXPECT_EQ(Fake_Context::exited, 0) << "the stack is unwound under the context"; }
    };
    int value = 0;
    EXPECT_EQ(run_joined(
                  [](void* arg) -> void* {
                      const Guard guard;
                      Thread::exit(arg);
                  },
                  &value),
              &value);
    expect_attached_once();
}

TEST_F(ThreadsUnderAContext, AreDetachedOnceAfterExitUnderAnotherContext)
{
    run_joined(
        [](void*) -> void* {
            static Fake_Context nested;
            Thread_Context::push(&nested);
            Thread::exit(nullptr);
        },
        nullptr);
    EXPECT_EQ(Fake_Context::exited, 1);
    EXPECT_EQ(Fake_Context::alive--, 2) << "the nested one lives for ever";
}

TEST_F(ThreadsUnderAContext, AreDetachedOnceAfterCancellation)
{
    Thread thread;
    ASSERT_EQ(Thread::create_joinable(
                  thread,
                  [](void*) -> void* {
                      for (;;)
                          Time::sleep(1000);
                  },
                  nullptr),
              0);
    while (Fake_Context::started == 0)
        Time::sleep(1000);
    pthread_cancel(thread.id());
    void* result = nullptr;
    EXPECT_EQ(Thread::join(thread, result), 0);
    EXPECT_EQ(result, PTHREAD_CANCELED);
    expect_attached_once();
}

TEST_F(ThreadsUnderAContext, AreDetachedOnceAfterAnException)
{
    EXPECT_EQ(run_joined([](void*) -> void* { throw 1; }, nullptr), nullptr);
    expect_attached_once();
}

TEST_F(ThreadsUnderAContext, HooksThatThrowEndNothingButTheThread)
{
    context.start_throws = true;
    static std::atomic<bool> ran;
    ran = false;
    const Proc proc = [](void* arg) {
        ran = true;
        return arg;
    };
    int value = 0;
    EXPECT_EQ(run_joined(proc, &value), nullptr);
    EXPECT_FALSE(ran) << "a thread that could not be attached does not run";
    EXPECT_EQ(Fake_Context::exited, 0);
    EXPECT_EQ(Fake_Context::alive, 1);
    context.start_throws = false;
    context.exit_throws = true;
    EXPECT_EQ(run_joined(proc, &value), &value);
    expect_attached_once();
}

TEST_F(ThreadsUnderAContext, AHookThatThrowsDoesNotStopAnExit)
{
    context.exit_throws = true;
    int value = 0;
    EXPECT_EQ(run_joined([](void* arg) -> void* { Thread::exit(arg); }, &value), &value);
    expect_attached_once();
}

TEST_F(ThreadsUnderAContext, RunDetachedToTheirEnd)
{
    static std::atomic<int> arrived;
    arrived = 0;
    for (int i = 0; i < 4; ++i) {
        Thread thread;
        ASSERT_EQ(Thread::create_detached(
                      thread,
                      [](void*) -> void* {
                          ++arrived;
                          return nullptr;
                      },
                      nullptr),
                  0);
        EXPECT_FALSE(thread.empty());
    }
    while (arrived < 4 || Fake_Context::alive > 1)
        Time::sleep(1000);
    EXPECT_EQ(Fake_Context::exited, 4);
}

TEST_F(ThreadsUnderAContext, AFailedCreationLeavesNoContextBehind)
{
    const System_Fault fault(System_Fault::create_thread, EAGAIN);
    Thread thread = Thread::self();
    EXPECT_EQ(Thread::create_joinable(thread, return_top, nullptr), EAGAIN);
    EXPECT_TRUE(thread.empty());
    EXPECT_EQ(Thread::create_detached(thread, return_top, nullptr), EAGAIN);
    EXPECT_EQ(context.hooks_called, 2);
    EXPECT_EQ(Fake_Context::alive, 1);
    EXPECT_EQ(Fake_Context::started, 0);
}

TEST_F(ThreadsUnderAContext, AHookWithoutMemoryFailsTheCreation)
{
    context.hook = Fake_Context::Hook::no_memory;
    Thread thread;
    EXPECT_EQ(Thread::create_joinable(thread, return_top, nullptr), ENOMEM);
    EXPECT_TRUE(thread.empty());
}

TEST(ThreadExit, OnAForeignThreadCallsTheHookOfTheTopContext)
{
    Fake_Context::exited = 0;
    pthread_t thread;
    int value = 0;
    ASSERT_EQ(pthread_create(
                  &thread, nullptr,
                  [](void* arg) -> void* {
                      Fake_Context context;
                      const Pushed hold(context);
                      Thread::exit(arg);
                  },
                  &value),
              0);
    void* result = nullptr;
    ASSERT_EQ(pthread_join(thread, &result), 0);
    EXPECT_EQ(result, &value);
    EXPECT_EQ(Fake_Context::exited, 1);
}

TEST(ContextStackDeathTest, WithoutRoomForAValueNothingIsPushed)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_EXIT(
        {
            const System_Fault fault(System_Fault::create_key, EAGAIN);
            Fake_Context context;
            bool refused = false;
            try {
                Thread_Context::push(&context);
            } catch (const std::bad_alloc&) {
                refused = true;
            }
            Thread_Context::pop();
            std::exit(refused && !Thread_Context::top() && run_joined(return_top, nullptr) == nullptr ? 0 : 1);
        },
        ::testing::ExitedWithCode(0), "");
}

TEST_F(ThreadsUnderAContext, WithoutRoomForAValueAThreadRunsWithoutContext)
{
    Thread_Context::top();
    const System_Fault fault(System_Fault::set_value, ENOMEM);
    EXPECT_EQ(run_joined(return_top, nullptr), nullptr);
    EXPECT_EQ(Fake_Context::started, 0);
    EXPECT_EQ(Fake_Context::alive, 1) << "what was prepared for it is released";
}

TEST(ContextDeathTest, AContextLeftOnTheStackFailsAnAssertion)
{
    GTEST_FLAG_SET(death_test_style, "threadsafe");
    EXPECT_DEATH(run_joined(
                     [](void*) -> void* {
                         Thread_Context::push(new Fake_Context);
                         return nullptr;
                     },
                     nullptr),
                 "context == Thread_Context::top\\(\\)");
}

TEST(MutexLock, ARecursiveMutexMayBeTakenAgain)
{
    Mutex mutex(true, "a recursive one", Lock_Place::observed);
    mutex.lock();
    mutex.lock();
    EXPECT_EQ(mutex.try_lock(), 0);
    mutex.unlock();
    mutex.unlock();
    EXPECT_EQ(
        run_joined(
            [](void* arg) -> void* { return reinterpret_cast<void*>(intptr_t{static_cast<Mutex*>(arg)->try_lock()}); },
            &mutex),
        reinterpret_cast<void*>(intptr_t{EBUSY}));
    mutex.unlock();
}

TEST(MutexLock, APlainMutexMayNot)
{
    EXPECT_EQ(EBUSY, 16);
    Mutex mutex(false, "a plain one", Lock_Place::observed);
    EXPECT_EQ(mutex.try_lock(), 0);
    EXPECT_EQ(mutex.try_lock(), EBUSY);
    mutex.unlock();
    const Auto_Mutex hold(mutex);
    EXPECT_EQ(mutex.try_lock(), EBUSY);
}

TEST(MutexLock, OtherFailuresOfTryLockAreMinusOne)
{
    const System_Fault fault(System_Fault::try_lock, EINVAL);
    Mutex mutex{true, "one", Lock_Place::observed};
    EXPECT_EQ(mutex.try_lock(), -1);
}

TEST(MutexDeathTest, AFailingLockStopsTheProcess)
{
    EXPECT_DEATH(
        {
            const System_Fault fault(System_Fault::lock, EINVAL);
            Mutex mutex(true, "one", Lock_Place::observed);
            mutex.lock();
        },
        "pthread_mutex_lock\\(&\\(\\(MutexRep\\*\\)_rep\\)->mutex\\) == 0");
}

TEST(Condition, WaitersAreWokenOneByOneAndTogether)
{
    struct Shared {
        Mutex mutex{true, "one", Lock_Place::observed};
        Cond cond;
        int tokens = 0;
        int woken = 0;
    } shared;
    Thread threads[3];
    for (Thread& thread : threads)
        ASSERT_EQ(Thread::create_joinable(
                      thread,
                      [](void* arg) -> void* {
                          auto* all = static_cast<Shared*>(arg);
                          const Auto_Mutex hold(all->mutex);
                          while (all->tokens == 0)
                              all->cond.wait(all->mutex);
                          --all->tokens;
                          ++all->woken;
                          return nullptr;
                      },
                      &shared),
                  0);
    {
        const Auto_Mutex hold(shared.mutex);
        shared.tokens = 1;
        shared.cond.signal();
    }
    {
        const Auto_Mutex hold(shared.mutex);
        shared.tokens += 2;
        shared.cond.broadcast();
    }
    for (Thread& thread : threads) {
        void* result;
        ASSERT_EQ(Thread::join(thread, result), 0);
    }
    EXPECT_EQ(shared.woken, 3);
    EXPECT_EQ(shared.tokens, 0);
}

TEST(ImmortalObject, IsMadeOnceAndNeverDestroyed)
{
    struct Counted {
        explicit Counted(int* counter) : m_counter(counter) { ++*m_counter; }
        ~Counted() { *m_counter = -1; }
        int* m_counter;
    };
    int counter = 0;
    {
        Immortal<Counted> thing(&counter);
        EXPECT_EQ(thing->m_counter, &counter);
        EXPECT_EQ((*thing).m_counter, &counter);
    }
    EXPECT_EQ(counter, 1);
    static_assert(std::is_trivially_destructible_v<Immortal<Counted>>);
    static_assert(std::is_trivially_destructible_v<Mutex>);
}
