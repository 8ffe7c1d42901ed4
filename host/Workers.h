/// The threads that requests run on: a new one for each, or shared ones, as the manner says.
///
/// Any thread may hand work in, also a worker itself: the number of shared threads grows with what is asked at once.
#pragma once

#include <condition_variable>
#include <functional>
#include <list>
#include <mutex>
#include <thread>
#include <vector>

namespace host {

class Workers {
public:
    explicit Workers(bool pooled) : m_pooled(pooled) {}
    ~Workers() { end(); }
    Workers(const Workers&) = delete;
    Workers& operator=(const Workers&) = delete;

    /// Runs `work` on another thread and waits. False if no thread could be had; then `work` did not run.
    bool run(const std::function<void()>& work);
    /// Runs them at once or in turn, and waits for all. False if one of them did not get a thread.
    bool run_all(const std::vector<std::function<void()>>& works, bool at_once);
    /// Ends the shared threads and waits for them. What is handed in afterwards runs on threads that nobody waits for.
    void end();

private:
    struct Worker {
        std::thread thread;
        std::condition_variable wake;
        const std::function<void()>* work = nullptr;
        bool* done = nullptr;
        std::condition_variable* finished = nullptr;
    };

    bool run_pooled(const std::vector<std::function<void()>>& works);
    bool run_fresh(const std::vector<std::function<void()>>& works);
    void serve(Worker& worker);

    const bool m_pooled;
    std::mutex m_mutex;
    std::list<Worker> m_workers;
    std::vector<Worker*> m_idle;
    bool m_stopping = false;
};

} // namespace host
