/// A counted, copy-on-write byte string: the value type of CIM strings.
///
/// A String is one pointer to a shared rep. Copying counts the rep up; writing to a shared rep copies it first. All
/// empty strings share one static rep. Different Strings that share a rep may be used on different threads; one String
/// may not.
#pragma once

#include <cstddef>

#include "runtime/Type.h"

namespace cimple {

class String {
public:
    String() noexcept;
    String(const String& other) noexcept;
    /// A copy of `text` up to its terminator; null counts as "".
    String(const char* text);
    /// A copy of `size` bytes at `text`; zero bytes are kept.
    String(const char* text, std::size_t size);
    ~String();

    String& operator=(const String& other) noexcept;
    String& operator=(const char* text);
    void assign(const char* text, std::size_t size);

    /// The bytes, with a terminator behind them. Valid until this String is written to or ends.
    const char* c_str() const;
    /// Number of bytes, without the terminator.
    std::size_t size() const;
    /// Bytes that the rep can hold without growing: a power of two, at least 32.
    std::size_t capacity() const;
    bool empty() const { return size() == 0; }
    char operator[](std::size_t i) const { return c_str()[i]; }

    void append(char c);
    void append(const char* text);
    void append(const char* text, std::size_t size);
    void append(const String& other) { append(other.c_str(), other.size()); }
    void reserve(std::size_t capacity);
    void clear();

private:
    struct Rep;
    Rep* m_rep;
    friend struct String_Access;
};

/// Byte-wise equality, with case.
bool operator==(const String& a, const String& b);
bool operator==(const String& a, const char* b);
bool operator==(const char* a, const String& b);
inline bool operator!=(const String& a, const String& b)
{
    return !(a == b);
}
inline bool operator!=(const String& a, const char* b)
{
    return !(a == b);
}

/// Equality without case, for the names of classes and features: the first characters decide through a table before
/// the whole is compared. Null arguments are equal to nothing.
bool equali(const char* a, const char* b);
bool equali(const String& a, const String& b);
bool equali(const String& a, const char* b);

/// The 256-entry table behind equali: ASCII capitals to small letters, all else to itself.
extern const uint8 lower_case[256];

static_assert(sizeof(String) == sizeof(void*));

} // namespace cimple
