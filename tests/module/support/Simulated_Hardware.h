/// The simulated libraries of this process, as tests steer them: scenarios, faults and counts, with failures as test
/// failures. One core a process; any thread.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace nvrtest {

/// The scenario file of that name that ships, or, for a text with a line feed, the scenario in it. Throws
/// std::runtime_error for a bad one.
void load_scenario(const std::string& scenario);

/// A fault, told as the inside of a TOML table: `call = "RM_GetVPD", status = 7`. Throws for a bad one.
void add_fault(const std::string& fault);
void clear_faults();
/// Calls that faults have hit since they were added.
std::uint64_t fault_hits();

std::uint64_t calls(const std::string& operation);

/// A value of a port, by its number over the host, as nvrsim_set and nvrsim_get name them.
void set_port(unsigned number, const std::string& name, std::uint64_t value);
std::string port_value(unsigned number, const std::string& name);

/// Puts links to these simulated libraries ("HBAAPI", "lrmapi", "rmapi", "tssdm") into the folder that the loader
/// searches first, and in the places of the others files that no loader takes. Libraries that are open stay.
void compose_libraries(const std::vector<std::string>& present);
/// The same with the libraries of a variant of the simulator, as "rmapi-only".
void compose_variant(const std::string& variant);

} // namespace nvrtest
