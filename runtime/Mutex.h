/// A POSIX mutex, plain or recursive, a condition, and a guard.
///
/// Both are constant-initialised. A Mutex needs no destruction (the platform's mutexes hold nothing but their own
/// bytes), so one at namespace scope simply lives for ever; a Cond there goes into an Immortal.
#pragma once

#include <pthread.h>

#include "runtime/Lock_Order.h"

namespace cimple {

struct MutexRep {
    pthread_mutex_t mutex;
};

class Mutex {
public:
    /// `recursive`: the owner may lock it again. `name` and `place` are those of the lock order (runtime/Lock_Order.h).
    constexpr Mutex(bool recursive, const char* name, Lock_Place place) noexcept
        : m_order(name, place, recursive),
          _rep(recursive ? MutexRep{PTHREAD_RECURSIVE_MUTEX_INITIALIZER_NP} : MutexRep{PTHREAD_MUTEX_INITIALIZER})
    {
    }
    Mutex(const Mutex&) = delete;
    Mutex& operator=(const Mutex&) = delete;

    /// Waits for the mutex. Failure (a corrupted mutex, say) stops the process by assertion.
    void lock();
    void unlock();
    /// 0, EBUSY (16) if another thread holds it, or -1.
    int try_lock();
    /// True once the mutex is the caller's; false if that does not happen within about 100 milliseconds. For a process
    /// that ends, whose other threads may hold the mutex for ever.
    bool lock_soon();

private:
    friend class Cond;
    [[no_unique_address]] Ordered_Lock m_order; // empty where nothing is checked
    MutexRep _rep;
};

class Cond {
public:
    constexpr Cond() noexcept : m_cond PTHREAD_COND_INITIALIZER {}
    /// Waits until threads that were woken have left wait().
    ~Cond() { pthread_cond_destroy(&m_cond); }
    Cond(const Cond&) = delete;
    Cond& operator=(const Cond&) = delete;

    /// Releases `mutex`, waits for a signal (or a spurious wake-up), and takes it again.
    void wait(Mutex& mutex);
    void signal();
    void broadcast();

private:
    pthread_cond_t m_cond;
};

/// Holds a mutex for a scope.
class Auto_Mutex {
public:
    explicit Auto_Mutex(Mutex& mutex) : m_mutex(mutex) { m_mutex.lock(); }
    ~Auto_Mutex() { m_mutex.unlock(); }
    Auto_Mutex(const Auto_Mutex&) = delete;
    Auto_Mutex& operator=(const Auto_Mutex&) = delete;

private:
    Mutex& m_mutex;
};

} // namespace cimple
