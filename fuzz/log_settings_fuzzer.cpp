// The log's settings file: what it says, and a trace file at whatever path it names.
#include <cerrno>
#include <cstdarg>
#include <cstring>
#include <fcntl.h>

#include "foundation/CLogger.h"
#include "foundation/NVR_FileLogger.h"
#include "fuzz/fuzzing.h"
#include "tests/support/private_host.h"
#include "tests/support/private_host_setup.h"

using namespace cimple;
using fuzzing::expect;

extern "C" int __real_open(const char* path, int flags, ...);

/// The linker sends every call of open here: a trace file may stand where the private host's folders are, but the rest
/// of the machine keeps its files.
extern "C" int __wrap_open(const char* path, int flags, ...)
{
    va_list arguments;
    va_start(arguments, flags);
    const int mode = flags & O_CREAT ? va_arg(arguments, int) : 0;
    va_end(arguments);
    const bool inside =
        (std::strncmp(path, "/etc/", 5) == 0 || std::strncmp(path, "/var/log/", 9) == 0) && !std::strstr(path, "/..");
    if ((flags & O_ACCMODE) != O_RDONLY && !inside) {
        errno = EACCES;
        return -1;
    }
    return __real_open(path, flags, mode);
}

extern "C" int LLVMFuzzerInitialize(int*, char*** argv)
{
    nvrtest::enter_private_host(*argv);
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    CLogger& logger = *CLogger::instance();
    logger.setMode(0);
    logger.enable();
    nvrtest::write_file(log_settings_path, std::string(reinterpret_cast<const char*>(data), size));
    NVR_FileLogger trace;
    logger.loadSettings();
    expect(logger.getMode() <= 4, "the mode is one of five");
    expect(logger.getLevel() >= 0 && logger.getLevel() <= 5, "the level keeps to its range");
    NVR_LOG("a line");
    const uint32 mode = logger.getMode();
    const String path = trace.getPath();
    logger.saveSettings();
    logger.loadSettings();
    if (mode == 2 || mode == 4) {
        expect(logger.getMode() == mode, "a mode that was saved is loaded");
        if (!std::strchr(path.c_str(), '\r')) // which ends a path in the file
            expect(trace.getPath() == path, "a path that was saved is loaded");
    }
    const bool ours = !path.empty() && std::strncmp(path.c_str(), "/var/log/", 9) == 0;
    trace.close();
    if (ours) nvrtest::remove(path.c_str());
    return 0;
}
