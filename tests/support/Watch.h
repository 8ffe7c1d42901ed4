/// Sees to it that every request is answered: tells of the first one that takes longer than a limit, not counting what
/// the library was made to delay meanwhile.
///
///     Watch watch(std::chrono::seconds(10), [](const std::string& what) { std::_Exit(1); });
///     { Watch::Turn turn(watch, "enumerate NVRHBA_FCPort"); server.enumerate(...); }
///
/// Its clock stands still while a thread of this process waits for a free processor.
/// Any thread. What the threads tell it orders nothing between them, so that the thread sanitizer sees them as they
/// are. The handler is called once, on the watch's own thread, while the request still waits.
#pragma once

#include <array>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <functional>
#include <mutex>
#include <string>
#include <thread>

namespace nvrtest {

class Watch {
    struct Place;

public:
    using Clock = std::chrono::steady_clock;
    static constexpr std::size_t most_turns = 256; ///< at once; another one waits for a place

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
        const std::string m_what;
        Place& m_place;
    };

private:
    enum class State { vacant, being_taken, taken, being_read };
    // Where a turn shows itself.
    struct Place {
        std::atomic<State> state{State::vacant};
        std::atomic<Clock::rep> until{0}; // by the watch's clock
        std::atomic<const std::string*> what{nullptr};
    };

    Place& vacant_place();
    void run();
    bool tells_of(Place& place);

    const Clock::duration m_limit;
    const std::function<void(const std::string&)> m_on_hang;
    std::array<Place, most_turns> m_places;
    std::atomic<Clock::rep> m_now{0};
    std::mutex m_mutex;
    std::condition_variable m_changed;
    bool m_ends = false;
    std::thread m_thread;
};

} // namespace nvrtest
