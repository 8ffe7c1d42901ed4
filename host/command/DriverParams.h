/// The verb that lists the driver's parameters, which are instances rather than the answer of a method.
#pragma once

#include "host/command/Actions.h"

namespace host {

/// Those of the run's port, or with the flag "--global" those of all ports, as a table or as JSON. The exit status.
int list_driver_params(const Action_Run& run);

} // namespace host
