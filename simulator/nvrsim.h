/* Control of the simulated Fibre Channel libraries: what tests and tools do to the host behind them.
 *
 * Plain C, exported by libnvrsim_core.so. Link against it, or take the library that the faces brought into the process
 * with dlopen("libnvrsim_core.so", RTLD_NOW | RTLD_NOLOAD): there is one core a process, and closing a face leaves it.
 * Any thread. Ports are named by `port`: a World Wide Name of 16 digits, or their number over the host, from "0".
 * Results: 0 success, -1 failure with a message for nvrsim_error, unless told otherwise.
 * Functions that give text write at most `size` bytes with the terminator and return the length that the whole text
 * has, as snprintf does; a null buffer with size 0 asks for the length. */
#ifndef _simulator_nvrsim_h
#define _simulator_nvrsim_h

#include <stddef.h>
#include <stdint.h>

#ifdef __cplusplus
extern "C" {
#endif

/* Replaces host, faults, counters, log and handles. Registered event callbacks stay. After a failure there are no
 * adapters and RM_InitLib fails. `name` stands for the file in messages. */
int nvrsim_load(const char* path);
int nvrsim_load_text(const char* toml, const char* name);
/* The scenario last loaded (or named by NVRSIM_SCENARIO) afresh; without one, no adapters. */
int nvrsim_reset(void);
/* Message of the last failure in this process, "FILE:LINE: reason" for scenarios; empty: none. */
size_t nvrsim_error(char* buffer, size_t size);

/* A fault from the inside of a TOML inline table, as docs/simulator.md tells: call = "RM_GetVPD", status = 7, times = 1
 * Its number (above 0), or -1. */
int nvrsim_fault(const char* table);
void nvrsim_clear_faults(void);
/* One line for each fault with its calls seen and hit, and those that it changed: something was handed to the caller, or
 * done, otherwise than without it. */
size_t nvrsim_faults(char* buffer, size_t size);
/* Whether such a fault would change something of the call of its function that is number `from` in the log: 1 or 0, by
 * what that call handed out, or -1. Other conditions are not looked at. */
int nvrsim_would_change(const char* table);

/* Calls of one operation since the load, e.g. "RM_GetVPD"; 0 for an unknown name. With a null name, of all. */
uint64_t nvrsim_calls(const char* operation);
/* The most calls of the management library (RM_...) that were under way at once, since the load or since this was last
 * asked. Only a delay lets one begin while another goes on. */
size_t nvrsim_most_at_once(void);
/* Whether calls are timed from now on (they are not at first: it costs more than some calls), and the processor time in
 * seconds that timed ones have taken since: what a caller measures can be told from what the libraries cost. */
void nvrsim_time_calls(int on);
double nvrsim_call_seconds(void);
/* The newest calls in order, one line each: name, port or "-", result. */
size_t nvrsim_log(char* buffer, size_t size);
void nvrsim_clear_log(void);
/* Adapter handles that are open, of both libraries. */
size_t nvrsim_open_handles(void);
size_t nvrsim_callbacks(void);

/* Link of a port: its state, speed and targets follow, and the event "online" or "offline" goes to its callbacks. */
int nvrsim_link(const char* port, int up);
/* An event of a type of the Common HBA API (513 offline, 514 online, ...) without any change of state.
 * The number of callbacks that will be called, or -1. */
int nvrsim_event(const char* port, uint32_t type, uint32_t fabric_port_id);
/* Waits until all events are delivered. Never from a callback. */
void nvrsim_drain_events(void);
/* The library's own threads in this process: one, which stays, since the first event that had a callback. */
size_t nvrsim_threads(void);

/* A value of a port as text: "wwpn", "wwnn", "state", "speed", "fc_id", "beacon", "enabled", "boot_code", "resets",
 * "retention", "pending", "firmware", "present", "targets", "paths", "test" (the newest diagnostic test with its
 * arguments: echo cycles=5 halt=0 pattern=1a2b3c4d target=50060E8005A10000). Length, or 0 for an unknown port or name.
 */
size_t nvrsim_get(const char* port, const char* name, char* buffer, size_t size);
/* Sets "state", "speed", "fc_id", "beacon", "enabled", "boot_code", "retention", "present" (0 takes the port's whole
 * adapter out of the host), "local", "loopback_plug", "statistic:N", "attribute:N" (32-bit number). */
int nvrsim_set(const char* port, const char* name, uint64_t value);
/* Activates names that wait for a reboot, on all ports. */
void nvrsim_reboot(void);

/* The whole host as JSON. */
size_t nvrsim_state(char* buffer, size_t size);
/* A scenario with `ports` ports that each see `targets` targets of `luns` units. */
size_t nvrsim_generate(uint32_t ports, uint32_t targets, uint32_t luns, char* buffer, size_t size);
/* Writes a firmware image that RM_VerifyFirmwareA accepts. */
int nvrsim_make_firmware(const char* path, const char* version, uint32_t payload);

/* One command of the control protocol, as nvrsimctl sends it; the answer's first line is "ok" or "error REASON". */
size_t nvrsim_command(const char* line, char* buffer, size_t size);

#ifdef __cplusplus
}
#endif

#endif /* _simulator_nvrsim_h */
