#include "tests/foundation/syslog_spy.h"

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <syslog.h>

namespace nvrtest {

Syslog_Spy& syslog_spy()
{
    static Syslog_Spy spy;
    return spy;
}

} // namespace nvrtest

extern "C" void openlog(const char* ident, int option, int facility)
{
    auto& spy = nvrtest::syslog_spy();
    spy.ident = ident;
    spy.option = option;
    spy.facility = facility;
    spy.opened++;
    errno = ENOENT; // as where no system log listens
}

extern "C" void syslog(int priority, const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    char text[5000];
    std::vsnprintf(text, sizeof text, format, arguments);
    va_end(arguments);
    nvrtest::syslog_spy().entries.push_back({priority, format, text});
}

extern "C" void closelog()
{
    nvrtest::syslog_spy().closed++;
}
