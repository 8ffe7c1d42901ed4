// Each piece of memory is of the heap.
#include "runtime/Blocks.h"

#include <new>

namespace cimple {

Blocks::Use::Use(Blocks*) noexcept : m_outer(nullptr) {}

Blocks::Use::~Use() = default;

void* Blocks::allocate(std::size_t size, bool& is_cut)
{
    is_cut = false;
    return ::operator new(size);
}

void Blocks::deallocate(void* piece, bool) noexcept
{
    ::operator delete(piece);
}

void Blocks::rewind() noexcept {}

void Blocks::close() noexcept {}

} // namespace cimple
