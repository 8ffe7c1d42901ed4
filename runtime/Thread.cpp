#include "runtime/Thread.h"

#include <cassert>
#include <cerrno>
#include <memory>
#include <new>

#include "runtime/Forced_Unwind.h"
#include "runtime/Thread_Context.h"

namespace cimple {

namespace {

/// What a new thread finds.
struct Start {
    Thread::Proc proc;
    void* arg;
    std::unique_ptr<Thread_Context> context;
};

// Was the calling thread made here? Its context then goes when its stack is unwound.
thread_local bool is_ours = false;

/// The context of the calling thread, for the thread's whole life; null: none. A cancelled thread, or one that calls
/// Thread::exit, leaves through the destructor, all others through leave().
class Attachment {
public:
    explicit Attachment(std::unique_ptr<Thread_Context> context)
    {
        if (!context) return;
        try {
            Thread_Context::push(context.get());
            m_context = context.release();
        } catch (const std::bad_alloc&) {
            // No room for a thread-specific value: run as a thread without a context.
        }
    }
    Attachment(const Attachment&) = delete;
    Attachment& operator=(const Attachment&) = delete;
    ~Attachment()
    {
        if (!m_context) return;
        while (Thread_Context::top() && Thread_Context::top() != m_context)
            Thread_Context::pop();
        try {
            detach();
        } catch (...) {
        }
        end();
    }

    void attach()
    {
        if (!m_context) return;
        m_context->thread_start_hook();
        m_attached = true;
    }
    void leave()
    {
        detach();
        Thread_Context* context = m_context;
        assert(context == Thread_Context::top());
        end();
    }

private:
    void detach()
    {
        if (!m_attached) return;
        m_attached = false;
        m_context->thread_exit_hook();
    }
    void end()
    {
        if (!m_context) return;
        Thread_Context::pop();
        delete m_context;
        m_context = nullptr;
    }

    Thread_Context* m_context = nullptr;
    bool m_attached = false;
};

// An exception has nobody to go to; a cancellation must reach the thread library.
template <class Action>
void quietly(Action action)
{
    try {
        action();
    } catch (...) {
        if (is_forced_unwind()) throw;
    }
}

void* _thread_proc(void* arg)
{
    is_ours = true;
    std::unique_ptr<Start> start(static_cast<Start*>(arg));
    const Thread::Proc proc = start->proc;
    void* const proc_arg = start->arg;
    Attachment attachment(std::move(start->context));
    start.reset();

    void* result = nullptr;
    quietly([&] {
        attachment.attach();
        result = proc(proc_arg);
    });
    quietly([&] { attachment.leave(); });
    return result;
}

enum class Context { if_there_is, needed };

int create(pthread_t& thread, int detach_state, Thread::Proc proc, void* arg, Context wanted)
{
    std::unique_ptr<Start> start;
    try {
        start.reset(new Start{proc, arg, nullptr});
        if (Thread_Context* context = Thread_Context::top()) start->context.reset(context->thread_create_hook(arg));
    } catch (const std::bad_alloc&) {
        return ENOMEM;
    }
    if (wanted == Context::needed && !start->context) return ENOTSUP;
    pthread_attr_t attributes;
    int status = pthread_attr_init(&attributes);
    if (status != 0) return status;
    status = pthread_attr_setdetachstate(&attributes, detach_state);
    pthread_t created{};
    if (status == 0) status = pthread_create(&created, &attributes, _thread_proc, start.get());
    pthread_attr_destroy(&attributes);
    if (status != 0) return status;
    start.release();
    thread = created;
    return 0;
}

} // namespace

int Thread::create_detached(Thread& thread, Proc proc, void* arg)
{
    thread.reset();
    return create(thread.m_thread, PTHREAD_CREATE_DETACHED, proc, arg, Context::if_there_is);
}

int Thread::create_joinable(Thread& thread, Proc proc, void* arg)
{
    thread.reset();
    return create(thread.m_thread, PTHREAD_CREATE_JOINABLE, proc, arg, Context::if_there_is);
}

int Thread::create_attached(Thread& thread, Proc proc, void* arg)
{
    thread.reset();
    return create(thread.m_thread, PTHREAD_CREATE_JOINABLE, proc, arg, Context::needed);
}

int Thread::join(Thread& thread, void*& result)
{
    result = nullptr;
    if (thread.empty()) return ESRCH;
    const int status = pthread_join(thread.m_thread, &result);
    if (status == 0) thread.reset();
    return status;
}

void Thread::exit(void* result)
{
    if (!is_ours) {
        if (Thread_Context* context = Thread_Context::top()) context->thread_exit_hook();
    }
    pthread_exit(result);
}

Thread Thread::self()
{
    Thread thread;
    thread.m_thread = pthread_self();
    return thread;
}

} // namespace cimple
