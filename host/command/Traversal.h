/// The verbs `associators` and `references`: what associations tie to one instance.
#pragma once

#include "host/Host.h"
#include "host/command/Options.h"

#include <ostream>

namespace host {

/// Traverses from the path by the options' classes and roles, and shows instances or, with --names, object paths. The
/// result is the exit status.
int traverse(Host& server, const Path& path, const Options& options, std::ostream& out, std::ostream& complaints);

} // namespace host
