/// The verb `check`: are the associations of the module whole?
#pragma once

#include "host/Host.h"
#include "host/command/Options.h"

#include <ostream>

namespace host {

/// Reads every association class that the module serves. Both ends of each instance must exist as instances, and names
/// of associators and of references asked from either end must lead to the other. Hosts and profiles of other providers
/// are taken on trust; ends that are loose by design are counted, not blamed. Prints a line for each fault and a
/// summary, with --all a line for each class. Exit status 0, or 1 if there is a fault.
int check_associations(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

} // namespace host
