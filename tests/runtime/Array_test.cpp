#include "runtime/Array.h"

#include <gtest/gtest.h>
#include <limits>
#include <memory>
#include <stdexcept>

#include "runtime/Datetime.h"
#include "runtime/String.h"

using namespace cimple;

TEST(ArrayValue, HoldsEightAtCreationAndGrows)
{
    Array<uint32> array;
    EXPECT_EQ(array.capacity(), 8u);
    EXPECT_EQ(array.size(), 0u);
    for (uint32 i = 0; i < 100; ++i)
        array.append(i);
    ASSERT_EQ(array.size(), 100u);
    EXPECT_GE(array.capacity(), 100u);
    for (uint32 i = 0; i < 100; ++i)
        EXPECT_EQ(array[i], i);
}

TEST(ArrayValue, FilledToItsFirstCapacityItStaysThere)
{
    Array<uint8> array{1, 2, 3, 4, 5, 6, 7, 8};
    EXPECT_EQ(array.capacity(), 8u);
    array.append(uint8(9));
    EXPECT_GT(array.capacity(), 8u);
}

TEST(ArrayValue, ACopyHasElementsOfItsOwn)
{
    Array<String> one{"a", "b"};
    Array<String> two(one);
    EXPECT_NE(one.begin(), two.begin());
    two[0] = "changed";
    two.append("c");
    EXPECT_TRUE(one == (Array<String>{"a", "b"}));
    one = two;
    EXPECT_TRUE(one == (Array<String>{"changed", "b", "c"}));
    Array<String>& alias = one;
    one = alias;
    EXPECT_EQ(one.size(), 3u);
}

TEST(ArrayValue, EmptyArraysAreIndependent)
{
    Array<uint16> one;
    Array<uint16> two;
    one.append(uint16(1));
    EXPECT_EQ(two.size(), 0u);
    EXPECT_TRUE(two == Array<uint16>());
    EXPECT_FALSE(one == two);
}

TEST(ArrayValue, ElementsOfItselfCanBeAppended)
{
    Array<String> array{"a", "b", "c", "d", "e", "f", "g", "h"};
    array.append(array[3]);
    array.append(array.begin(), array.size());
    ASSERT_EQ(array.size(), 18u);
    EXPECT_STREQ(array[8].c_str(), "d");
    EXPECT_STREQ(array[17].c_str(), "d");
}

TEST(ArrayValue, RemoveClosesTheGap)
{
    Array<uint8> bytes{1, 2, 3, 4, 5};
    bytes.remove(1, 2);
    EXPECT_TRUE(bytes == (Array<uint8>{1, 4, 5}));
    bytes.remove(2, 100);
    EXPECT_TRUE(bytes == (Array<uint8>{1, 4}));
    bytes.remove(2);
    bytes.remove(std::numeric_limits<std::size_t>::max(), 3);
    bytes.remove(0, 0);
    EXPECT_TRUE(bytes == (Array<uint8>{1, 4}));

    Array<String> texts{"a", "b", "c", "d"};
    texts.remove(1);
    EXPECT_TRUE(texts == (Array<String>{"a", "c", "d"}));
    texts.remove(1, 2);
    EXPECT_TRUE(texts == (Array<String>{"a"}));
    texts.clear();
    EXPECT_EQ(texts.size(), 0u);
    texts.append("again");
    EXPECT_STREQ(texts[0].c_str(), "again");
}

TEST(ArrayValue, RealsCompareAsNumbers)
{
    EXPECT_TRUE((Array<real32>{0.0f}) == (Array<real32>{-0.0f}));
    EXPECT_TRUE((Array<real64>{0.0}) == (Array<real64>{-0.0}));
    const real64 nan = std::numeric_limits<real64>::quiet_NaN();
    EXPECT_FALSE((Array<real64>{nan}) == (Array<real64>{nan}));
}

TEST(ArrayValue, ArraysOfDifferentTypesAreNotEqual)
{
    EXPECT_TRUE((Array<uint8>{1}) != (Array<sint8>{1}));
    EXPECT_TRUE(Array<uint8>() != Array<sint8>());
    EXPECT_TRUE((Array<Datetime>{Datetime(1)}) == (Array<Datetime>{Datetime(1)}));
    EXPECT_TRUE((Array<Datetime>{Datetime(1)}) != (Array<Datetime>{Datetime(2)}));
}

TEST(ArrayValue, EveryTypeHasTraitsOfItsSize)
{
    for (unsigned type = 0; type < number_of_types; ++type)
        EXPECT_EQ(array_traits[type].element_size, type_sizes[type]) << type_names[type];
    EXPECT_EQ(array_traits[UINT32].construct, nullptr);
    EXPECT_EQ(array_traits[UINT32].equal, nullptr);
    EXPECT_NE(array_traits[REAL32].equal, nullptr);
    EXPECT_EQ(array_traits[REAL32].construct, nullptr);
    EXPECT_NE(array_traits[STRING].construct, nullptr);
    EXPECT_NE(array_traits[DATETIME].destruct, nullptr);
    EXPECT_EQ(instance_array_traits.element_size, sizeof(void*));
    EXPECT_EQ(instance_array_traits.construct, nullptr);
    EXPECT_EQ(instance_array_traits.destruct, nullptr);
    EXPECT_EQ(instance_array_traits.equal, nullptr);
}

TEST(ArrayValue, SizesThatNoMemoryHoldsAreRefused)
{
    Array<uint64> array{1};
    EXPECT_THROW(array.reserve(std::numeric_limits<std::size_t>::max() / 4), std::bad_alloc);
    EXPECT_THROW(array.Array_Base::append(array.begin(), std::numeric_limits<std::size_t>::max() / 2), std::bad_alloc);
    EXPECT_TRUE(array == (Array<uint64>{1}));
}

TEST(ArrayDeathTest, AnIndexOutsideStopsByAssertion)
{
    Array<uint8> array{1};
    EXPECT_DEATH(static_cast<void>(array.at(1)), "index < m_rep->size");
}

namespace {

// An element that a room of its own might keep: counted, and able to fail.
struct Counted {
    static int alive;
    static int copies_left;
    int value = 0;
    explicit Counted(int v) : value(v) { ++alive; }
    Counted(const Counted& other) : value(other.value)
    {
        if (copies_left == 0) throw std::runtime_error("no more copies");
        --copies_left;
        ++alive;
    }
    ~Counted() { --alive; }
};
int Counted::alive = 0;
int Counted::copies_left = 1000;

const Array_Traits counted_traits = {
    sizeof(Counted),
    [](void* element, const void* source) { new (element) Counted(*static_cast<const Counted*>(source)); },
    [](void* element) { static_cast<Counted*>(element)->~Counted(); }, nullptr};

} // namespace

namespace cimple {

template <>
struct Traits_Of<Counted> {
    static const Array_Traits& traits() { return counted_traits; }
};

} // namespace cimple

TEST(ArrayValue, AnElementThatCannotBeCopiedLeavesTheArrayAsItWas)
{
    {
        Array<Counted> array;
        for (int i = 0; i < 8; ++i)
            array.append(Counted(i));
        for (int left = 0; left < 9; ++left) {
            Counted::copies_left = left;
            EXPECT_THROW(array.append(Counted(9)), std::runtime_error);
            if (left < 8) {
                EXPECT_THROW(Array<Counted> copy(array), std::runtime_error);
            }
            Counted::copies_left = left < 7 ? left : 6;
            EXPECT_THROW(array.remove(0), std::runtime_error);
            ASSERT_EQ(array.size(), 8u);
            EXPECT_EQ(array[7].value, 7);
            EXPECT_EQ(Counted::alive, 8);
        }
        Counted::copies_left = 1000;
        array.append(Counted(8));
        array.remove(0, 3);
        EXPECT_EQ(array.size(), 6u);
        EXPECT_EQ(array[0].value, 3);
        EXPECT_EQ(Counted::alive, 6);
    }
    EXPECT_EQ(Counted::alive, 0);
}
