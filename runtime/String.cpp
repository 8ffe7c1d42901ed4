#include "runtime/String.h"

#include <cstdint>
#include <cstring>
#include <new>

#include "runtime/Blocks.h"

namespace cimple {

namespace {

constexpr std::size_t smallest_capacity = 32;

std::size_t length_of(const char* text)
{
    return text ? std::strlen(text) : 0;
}

std::size_t rounded_up(std::size_t size)
{
    if (size > SIZE_MAX / 4) throw std::bad_alloc();
    std::size_t capacity = smallest_capacity;
    while (capacity < size)
        capacity *= 2;
    return capacity;
}

} // namespace

String::Empty_Rep String::empty_rep{{{2}, false, 0, smallest_capacity}, {}};

String::Rep* String::new_rep(std::size_t capacity)
{
    capacity = rounded_up(capacity);
    bool is_cut;
    void* place = Blocks::allocate(sizeof(Rep) + capacity + 1, is_cut);
    Rep* rep = new (place) Rep{{1}, is_cut, 0, capacity};
    bytes(rep)[0] = '\0';
    return rep;
}

void String::free_rep(Rep* rep) noexcept
{
    const bool is_cut = rep->is_cut;
    rep->~Rep();
    Blocks::deallocate(rep, is_cut);
}

// Fills `rep`, fresh and unshared, before the old rep goes: `text` may lie in that.
void String::adopt(Rep* rep, const char* text, std::size_t size) noexcept
{
    if (size) std::memcpy(bytes(rep), text, size);
    bytes(rep)[size] = '\0';
    rep->size = size;
    Rep* old = m_rep;
    m_rep = rep;
    release(old);
}

String::String(const char* text) : String(text, length_of(text)) {}

String::String(const char* text, std::size_t size) : m_rep(&empty_rep.head)
{
    if (size) adopt(new_rep(size), text, size);
}

String& String::operator=(const char* text)
{
    assign(text, length_of(text));
    return *this;
}

void String::assign(const char* text, std::size_t size)
{
    if (size == 0) {
        clear();
    } else if (m_rep->refs.load(std::memory_order_acquire) == 1 && size <= m_rep->capacity) {
        std::memmove(bytes(m_rep), text, size);
        bytes(m_rep)[size] = '\0';
        m_rep->size = size;
    } else {
        adopt(new_rep(size), text, size);
    }
}

void String::reserve(std::size_t capacity)
{
    if (capacity < m_rep->size) capacity = m_rep->size;
    if (m_rep->refs.load(std::memory_order_acquire) == 1 && capacity <= m_rep->capacity) return;
    adopt(new_rep(capacity), bytes(m_rep), m_rep->size);
}

void String::append(const char* text, std::size_t size)
{
    if (size == 0) return;
    const std::size_t old_size = m_rep->size;
    if (size > SIZE_MAX / 4 - old_size) throw std::bad_alloc();
    if (m_rep->refs.load(std::memory_order_acquire) == 1 && old_size + size <= m_rep->capacity) {
        std::memmove(bytes(m_rep) + old_size, text, size);
        bytes(m_rep)[old_size + size] = '\0';
        m_rep->size = old_size + size;
        return;
    }
    Rep* rep = new_rep(old_size + size);
    std::memcpy(bytes(rep), bytes(m_rep), old_size);
    std::memcpy(bytes(rep) + old_size, text, size); // may lie in the old rep
    bytes(rep)[old_size + size] = '\0';
    rep->size = old_size + size;
    release(m_rep);
    m_rep = rep;
}

void String::append(const char* text)
{
    append(text, length_of(text));
}

void String::append(char c)
{
    append(&c, 1);
}

bool operator==(const String& a, const String& b)
{
    return a.size() == b.size() && std::memcmp(a.c_str(), b.c_str(), a.size()) == 0;
}

bool operator==(const String& a, const char* b)
{
    const std::size_t size = length_of(b);
    return a.size() == size && (size == 0 || std::memcmp(a.c_str(), b, size) == 0);
}

// clang-format off
const uint8 lower_case[256] = {
    0, 1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12, 13, 14, 15,
    16, 17, 18, 19, 20, 21, 22, 23, 24, 25, 26, 27, 28, 29, 30, 31,
    32, 33, 34, 35, 36, 37, 38, 39, 40, 41, 42, 43, 44, 45, 46, 47,
    48, 49, 50, 51, 52, 53, 54, 55, 56, 57, 58, 59, 60, 61, 62, 63,
    64, 97, 98, 99, 100, 101, 102, 103, 104, 105, 106, 107, 108, 109, 110, 111,
    112, 113, 114, 115, 116, 117, 118, 119, 120, 121, 122, 91, 92, 93, 94, 95,
    96, 97, 98, 99, 100, 101, 102, 103, 104, 105, 106, 107, 108, 109, 110, 111,
    112, 113, 114, 115, 116, 117, 118, 119, 120, 121, 122, 123, 124, 125, 126, 127,
    128, 129, 130, 131, 132, 133, 134, 135, 136, 137, 138, 139, 140, 141, 142, 143,
    144, 145, 146, 147, 148, 149, 150, 151, 152, 153, 154, 155, 156, 157, 158, 159,
    160, 161, 162, 163, 164, 165, 166, 167, 168, 169, 170, 171, 172, 173, 174, 175,
    176, 177, 178, 179, 180, 181, 182, 183, 184, 185, 186, 187, 188, 189, 190, 191,
    192, 193, 194, 195, 196, 197, 198, 199, 200, 201, 202, 203, 204, 205, 206, 207,
    208, 209, 210, 211, 212, 213, 214, 215, 216, 217, 218, 219, 220, 221, 222, 223,
    224, 225, 226, 227, 228, 229, 230, 231, 232, 233, 234, 235, 236, 237, 238, 239,
    240, 241, 242, 243, 244, 245, 246, 247, 248, 249, 250, 251, 252, 253, 254, 255,
};
// clang-format on

bool equali_tail(const char* a, const char* b)
{
    while (*a && *b) {
        ++a;
        ++b;
        if (lower_case[static_cast<uint8>(*a)] != lower_case[static_cast<uint8>(*b)]) return false;
    }
    return true;
}

bool equali(const String& a, const String& b)
{
    return a.size() == b.size() && equali(a.c_str(), b.c_str());
}

bool equali(const String& a, const char* b)
{
    return equali(a.c_str(), b);
}

} // namespace cimple
