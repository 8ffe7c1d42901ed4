/// The crash handler that the module holds and never installs: a CIM server's signals are its own.
#pragma once

#include <csignal>

namespace cimple {

/// Writes the stack to the logs and ends the process.
[[noreturn]] void fatalSignalHandler(int signal, siginfo_t* information, void* context);

/// The action record for that handler, registered with no signal.
struct sigaction prepareFatalSignalAction();

} // namespace cimple
