/// The module's logs and alerts as people use them: `log`, `driverlog` and `listen`.
///
/// Each runs on a server that has its module, and gives the exit status.
#pragma once

#include "host/Host.h"
#include "host/command/Options.h"

#include <ostream>

namespace CLI {
class App;
}

namespace host {

/// Adds the three verbs to the command line; what is given goes into the options.
void add_log_verbs(CLI::App& app, Options& options);

/// Shows the module's own record log, or steers the logger behind it.
int run_log(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

/// Has the driver's lines read from the system's log, and prints them, the newest last.
int show_driver_log(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

/// Prints alerts as they come, in the namespaces of the options, until so many came or the process is told to end.
int listen(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

} // namespace host
