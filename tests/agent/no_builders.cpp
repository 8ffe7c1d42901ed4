// What the agent's own tests compose into its refresh.
#include "tests/agent/Simulated_Host.h"

namespace {

cimple::uint32 driverLog(cimple::ProviderAgent& agent)
{
    if (nvrtest::on_driver_log) nvrtest::on_driver_log(agent);
    return 0;
}

} // namespace

namespace cimple {

const Agent_Builders agent_builders = {nullptr, nullptr, nullptr, &driverLog, nullptr, nullptr, nullptr};

} // namespace cimple
