/// Ends connections that take too long, however busy they look: a client that sends a byte now and then is never idle,
/// and would keep its connection for ever.
///
/// Any thread. One thread of its own; a connection is ended by shutting its socket down, so that whoever waits on it
/// wakes.
#pragma once

#include <chrono>
#include <condition_variable>
#include <map>
#include <mutex>
#include <thread>

namespace host {

class Deadlines {
public:
    using Clock = std::chrono::steady_clock;

    Deadlines();
    ~Deadlines();
    Deadlines(const Deadlines&) = delete;
    Deadlines& operator=(const Deadlines&) = delete;

    /// The connection ends after this time, unless it is set anew or taken off before.
    void set(int socket, Clock::duration limit);
    /// Needed before the socket is closed, since its number may then name another.
    void take_off(int socket);

private:
    void run();

    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::map<int, Clock::time_point> m_ends;
    bool m_stopped = false;
    std::thread m_thread;
};

} // namespace host
