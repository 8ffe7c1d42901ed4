// Reads scenario files: TOML text that describes a host, short by defaults. The format is told in docs/simulator.md.
#ifndef _simulator_Scenario_h
#define _simulator_Scenario_h

#include "simulator/Fault.h"

#include <stdexcept>
#include <string>
#include <vector>

namespace nvrsim {

/// What is wrong with a scenario: "FILE:LINE: reason".
class Scenario_Error : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

struct Scenario {
    Host host;
    std::vector<Fault> faults;
};

/// `name` stands in messages for the text's file. Throws Scenario_Error.
Scenario parse_scenario(const std::string& text, const std::string& name);

/// A fault from the inside of a TOML inline table: `call = "RM_GetVPD", status = 7`. Throws Scenario_Error.
Fault parse_fault(const std::string& text);

} // namespace nvrsim

#endif // _simulator_Scenario_h
