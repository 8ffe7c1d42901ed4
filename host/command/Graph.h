/// The verb `graph`: the tree as a picture, drawn by Graphviz.
#pragma once

#include "host/Host.h"
#include "host/command/Options.h"
#include "host/command/Walk.h"

#include <ostream>

namespace host {

/// Walks as `tree` does and draws into the options' file, whose ending chooses SVG, PNG, or the plain graph (.dot),
/// which needs no Graphviz. The result is the exit status.
int draw_graph(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

/// The graph in Graphviz's own language.
std::string dot_text(const Walk& walk, const Schema& schema);

} // namespace host
