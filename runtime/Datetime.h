/// A CIM datetime: a point in time with its offset from UTC, or an interval. The value type of CIM datetimes.
///
/// A Datetime is one pointer to a shared, counted rep; writing to a shared rep makes a new one. The default value is
/// the interval of length zero. Threads and exceptions as with String.
#pragma once

#include <cstddef>

#include "runtime/Type.h"

namespace cimple {

class Datetime {
public:
    Datetime() noexcept : m_rep(nullptr) {}
    Datetime(const Datetime& other) noexcept : m_rep(other.m_rep)
    {
        if (m_rep) count_up(m_rep);
    }
    /// An interval of `usec` microseconds.
    explicit Datetime(uint64 usec);
    /// A timestamp `usec` microseconds behind the epoch, told in a zone `utc` minutes east of UTC.
    Datetime(uint64 usec, sint32 utc);
    ~Datetime()
    {
        if (m_rep) release(m_rep);
    }
    Datetime& operator=(const Datetime& other) noexcept;

    /// The current time; the zero interval if the system's clock fails.
    static Datetime now();

    /// Reads the 25-character form of DSP0004: interval "ddddddddhhmmss.mmmmmm:000" or timestamp
    /// "yyyymmddhhmmss.mmmmmmsutc". The date of a timestamp is read as local time, whatever its offset says.
    /// Result 1, or 0 for null, a text of another form, or a date before the epoch, which usec() cannot tell; this
    /// Datetime is then unchanged.
    int set(const char* text);

    uint64 usec() const;
    /// Minutes east of UTC; 0 for an interval.
    sint32 utc() const;
    bool is_timestamp() const;
    bool is_interval() const { return !is_timestamp(); }
    void set_interval(uint64 usec);
    void set_timestamp(uint64 usec, sint32 utc);

    static constexpr std::size_t text_size = 64;
    /// The 25-character form (longer where a value outgrows its field).
    void ascii(char (&text)[text_size]) const { print(text, false); }
    /// The readable form: "yyyy/mm/dd hh:mm:ss.mmmmmm+utc", or an interval with blanks between its parts.
    void pretty(char (&text)[text_size]) const { print(text, true); }
    /// now() as pretty() writes it, for messages: asks for no memory.
    static void now_pretty(char (&text)[text_size]);

private:
    struct Rep;
    static void count_up(Rep* rep) noexcept;
    static void release(Rep* rep) noexcept;
    void assign(uint64 usec, sint32 utc, bool is_timestamp);
    void print(char (&text)[text_size], bool prettify) const;
    Rep* m_rep; // null: the zero interval
};

bool operator==(const Datetime& a, const Datetime& b);
inline bool operator!=(const Datetime& a, const Datetime& b)
{
    return !(a == b);
}

static_assert(sizeof(Datetime) == sizeof(void*));

} // namespace cimple
