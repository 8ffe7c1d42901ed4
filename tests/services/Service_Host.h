/// A host whose services are published, for tests at a provider's own interface: of what no server hands over.
#pragma once

#include <string>
#include <vector>

#include "classes/NVRHBA_FCPort.h"
#include "tests/agent/Simulated_Host.h"

namespace nvrtest {

/// The name of the first port, as the library takes it.
constexpr HBA_WWN first_name = {{0x10, 0, 0, 0, 0xC9, 0xA0, 0, 1}};

class ServiceHost : public SimulatedHost {
protected:
    explicit ServiceHost(const std::string& toml)
    {
        scenario(toml);
        EXPECT_EQ(load(), 0);
        refresh();
        words();
    }
    ~ServiceHost() override
    {
        settle();
        unload();
    }

    cimple::NVRHBA_FCPort* port() { return agent().m_NVRHBA_FCPort_map[0]; }
    /// A port of that key, as no library would name it, that the agent takes for known.
    Ref<cimple::NVRHBA_FCPort> known_port(const char* device_id)
    {
        Ref<cimple::NVRHBA_FCPort> port(cimple::create_as<cimple::NVRHBA_FCPort>(true));
        port->DeviceID.set(device_id);
        EXPECT_GE(agent().m_NVRHBA_FCPort_map.insert(cimple::clone(port.get())), 0);
        return port;
    }

    /// The words of the last call, for fixtures that keep them.
    std::vector<std::string> told;
};

} // namespace nvrtest
