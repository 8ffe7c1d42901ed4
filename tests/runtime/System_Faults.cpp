#include "tests/runtime/System_Faults.h"

#include <atomic>
#include <pthread.h>
#include <sys/time.h>

namespace {

std::atomic<int> failing_call{cimple::System_Fault::none};
std::atomic<int> failing_error{0};

bool fails(cimple::System_Fault::Call call)
{
    return failing_call.load() == call;
}

} // namespace

namespace cimple {

System_Fault::System_Fault(Call call, int error)
{
    failing_error = error;
    failing_call = call;
}

System_Fault::~System_Fault()
{
    failing_call = none;
}

} // namespace cimple

using cimple::System_Fault;

extern "C" {

int __real_pthread_create(pthread_t*, const pthread_attr_t*, void* (*)(void*), void*);
int __wrap_pthread_create(pthread_t* thread, const pthread_attr_t* attributes, void* (*proc)(void*), void* arg)
{
    return fails(System_Fault::create_thread) ? failing_error.load()
                                              : __real_pthread_create(thread, attributes, proc, arg);
}

int __real_pthread_key_create(pthread_key_t*, void (*)(void*));
int __wrap_pthread_key_create(pthread_key_t* key, void (*destructor)(void*))
{
    return fails(System_Fault::create_key) ? failing_error.load() : __real_pthread_key_create(key, destructor);
}

int __real_pthread_setspecific(pthread_key_t, const void*);
int __wrap_pthread_setspecific(pthread_key_t key, const void* value)
{
    return fails(System_Fault::set_value) ? failing_error.load() : __real_pthread_setspecific(key, value);
}

int __real_pthread_mutex_lock(pthread_mutex_t*);
int __wrap_pthread_mutex_lock(pthread_mutex_t* mutex)
{
    return fails(System_Fault::lock) ? failing_error.load() : __real_pthread_mutex_lock(mutex);
}

int __real_pthread_mutex_trylock(pthread_mutex_t*);
int __wrap_pthread_mutex_trylock(pthread_mutex_t* mutex)
{
    return fails(System_Fault::try_lock) ? failing_error.load() : __real_pthread_mutex_trylock(mutex);
}

int __real_gettimeofday(timeval*, void*);
int __wrap_gettimeofday(timeval* time, void* zone)
{
    return fails(System_Fault::clock) ? -1 : __real_gettimeofday(time, zone);
}

} // extern "C"
