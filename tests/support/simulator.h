/// The simulated libraries of this process, as tests steer them: which the loader finds, what host they show, what
/// fails.
///
///     compose_libraries();
///     load_scenario("typical");
///     add_fault("call = \"RM_GetVPD\", status = 7");
///
/// Needs a private host (norvane_private_main) and links the simulator's core, which is one a process. Failures throw
/// std::runtime_error with the simulator's own words. Any thread.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

namespace nvrtest {

/// The scenario file of that name that ships, or, for a text with a line feed, the scenario in it. Replaces host,
/// faults and counts.
void load_scenario(const std::string& scenario);

/// A fault, told as the inside of a TOML table: `call = "RM_GetVPD", status = 7`.
void add_fault(const std::string& fault);
void clear_faults();
/// Calls that faults have hit since they were added.
std::uint64_t fault_hits();
/// Those of them in which something was handed to the caller, or done, otherwise than without the fault.
std::uint64_t fault_changes();

/// A way in which one call can fail, and which ends with its fault.
struct Library_Failure {
    const char* name;  ///< as a part of a test's name
    const char* fault; ///< the inside of a fault's table, but for the call
};
/// The ways in which any call is made to fail: statuses, rubbish, counts that lie, an exception. What a test does
/// beyond them is its own.
const std::vector<Library_Failure>& library_failures();

/// The operations among the newest calls, in alphabetical order.
std::vector<std::string> called_operations();

/// Calls of an operation since the load.
std::uint64_t calls(const std::string& operation);
/// A value of the port of that number, from 0, as nvrsim_get and nvrsim_set name it.
std::string port_value(unsigned number, const std::string& name);
void set_port(unsigned number, const std::string& name, std::uint64_t value);

/// Puts links to these simulated libraries into the folder that the loader searches first, and in the places of the
/// others files that no loader takes. Libraries that are open stay.
void compose_libraries(const std::vector<std::string>& present = {"HBAAPI", "lrmapi", "rmapi", "tssdm"});
/// The same with the files of a variant of the simulator, as "rmapi-only"; what it has no file for is the machine's
/// own.
void compose_variant(const std::string& variant);

} // namespace nvrtest
