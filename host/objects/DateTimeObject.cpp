#include "host/objects/DateTimeObject.h"

#include "host/Broker.h"

#include <cstdio>
#include <cstdlib>
#include <ctime>

namespace host {
namespace {

constexpr std::size_t text_size = 25;

CMPIDateTime* clone(const CMPIDateTime* self, CMPIStatus* status)
{
    auto* object = unwrap<Date_Time_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? &object->broker.make<Date_Time_Object>(Origin::cloned, object->text)->face : nullptr;
}

CMPIUint64 get_binary_format(const CMPIDateTime* self, CMPIStatus* status)
{
    auto* object = unwrap<Date_Time_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? date_time_binary(object->text) : 0;
}

CMPIString* get_string_format(const CMPIDateTime* self, CMPIStatus* status)
{
    auto* object = unwrap<Date_Time_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object ? object->broker.make_string(Origin::got, object->text) : nullptr;
}

CMPIBoolean is_interval(const CMPIDateTime* self, CMPIStatus* status)
{
    auto* object = unwrap<Date_Time_Object>(self);
    put_status(status, object ? CMPI_RC_OK : CMPI_RC_ERR_INVALID_HANDLE);
    return object && object->text[21] == ':' ? CMPI_true : CMPI_false;
}

long number(const std::string& text, std::size_t at, std::size_t size)
{
    return std::strtol(text.substr(at, size).c_str(), nullptr, 10);
}

} // namespace

bool is_date_time(const std::string& text)
{
    if (text.size() != text_size || text[14] != '.') return false;
    if (text[21] != ':' && text[21] != '+' && text[21] != '-') return false;
    for (std::size_t i = 0; i < text_size; ++i)
        if (i != 14 && i != 21 && text[i] != '*' && (text[i] < '0' || text[i] > '9')) return false;
    return true;
}

std::string date_time_text(std::uint64_t microseconds, bool interval)
{
    char text[64];
    std::uint64_t seconds = microseconds / 1000000;
    unsigned rest = static_cast<unsigned>(microseconds % 1000000);
    if (interval) {
        auto days = static_cast<unsigned>(seconds / 86400 % 100000000);
        std::snprintf(text, sizeof text, "%08u%02u%02u%02u.%06u:000", days, static_cast<unsigned>(seconds / 3600 % 24),
                      static_cast<unsigned>(seconds / 60 % 60), static_cast<unsigned>(seconds % 60), rest);
        return text;
    }
    constexpr std::uint64_t year_10000 = 253402300800ull;
    auto time = static_cast<std::time_t>(seconds < year_10000 ? seconds : year_10000 - 1);
    std::tm parts{};
    gmtime_r(&time, &parts);
    std::snprintf(text, sizeof text, "%04d%02d%02d%02d%02d%02d.%06u+000", parts.tm_year + 1900, parts.tm_mon + 1,
                  parts.tm_mday, parts.tm_hour, parts.tm_min, parts.tm_sec, rest);
    return text;
}

std::uint64_t date_time_binary(const std::string& text)
{
    if (!is_date_time(text)) return 0;
    auto rest = static_cast<std::uint64_t>(number(text, 15, 6));
    if (text[21] == ':') {
        auto seconds =
            static_cast<std::uint64_t>(number(text, 0, 8)) * 86400 +
            static_cast<std::uint64_t>(number(text, 8, 2) * 3600 + number(text, 10, 2) * 60 + number(text, 12, 2));
        return seconds * 1000000 + rest;
    }
    std::tm parts{};
    parts.tm_year = static_cast<int>(number(text, 0, 4)) - 1900;
    parts.tm_mon = static_cast<int>(number(text, 4, 2)) - 1;
    parts.tm_mday = static_cast<int>(number(text, 6, 2));
    parts.tm_hour = static_cast<int>(number(text, 8, 2));
    parts.tm_min = static_cast<int>(number(text, 10, 2));
    parts.tm_sec = static_cast<int>(number(text, 12, 2));
    long minutes = number(text, 22, 3) * (text[21] == '-' ? -1 : 1);
    std::int64_t seconds = static_cast<std::int64_t>(timegm(&parts)) - minutes * 60;
    return seconds < 0 ? 0 : static_cast<std::uint64_t>(seconds) * 1000000 + rest;
}

CMPIDateTimeFT Date_Time_Object::table(const Manner& manner)
{
    CMPIDateTimeFT ft{};
    ft.ftVersion = manner.object_version;
    ft.release = release_face<Date_Time_Object, CMPIDateTime>;
    ft.clone = clone;
    ft.getBinaryFormat = get_binary_format;
    ft.getStringFormat = get_string_format;
    ft.isInterval = is_interval;
    return ft;
}

Date_Time_Object::Date_Time_Object(Broker& owner, Origin from, std::string characters)
    : Object(owner, object_kind, from), face{static_cast<Object*>(this), &owner.tables().datetime},
      text(std::move(characters))
{
}

} // namespace host
