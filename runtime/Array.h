/// A growing array of values of one CIM type: the value type of CIM arrays.
///
/// Array_Base is one pointer to a rep of (traits, size, capacity, elements) and knows its element type only through
/// Array_Traits, so that code that walks class records can handle every array alike. Array<T> is the typed face of the
/// same handle. Copying copies the elements. No locks; one thread at a time. What makes or grows a rep throws
/// std::bad_alloc and leaves the array as it was.
#pragma once

#include <cstddef>
#include <initializer_list>

#include "runtime/Type.h"

namespace cimple {

struct Instance;

/// How to handle the elements of an array. A null function means bytes: plain copy, no destructor, comparison of bytes.
struct Array_Traits {
    std::size_t element_size;
    void (*construct)(void* element, const void* source); // copy-constructs `element` from `source`
    void (*destruct)(void* element);
    bool (*equal)(const void* a, const void* b);
};

/// The traits of each Type, by code; and those of arrays of Instance pointers, which own nothing by themselves.
extern const Array_Traits array_traits[number_of_types];
extern const Array_Traits instance_array_traits;

class Array_Base {
public:
    /// An empty array. Allocates nothing, and cannot throw, for the traits declared above.
    explicit Array_Base(const Array_Traits& traits);
    Array_Base(const Array_Base& other);
    ~Array_Base();
    Array_Base& operator=(const Array_Base& other);

    std::size_t size() const;
    /// Elements that fit without growing: 8 at first.
    std::size_t capacity() const;
    const Array_Traits& traits() const;
    /// The elements, contiguous; null or not when empty. Valid until the array is written to.
    const void* data() const;
    void* data();
    /// The element at `index`, which must lie inside.
    const void* at(std::size_t index) const;
    void* at(std::size_t index);

    /// Appends copies of `count` elements at `elements` (which may lie in this very array).
    void append(const void* elements, std::size_t count);
    /// Removes `count` elements from `index` on; what lies outside the array is not counted.
    void remove(std::size_t index, std::size_t count = 1);
    void clear();
    void reserve(std::size_t capacity);
    void swap(Array_Base& other) noexcept;

private:
    struct Rep;
    static Rep empty_reps[number_of_types + 1]; // what empty arrays of the declared traits share; never written to
    static Rep* new_rep(const Array_Traits& traits, std::size_t capacity);
    static Rep* empty_rep(const Array_Traits& traits) noexcept;
    static void free_rep(Rep* rep) noexcept;
    static bool is_shared(const Rep* rep) noexcept;
    static Rep* copy_rep(const Rep& source, std::size_t capacity, std::size_t gap, std::size_t left_out);
    Rep* m_rep;
};

/// Same size and equal elements.
bool operator==(const Array_Base& a, const Array_Base& b);
inline bool operator!=(const Array_Base& a, const Array_Base& b)
{
    return !(a == b);
}

/// Traits_Of<T>::traits(): the Array_Traits of a C++ element type. Special element types of a room specialise it.
template <class T>
struct Traits_Of {
    static const Array_Traits& traits() { return array_traits[Type_Of<T>::code]; }
};
template <class T>
struct Traits_Of<T*> {
    static const Array_Traits& traits() { return instance_array_traits; }
};

template <class T>
class Array : public Array_Base {
public:
    Array() : Array_Base(Traits_Of<T>::traits()) {}
    Array(std::initializer_list<T> elements) : Array() { Array_Base::append(elements.begin(), elements.size()); }

    const T& operator[](std::size_t i) const { return *static_cast<const T*>(at(i)); }
    T& operator[](std::size_t i) { return *static_cast<T*>(at(i)); }
    void append(const T& element) { Array_Base::append(&element, 1); }
    void append(const T* elements, std::size_t count) { Array_Base::append(elements, count); }
    const T* begin() const { return static_cast<const T*>(data()); }
    const T* end() const { return begin() + size(); }
    T* begin() { return static_cast<T*>(data()); }
    T* end() { return begin() + size(); }
};

static_assert(sizeof(Array_Base) == sizeof(void*));

} // namespace cimple
