/// CMPIDateTime of the broker: the 25 characters of a CIM date-time, "yyyymmddhhmmss.mmmmmmsutc" or
/// "ddddddddhhmmss.mmmmmm:000" for an interval.
#pragma once

#include "host/objects/Object.h"

#include <string>

namespace host {

struct Manner;

class Date_Time_Object final : public Object {
public:
    static constexpr Object_Kind object_kind = Object_Kind::datetime;
    static CMPIDateTimeFT table(const Manner& manner);

    Date_Time_Object(Broker& owner, Origin from, std::string characters);
    std::string to_text() const override { return text; }

    CMPIDateTime face;
    std::string text;
};

/// True for 25 characters of one of the two forms; '*' may stand for digits.
bool is_date_time(const std::string& text);
/// Microseconds since 1970 (or of an interval) as text, in UTC.
std::string date_time_text(std::uint64_t microseconds, bool interval);
/// The reverse; '*' counts as 0.
std::uint64_t date_time_binary(const std::string& text);

} // namespace host
