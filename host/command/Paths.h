/// The routes to the logical units, one a row: from the name that the operating system has for the unit, over the ports
/// at both ends, to what the unit says it is.
#pragma once

#include "host/Host.h"
#include "host/command/Options.h"

#include <ostream>

namespace host {

/// The verb `paths`: asks for each class once, whatever the number of routes. The result is the exit status.
int show_paths(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

} // namespace host
