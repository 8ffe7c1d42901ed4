#include "tests/support/short_memory.h"

#include <cstdlib>

#include "tests/support/log_capture.h"

namespace {

thread_local long allocations_left = -1; // until the refused one; negative: none is
thread_local bool was_refused = false;

bool refuses()
{
    if (allocations_left < 0 || nvrtest::keeps_log) return false;
    if (allocations_left-- > 0) return false;
    was_refused = true;
    return true;
}

} // namespace

// All that meet in one operator delete: a sanitizer has its own for each.
void* operator new(std::size_t size, const std::nothrow_t&) noexcept
{
    return refuses() ? nullptr : std::malloc(size ? size : 1);
}

void* operator new(std::size_t size)
{
    if (void* block = operator new(size, std::nothrow)) return block;
    throw std::bad_alloc();
}

void operator delete(void* block, const std::nothrow_t&) noexcept
{
    std::free(block);
}

void operator delete(void* block) noexcept
{
    std::free(block);
}

void operator delete(void* block, std::size_t) noexcept
{
    std::free(block);
}

// Of arrays too.
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept
{
    return operator new(size, std::nothrow);
}

void* operator new[](std::size_t size)
{
    return operator new(size);
}

void operator delete[](void* block) noexcept
{
    std::free(block);
}

void operator delete[](void* block, std::size_t) noexcept
{
    std::free(block);
}

namespace nvrtest {

void refuse_allocation(long number)
{
    was_refused = false;
    allocations_left = number - 1;
}

bool forget_refusal()
{
    allocations_left = -1;
    return was_refused;
}

} // namespace nvrtest
