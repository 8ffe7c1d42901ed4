/// What nvrcim does: one request on a host, and its answer printed.
#pragma once

#include "host/Host.h"
#include "host/command/Options.h"

#include <ostream>

namespace host {

/// Runs the verb of the options on a server that has its module. Results go to `out`, complaints to `complaints`,
/// each beginning with whose fault it is. The result is the exit status.
int run_verb(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

/// "nvrcim: the provider answered CMPI_RC_ERR_NOT_FOUND (6): ..." and so on.
std::string complaint(const Status& status);

/// Object paths, one a line; with --csv under a header.
std::string path_lines(const std::vector<Path>& paths, const Options& options);

// For the verbs, the two ways to end without success; each gives the exit status.

/// The command cannot be understood.
int tell_wrong(const std::string& text, std::ostream& complaints);
/// A request failed; with --json it is told in JSON too.
int tell_failure(const Status& status, const Options& options, std::ostream& out, std::ostream& complaints);

/// Finds the port that the user named, or the only one, among those of `class_name`, whose key DeviceID is its name.
/// `unnamed` is what the complaint asks for where there are several and none was named. 0, or the exit status.
int find_port(Host& server, const Options& options, const char* class_name, const char* unnamed, Path& found,
              std::ostream& out, std::ostream& complaints);

} // namespace host
