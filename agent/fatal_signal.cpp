#include "agent/fatal_signal.h"

#include <cstdlib>
#include <execinfo.h>
#include <syslog.h>

#include "foundation/CLogger.h"

namespace cimple {

void fatalSignalHandler(int, siginfo_t*, void*)
{
    constexpr int max_frames = 16;
    syslog(LOG_INFO, "Signal in CIM Provider");
    void* frames[max_frames];
    const int count = backtrace(frames, max_frames);
    char** names = backtrace_symbols(frames, count);
    NVR_LOG("Back Trace Execution Path:");
    for (int i = 0; names && i < count; i++)
        NVR_LOG("Trace message [bt] %s", names[i]);
    std::exit(1);
}

struct sigaction prepareFatalSignalAction()
{
    struct sigaction action = {};
    action.sa_sigaction = &fatalSignalHandler;
    sigemptyset(&action.sa_mask);
    action.sa_flags = SA_SIGINFO;
    return action;
}

} // namespace cimple
