// What the agent's own tests compose into its refresh.
#include "tests/agent/Simulated_Host.h"

namespace nvrtest {

Higher_Floors higher_floors;

} // namespace nvrtest

namespace {

using namespace nvrtest;
using cimple::ProviderAgent;
using cimple::uint32;

uint32 driverLog(ProviderAgent& agent)
{
    if (on_driver_log) on_driver_log(agent);
    return higher_floors.driver_log;
}
uint32 dumps(ProviderAgent&)
{
    return higher_floors.dumps;
}
uint32 virtualPorts(ProviderAgent&)
{
    return higher_floors.virtual_ports;
}
uint32 diagnostics(ProviderAgent&)
{
    return higher_floors.diagnostics ? higher_floors.diagnostics() : 0;
}

} // namespace

namespace cimple {

const Agent_Builders agent_builders = {nullptr, nullptr, nullptr, &driverLog, &dumps, &virtualPorts, &diagnostics};

} // namespace cimple
