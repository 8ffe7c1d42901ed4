/// The verbs about diagnostic tests: what there is, one run, what runs have found, and the end of their records.
#pragma once

#include "host/Host.h"

#include <ostream>

namespace host {

struct Options;

/// Runs the verb that `options.method` names: list, run, results, clear. The result is the exit status.
int run_diagnostics(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

/// Exit status of a run whose test was carried out and failed.
constexpr int test_failed = 67;

} // namespace host
