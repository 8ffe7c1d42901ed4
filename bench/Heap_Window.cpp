#include "bench/Heap_Window.h"

#include <atomic>
#include <cstddef>
#include <malloc.h>

extern "C" {
// What stands behind glibc's malloc, which the functions below take the place of.
void* __libc_malloc(std::size_t size);
void* __libc_calloc(std::size_t count, std::size_t size);
void* __libc_realloc(void* block, std::size_t size);
void __libc_free(void* block);
}

namespace {

std::atomic<bool> counts{false};
std::atomic<long long> held{0};
std::atomic<long long> peak{0};

void* taken(void* block)
{
    if (!block || !counts.load(std::memory_order_relaxed)) return block;
    const long long now = held += static_cast<long long>(malloc_usable_size(block));
    long long most = peak;
    while (now > most && !peak.compare_exchange_weak(most, now)) {
    }
    return block;
}

void given_back(void* block)
{
    if (block && counts.load(std::memory_order_relaxed)) held -= static_cast<long long>(malloc_usable_size(block));
}

} // namespace

extern "C" {
void* malloc(std::size_t size)
{
    return taken(__libc_malloc(size));
}
void* calloc(std::size_t count, std::size_t size)
{
    return taken(__libc_calloc(count, size));
}
void* realloc(void* block, std::size_t size)
{
    given_back(block);
    return taken(__libc_realloc(block, size));
}
void free(void* block)
{
    given_back(block);
    __libc_free(block);
}
}

namespace nvrbench {

Heap_Window::Heap_Window()
{
    held = peak = 0;
    counts = true;
}

Heap_Window::~Heap_Window()
{
    counts = false;
}

double Heap_Window::peak_kilobytes() const
{
    return static_cast<double>(peak.load()) / 1024;
}

double Heap_Window::held_kilobytes() const
{
    return static_cast<double>(held.load()) / 1024;
}

} // namespace nvrbench
