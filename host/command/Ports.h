/// The ports as listings of FC hosts show them: names, speeds, firmware and driver, and the counters of errors.
#pragma once

#include "host/Host.h"
#include "host/command/Options.h"

#include <ostream>

namespace host {

/// The verb `ports`. The result is the exit status.
int show_ports(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

} // namespace host
