/// What a sink of log records looks like to the dispatcher.
///
/// A logger attaches itself in its constructor and leaves the dispatcher in its destructor. CLogger calls it with the
/// dispatch mutex held (but see CLogger::log for the one exception), so it must not log from inside these operations.
#pragma once

#include "runtime/Type.h"

namespace cimple {

class NVR_LoggerInterface {
public:
    virtual ~NVR_LoggerInterface() = default;

    /// Takes one record or drops it. `file` and `text` are texts with a terminator, valid during the call.
    virtual void logMessage(sint32 level, const char* file, uint32 line, const char* text) = 0;
    /// Told when the mode becomes one of 1 to 4.
    virtual void open() = 0;
    /// Told when the mode becomes 0.
    virtual void close() = 0;
    /// Drops what was recorded so far.
    virtual void clear() = 0;
};

} // namespace cimple
