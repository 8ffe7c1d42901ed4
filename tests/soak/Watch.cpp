#include "tests/soak/Watch.h"

#include <algorithm>
#include <utility>

#include "tests/soak/Process.h"

namespace soak {

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
    const std::lock_guard<std::mutex> lock(m_mutex);
    for (Turn* turn : m_turns)
        turn->m_until += delay;
}

Watch::Turn::Turn(Watch& watch, std::string what) : m_watch(watch), m_what(std::move(what))
{
    const std::lock_guard<std::mutex> lock(watch.m_mutex);
    m_until = watch.m_now + watch.m_limit;
    m_place = watch.m_turns.insert(watch.m_turns.end(), this);
}

Watch::Turn::~Turn()
{
    const std::lock_guard<std::mutex> lock(m_watch.m_mutex);
    m_watch.m_turns.erase(m_place);
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
        m_now += std::max(Clock::duration(0), passed - starvation.since_last());
        for (const Turn* turn : m_turns)
            if (m_now > turn->m_until) return m_on_hang(turn->m_what);
    }
}

} // namespace soak
