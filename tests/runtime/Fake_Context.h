/// A Thread_Context that notes its calls instead of asking a server.
///
/// The counters of all contexts of a process are shared and atomic, so that a test sees contexts come and go on other
/// threads; the rest belongs to the thread that uses the context.
#pragma once

#include <atomic>
#include <string>

#include "runtime/Thread_Context.h"

namespace cimple {

struct Instance_Enumerator_Rep {
    const Instance* model;
    int left;
};

class Fake_Context : public Thread_Context {
public:
    inline static std::atomic<int> alive{0};
    inline static std::atomic<int> started{0};
    inline static std::atomic<int> exited{0};

    Fake_Context() { ++alive; }
    ~Fake_Context() override { --alive; }

    /// What thread_create_hook does: a child by default.
    enum class Hook { child, none, no_memory } hook = Hook::child;
    std::atomic<int> hooks_called{0};
    bool start_throws = false;
    bool exit_throws = false;
    int to_enumerate = 0;
    int open_enumerations = 0;
    std::string calls;

    Thread_Context* thread_create_hook(void*) override
    {
        ++hooks_called;
        if (hook == Hook::no_memory) throw std::bad_alloc();
        if (hook == Hook::none) return nullptr;
        auto* child = new Fake_Context;
        child->start_throws = start_throws;
        child->exit_throws = exit_throws;
        return child;
    }
    void thread_start_hook() override
    {
        if (start_throws) throw 1;
        ++started;
    }
    void thread_exit_hook() override
    {
        ++exited;
        if (exit_throws) throw 1;
    }

    Instance_Enumerator_Rep* instance_enumerator_create(const char*, const Instance* model) override
    {
        if (!model) return nullptr;
        ++open_enumerations;
        return new Instance_Enumerator_Rep{model, to_enumerate};
    }
    void instance_enumerator_destroy(Instance_Enumerator_Rep* enumerator) override
    {
        --open_enumerations;
        delete enumerator;
    }
    bool instance_enumerator_more(Instance_Enumerator_Rep* enumerator) override { return enumerator->left > 0; }
    void instance_enumerator_next(Instance_Enumerator_Rep* enumerator) override { --enumerator->left; }
    Instance* instance_enumerator_get(Instance_Enumerator_Rep* enumerator) override
    {
        return enumerator->left > 0 ? clone(enumerator->model) : nullptr;
    }

    Instance* get_instance(const char*, const Instance* model) override
    {
        calls += "get_instance ";
        return clone(model);
    }
    int create_instance(const char*, const Instance*) override { return noted("create_instance ", 1); }
    int delete_instance(const char*, const Instance*) override { return noted("delete_instance ", 2); }
    int modify_instance(const char*, const Instance*) override { return noted("modify_instance ", 3); }
    int invoke_method(const char*, const Instance*, Instance*) override { return noted("invoke_method ", 4); }
    void allow_unload(bool flag) override { calls += flag ? "allow_unload:1 " : "allow_unload:0 "; }
    bool get_username(String& name) override
    {
        name = "somebody";
        return noted("get_username ", 1) == 1;
    }

private:
    int noted(const char* call, int result)
    {
        calls += call;
        return result;
    }
};

/// Makes a context the top one for a scope.
class Pushed {
public:
    explicit Pushed(Thread_Context& context) { Thread_Context::push(&context); }
    ~Pushed() { Thread_Context::pop(); }
    Pushed(const Pushed&) = delete;
    Pushed& operator=(const Pushed&) = delete;
};

} // namespace cimple
