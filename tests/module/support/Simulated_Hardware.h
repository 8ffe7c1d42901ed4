/// The simulated libraries: see tests/support/simulator.h.
#pragma once

#include "tests/support/simulator.h"
