/// Memory for what is made together and goes together: the instances of a rebuild, with their strings and arrays.
///
/// While a Blocks::Use lives on a thread, the pieces that the thread asks for are cut one behind the other from large
/// blocks: a walk over them in the order of their making goes straight through memory, and where the last piece of a
/// block has gone, the block goes back to the system. Pieces are freed on any thread, in any order. One that is freed
/// early leaves a hole, so what is made for a moment only is made outside of a Use.
///
/// A Blocks object is one thread's at a time; it may end before its pieces do.
#pragma once

#include <cstddef>

namespace cimple {

class Blocks {
public:
    Blocks() = default;
    ~Blocks() { close(); }
    Blocks(const Blocks&) = delete;
    Blocks& operator=(const Blocks&) = delete;

    /// Where all pieces of the block that is being cut have gone, starts it again from its beginning.
    void rewind() noexcept;

    /// This thread's pieces come from `blocks` (null: from the heap) until the end of the scope.
    class Use {
    public:
        explicit Use(Blocks* blocks) noexcept;
        ~Use();
        Use(const Use&) = delete;
        Use& operator=(const Use&) = delete;

    private:
        Blocks* m_outer;
    };

    /// `size` bytes, aligned for any type: of the blocks in use, or else (none, a large piece, no room for a block) of
    /// the heap. `is_cut` tells which, and must be told again to `deallocate`. Throws std::bad_alloc.
    static void* allocate(std::size_t size, bool& is_cut);
    static void deallocate(void* piece, bool is_cut) noexcept;

private:
    struct Block;
    void* cut(std::size_t size) noexcept;
    bool open() noexcept;
    void start() noexcept;
    void close() noexcept;

    Block* m_block = nullptr; // the one that is being cut
    char* m_next = nullptr;
    char* m_end = nullptr;
    std::size_t m_pieces = 0; // of this block so far
    bool m_is_first = true;
};

} // namespace cimple
