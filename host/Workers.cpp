#include "host/Workers.h"

#include <deque>
#include <system_error>

namespace host {

void Workers::end()
{
    std::list<Worker> ending;
    {
        std::lock_guard lock(m_mutex);
        m_stopping = true;
        m_idle.clear();
        ending.swap(m_workers);
        for (Worker& worker : ending)
            worker.wake.notify_all();
    }
    for (Worker& worker : ending)
        worker.thread.join();
}

bool Workers::run(const std::function<void()>& work)
{
    return run_all({work}, false);
}

bool Workers::run_all(const std::vector<std::function<void()>>& works, bool at_once)
{
    if (at_once) return m_pooled ? run_pooled(works) : run_fresh(works);
    bool all = true;
    for (const auto& work : works)
        all = (m_pooled ? run_pooled({work}) : run_fresh({work})) && all;
    return all;
}

bool Workers::run_fresh(const std::vector<std::function<void()>>& works)
{
    std::vector<std::thread> threads;
    try {
        for (const auto& work : works)
            threads.emplace_back(work);
    } catch (const std::system_error&) {
        // What has started is waited for; the rest does not run.
    }
    for (std::thread& thread : threads)
        thread.join();
    return threads.size() == works.size();
}

bool Workers::run_pooled(const std::vector<std::function<void()>>& works)
{
    std::condition_variable finished;
    std::deque<bool> done(works.size(), false);
    std::unique_lock lock(m_mutex);
    std::size_t started = 0;
    for (; started < works.size(); ++started) {
        Worker* worker = nullptr;
        if (!m_idle.empty()) {
            worker = m_idle.back();
            m_idle.pop_back();
        } else {
            worker = &m_workers.emplace_back();
            try {
                worker->thread = std::thread([this, worker] { serve(*worker); });
            } catch (const std::system_error&) {
                m_workers.pop_back();
                break;
            }
        }
        worker->work = &works[started];
        worker->done = &done[started];
        worker->finished = &finished;
        worker->wake.notify_one();
    }
    finished.wait(lock, [&] {
        for (std::size_t i = 0; i < started; ++i)
            if (!done[i]) return false;
        return true;
    });
    return started == works.size();
}

void Workers::serve(Worker& worker)
{
    std::unique_lock lock(m_mutex);
    for (;;) {
        worker.wake.wait(lock, [&] { return worker.work || m_stopping; });
        if (!worker.work) return;
        lock.unlock();
        (*worker.work)();
        lock.lock();
        worker.work = nullptr;
        *worker.done = true;
        if (!m_stopping) m_idle.push_back(&worker);
        worker.finished->notify_all();
    }
}

} // namespace host
