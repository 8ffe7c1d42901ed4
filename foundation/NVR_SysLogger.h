/// The system log: records of the levels 1 to 4 go to syslog, under the name "[NVR][CIM][FC]".
///
/// Stateless. Its end closes the process's connection to the system log and takes it from CLogger. Its constructor
/// leaves errno as it was, since the connection it opens may fail.
#pragma once

#include "foundation/NVR_LoggerInterface.h"

namespace cimple {

class NVR_SysLogger final : public NVR_LoggerInterface {
public:
    NVR_SysLogger();
    ~NVR_SysLogger() override;
    NVR_SysLogger(const NVR_SysLogger&) = delete;
    NVR_SysLogger& operator=(const NVR_SysLogger&) = delete;

    void logMessage(sint32 level, const char* file, uint32 line, const char* text) override;
    void open() override {}
    void close() override {}
    void clear() override {}
};

} // namespace cimple
