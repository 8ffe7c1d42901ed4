/// nvrcim serve: the host over HTTP, until it is told to end.
#pragma once

#include "host/Host.h"
#include "host/command/Options.h"

#include <ostream>

namespace host {

/// Listens as the options say, tells where in its first line, and answers until SIGINT or SIGTERM. The result is the
/// exit status.
int serve(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

} // namespace host
