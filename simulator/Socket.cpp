// The control socket: one request a connection, a line of text; the answer, then the end of the connection.
#include "simulator/Control.h"

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <sys/socket.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/un.h>
#include <thread>
#include <unistd.h>

namespace nvrsim {

namespace {

constexpr size_t longestRequest = 1 << 16;

void answer(int connection)
{
    const timeval limit{5, 0}; // a client that says nothing must not hold up the others
    ::setsockopt(connection, SOL_SOCKET, SO_RCVTIMEO, &limit, sizeof limit);
    ::setsockopt(connection, SOL_SOCKET, SO_SNDTIMEO, &limit, sizeof limit);
    std::string request;
    char piece[4096];
    for (ssize_t got; request.find('\n') == std::string::npos && request.size() < longestRequest;) {
        if ((got = ::recv(connection, piece, sizeof piece, 0)) <= 0) break;
        request.append(piece, static_cast<size_t>(got));
    }
    request.resize(std::min(request.find('\n'), request.size()));
    const std::string reply = run_command(request);
    for (size_t sent = 0; sent < reply.size();) {
        const ssize_t put = ::send(connection, reply.data() + sent, reply.size() - sent, MSG_NOSIGNAL);
        if (put <= 0) break;
        sent += static_cast<size_t>(put);
    }
}

bool is_answered(const sockaddr_un& address)
{
    const int connection = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (connection < 0) return true; // not known, so nothing is removed
    const bool answered = ::connect(connection, reinterpret_cast<const sockaddr*>(&address), sizeof address) == 0 ||
                          errno != ECONNREFUSED;
    ::close(connection);
    return answered;
}

void serve(int listener)
{
    for (;;) {
        const int connection = ::accept4(listener, nullptr, nullptr, SOCK_CLOEXEC);
        if (connection < 0) {
            if (errno != EINTR) std::this_thread::sleep_for(std::chrono::milliseconds(100));
            continue;
        }
        try {
            answer(connection);
        } catch (const std::exception&) {
            // Memory ran out: this client gets no answer.
        }
        ::close(connection);
    }
}

} // namespace

void start_socket()
{
    const char* name = std::getenv("NVRSIM_SOCKET");
    if (!name || !*name) return;
    std::string whole = name;
    const size_t place = whole.find("%p"); // the process id, where several processes share an environment
    if (place != std::string::npos) whole.replace(place, 2, std::to_string(::getpid()));
    const char* const path = whole.c_str();
    sockaddr_un address{};
    address.sun_family = AF_UNIX;
    if (std::strlen(path) >= sizeof address.sun_path) {
        std::fprintf(stderr, "nvrsim: the name of the control socket is too long: %s\n", path);
        return;
    }
    std::strcpy(address.sun_path, path);
    // What an earlier process left behind is removed; never a socket that somebody answers at, never another file.
    struct stat status;
    const int listener = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0);
    if (listener >= 0 && ::lstat(path, &status) == 0 && S_ISSOCK(status.st_mode) && !is_answered(address))
        ::unlink(path);
    if (listener >= 0) ::fchmod(listener, 0600);
    if (listener < 0 || ::bind(listener, reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0 ||
        ::chmod(path, 0600) != 0 || ::listen(listener, 8) != 0) {
        std::fprintf(stderr, "nvrsim: cannot open the control socket %s: %s\n", path, std::strerror(errno));
        if (listener >= 0) ::close(listener);
        return;
    }
    try {
        std::thread(serve, listener).detach();
    } catch (const std::exception&) {
        ::close(listener);
    }
}

namespace {

// When the core comes into the process, so that faults can be set before the first call.
__attribute__((constructor)) void core_loaded()
{
    start_socket();
}

} // namespace

} // namespace nvrsim
