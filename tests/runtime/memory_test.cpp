#include <atomic>
#include <cstdlib>
#include <functional>
#include <gtest/gtest.h>
#include <new>

#include "runtime/Instance.h"
#include "tests/runtime/Test_Classes.h"

// What happens when memory runs out: every operation is run again and again, with one more allocation allowed each
// time, until it succeeds. Nothing may be left allocated on the way.

namespace {

// Off below zero.
std::atomic<long> allocations_left{-1};
std::atomic<long> blocks{0};

} // namespace

void* operator new(std::size_t size)
{
    if (allocations_left == 0) throw std::bad_alloc();
    if (allocations_left > 0) --allocations_left;
    void* block = std::malloc(size ? size : 1);
    if (!block) throw std::bad_alloc();
    ++blocks;
    return block;
}

void operator delete(void* block) noexcept
{
    if (block) --blocks;
    std::free(block);
}

void operator delete(void* block, std::size_t) noexcept
{
    operator delete(block);
}

using namespace cimple;

namespace {

/// Runs `action` with ever more memory. `expect_untouched` is asked after each failure. Result: how often it failed.
long starve(const std::function<void()>& action, const std::function<void()>& expect_untouched = {})
{
    for (long allowed = 0;; ++allowed) {
        const long before = blocks;
        bool failed = false;
        allocations_left = allowed;
        try {
            action();
        } catch (const std::bad_alloc&) {
            failed = true;
        }
        allocations_left = -1;
        if (!failed) return allowed;
        EXPECT_EQ(blocks, before) << "after " << allowed << " allocations";
        if (expect_untouched) expect_untouched();
    }
}

} // namespace

TEST(OutOfMemory, CreationLeavesNothingBehind)
{
    EXPECT_GT(starve([] { destroy(create(&Test_Defaults::meta, true)); }), 5);
    EXPECT_EQ(starve([] { destroy(create(&Test_Thing::meta, true)); }), 1) << "an empty record is one block";
    EXPECT_EQ(starve([] { destroy(create(&Test_Thing::meta, false)); }), 1);
}

TEST(OutOfMemory, CloningLeavesNothingBehind)
{
    const Ref<Test_Thing> thing(make_full_thing());
    EXPECT_GT(starve([&] { destroy(clone(thing.get())); }), 15);
    EXPECT_EQ(thing->refs, 1u);
    EXPECT_EQ(thing->Peer->refs, 1u);
}

TEST(OutOfMemory, CopyingAssignsEachFeatureWholeOrNotAtAll)
{
    const Ref<Test_Thing> source(make_full_thing());
    const Ref<Test_Thing> old(make_full_thing());
    old->Texts.set(Array<String>{"old"});
    unref(old->Peer);
    old->Peer = make_keyed("old", 1);
    Ref<Test_Thing> dest(clone_as(old.get()));
    long failures = 0;
    for (bool done = false; !done; ++failures) {
        dest.reset(clone_as(old.get()));
        allocations_left = failures;
        try {
            copy(dest.get(), source.get());
            done = true;
        } catch (const std::bad_alloc&) {
        }
        allocations_left = -1;
        const auto& texts = dest->Texts.value;
        EXPECT_TRUE(texts == old->Texts.value || texts == source->Texts.value);
        EXPECT_TRUE(identical(dest->Peer, old->Peer) || identical(dest->Peer, source->Peer));
        EXPECT_EQ(dest->Peers.value.size(), 3u);
    }
    EXPECT_GT(failures, 10);
    EXPECT_TRUE(identical(dest.get(), source.get()));
}

TEST(OutOfMemory, TextsLeaveNothingBehind)
{
    const Ref<Test_Link> link(create_as<Test_Link>());
    link->Left = make_keyed("a name that does not fit into the smallest rep", 1);
    link->Right = make_keyed<Test_Thing>("another name that does not fit into it", 2);
    String path;
    EXPECT_GT(starve([&] {
                  String text;
                  instance_to_model_path(link.get(), text);
                  path = text;
              }),
              3);
    EXPECT_GT(starve([&] { unref(model_path_to_instance(&Test_Link::meta, path.c_str())); }), 5);
}

TEST(OutOfMemory, AStringKeepsItsText)
{
    String text("0123456789012345678901234567890123456789");
    const auto expect_untouched = [&] { EXPECT_STREQ(text.c_str(), "0123456789012345678901234567890123456789"); };
    const String shared(text);
    EXPECT_EQ(starve([&] { text.append("x"); }, expect_untouched), 1);
    text = shared;
    EXPECT_EQ(starve([&] { text.reserve(1000); }, expect_untouched), 1);
    text = shared;
    EXPECT_EQ(starve([&] { text = "another text"; }, expect_untouched), 1);
}

TEST(OutOfMemory, AnArrayKeepsItsElements)
{
    Array<String> array{"a", "b", "c", "d", "e", "f", "g", "h"};
    const Array<String> expected(array);
    const auto expect_untouched = [&] { EXPECT_TRUE(array == expected); };
    EXPECT_EQ(starve([&] { array.append(array[0]); }, expect_untouched), 1);
    array = expected;
    EXPECT_EQ(starve([&] { array.reserve(1000); }, expect_untouched), 1);
    EXPECT_EQ(starve([&] { array = Array<String>(expected); }, expect_untouched), 2);
}

TEST(OutOfMemory, ADatetimeKeepsItsTime)
{
    Datetime time(5);
    const Datetime shared(time);
    EXPECT_EQ(starve([&] { time.set_timestamp(6, 60); }, [&] { EXPECT_TRUE(time == shared); }), 1);
}

TEST(Memory, ALifeOfInstancesLeavesNothing)
{
    const long before = blocks;
    {
        const Ref<Test_Thing> thing(make_full_thing());
        const Ref<Test_Thing> copy(clone_as(thing.get()));
        nullify_properties(copy.get(), true, true, 1);
        const char* const names[] = {"Peer", "Inside", nullptr};
        filter_properties(copy.get(), names, false);
        cimple::copy(copy.get(), thing.get());
        set_name_space_recursive(copy.get(), "root/somewhere/that/needs/more/than/32/bytes", true);
    }
    EXPECT_EQ(blocks, before);
}

TEST(Memory, EmptyAndSharedValuesAllocateNothing)
{
    EXPECT_EQ(starve([] {
                  const String empty;
                  const String copy(empty);
                  const String other("");
                  const Datetime time;
                  const Datetime time_copy(time);
                  const Array<String> array;
                  const Array<String> array_copy(array);
              }),
              0);
}
