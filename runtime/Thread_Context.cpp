#include "runtime/Thread_Context.h"

#include <new>

// The key under names that no other module of the process can take over, and the exported names for the same places.
extern "C" {
__attribute__((visibility("hidden"))) pthread_key_t nvr_thread_context_key;
__attribute__((visibility("hidden"))) pthread_once_t nvr_thread_context_key_once = PTHREAD_ONCE_INIT;
}

namespace cimple {

extern "C" {
extern __attribute__((alias("nvr_thread_context_key"))) pthread_key_t _thread_context_key;
extern __attribute__((alias("nvr_thread_context_key_once"))) pthread_once_t _thread_context_key_once;
}

namespace {

bool key_made = false;

void make_key()
{
    key_made = pthread_key_create(&nvr_thread_context_key, nullptr) == 0;
}

bool has_key()
{
    pthread_once(&nvr_thread_context_key_once, make_key);
    return key_made;
}

} // namespace

Thread_Context* Thread_Context::top()
{
    return has_key() ? static_cast<Thread_Context*>(pthread_getspecific(nvr_thread_context_key)) : nullptr;
}

void Thread_Context::push(Thread_Context* context)
{
    Thread_Context* below = top();
    if (!has_key() || pthread_setspecific(nvr_thread_context_key, context) != 0) throw std::bad_alloc();
    context->prev = below;
}

void Thread_Context::pop() noexcept
{
    Thread_Context* context = top();
    if (!context) return;
    pthread_setspecific(nvr_thread_context_key, context->prev);
    context->prev = nullptr;
}

} // namespace cimple
