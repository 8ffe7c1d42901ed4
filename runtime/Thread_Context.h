/// What a thread needs to reach the CIM server: an abstract set of up-calls, kept as a stack per thread.
///
/// The bridge implements it over CMPI and pushes one for each request; `cimom` forwards to the top one. One context
/// belongs to one thread. The order of the virtual functions is fixed.
#pragma once

#include <pthread.h>

#include "runtime/Export.h"
#include "runtime/Instance.h"

namespace cimple {

/// An open enumeration of an up-call; what is behind it only the context knows.
struct Instance_Enumerator_Rep;

class Thread_Context {
public:
    Thread_Context* prev = nullptr;

    Thread_Context() = default;
    Thread_Context(const Thread_Context&) = delete;
    Thread_Context& operator=(const Thread_Context&) = delete;
    virtual ~Thread_Context() = default;

    /// A context for a thread that is about to be created from this one, owned by the caller; null: it gets none.
    virtual Thread_Context* thread_create_hook(void* arg) = 0;
    /// On the new thread, before and behind its procedure.
    virtual void thread_start_hook() = 0;
    virtual void thread_exit_hook() = 0;

    virtual Instance_Enumerator_Rep* instance_enumerator_create(const char* name_space, const Instance* model) = 0;
    virtual void instance_enumerator_destroy(Instance_Enumerator_Rep* enumerator) = 0;
    virtual bool instance_enumerator_more(Instance_Enumerator_Rep* enumerator) = 0;
    virtual void instance_enumerator_next(Instance_Enumerator_Rep* enumerator) = 0;
    /// The current instance with one more count for the caller, or null.
    virtual Instance* instance_enumerator_get(Instance_Enumerator_Rep* enumerator) = 0;

    virtual Instance* get_instance(const char* name_space, const Instance* model) = 0;
    virtual int create_instance(const char* name_space, const Instance* instance) = 0;
    virtual int delete_instance(const char* name_space, const Instance* instance) = 0;
    virtual int modify_instance(const char* name_space, const Instance* instance) = 0;
    virtual int invoke_method(const char* name_space, const Instance* instance, Instance* method) = 0;
    virtual void allow_unload(bool flag) = 0;
    virtual bool get_username(String& name) = 0;

    /// The calling thread's current context, or null.
    static Thread_Context* top();
    /// Makes `context` the current one. Throws std::bad_alloc where the process or the thread has no room for a
    /// thread-specific value; nothing is pushed then.
    static void push(Thread_Context* context);
    /// Goes back to the context before. Neither owns anything.
    static void pop() noexcept;
};

/// The thread-specific value behind the stack. Exported for onlookers; code in here never binds to another module's.
extern "C" {
extern CIMPLE_EXPORT pthread_key_t _thread_context_key;
extern CIMPLE_EXPORT pthread_once_t _thread_context_key_once;
}

} // namespace cimple
