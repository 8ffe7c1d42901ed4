/// Sees to it that every request is answered: tells of the first one that takes longer than a limit, not counting what
/// the library was made to delay meanwhile.
///
///     Watch watch(std::chrono::seconds(10), [](const std::string& what) { std::_Exit(1); });
///     { Watch::Turn turn(watch, "enumerate NVRHBA_FCPort"); server.enumerate(...); }
///
/// Its clock stands still while a thread of this process waits for a free processor.
/// Any thread. The handler is called once, on the watch's own thread, while the request still waits.
#pragma once

#include <chrono>
#include <condition_variable>
#include <functional>
#include <list>
#include <mutex>
#include <string>
#include <thread>

namespace soak {

class Watch {
public:
    using Clock = std::chrono::steady_clock;

    Watch(Clock::duration limit, std::function<void(const std::string& what)> on_hang);
    ~Watch();
    Watch(const Watch&) = delete;
    Watch& operator=(const Watch&) = delete;

    /// From now on the library may delay calls by so much more in all: who waits now may wait so much longer.
    void allow(Clock::duration delay);

    /// One request, from its start to its end.
    class Turn {
    public:
        Turn(Watch& watch, std::string what);
        ~Turn();
        Turn(const Turn&) = delete;
        Turn& operator=(const Turn&) = delete;

    private:
        friend class Watch;
        Watch& m_watch;
        const std::string m_what;
        Clock::duration m_until;
        std::list<Turn*>::iterator m_place;
    };

private:
    void run();

    const Clock::duration m_limit;
    const std::function<void(const std::string&)> m_on_hang;
    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::list<Turn*> m_turns;
    Clock::duration m_now{};
    bool m_ends = false;
    std::thread m_thread;
};

} // namespace soak
