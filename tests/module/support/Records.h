/// What a host has to tell once clients have used the module: the records of a diagnostic run and the driver's lines.
#pragma once

#include "tests/module/support/Rig.h"

namespace nvrtest {

/// Runs a diagnostic test on the first port, with a setting of the client's own, and has two lines of the driver read.
/// Then each association class that ever has instances has some. Throws std::runtime_error if a call is refused.
void leave_records(Rig& rig);

/// Clears the log of that test: its records go, their ties to what they were set to stay.
void clear_test_log(Rig& rig);

} // namespace nvrtest
