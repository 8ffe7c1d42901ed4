/// The runtime's own log: off unless `.cimplerc` in the folder of CIMPLE_HOME names a level; and the exported assertion
/// helpers.
///
/// Any thread. A message costs one comparison while the log is off. Lines go to `.cimple/messages` under that folder,
/// whole, also when several processes write there.
#pragma once

#include <atomic>

#include "runtime/Export.h"

namespace cimple {

enum Log_Level { LL_FATAL = 0, LL_ERR = 1, LL_WARN = 2, LL_INFO = 3, LL_DBG = 4 };

/// The highest level that is written, -1 while the log is closed; above all levels until somebody asks.
extern std::atomic<int> log_threshold;
/// Opens the log, once a process. True if a message of that level would be written.
bool log_open_and_ask(Log_Level level);

/// True if a message of that level would be written. Opens the log at the first call of the process.
inline bool log_wanted(Log_Level level)
{
    return level <= log_threshold.load(std::memory_order_acquire) && log_open_and_ask(level);
}

/// Writes one line by printf rules. Never fails, leaves errno as it was, and is no cancellation point.
void log_write(Log_Level level, const char* file, int line, const char* format, ...)
    __attribute__((format(printf, 4, 5)));

/// Lets the conversion layer's warnings through (on from the start) or not: it asks before it logs one.
void log_enable_warnings(bool enable);
bool log_warnings_enabled();

extern "C" {
/// Writes "TRACE: file(line): message" to standard error.
CIMPLE_EXPORT void __cimple_trace(const char* file, int line, const char* message);
/// Writes "file(line): function(): assert: expression" to standard error and aborts.
[[noreturn]] CIMPLE_EXPORT void __cimple_assert(const char* file, int line, const char* function,
                                                const char* expression);
}

} // namespace cimple

// The call site's file and line, and no formatting where nothing is written.
#define CIMPLE_LOG(LEVEL, ...)                                                                                         \
    do {                                                                                                               \
        if (::cimple::log_wanted(LEVEL)) ::cimple::log_write(LEVEL, __FILE__, __LINE__, __VA_ARGS__);                  \
    } while (0)
#define CIMPLE_DBG(...) CIMPLE_LOG(::cimple::LL_DBG, __VA_ARGS__)
#define CIMPLE_INFO(...) CIMPLE_LOG(::cimple::LL_INFO, __VA_ARGS__)
#define CIMPLE_WARN(...) CIMPLE_LOG(::cimple::LL_WARN, __VA_ARGS__)
#define CIMPLE_ERR(...) CIMPLE_LOG(::cimple::LL_ERR, __VA_ARGS__)
