/// Where many pass at once, and one can hold all of them up: it waits until the last has come out.
///
/// Any thread; one holds at a time.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <mutex>

namespace soak {

class Crossing {
public:
    /// Between its construction and its end a thread is inside.
    class Pass {
    public:
        explicit Pass(Crossing& crossing) : m_crossing(crossing)
        {
            std::unique_lock<std::mutex> lock(crossing.m_mutex);
            crossing.m_changed.wait(lock, [&] { return !crossing.m_is_held; });
            crossing.m_inside++;
        }
        ~Pass()
        {
            const std::lock_guard<std::mutex> lock(m_crossing.m_mutex);
            if (--m_crossing.m_inside == 0) m_crossing.m_changed.notify_all();
        }
        Pass(const Pass&) = delete;
        Pass& operator=(const Pass&) = delete;

    private:
        Crossing& m_crossing;
    };

    /// While it lives, nobody is inside.
    class Hold {
    public:
        explicit Hold(Crossing& crossing) : m_crossing(crossing)
        {
            std::unique_lock<std::mutex> lock(crossing.m_mutex);
            crossing.m_is_held = true;
            crossing.m_changed.wait(lock, [&] { return crossing.m_inside == 0; });
        }
        ~Hold()
        {
            const std::lock_guard<std::mutex> lock(m_crossing.m_mutex);
            m_crossing.m_is_held = false;
            m_crossing.m_changed.notify_all();
        }
        Hold(const Hold&) = delete;
        Hold& operator=(const Hold&) = delete;

    private:
        Crossing& m_crossing;
    };

private:
    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::size_t m_inside = 0;
    bool m_is_held = false;
};

} // namespace soak
