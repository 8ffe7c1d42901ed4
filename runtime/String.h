/// A counted, copy-on-write byte string: the value type of CIM strings.
///
/// A String is one pointer to a shared rep. Copying counts the rep up; writing to a shared rep copies it first. All
/// empty strings share one static rep. Different Strings that share a rep may be used on different threads; one String
/// may not. Only what makes or grows a rep can throw, and then std::bad_alloc; the String is unchanged.
#pragma once

#include <atomic>
#include <cstddef>

#include "runtime/Type.h"

namespace cimple {

class String {
public:
    String() noexcept : m_rep(&empty_rep.head) {}
    String(const String& other) noexcept : m_rep(other.m_rep) { count_up(m_rep); }
    String(String&& other) noexcept : m_rep(other.m_rep) { other.m_rep = &empty_rep.head; }
    /// A copy of `text` up to its terminator; null counts as "".
    String(const char* text);
    /// A copy of `size` bytes at `text`; zero bytes are kept.
    String(const char* text, std::size_t size);
    ~String() { release(m_rep); }

    String& operator=(const String& other) noexcept
    {
        Rep* mine = m_rep;
        count_up(other.m_rep);
        m_rep = other.m_rep;
        release(mine);
        return *this;
    }
    String& operator=(String&& other) noexcept
    {
        swap(other);
        return *this;
    }
    /// As the constructors; `text` may lie in this very String.
    String& operator=(const char* text);
    void assign(const char* text, std::size_t size);
    void swap(String& other) noexcept
    {
        Rep* mine = m_rep;
        m_rep = other.m_rep;
        other.m_rep = mine;
    }

    /// The bytes, with a terminator behind them. Valid until this String is written to or ends.
    const char* c_str() const { return bytes(m_rep); }
    /// Number of bytes, without the terminator.
    std::size_t size() const { return m_rep->size; }
    /// Bytes that the rep can hold without growing: a power of two, at least 32.
    std::size_t capacity() const { return m_rep->capacity; }
    bool empty() const { return m_rep->size == 0; }
    char operator[](std::size_t i) const { return c_str()[i]; }

    /// `text` may lie in this very String; null counts as "".
    void append(char c);
    void append(const char* text);
    void append(const char* text, std::size_t size);
    void append(const String& other) { append(other.c_str(), other.size()); }
    /// Makes room for `capacity` bytes in a rep of this String's own.
    void reserve(std::size_t capacity);
    /// Goes back to the shared empty rep.
    void clear() noexcept
    {
        release(m_rep);
        m_rep = &empty_rep.head;
    }

private:
    struct Rep {
        std::atomic<uint32> refs;
        bool is_cut; // from a block
        std::size_t size;
        std::size_t capacity; // the terminator is not counted; the bytes follow
    };
    /// Its count stands at 2 for ever, so that it reads as shared to every writer. It is never counted: one cache line
    /// that all threads write to would make every copy of an empty property slow.
    struct Empty_Rep {
        Rep head;
        char bytes[33];
    };
    static Empty_Rep empty_rep;

    static char* bytes(Rep* rep) { return reinterpret_cast<char*>(rep + 1); }
    static void count_up(Rep* rep) noexcept
    {
        if (rep != &empty_rep.head) rep->refs.fetch_add(1, std::memory_order_relaxed);
    }
    static void release(Rep* rep) noexcept
    {
        if (rep != &empty_rep.head && rep->refs.fetch_sub(1, std::memory_order_acq_rel) == 1) free_rep(rep);
    }
    static Rep* new_rep(std::size_t capacity);
    static void free_rep(Rep* rep) noexcept;
    void adopt(Rep* rep, const char* text, std::size_t size) noexcept;

    Rep* m_rep;
};

/// Byte-wise equality, with case. A null text counts as "".
bool operator==(const String& a, const String& b);
bool operator==(const String& a, const char* b);
inline bool operator==(const char* a, const String& b)
{
    return b == a;
}
inline bool operator!=(const String& a, const String& b)
{
    return !(a == b);
}
inline bool operator!=(const String& a, const char* b)
{
    return !(a == b);
}
inline bool operator!=(const char* a, const String& b)
{
    return !(b == a);
}

/// The 256-entry table behind equali: ASCII capitals to small letters, all else to itself, in every locale.
extern const uint8 lower_case[256];

/// Are the texts equal from their second characters on, without case? The first are known to agree.
bool equali_tail(const char* a, const char* b);

/// Equality without case, for the names of classes and features. Most names differ in the first character, which is
/// looked at without a call. Null arguments are equal to nothing.
inline bool equali(const char* a, const char* b)
{
    return a && b && lower_case[static_cast<uint8>(*a)] == lower_case[static_cast<uint8>(*b)] && equali_tail(a, b);
}
bool equali(const String& a, const String& b);
bool equali(const String& a, const char* b);
inline bool equali(const char* a, const String& b)
{
    return equali(b, a);
}

static_assert(sizeof(String) == sizeof(void*));

} // namespace cimple
