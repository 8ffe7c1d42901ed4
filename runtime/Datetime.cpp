#include "runtime/Datetime.h"

#include <atomic>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <sys/time.h>

namespace cimple {

namespace {

constexpr uint64 second = 1000000;
constexpr uint64 minute = 60 * second;
constexpr uint64 hour = 60 * minute;
constexpr uint64 day = 24 * hour;

constexpr std::size_t text_length = 25;
constexpr std::size_t kind_index = 21; // where ":", "+" or "-" tells the kind

/// Takes digits and fixed characters from a text, in order, and remembers the first that does not fit.
class Scanner {
public:
    explicit Scanner(const char* text) : m_text(text) {}

    uint32 digits(int count)
    {
        uint32 value = 0;
        for (; count; --count, ++m_text) {
            if (*m_text < '0' || *m_text > '9') {
                m_fits = false;
                return 0;
            }
            value = value * 10 + static_cast<uint32>(*m_text - '0');
        }
        return value;
    }
    void expect(char c)
    {
        if (*m_text == c)
            ++m_text;
        else
            m_fits = false;
    }
    bool fits() const { return m_fits; }

private:
    const char* m_text;
    bool m_fits = true;
};

bool scan_interval(const char* text, uint64& usec)
{
    Scanner scanner(text);
    usec = scanner.digits(8) * day;
    usec += scanner.digits(2) * hour;
    usec += scanner.digits(2) * minute;
    usec += scanner.digits(2) * second;
    scanner.expect('.');
    usec += scanner.digits(6);
    return scanner.fits() && std::strcmp(text + kind_index, ":000") == 0;
}

bool scan_timestamp(const char* text, uint64& usec, sint32& utc)
{
    Scanner scanner(text);
    std::tm date{};
    date.tm_year = static_cast<int>(scanner.digits(4)) - 1900;
    date.tm_mon = static_cast<int>(scanner.digits(2)) - 1;
    date.tm_mday = static_cast<int>(scanner.digits(2));
    date.tm_hour = static_cast<int>(scanner.digits(2));
    date.tm_min = static_cast<int>(scanner.digits(2));
    date.tm_sec = static_cast<int>(scanner.digits(2));
    date.tm_isdst = -1;
    scanner.expect('.');
    const uint32 fraction = scanner.digits(6);
    const char sign = text[kind_index];
    scanner.expect(sign);
    utc = static_cast<sint32>(scanner.digits(3));
    if (sign == '-') utc = -utc;
    if (!scanner.fits()) return false;
    const std::time_t time = std::mktime(&date);
    if (time < 0) return false;
    usec = static_cast<uint64>(time) * second + fraction;
    return true;
}

/// The system's clock: microseconds since the epoch, and the zone. False if it fails.
bool read_clock(uint64& usec, sint32& utc)
{
    timeval time{};
    struct timezone zone {};
    if (gettimeofday(&time, &zone) != 0) return false;
    usec = static_cast<uint64>(time.tv_sec) * second + static_cast<uint64>(time.tv_usec);
    utc = -zone.tz_minuteswest;
    return true;
}

void write(char (&text)[Datetime::text_size], uint64 usec, sint32 utc, bool is_timestamp, bool prettify)
{
    const auto fraction = static_cast<unsigned>(usec % second);
    if (!is_timestamp) {
        std::snprintf(text, sizeof text, prettify ? "%08u %02u %02u %02u.%06u:000" : "%08u%02u%02u%02u.%06u:000",
                      static_cast<unsigned>(usec / day), static_cast<unsigned>(usec / hour % 24),
                      static_cast<unsigned>(usec / minute % 60), static_cast<unsigned>(usec / second % 60), fraction);
        return;
    }
    const auto time = static_cast<std::time_t>(usec / second);
    std::tm date{};
    localtime_r(&time, &date);
    const long long zone = utc;
    std::snprintf(text, sizeof text,
                  prettify ? "%04d/%02d/%02d %02d:%02d:%02d.%06d%c%03d" : "%04d%02d%02d%02d%02d%02d.%06d%c%03d",
                  date.tm_year + 1900, date.tm_mon + 1, date.tm_mday, date.tm_hour, date.tm_min, date.tm_sec,
                  static_cast<int>(fraction), zone < 0 ? '-' : '+', static_cast<int>(zone < 0 ? -zone : zone));
}

} // namespace

struct Datetime::Rep {
    std::atomic<uint32> refs;
    uint64 usec;
    sint32 utc;
    bool is_timestamp;
};

void Datetime::count_up(Rep* rep) noexcept
{
    rep->refs.fetch_add(1, std::memory_order_relaxed);
}

void Datetime::release(Rep* rep) noexcept
{
    if (rep->refs.fetch_sub(1, std::memory_order_acq_rel) == 1) delete rep;
}

// Every write replaces the whole value, so a shared rep is left to the others rather than copied.
void Datetime::assign(uint64 usec, sint32 utc, bool is_timestamp)
{
    if (m_rep && m_rep->refs.load(std::memory_order_acquire) == 1) {
        m_rep->usec = usec;
        m_rep->utc = utc;
        m_rep->is_timestamp = is_timestamp;
        return;
    }
    Rep* rep = new Rep{{1}, usec, utc, is_timestamp};
    if (m_rep) release(m_rep);
    m_rep = rep;
}

Datetime::Datetime(uint64 usec) : Datetime()
{
    set_interval(usec);
}

Datetime::Datetime(uint64 usec, sint32 utc) : Datetime()
{
    set_timestamp(usec, utc);
}

Datetime& Datetime::operator=(const Datetime& other) noexcept
{
    Rep* mine = m_rep;
    if (other.m_rep) count_up(other.m_rep);
    m_rep = other.m_rep;
    if (mine) release(mine);
    return *this;
}

Datetime Datetime::now()
{
    uint64 usec = 0;
    sint32 utc = 0;
    return read_clock(usec, utc) ? Datetime(usec, utc) : Datetime();
}

int Datetime::set(const char* text)
{
    if (!text || strnlen(text, text_length + 1) != text_length) return 0;
    uint64 usec = 0;
    sint32 utc = 0;
    switch (text[kind_index]) {
    case ':':
        if (!scan_interval(text, usec)) return 0;
        set_interval(usec);
        return 1;
    case '+':
    case '-':
        if (!scan_timestamp(text, usec, utc)) return 0;
        set_timestamp(usec, utc);
        return 1;
    default:
        return 0;
    }
}

uint64 Datetime::usec() const
{
    return m_rep ? m_rep->usec : 0;
}

sint32 Datetime::utc() const
{
    return m_rep ? m_rep->utc : 0;
}

bool Datetime::is_timestamp() const
{
    return m_rep && m_rep->is_timestamp;
}

void Datetime::set_interval(uint64 usec)
{
    assign(usec, 0, false);
}

void Datetime::set_timestamp(uint64 usec, sint32 utc)
{
    assign(usec, utc, true);
}

void Datetime::print(char (&text)[text_size], bool prettify) const
{
    write(text, usec(), utc(), is_timestamp(), prettify);
}

void Datetime::now_pretty(char (&text)[text_size])
{
    uint64 usec = 0;
    sint32 utc = 0;
    const bool is_known = read_clock(usec, utc);
    write(text, usec, utc, is_known, true);
}

bool operator==(const Datetime& a, const Datetime& b)
{
    return a.usec() == b.usec() && a.utc() == b.utc() && a.is_timestamp() == b.is_timestamp();
}

} // namespace cimple
