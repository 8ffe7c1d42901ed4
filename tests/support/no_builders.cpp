// For programs that link rooms above the agent and never build one.
#include "agent/Agent_Builders.h"

namespace cimple {

const Agent_Builders agent_builders{};

} // namespace cimple
