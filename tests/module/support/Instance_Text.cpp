#include "tests/module/support/Instance_Text.h"

#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <map>
#include <sstream>
#include <unistd.h>
#include <unordered_map>

namespace nvrtest {

namespace {

// The clock of a test runs at most some days ahead.
bool is_present(const std::string& datetime)
{
    const std::time_t now = std::time(nullptr);
    for (int day = -1; day < 30; day++) {
        const std::time_t then = now + day * 86400;
        char text[16];
        std::tm broken;
        std::strftime(text, sizeof text, "%Y%m%d", localtime_r(&then, &broken));
        if (datetime.compare(0, 8, text) == 0) return true;
    }
    return false;
}

std::string own_dumps()
{
    const char* base = std::getenv("TMPDIR");
    return std::string(base && *base ? base : "/tmp") + "/nvrsim-dumps-" + std::to_string(getpid());
}

std::string text_of(const host::Value& value)
{
    if (value.type() == CMPI_dateTime && is_present(value.as_text())) return "<now>";
    // The simulator keeps dumps in a directory of the process.
    if (value.type() == CMPI_string && value.to_text() == own_dumps()) return "<the simulator's dumps>";
    std::string text;
    for (const char c : value.to_text()) {
        char escaped[8] = {c, '\0'};
        if (static_cast<unsigned char>(c) < 0x20) std::snprintf(escaped, sizeof escaped, "\\x%02X", c);
        text += escaped;
    }
    return text;
}

std::vector<std::string> lines(const std::string& text)
{
    std::vector<std::string> all;
    std::istringstream stream(text);
    for (std::string line; std::getline(stream, line);)
        all.push_back(line);
    return all;
}

} // namespace

std::string to_lines(const std::string& class_name, const std::vector<host::Instance>& instances)
{
    std::ostringstream text;
    for (std::size_t i = 0; i < instances.size(); i++) {
        std::map<std::string, std::string> properties;
        for (const host::Named_Value& property : instances[i].properties)
            if (!property.value.is_null())
                properties[property.name] =
                    host::type_name(property.value.type()) + ' ' + property.name + " = " + text_of(property.value);
        for (const auto& property : properties)
            text << class_name << '[' << i << "] " << property.second << '\n';
    }
    return text.str();
}

std::string lines_of_class(const std::string& text, const std::string& class_name)
{
    std::string mine;
    for (const std::string& line : lines(text))
        if (line.rfind(class_name + "[", 0) == 0) mine += line + '\n';
    return mine;
}

std::string difference(const std::string& expected, const std::string& actual)
{
    const std::vector<std::string> wanted = lines(expected);
    const std::vector<std::string> found = lines(actual);
    if (wanted == found) return {};
    std::unordered_map<std::string, long> missing; // less than 0: there are too many
    for (const std::string& line : wanted)
        missing[line]++;
    for (const std::string& line : found)
        missing[line]--;
    std::ostringstream result;
    for (const std::string& line : wanted)
        if (missing[line] > 0) result << "- " << line << '\n';
    for (const std::string& line : found)
        if (missing[line] < 0) result << "+ " << line << '\n';
    return result.str().empty() ? "the same lines, in another order\n" : result.str();
}

} // namespace nvrtest
