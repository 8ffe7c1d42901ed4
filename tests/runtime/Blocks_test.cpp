#include <cerrno>
#include <cstdint>
#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <sys/mman.h>
#include <thread>
#include <vector>

#ifdef __SANITIZE_ADDRESS__
#include <sanitizer/asan_interface.h>
#endif

#include "runtime/Blocks.h"
#include "runtime/Instance.h"
#include "tests/runtime/Test_Classes.h"

using namespace cimple;

namespace {

bool has_no_pages = false; // for a block

} // namespace

extern "C" {
void* __real_mmap(void* place, std::size_t size, int protection, int flags, int file, off_t offset);
void* __wrap_mmap(void* place, std::size_t size, int protection, int flags, int file, off_t offset)
{
    return has_no_pages ? MAP_FAILED : __real_mmap(place, size, protection, flags, file, offset);
}
}

namespace {

constexpr std::uintptr_t block_size = std::uintptr_t{2} << 20;
#ifdef __SANITIZE_ADDRESS__
constexpr std::size_t red_zone = 16; // between two pieces
#else
constexpr std::size_t red_zone = 0;
#endif

std::uintptr_t block_of(const void* piece)
{
    return reinterpret_cast<std::uintptr_t>(piece) / block_size;
}

bool is_mapped(std::uintptr_t block)
{
    unsigned char resident;
    return mincore(reinterpret_cast<void*>(block * block_size), 4096, &resident) == 0 || errno != ENOMEM;
}

struct Piece {
    explicit Piece(std::size_t size) : place(Blocks::allocate(size, is_cut)) {}
    Piece(const Piece&) = delete;
    Piece& operator=(const Piece&) = delete;
    ~Piece() { Blocks::deallocate(place, is_cut); }
    bool is_cut = false;
    void* place;
};

std::unique_ptr<Piece> piece(Blocks* blocks, std::size_t size)
{
    const Blocks::Use use(blocks);
    return std::make_unique<Piece>(size);
}

TEST(Blocks, CutsPiecesOneBehindTheOtherAlignedForAnyType)
{
    Blocks blocks;
    const char* end = nullptr;
    std::vector<std::unique_ptr<Piece>> pieces;
    for (std::size_t size : {1u, 16u, 17u, 1000u}) {
        pieces.push_back(piece(&blocks, size));
        EXPECT_TRUE(pieces.back()->is_cut);
        const auto* place = static_cast<const char*>(pieces.back()->place);
        EXPECT_EQ(reinterpret_cast<std::uintptr_t>(place) % alignof(std::max_align_t), 0u);
        if (end) {
            EXPECT_GE(place, end);
            EXPECT_LT(place, end + red_zone + alignof(std::max_align_t));
        }
        end = place + size;
    }
}

#ifdef __SANITIZE_ADDRESS__
TEST(Blocks, HidesNothingFromTheAddressSanitizer)
{
    Blocks blocks;
    const auto first = piece(&blocks, 16);
    auto second = piece(&blocks, 32), third = piece(&blocks, 20);
    char* const gone = static_cast<char*>(second->place);
    EXPECT_EQ(__asan_region_is_poisoned(gone, 32), nullptr);
    EXPECT_TRUE(__asan_address_is_poisoned(static_cast<char*>(first->place) + 16)) << "behind a piece";
    EXPECT_TRUE(__asan_address_is_poisoned(static_cast<char*>(third->place) - 1)) << "in front of a piece";
    second.reset();
    EXPECT_TRUE(__asan_address_is_poisoned(gone)) << "a piece that was given back";
    EXPECT_TRUE(__asan_address_is_poisoned(gone + 31));
    third.reset();
    EXPECT_EQ(__asan_region_is_poisoned(first->place, 16), nullptr);
}
#endif

TEST(Blocks, TakesTheHeapOutsideOfAUseAndForALargePiece)
{
    Blocks blocks;
    EXPECT_FALSE(Piece(16).is_cut);
    EXPECT_FALSE(piece(&blocks, 100000)->is_cut);
    const Blocks::Use use(&blocks);
    EXPECT_TRUE(Piece(16).is_cut);
    {
        const Blocks::Use heap(nullptr);
        EXPECT_FALSE(Piece(16).is_cut);
    }
    EXPECT_TRUE(Piece(16).is_cut) << "an inner use ends at its scope";
    std::thread([] { EXPECT_FALSE(Piece(16).is_cut) << "a use is its thread's"; }).join();
}

TEST(Blocks, TakesTheHeapWhereThereIsNoRoomForABlock)
{
    Blocks blocks;
    has_no_pages = true;
    EXPECT_FALSE(piece(&blocks, 16)->is_cut);
    has_no_pages = false;
    EXPECT_TRUE(piece(&blocks, 16)->is_cut);
}

TEST(Blocks, ABlockEndsWithTheLastOfItsPiecesAndNotBefore)
{
    auto blocks = std::make_unique<Blocks>();
    auto first = piece(blocks.get(), 100), second = piece(blocks.get(), 100);
    const std::uintptr_t block = block_of(first->place);
    first.reset();
    second.reset();
    EXPECT_TRUE(is_mapped(block)) << "it is being cut";
    first = piece(blocks.get(), 100);
    EXPECT_EQ(block_of(first->place), block);
    blocks.reset();
    EXPECT_TRUE(is_mapped(block)) << "a piece is left";
    first.reset();
    EXPECT_FALSE(is_mapped(block));
}

TEST(Blocks, AFullBlockEndsWhileTheNextIsCut)
{
    Blocks blocks;
    auto kept = piece(&blocks, 50000);
    const std::uintptr_t block = block_of(kept->place);
    while (block_of(piece(&blocks, 50000)->place) == block) {
    }
    EXPECT_TRUE(is_mapped(block));
    kept.reset();
    EXPECT_FALSE(is_mapped(block));
}

TEST(Blocks, RewindStartsABlockAgainThatHasNoPieceLeft)
{
    Blocks blocks;
    blocks.rewind();
    auto first = piece(&blocks, 100), second = piece(&blocks, 100);
    const void* start = first->place;
    first.reset();
    blocks.rewind();
    EXPECT_NE(piece(&blocks, 100)->place, start) << "a piece is left";
    second.reset();
    blocks.rewind();
    first = piece(&blocks, 100);
    EXPECT_EQ(first->place, start);
    EXPECT_TRUE(is_mapped(block_of(start)));
}

TEST(Blocks, InstancesStringsAndArraysAreCutAndOutliveTheUse)
{
    Ref<Instance> made, copied;
    std::uintptr_t block = 0;
    {
        Blocks blocks;
        const Blocks::Use use(&blocks);
        auto* thing = create_as<Test_Thing>();
        made.reset(thing);
        thing->Text.set("a text of some length, so that it needs a rep");
        thing->Uint32s.value.append(4711);
        block = block_of(thing);
        EXPECT_EQ(block_of(thing->Text.value.c_str()), block);
        EXPECT_EQ(block_of(thing->Uint32s.value.data()), block);
        EXPECT_EQ(thing->refs, 1u);
        copied.reset(clone(thing));
        EXPECT_EQ(block_of(copied.get()), block);
    }
    EXPECT_TRUE(identical(made.get(), copied.get()));
    const Ref<Instance> apart(clone(made.get()));
    EXPECT_NE(block_of(apart.get()), block);
    made.reset();
    EXPECT_TRUE(identical(copied.get(), apart.get()));
    EXPECT_TRUE(is_mapped(block));
    copied.reset();
    EXPECT_TRUE(is_mapped(block)) << "the text is shared with the one apart";
    EXPECT_EQ(static_cast<Test_Thing*>(apart.get())->Text.value, "a text of some length, so that it needs a rep");
}

TEST(Blocks, PiecesEndOnOtherThreadsWhileMoreAreCut)
{
    Blocks blocks;
    std::vector<std::thread> threads;
    for (int round = 0; round < 4; round++) {
        std::vector<String> texts;
        {
            const Blocks::Use use(&blocks);
            for (int i = 0; i < 20000; i++)
                texts.push_back(String(("text number " + std::to_string(i)).c_str()));
        }
        threads.emplace_back([mine = std::move(texts)]() mutable {
            for (std::size_t i = 0; i < mine.size(); i += 7)
                ASSERT_EQ(mine[i], ("text number " + std::to_string(i)).c_str());
            mine.clear();
        });
    }
    for (std::thread& thread : threads)
        thread.join();
}

} // namespace
