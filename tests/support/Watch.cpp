#include "tests/support/Watch.h"

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <map>
#include <utility>

namespace nvrtest {

namespace {

/// How long threads of this process were ready to run while no processor was free for them.
class Starvation {
public:
    /// The longest such time of a thread since the last call.
    std::chrono::nanoseconds since_last();

private:
    std::map<std::string, std::chrono::nanoseconds> m_waited; // by thread, since its start
};

std::chrono::nanoseconds Starvation::since_last()
{
    std::map<std::string, std::chrono::nanoseconds> now;
    std::chrono::nanoseconds longest{0};
    std::error_code none; // threads end meanwhile
    for (const auto& task : std::filesystem::directory_iterator("/proc/self/task", none)) {
        std::ifstream figures(task.path() / "schedstat");
        long long ran = 0, waited = 0;
        if (!(figures >> ran >> waited)) continue;
        const std::string thread = task.path().filename();
        now[thread] = std::chrono::nanoseconds(waited);
        longest = std::max(longest, now[thread] - m_waited[thread]);
    }
    m_waited = std::move(now);
    return longest;
}

// Moves a place on, if it is in that state.
template <class State>
bool goes_on(std::atomic<State>& state, State from, State to)
{
    return state.compare_exchange_strong(from, to, std::memory_order_relaxed);
}

} // namespace

Watch::Watch(Clock::duration limit, std::function<void(const std::string&)> on_hang)
    : m_limit(limit), m_on_hang(std::move(on_hang)), m_thread([this] { run(); })
{
}

Watch::~Watch()
{
    {
        const std::lock_guard<std::mutex> lock(m_mutex);
        m_ends = true;
    }
    m_changed.notify_all();
    m_thread.join();
}

void Watch::allow(Clock::duration delay)
{
    for (Place& place : m_places)
        place.until.fetch_add(delay.count(), std::memory_order_relaxed);
}

Watch::Place& Watch::vacant_place()
{
    for (;; std::this_thread::yield())
        for (Place& place : m_places)
            if (goes_on(place.state, State::vacant, State::being_taken)) return place;
}

Watch::Turn::Turn(Watch& watch, std::string what) : m_what(std::move(what)), m_place(watch.vacant_place())
{
    const Clock::rep now = watch.m_now.load(std::memory_order_relaxed);
    m_place.until.store(now + watch.m_limit.count(), std::memory_order_relaxed);
    m_place.what.store(&m_what, std::memory_order_relaxed);
    m_place.state.store(State::taken, std::memory_order_release);
}

Watch::Turn::~Turn()
{
    // Its name stays while the watch tells of it.
    while (!goes_on(m_place.state, State::taken, State::vacant))
        std::this_thread::yield();
}

void Watch::run()
{
    const auto pause = std::min<Clock::duration>(m_limit / 10, std::chrono::milliseconds(500));
    std::unique_lock<std::mutex> lock(m_mutex);
    Starvation starvation;
    starvation.since_last();
    Clock::time_point last = Clock::now();
    while (!m_changed.wait_for(lock, pause, [this] { return m_ends; })) {
        const Clock::time_point now = Clock::now();
        const Clock::duration passed = now - std::exchange(last, now);
        m_now += std::max(Clock::duration(0), passed - starvation.since_last()).count();
        for (Place& place : m_places)
            if (tells_of(place)) return;
    }
}

bool Watch::tells_of(Place& place)
{
    const auto waits_too_long = [&] { return m_now > place.until.load(std::memory_order_relaxed); };
    if (place.state.load(std::memory_order_acquire) != State::taken || !waits_too_long()) return false;
    State expected = State::taken;
    if (!place.state.compare_exchange_strong(expected, State::being_read, std::memory_order_acquire)) return false;
    const bool is_so = waits_too_long(); // a later turn may have the place now
    if (is_so) m_on_hang(*place.what);
    place.state.store(State::taken, std::memory_order_relaxed);
    return is_so;
}

} // namespace nvrtest
