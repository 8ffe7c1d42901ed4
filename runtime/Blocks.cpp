#include "runtime/Blocks.h"

#include <atomic>
#include <cstdint>
#include <cstring>
#include <new>
#include <sys/mman.h>

#if defined(__has_feature)
#if __has_feature(address_sanitizer)
#define NVR_ADDRESS_SANITIZER
#endif
#elif defined(__SANITIZE_ADDRESS__)
#define NVR_ADDRESS_SANITIZER
#endif
#ifdef NVR_ADDRESS_SANITIZER
#include <sanitizer/asan_interface.h>
#include <sanitizer/lsan_interface.h>
#endif

namespace cimple {

namespace {

// A block lies at a multiple of its size, so that the head is found from any piece; the size is that of a large page.
constexpr std::size_t block_size = std::size_t{2} << 20;
constexpr std::size_t largest_piece = block_size / 32; // the unused end of a block is no longer than this
constexpr std::size_t alignment = alignof(std::max_align_t);
// What a block counts while it is being cut, so that it does not end before its last piece is made.
constexpr std::size_t being_cut = SIZE_MAX / 2;

thread_local Blocks* in_use = nullptr;

// What the address sanitizer knows of a block: nothing of it may be touched but the pieces that are out. In front of
// each lies its size, which is as forbidden, as a red zone.

#ifdef NVR_ADDRESS_SANITIZER
constexpr std::size_t red_zone = alignment;

void tell_mapped(void* block)
{
    __lsan_register_root_region(block, block_size);
}
void tell_unmapped(void* block)
{
    ASAN_UNPOISON_MEMORY_REGION(block, block_size);
    __lsan_unregister_root_region(block, block_size);
}
void tell_empty(char* begin, char* end)
{
    ASAN_POISON_MEMORY_REGION(begin, static_cast<std::size_t>(end - begin));
}
void tell_out(char* piece, std::size_t size)
{
    char* front = piece - red_zone;
    ASAN_UNPOISON_MEMORY_REGION(front, red_zone + size);
    std::memcpy(front, &size, sizeof size);
    ASAN_POISON_MEMORY_REGION(front, red_zone);
}
void tell_back(char* piece)
{
    char* front = piece - red_zone;
    ASAN_UNPOISON_MEMORY_REGION(front, red_zone);
    std::size_t size;
    std::memcpy(&size, front, sizeof size);
    ASAN_POISON_MEMORY_REGION(front, red_zone + size);
}
#else
constexpr std::size_t red_zone = 0;

void tell_mapped(void*) {}
void tell_unmapped(void*) {}
void tell_empty(char*, char*) {}
void tell_out(char*, std::size_t) {}
void tell_back(char*) {}
#endif

void* map_block() noexcept
{
    void* mapped = mmap(nullptr, 2 * block_size, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (mapped == MAP_FAILED) return nullptr;
    char* start = static_cast<char*>(mapped);
    const std::size_t before = (block_size - reinterpret_cast<std::uintptr_t>(start) % block_size) % block_size;
    if (before) munmap(start, before);
    munmap(start + before + block_size, block_size - before);
    return start + before;
}

} // namespace

struct alignas(alignment) Blocks::Block {
    std::atomic<std::size_t> pieces{being_cut};

    static Block* of(void* piece)
    {
        return reinterpret_cast<Block*>(reinterpret_cast<std::uintptr_t>(piece) & ~(block_size - 1));
    }
    void count_down(std::size_t by) noexcept
    {
        if (pieces.fetch_sub(by, std::memory_order_acq_rel) != by) return;
        tell_unmapped(this);
        munmap(this, block_size);
    }
};

Blocks::Use::Use(Blocks* blocks) noexcept : m_outer(in_use)
{
    in_use = blocks;
}

Blocks::Use::~Use()
{
    in_use = m_outer;
}

void* Blocks::allocate(std::size_t size, bool& is_cut)
{
    void* piece = in_use ? in_use->cut(size) : nullptr;
    is_cut = piece != nullptr;
    return piece ? piece : ::operator new(size);
}

void Blocks::deallocate(void* piece, bool is_cut) noexcept
{
    if (!is_cut) return ::operator delete(piece);
    tell_back(static_cast<char*>(piece));
    Block::of(piece)->count_down(1);
}

void* Blocks::cut(std::size_t size) noexcept
{
    if (size > largest_piece) return nullptr;
    const std::size_t room = red_zone + ((size + alignment - 1) & ~(alignment - 1));
    if (static_cast<std::size_t>(m_end - m_next) < room && !open()) return nullptr;
    char* piece = m_next + red_zone;
    m_next += room;
    ++m_pieces;
    tell_out(piece, size);
    return piece;
}

void Blocks::rewind() noexcept
{
    if (!m_block || m_block->pieces.load(std::memory_order_acquire) != being_cut - m_pieces) return;
    m_block->pieces.store(being_cut, std::memory_order_relaxed);
    start();
}

void Blocks::start() noexcept
{
    m_next = reinterpret_cast<char*>(m_block + 1);
    m_end = reinterpret_cast<char*>(m_block) + block_size;
    m_pieces = 0;
    tell_empty(m_next, m_end);
}

bool Blocks::open() noexcept
{
    close();
    void* place = map_block();
    if (!place) return false;
    // Little is needed as a rule; who needs more than a block needs many.
    if (!m_is_first) madvise(place, block_size, MADV_HUGEPAGE);
    m_is_first = false;
    m_block = new (place) Block;
    tell_mapped(place);
    start();
    return true;
}

void Blocks::close() noexcept
{
    if (m_block) m_block->count_down(being_cut - m_pieces);
    m_block = nullptr;
    m_next = m_end = nullptr;
}

} // namespace cimple
