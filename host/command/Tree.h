/// The verb `tree`: the host with all that hangs on it, as lines of text.
#pragma once

#include "host/Host.h"
#include "host/command/Options.h"

#include <ostream>

namespace host {

/// Walks the associations and prints what they tie together; with --json as nested objects. The result is the exit
/// status.
int show_tree(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

} // namespace host
