// What the control API and the socket's commands share: actions on the host, each with its own locking.
#ifndef _simulator_Control_h
#define _simulator_Control_h

#include "simulator/Simulator.h"

namespace nvrsim {

/// Remembers a failure for nvrsim_error; gives -1.
int control_failure(const std::string& reason);
std::string control_error();

/// A port by name or number; null if there is none. With the lock held.
Port* find_port(Simulator& simulator, const std::string& port, Adapter** owner = nullptr);

bool set_link(const std::string& port, bool up, std::string& error);
/// Sends so many events, at most longest_burst. Calls of callbacks that will be made; -1 for an unknown port.
int send_event(const std::string& port, uint32_t type, uint32_t fabricPortId, uint32_t times = 1);
constexpr uint32_t longest_burst = 1000000;
bool set_value(const std::string& port, const std::string& name, uint64_t value, std::string& error);
bool get_value(const std::string& port, const std::string& name, std::string& value);

std::string describe_faults();
std::string describe_log();
std::string describe_counters(); // JSON
std::string describe_state();    // JSON
std::string generate_scenario(uint32_t ports, uint32_t targets, uint32_t luns);

/// "ok\n" and what was asked for, or "error REASON\n".
std::string run_command(const std::string& line);

/// Opens the control socket that NVRSIM_SOCKET names, if it names one.
void start_socket();

} // namespace nvrsim

#endif // _simulator_Control_h
