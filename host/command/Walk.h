/// The host as the module's associations tie it together: adapters, their ports, the targets that each port sees, and
/// the logical units behind them.
///
/// Plain data, owned by the caller. Nothing but the host's own path is found by enumeration; each step is a traversal:
/// package by NVRHBA_SystemPackaging, controller by NVRHBA_Realizes, port by NVRHBA_ControlledBy, initiator by
/// NVRHBA_DeviceSAPImplementation, and targets with their units by the classes of
/// CIM_SCSIInitiatorTargetLogicalUnitPath.
#pragma once

#include "host/Host.h"

#include <string>
#include <vector>

namespace host {

struct Unit_Node {
    std::string number; ///< as FCP addresses it: "0", or the eight bytes where they are no flat number
    std::string device; ///< what the operating system calls it on this route; may be empty
    Instance unit;
};

/// A target port, with all units that one port of ours reaches by it.
struct Target_Node {
    std::string name;  ///< WWPN
    Instance endpoint; ///< the one of the first unit
    std::vector<Unit_Node> units;
};

struct Port_Node {
    Instance port;
    std::vector<Target_Node> targets;
};

struct Adapter_Node {
    Instance package;
    std::vector<Port_Node> ports;
};

struct Host_Node {
    Path path;
    std::vector<Adapter_Node> adapters;
};

struct Walk {
    Status status; ///< of the first request that failed; what was found before it stays
    std::vector<Host_Node> hosts;
};

/// Walks from each host that the module knows. Everything keeps the order in which the module tells
/// it, but for the units of a target, which stand by their number.
Walk walk_hosts(Host& server, const std::string& name_space);

/// The same text for paths that mean the same object, whatever their namespace or the order of their keys.
std::string identity(const Path& path);

/// What the operating system calls the unit behind an endpoint. Each route to a unit has an endpoint of its own, which
/// has the name of the unit's device and no other. May be empty.
std::string device_name(const Instance& endpoint);

/// A size in the binary unit that keeps it readable: "8 GiB", "1.5 TiB". Null gives an empty text.
std::string size_text(const Value& bytes);

// What tree and picture tell of a node, in short parts for one line each; empty parts are left out.

std::vector<std::string> facts(const Adapter_Node& adapter);
std::vector<std::string> facts(const Port_Node& port, const Schema& schema);
std::vector<std::string> facts(const Target_Node& target, const Schema& schema);
std::vector<std::string> facts(const Unit_Node& unit, const Schema& schema);
std::string host_name(const Host_Node& host);

} // namespace host
