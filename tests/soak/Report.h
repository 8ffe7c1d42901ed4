/// What the user reads: lines as those of printf. One thread at a time.
#pragma once

#include <cstdio>

namespace soak {

/// Where the report goes; what the module writes to standard output goes nowhere from the first call on. Throws
/// std::runtime_error without an output.
std::FILE* report_stream();

template <class... Values>
void say(const char* format, Values... values)
{
    std::fprintf(report_stream(), format, values...);
}

/// Says it as a verdict; the result is `is_well`.
template <class... Values>
bool hold_against(bool is_well, const char* format, Values... values)
{
    say("%s", is_well ? "well: " : "NOT WELL: ");
    say(format, values...);
    return is_well;
}

} // namespace soak
