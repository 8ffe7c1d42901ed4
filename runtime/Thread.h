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

    /// True for a handle that no thread was created into (or whose thread was joined).
    bool empty() const { return !m_set; }
    void reset() { m_set = false; }

    /// Creates a thread. Result 0 or the error of pthread_create; nothing is left behind then.
    static int create_detached(Thread& thread, Proc proc, void* arg);
    static int create_joinable(Thread& thread, Proc proc, void* arg);

    /// Waits for a joinable thread to end; `result` takes what its procedure returned. Result that of pthread_join.
    static int join(Thread thread, void*& result);

    /// Ends the calling thread as a return of its procedure would.
    [[noreturn]] static void exit(void* result);

    static Thread self();

    pthread_t id() const { return m_thread; }

private:
    pthread_t m_thread{};
    bool m_set = false;
};

} // namespace cimple
