#include "host/serve/Deadlines.h"

#include <algorithm>
#include <sys/socket.h>

namespace host {

Deadlines::Deadlines() : m_thread([this] { run(); }) {}

Deadlines::~Deadlines()
{
    {
        std::lock_guard<std::mutex> hold(m_mutex);
        m_stopped = true;
    }
    m_changed.notify_one();
    m_thread.join();
}

void Deadlines::set(int socket, Clock::duration limit)
{
    std::lock_guard<std::mutex> hold(m_mutex);
    m_ends[socket] = Clock::now() + limit;
    m_changed.notify_one();
}

void Deadlines::take_off(int socket)
{
    std::lock_guard<std::mutex> hold(m_mutex);
    m_ends.erase(socket);
}

void Deadlines::run()
{
    std::unique_lock<std::mutex> hold(m_mutex);
    while (!m_stopped) {
        const auto first = std::min_element(m_ends.begin(), m_ends.end(),
                                            [](const auto& a, const auto& b) { return a.second < b.second; });
        if (first == m_ends.end()) {
            m_changed.wait(hold);
        } else if (first->second > Clock::now()) {
            m_changed.wait_until(hold, Clock::time_point(first->second));
        } else {
            shutdown(first->first, SHUT_RDWR);
            m_ends.erase(first);
        }
    }
}

} // namespace host
