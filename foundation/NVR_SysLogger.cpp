#include "foundation/NVR_SysLogger.h"

#include <atomic>
#include <cstdio>
#include <cstring>
#include <syslog.h>

#include "foundation/CLogger.h"
#include "runtime/Undisturbed.h"

namespace cimple {

extern std::atomic<NVR_SysLogger*> system_logger;

namespace {

// The name outlives the module: the process's own syslog calls read it for as long as nobody calls openlog again.
const char* lasting_name()
{
    static const char* const name = ::strdup("[NVR][CIM][FC]");
    return name;
}

// `text` becomes the format of a call without arguments. "%%" and "%m" take none and pass as they are; the sign of any
// other conversion is doubled, so that it stands in the log as it stands in the text.
void make_format(char* format, const char* text)
{
    for (; *text; text++) {
        *format++ = *text;
        if (*text != '%') continue;
        if (text[1] == '%' || text[1] == 'm')
            *format++ = *++text;
        else
            *format++ = '%';
    }
    *format = '\0';
}

} // namespace

NVR_SysLogger::NVR_SysLogger()
{
    CLogger::instance()->attach(this);
    Undisturbed undisturbed;
    ::openlog(lasting_name(), LOG_NDELAY | LOG_NOWAIT, LOG_USER);
}

NVR_SysLogger::~NVR_SysLogger()
{
    CLogger::instance()->detach(this);
    NVR_SysLogger* self = this;
    system_logger.compare_exchange_strong(self, nullptr);
    Undisturbed undisturbed;
    ::closelog();
}

void NVR_SysLogger::logMessage(sint32 level, const char*, uint32, const char* text)
{
    static const int priorities[] = {-1, LOG_CRIT, LOG_WARNING, LOG_ERR, LOG_INFO};
    if (level > NVR_INFO || level < NVR_CRIT) return;
    char record[2000];
    std::snprintf(record, sizeof record, "[%s]\n", text);
    // Two noisy callers were to be left out here. Records begin with a bracket, so these never match; what the log
    // carries has come to depend on that.
    if (std::strncmp(record, "GetInterfaceState", 15) == 0 || std::strncmp(record, "GetIPAddressType", 13) == 0) return;
    char format[2 * sizeof record];
    make_format(format, record);
#pragma GCC diagnostic push
#pragma GCC diagnostic ignored "-Wformat-security" // safe: make_format leaves no conversion that takes an argument
    ::syslog(priorities[level], format);
#pragma GCC diagnostic pop
}

} // namespace cimple
