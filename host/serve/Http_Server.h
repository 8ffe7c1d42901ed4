/// The HTTP side of the host: CIM-XML requests (DMTF DSP0200) to a Cim_Server, by GNU libmicrohttpd.
///
/// For trying and testing: no encryption, no user names. Size and time of a request and the number of connections are
/// bounded, so that a client that sends nothing, too slowly or too much harms nobody else. Answers go out in chunks.
#pragma once

#include "host/serve/Cim_Server.h"

#include <cstdint>
#include <memory>
#include <string>

namespace host {

struct Http_Options {
    std::string address = "127.0.0.1";         ///< to bind to; IPv4 or IPv6
    std::uint16_t port = 5988;                 ///< 0 for any that is free
    std::size_t most_bytes = 16 * 1024 * 1024; ///< of a request's body
    unsigned idle_seconds = 30;                ///< until a silent connection is closed
    unsigned request_seconds = 60;             ///< for a whole request to come in, however it trickles
    unsigned answer_seconds = 600;             ///< for an answer to be taken
    unsigned most_connections = 256;
};

class Http_Server {
public:
    /// Listens at once. Throws std::runtime_error if it cannot. `server` outlives it.
    Http_Server(Cim_Server& server, const Http_Options& options);
    /// Ends all connections.
    ~Http_Server();
    Http_Server(const Http_Server&) = delete;
    Http_Server& operator=(const Http_Server&) = delete;

    /// Where it listens, also if any free port was asked for.
    std::uint16_t port() const;

private:
    struct Parts;
    std::unique_ptr<Parts> m_parts;
};

} // namespace host
