/// A handle on a thread of ours, which inherits the thread context of its creator.
///
/// A thread that was created on a thread with a Thread_Context gets a context of its own for its whole life: it is
/// attached to the CIM server before its procedure and detached behind it. Others run without.
#pragma once

#include <pthread.h>

#include "runtime/Type.h"

namespace cimple {

class Thread {
public:
    using Proc = void* (*)(void* arg);

    Thread() = default;

    /// True for a handle that no thread was created into, or whose thread was joined.
    bool empty() const { return m_thread == pthread_t{}; }
    void reset() { m_thread = pthread_t{}; }

    /// Creates a thread that runs `proc(arg)`; an exception that leaves `proc` ends the thread with result null.
    /// Result 0 or the error of pthread_create (`thread` is empty and nothing is left behind then).
    static int create_detached(Thread& thread, Proc proc, void* arg);
    static int create_joinable(Thread& thread, Proc proc, void* arg);
    /// As create_joinable, for a thread that has work at the CIM server: ENOTSUP if it would get no thread context.
    static int create_attached(Thread& thread, Proc proc, void* arg);

    /// Waits for a joinable thread to end and empties the handle; `result` takes what its procedure returned, null on
    /// failure. Result that of pthread_join, ESRCH for an empty handle.
    static int join(Thread& thread, void*& result);

    /// Ends the calling thread, unwinding its stack: as a return of its procedure would, where the thread is one of
    /// ours; on another, the current context's thread_exit_hook runs first.
    [[noreturn]] static void exit(void* result);

    static Thread self();

    pthread_t id() const { return m_thread; }

private:
    pthread_t m_thread{}; // glibc never gives a thread the value 0
};

} // namespace cimple
