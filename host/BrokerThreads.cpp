// The xft and mft of the broker: what CMPI offers of the operating system and of its memory.
#include "host/Broker.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <pthread.h>
#include <unistd.h>

namespace host {
namespace {

static_assert(sizeof(pthread_t) == sizeof(void*), "a thread's handle is handed out as a pointer");
static_assert(sizeof(pthread_once_t) == sizeof(int), "threadOnce takes an int");

char* resolve_file_name(const char* name)
{
    return name ? strdup(name) : nullptr;
}

void* new_thread(void* (*start)(void*), void* argument, int detached)
{
    pthread_attr_t attributes;
    if (pthread_attr_init(&attributes) != 0) return nullptr;
    if (detached) pthread_attr_setdetachstate(&attributes, PTHREAD_CREATE_DETACHED);
    pthread_t thread{};
    int failed = pthread_create(&thread, &attributes, start, argument);
    pthread_attr_destroy(&attributes);
    return failed ? nullptr : reinterpret_cast<void*>(thread);
}

int join_thread(void* thread, void** result)
{
    return pthread_join(reinterpret_cast<pthread_t>(thread), result);
}
int exit_thread(void* code)
{
    pthread_exit(code);
}
int cancel_thread(void* thread)
{
    return pthread_cancel(reinterpret_cast<pthread_t>(thread));
}

int thread_sleep(CMPIUint32 milliseconds)
{
    timespec time{static_cast<time_t>(milliseconds / 1000), static_cast<long>(milliseconds % 1000) * 1000000};
    while (nanosleep(&time, &time) != 0 && errno == EINTR) {
    }
    return 0;
}

int thread_once(int* once, void (*init)())
{
    return pthread_once(once, init);
}

/// Fills the 4 bytes that a key has, and leaves the others of the caller's 8 alone, as servers do.
int create_thread_key(unsigned long int* key, void (*cleanup)(void*))
{
    pthread_key_t made{};
    int failed = pthread_key_create(&made, cleanup);
    if (!failed) std::memcpy(key, &made, sizeof made);
    return failed;
}

int destroy_thread_key(unsigned long int key)
{
    return pthread_key_delete(static_cast<pthread_key_t>(key));
}
void* get_thread_specific(unsigned long int key)
{
    return pthread_getspecific(static_cast<pthread_key_t>(key));
}
int set_thread_specific(unsigned long int key, void* value)
{
    return pthread_setspecific(static_cast<pthread_key_t>(key), value);
}

void* new_mutex(int)
{
    auto* mutex = new pthread_mutex_t;
    pthread_mutex_init(mutex, nullptr);
    return mutex;
}

void destroy_mutex(void* mutex)
{
    if (!mutex) return;
    pthread_mutex_destroy(static_cast<pthread_mutex_t*>(mutex));
    delete static_cast<pthread_mutex_t*>(mutex);
}

void lock_mutex(void* mutex)
{
    pthread_mutex_lock(static_cast<pthread_mutex_t*>(mutex));
}
void unlock_mutex(void* mutex)
{
    pthread_mutex_unlock(static_cast<pthread_mutex_t*>(mutex));
}

void* new_condition(int)
{
    auto* condition = new pthread_cond_t;
    pthread_cond_init(condition, nullptr);
    return condition;
}

void destroy_condition(void* condition)
{
    if (!condition) return;
    pthread_cond_destroy(static_cast<pthread_cond_t*>(condition));
    delete static_cast<pthread_cond_t*>(condition);
}

int cond_wait(void* condition, void* mutex)
{
    return pthread_cond_wait(static_cast<pthread_cond_t*>(condition), static_cast<pthread_mutex_t*>(mutex));
}

template <int timed_out>
int timed_cond_wait(void* condition, void* mutex, struct timespec* until)
{
    int result =
        pthread_cond_timedwait(static_cast<pthread_cond_t*>(condition), static_cast<pthread_mutex_t*>(mutex), until);
    return result == ETIMEDOUT ? timed_out : result;
}

int signal_condition(void* condition)
{
    return pthread_cond_signal(static_cast<pthread_cond_t*>(condition));
}

/// A mark is the number of the newest object, as a pointer that is never followed nor null.
CMPIGcStat* mark(const CMPIBroker* mb, CMPIStatus* status)
{
    Scope* scope = Scope::current(*Broker::of(mb));
    put_status(status, scope ? CMPI_RC_OK : CMPI_RC_ERR_FAILED);
    return scope ? reinterpret_cast<void*>(static_cast<std::uintptr_t>(scope->mark() + 1)) : nullptr;
}

CMPIStatus release(const CMPIBroker* mb, const CMPIGcStat* gc)
{
    Scope* scope = Scope::current(*Broker::of(mb));
    if (!scope || !gc) return status_of(CMPI_RC_ERR_FAILED);
    scope->release_since(reinterpret_cast<std::uintptr_t>(gc) - 1);
    return status_of(CMPI_RC_OK);
}

CMPIBrokerMemFT mark_and_release{1,       mark,    release, nullptr, nullptr, nullptr, nullptr, nullptr,
                                 nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr};

} // namespace

void fill_threads(CMPIBrokerExtFT& table, const Manner& manner)
{
    table.ftVersion = 200;
    table.resolveFileName = resolve_file_name;
    table.newThread = new_thread;
    table.threadOnce = thread_once;
    table.createThreadKey = create_thread_key;
    table.destroyThreadKey = destroy_thread_key;
    table.getThreadSpecific = get_thread_specific;
    table.setThreadSpecific = set_thread_specific;
    table.newMutex = new_mutex;
    table.destroyMutex = destroy_mutex;
    table.lockMutex = lock_mutex;
    table.unlockMutex = unlock_mutex;
    table.newCondition = new_condition;
    table.destroyCondition = destroy_condition;
    table.condWait = cond_wait;
    table.timedCondWait = manner.wait_timed_out == 0 ? timed_cond_wait<0> : timed_cond_wait<ETIMEDOUT>;
    if (manner.thread_ends_absent) return;
    table.joinThread = join_thread;
    table.exitThread = exit_thread;
    table.cancelThread = cancel_thread;
    table.threadSleep = thread_sleep;
    table.signalCondition = signal_condition;
}

CMPIBrokerMemFT* memory_table(const Manner& manner)
{
    return manner.memory == Manner::Mft::mark_and_release ? &mark_and_release : nullptr;
}

} // namespace host
