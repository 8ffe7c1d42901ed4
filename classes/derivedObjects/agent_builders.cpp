// What the module composes into the agent's refresh.
#include "agent/Agent_Builders.h"

namespace cimple {

const Agent_Builders agent_builders = {};

} // namespace cimple
