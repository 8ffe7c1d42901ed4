/// A CIM server over a simulated host of so many ports, without a trace: what the figures are taken on.
///
/// For programs in a private host. One at a time; the module of an earlier one has ended with it.
#pragma once

#include <set>
#include <string>

#include "host/Host.h"

namespace nvrbench {

class Bench_Host {
public:
    /// Adapters of one port each, which sees so many targets of so many units. A time-out refreshes the adapters,
    /// or, where there are targets, the SAN.
    explicit Bench_Host(unsigned ports, unsigned targets = 0, unsigned luns = 0);
    ~Bench_Host() { m_server.stop(); }

    host::Host& server() { return m_server; }
    host::Answer enumerate(const std::string& class_name);

private:
    host::Host m_server;
};

/// The host's hardware, libraries and settings, without a server.
void prepare_host(unsigned ports, unsigned targets = 0, unsigned luns = 0);

/// What the class's instances carry, a line each: a property with its type, an array with its length, a key of a name.
/// Throws where instances differ in how many, or where the server has seen a rule broken so far.
std::set<std::string> shape_of(host::Host& server, const std::string& class_name);
/// Throws unless both are the same: a floor that returns something else is none.
void require_same(const std::set<std::string>& module, const std::set<std::string>& floor);

/// Measures the first answer of a module in this fresh process and prints it; the exit status.
int answer_first(unsigned ports);

} // namespace nvrbench
