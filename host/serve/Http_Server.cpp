#include "host/serve/Http_Server.h"

#include "host/serve/Deadlines.h"

#include <algorithm>
#include <arpa/inet.h>
#include <cstring>
#include <microhttpd.h>
#include <netinet/in.h>
#include <stdexcept>

namespace host {
namespace {

constexpr std::size_t dropped_bytes = 256 * 1024 * 1024;

/// One request while it comes in.
struct Incoming {
    std::string body;
    bool too_large = false;
    bool refused = false; ///< answered before its body
};

/// One answer while it goes out.
struct Outgoing {
    std::function<bool(std::string&)> pieces;
    std::string buffer;
    std::size_t sent = 0;
};

ssize_t read_pieces(void* context, std::uint64_t, char* to, std::size_t room)
{
    auto& out = *static_cast<Outgoing*>(context);
    try {
        while (out.sent == out.buffer.size()) {
            out.buffer.clear();
            out.sent = 0;
            if (!out.pieces(out.buffer)) return MHD_CONTENT_READER_END_OF_STREAM;
        }
    } catch (...) {
        return MHD_CONTENT_READER_END_WITH_ERROR; // out of memory: the connection is closed
    }
    const std::size_t size = std::min(room, out.buffer.size() - out.sent);
    std::memcpy(to, out.buffer.data() + out.sent, size);
    out.sent += size;
    return static_cast<ssize_t>(size);
}

void free_outgoing(void* context)
{
    delete static_cast<Outgoing*>(context);
}

/// A header, also in the numbered form that M-POST has ("73-CIMMethod").
std::string header(MHD_Connection* connection, const char* name)
{
    if (const char* value = MHD_lookup_connection_value(connection, MHD_HEADER_KIND, name)) return value;
    struct Wanted {
        const char* name;
        std::string value;
    } wanted{name, ""};
    MHD_get_connection_values(
        connection, MHD_HEADER_KIND,
        [](void* context, MHD_ValueKind, const char* key, const char* value) {
            auto& looked_for = *static_cast<Wanted*>(context);
            if (std::strlen(key) > 3 && key[2] == '-' && same_name(key + 3, looked_for.name)) {
                looked_for.value = value ? value : "";
                return MHD_NO;
            }
            return MHD_YES;
        },
        &wanted);
    return wanted.value;
}

/// Answers that are no CIM-XML: a status, a word for the CIMError header, a sentence.
MHD_Result refuse(MHD_Connection* connection, unsigned status, const char* text)
{
    MHD_Response* response =
        MHD_create_response_from_buffer(std::strlen(text), const_cast<char*>(text), MHD_RESPMEM_PERSISTENT);
    if (!response) return MHD_NO;
    MHD_add_response_header(response, "Content-Type", "text/plain; charset=utf-8");
    if (status == MHD_HTTP_METHOD_NOT_ALLOWED) MHD_add_response_header(response, "Allow", "POST, M-POST");
    const MHD_Result result = MHD_queue_response(connection, status, response);
    MHD_destroy_response(response);
    return result;
}

MHD_Result send(MHD_Connection* connection, Reply reply)
{
    auto* out = new Outgoing{std::move(reply.pieces), "", 0};
    MHD_Response* response =
        MHD_create_response_from_callback(MHD_SIZE_UNKNOWN, 32 * 1024, &read_pieces, out, &free_outgoing);
    if (!response) {
        free_outgoing(out);
        return MHD_NO;
    }
    if (reply.status == MHD_HTTP_OK) {
        MHD_add_response_header(response, "Content-Type", "application/xml; charset=\"utf-8\"");
        MHD_add_response_header(response, "CIMOperation", "MethodResponse");
    } else {
        MHD_add_response_header(response, "Content-Type", "text/plain; charset=utf-8");
    }
    if (!reply.cim_error.empty()) MHD_add_response_header(response, "CIMError", reply.cim_error.c_str());
    const MHD_Result result = MHD_queue_response(connection, reply.status, response);
    MHD_destroy_response(response);
    return result;
}

int socket_of(MHD_Connection* connection)
{
    const MHD_ConnectionInfo* info = MHD_get_connection_info(connection, MHD_CONNECTION_INFO_CONNECTION_FD);
    return info ? info->connect_fd : -1;
}

Request_Head head_of(MHD_Connection* connection)
{
    return {header(connection, "CIMOperation"),       header(connection, "CIMMethod"), header(connection, "CIMObject"),
            header(connection, "CIMProtocolVersion"), header(connection, "CIMBatch"),  header(connection, "Host")};
}

} // namespace

struct Http_Server::Parts {
    Cim_Server& server;
    Http_Options options;
    MHD_Daemon* daemon = nullptr;
    Deadlines deadlines = {};

    /// What is wrong with a request before its body is read, or 0.
    unsigned objection(MHD_Connection* connection, const char* method) const
    {
        if (std::strcmp(method, "POST") != 0 && std::strcmp(method, "M-POST") != 0) return MHD_HTTP_METHOD_NOT_ALLOWED;
        // Somewhat too much is taken and dropped: who still sends does not read an answer.
        const std::string length = header(connection, "Content-Length");
        const bool sends_at_once = header(connection, "Expect").empty();
        const std::size_t most = sends_at_once ? std::max(options.most_bytes, dropped_bytes) : options.most_bytes;
        if (length.size() > 18 || (!length.empty() && std::strtoull(length.c_str(), nullptr, 10) > most))
            return MHD_HTTP_CONTENT_TOO_LARGE;
        const std::string type = lower_case(header(connection, "Content-Type"));
        const bool is_xml = type.empty() || type.find("xml") != std::string::npos;
        const std::size_t charset = type.find("charset=");
        const bool is_utf8 = charset == std::string::npos || type.find("utf-8", charset) != std::string::npos;
        return is_xml && is_utf8 ? 0 : MHD_HTTP_UNSUPPORTED_MEDIA_TYPE;
    }

    MHD_Result take(MHD_Connection* connection, const char* method, const char* data, std::size_t* size, void** state)
    {
        auto* incoming = static_cast<Incoming*>(*state);
        if (!incoming) {
            *state = incoming = new Incoming;
            if (const unsigned status = objection(connection, method)) {
                incoming->refused = true;
                return refuse(connection, status, "This is a CIM-XML server: POST one request as UTF-8.\n");
            }
            return MHD_YES;
        }
        if (*size) {
            incoming->too_large = incoming->too_large || *size > options.most_bytes - incoming->body.size();
            if (incoming->too_large)
                incoming->body.clear();
            else
                incoming->body.append(data, *size);
            *size = 0;
            return MHD_YES;
        }
        if (incoming->refused) return MHD_YES;
        if (incoming->too_large) return refuse(connection, MHD_HTTP_CONTENT_TOO_LARGE, "The request is too large.\n");
        deadlines.take_off(socket_of(connection));
        Reply reply = server.answer(incoming->body, head_of(connection));
        deadlines.set(socket_of(connection), std::chrono::seconds(options.answer_seconds));
        return send(connection, std::move(reply));
    }

    /// A connection has come or goes.
    static void connected(void* context, MHD_Connection* connection, void**, MHD_ConnectionNotificationCode code)
    {
        auto& parts = *static_cast<Parts*>(context);
        if (code == MHD_CONNECTION_NOTIFY_STARTED)
            parts.deadlines.set(socket_of(connection), std::chrono::seconds(parts.options.request_seconds));
        else
            parts.deadlines.take_off(socket_of(connection));
    }

    static MHD_Result taken(void* context, MHD_Connection* connection, const char*, const char* method, const char*,
                            const char* data, std::size_t* size, void** state)
    {
        try {
            return static_cast<Parts*>(context)->take(connection, method, data, size, state);
        } catch (...) {
            return MHD_NO; // as above
        }
    }

    static void ended(void* context, MHD_Connection* connection, void** state, MHD_RequestTerminationCode)
    {
        delete static_cast<Incoming*>(*state);
        *state = nullptr;
        // The next request on the connection has its own time.
        auto& parts = *static_cast<Parts*>(context);
        parts.deadlines.set(socket_of(connection), std::chrono::seconds(parts.options.request_seconds));
    }
};

Http_Server::Http_Server(Cim_Server& server, const Http_Options& options) : m_parts(new Parts{server, options})
{
    sockaddr_in six_less{};
    sockaddr_in6 six{};
    const sockaddr* address = nullptr;
    unsigned flags = MHD_USE_INTERNAL_POLLING_THREAD | MHD_USE_THREAD_PER_CONNECTION | MHD_USE_POLL;
    if (inet_pton(AF_INET, options.address.c_str(), &six_less.sin_addr) == 1) {
        six_less.sin_family = AF_INET;
        six_less.sin_port = htons(options.port);
        address = reinterpret_cast<const sockaddr*>(&six_less);
    } else if (inet_pton(AF_INET6, options.address.c_str(), &six.sin6_addr) == 1) {
        six.sin6_family = AF_INET6;
        six.sin6_port = htons(options.port);
        address = reinterpret_cast<const sockaddr*>(&six);
        flags |= MHD_USE_IPv6;
    } else {
        throw std::runtime_error("'" + options.address + "' is no address");
    }
    m_parts->daemon =
        MHD_start_daemon(flags, options.port, nullptr, nullptr, &Parts::taken, m_parts.get(), MHD_OPTION_SOCK_ADDR,
                         address, MHD_OPTION_NOTIFY_COMPLETED, &Parts::ended, m_parts.get(),
                         MHD_OPTION_NOTIFY_CONNECTION, &Parts::connected, m_parts.get(), MHD_OPTION_CONNECTION_LIMIT,
                         options.most_connections, MHD_OPTION_CONNECTION_TIMEOUT, options.idle_seconds, MHD_OPTION_END);
    if (!m_parts->daemon)
        throw std::runtime_error("cannot listen on " + options.address + " port " + std::to_string(options.port) +
                                 ": " + std::strerror(errno));
}

Http_Server::~Http_Server()
{
    MHD_stop_daemon(m_parts->daemon);
}

std::uint16_t Http_Server::port() const
{
    const MHD_DaemonInfo* info = MHD_get_daemon_info(m_parts->daemon, MHD_DAEMON_INFO_BIND_PORT);
    return info ? info->port : 0;
}

} // namespace host
