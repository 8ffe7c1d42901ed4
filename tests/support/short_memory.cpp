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

void* operator new(std::size_t size)
{
    if (refuses()) throw std::bad_alloc();
    if (void* block = std::malloc(size ? size : 1)) return block;
    throw std::bad_alloc();
}

void operator delete(void* block) noexcept
{
    std::free(block);
}

void operator delete(void* block, std::size_t) noexcept
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
