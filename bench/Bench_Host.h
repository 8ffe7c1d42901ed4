/// A CIM server over a simulated host of so many ports, without a trace: what the figures are taken on.
///
/// For programs in a private host. One at a time; the module of an earlier one has ended with it.
#pragma once

#include <string>

#include "host/Host.h"

namespace nvrbench {

class Bench_Host {
public:
    /// Adapters of two ports, each of which sees so many targets of so many units. A time-out refreshes the adapters,
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

/// Measures the first answer of a module in this fresh process and prints it; the exit status.
int answer_first(unsigned ports);

} // namespace nvrbench
