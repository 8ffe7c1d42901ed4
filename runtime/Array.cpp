#include "runtime/Array.h"

#include <algorithm>
#include <cassert>
#include <cstdint>
#include <cstring>
#include <new>
#include <utility>

#include "runtime/Blocks.h"
#include "runtime/Datetime.h"
#include "runtime/String.h"

namespace cimple {

namespace {

template <class T>
void construct(void* element, const void* source)
{
    new (element) T(*static_cast<const T*>(source));
}

template <class T>
void destruct(void* element)
{
    static_cast<T*>(element)->~T();
}

template <class T>
bool equal(const void* a, const void* b)
{
    return *static_cast<const T*>(a) == *static_cast<const T*>(b);
}

constexpr std::size_t first_capacity = 8;

} // namespace

const Array_Traits array_traits[number_of_types] = {
    {sizeof(boolean), nullptr, nullptr, nullptr},
    {sizeof(uint8), nullptr, nullptr, nullptr},
    {sizeof(sint8), nullptr, nullptr, nullptr},
    {sizeof(uint16), nullptr, nullptr, nullptr},
    {sizeof(sint16), nullptr, nullptr, nullptr},
    {sizeof(uint32), nullptr, nullptr, nullptr},
    {sizeof(sint32), nullptr, nullptr, nullptr},
    {sizeof(uint64), nullptr, nullptr, nullptr},
    {sizeof(sint64), nullptr, nullptr, nullptr},
    {sizeof(real32), nullptr, nullptr, equal<real32>},
    {sizeof(real64), nullptr, nullptr, equal<real64>},
    {sizeof(char16), nullptr, nullptr, nullptr},
    {sizeof(String), construct<String>, destruct<String>, equal<String>},
    {sizeof(Datetime), construct<Datetime>, destruct<Datetime>, equal<Datetime>},
};

const Array_Traits instance_array_traits = {sizeof(void*), nullptr, nullptr, nullptr};

struct alignas(std::max_align_t) Array_Base::Rep {
    const Array_Traits* traits;
    std::size_t size;
    std::size_t capacity; // in elements
    bool is_cut;          // from a block; the elements follow

    char* at(std::size_t index) { return reinterpret_cast<char*>(this + 1) + index * traits->element_size; }
    const char* at(std::size_t index) const
    {
        return reinterpret_cast<const char*>(this + 1) + index * traits->element_size;
    }
};

Array_Base::Rep Array_Base::empty_reps[number_of_types + 1] = {
    {&array_traits[0], 0, first_capacity, false},       {&array_traits[1], 0, first_capacity, false},
    {&array_traits[2], 0, first_capacity, false},       {&array_traits[3], 0, first_capacity, false},
    {&array_traits[4], 0, first_capacity, false},       {&array_traits[5], 0, first_capacity, false},
    {&array_traits[6], 0, first_capacity, false},       {&array_traits[7], 0, first_capacity, false},
    {&array_traits[8], 0, first_capacity, false},       {&array_traits[9], 0, first_capacity, false},
    {&array_traits[10], 0, first_capacity, false},      {&array_traits[11], 0, first_capacity, false},
    {&array_traits[12], 0, first_capacity, false},      {&array_traits[13], 0, first_capacity, false},
    {&instance_array_traits, 0, first_capacity, false},
};

namespace {

void destruct_all(const Array_Traits& traits, char* element, std::size_t count) noexcept
{
    if (!traits.destruct) return;
    for (; count; --count, element += traits.element_size)
        traits.destruct(element);
}

// All or none.
void construct_all(const Array_Traits& traits, char* to, const char* from, std::size_t count)
{
    if (count == 0) return;
    if (!traits.construct) {
        std::memcpy(to, from, count * traits.element_size);
        return;
    }
    std::size_t made = 0;
    try {
        for (; made < count; ++made)
            traits.construct(to + made * traits.element_size, from + made * traits.element_size);
    } catch (...) {
        destruct_all(traits, to, made);
        throw;
    }
}

} // namespace

Array_Base::Rep* Array_Base::new_rep(const Array_Traits& traits, std::size_t capacity)
{
    if (capacity > (SIZE_MAX / 4 - sizeof(Rep)) / traits.element_size) throw std::bad_alloc();
    bool is_cut;
    void* place = Blocks::allocate(sizeof(Rep) + capacity * traits.element_size, is_cut);
    return new (place) Rep{&traits, 0, capacity, is_cut};
}

// The shared empty rep of the traits, or null for traits of a room's own.
Array_Base::Rep* Array_Base::empty_rep(const Array_Traits& traits) noexcept
{
    const std::uintptr_t distance =
        reinterpret_cast<std::uintptr_t>(&traits) - reinterpret_cast<std::uintptr_t>(array_traits);
    if (distance < sizeof(array_traits)) return &empty_reps[distance / sizeof(Array_Traits)];
    return &traits == &instance_array_traits ? &empty_reps[number_of_types] : nullptr;
}

bool Array_Base::is_shared(const Rep* rep) noexcept
{
    return reinterpret_cast<std::uintptr_t>(rep) - reinterpret_cast<std::uintptr_t>(empty_reps) < sizeof(empty_reps);
}

void Array_Base::free_rep(Rep* rep) noexcept
{
    if (is_shared(rep)) return;
    destruct_all(*rep->traits, rep->at(0), rep->size);
    Blocks::deallocate(rep, rep->is_cut);
}

// A rep with copies of `source`'s elements but the `left_out` ones from `gap` on.
Array_Base::Rep* Array_Base::copy_rep(const Rep& source, std::size_t capacity, std::size_t gap, std::size_t left_out)
{
    Rep* rep = new_rep(*source.traits, capacity);
    try {
        construct_all(*rep->traits, rep->at(0), source.at(0), gap);
        rep->size = gap;
        construct_all(*rep->traits, rep->at(gap), source.at(gap + left_out), source.size - gap - left_out);
        rep->size = source.size - left_out;
    } catch (...) {
        free_rep(rep);
        throw;
    }
    return rep;
}

Array_Base::Array_Base(const Array_Traits& traits) : m_rep(empty_rep(traits))
{
    if (!m_rep) m_rep = new_rep(traits, first_capacity);
}

Array_Base::Array_Base(const Array_Base& other) : m_rep(nullptr)
{
    const Rep& source = *other.m_rep;
    if (source.size == 0) m_rep = empty_rep(*source.traits);
    if (!m_rep) m_rep = copy_rep(source, std::max(source.size, first_capacity), source.size, 0);
}

Array_Base::~Array_Base()
{
    free_rep(m_rep);
}

Array_Base& Array_Base::operator=(const Array_Base& other)
{
    Array_Base copy(other);
    swap(copy);
    return *this;
}

void Array_Base::swap(Array_Base& other) noexcept
{
    std::swap(m_rep, other.m_rep);
}

std::size_t Array_Base::size() const
{
    return m_rep->size;
}

std::size_t Array_Base::capacity() const
{
    return m_rep->capacity;
}

const Array_Traits& Array_Base::traits() const
{
    return *m_rep->traits;
}

const void* Array_Base::data() const
{
    return m_rep->at(0);
}

void* Array_Base::data()
{
    return m_rep->at(0);
}

const void* Array_Base::at(std::size_t index) const
{
    assert(index < m_rep->size);
    return m_rep->at(index);
}

void* Array_Base::at(std::size_t index)
{
    assert(index < m_rep->size);
    return m_rep->at(index);
}

void Array_Base::append(const void* elements, std::size_t count)
{
    if (count == 0) return;
    const std::size_t size = m_rep->size;
    const char* source = static_cast<const char*>(elements);
    if (!is_shared(m_rep) && count <= m_rep->capacity - size) {
        construct_all(*m_rep->traits, m_rep->at(size), source, count);
        m_rep->size = size + count;
        return;
    }
    if (count > SIZE_MAX / 4 - size) throw std::bad_alloc();
    // The old rep goes last: the elements may lie in it.
    Rep* rep = copy_rep(*m_rep, std::max({size + count, size * 2, first_capacity}), size, 0);
    try {
        construct_all(*rep->traits, rep->at(size), source, count);
    } catch (...) {
        free_rep(rep);
        throw;
    }
    rep->size = size + count;
    free_rep(m_rep);
    m_rep = rep;
}

void Array_Base::remove(std::size_t index, std::size_t count)
{
    const std::size_t size = m_rep->size;
    if (index >= size || count == 0) return;
    count = std::min(count, size - index);
    const Array_Traits& traits = *m_rep->traits;
    const std::size_t behind = size - index - count;
    if (behind && traits.construct) {
        Rep* rep = copy_rep(*m_rep, m_rep->capacity, index, count);
        free_rep(m_rep);
        m_rep = rep;
        return;
    }
    destruct_all(traits, m_rep->at(index), count);
    if (behind) std::memmove(m_rep->at(index), m_rep->at(index + count), behind * traits.element_size);
    m_rep->size = size - count;
}

void Array_Base::clear()
{
    remove(0, m_rep->size);
}

void Array_Base::reserve(std::size_t capacity)
{
    if (!is_shared(m_rep) && capacity <= m_rep->capacity) return;
    Rep* rep = copy_rep(*m_rep, std::max(capacity, first_capacity), m_rep->size, 0);
    free_rep(m_rep);
    m_rep = rep;
}

bool operator==(const Array_Base& a, const Array_Base& b)
{
    if (&a.traits() != &b.traits() || a.size() != b.size()) return false;
    const Array_Traits& traits = a.traits();
    if (!traits.equal) return a.size() == 0 || std::memcmp(a.data(), b.data(), a.size() * traits.element_size) == 0;
    for (std::size_t i = 0; i < a.size(); ++i)
        if (!traits.equal(a.at(i), b.at(i))) return false;
    return true;
}

} // namespace cimple
