/// A CIM datetime: a point in time with its offset from UTC, or an interval. The value type of CIM datetimes.
///
/// A Datetime is one pointer to a shared, counted rep; writing copies a shared rep first. The default value is the
/// interval of length zero. Threads as with String.
#pragma once

#include <cstddef>

#include "runtime/Type.h"

namespace cimple {

class Datetime {
public:
    Datetime() noexcept;
    Datetime(const Datetime& other) noexcept;
    /// An interval of `usec` microseconds.
    explicit Datetime(uint64 usec);
    /// A timestamp `usec` microseconds behind the epoch, told in a zone `utc` minutes east of UTC.
    Datetime(uint64 usec, sint32 utc);
    ~Datetime();
    Datetime& operator=(const Datetime& other) noexcept;

    /// The current time; the zero interval if the system's clock fails.
    static Datetime now();

    /// Reads the 25-character form of DSP0004: interval "ddddddddhhmmss.mmmmmm:000" or timestamp
    /// "yyyymmddhhmmss.mmmmmmsutc". The date of a timestamp is read as local time, whatever its offset says.
    /// Result 1, or 0 for a text of another form (this Datetime is then unchanged). Null is no text.
    int set(const char* text);

    uint64 usec() const;
    /// Minutes east of UTC; 0 for an interval.
    sint32 utc() const;
    bool is_timestamp() const;
    bool is_interval() const { return !is_timestamp(); }
    /// Milliseconds, for callers that count by them.
    void set_interval(uint64 usec);
    void set_timestamp(uint64 usec, sint32 utc);

    static constexpr std::size_t text_size = 64;
    /// The 25-character form (25 characters whenever the value fits it).
    void ascii(char (&text)[text_size]) const { print(text, false); }
    /// The readable form: "yyyy/mm/dd hh:mm:ss.mmmmmm+utc", or an interval with blanks between its parts.
    void pretty(char (&text)[text_size]) const { print(text, true); }

private:
    struct Rep;
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
