// From an event at the library to the subscriber's sink, at one event a second and at a thousand.
#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <stdexcept>
#include <thread>
#include <vector>

#include <benchmark/benchmark.h>

#include "bench/Bench_Host.h"
#include "simulator/nvrsim.h"

namespace {

using Clock = std::chrono::steady_clock;

/// Sends events one by one and notes when each is sent and when it comes.
class Stopwatch {
public:
    explicit Stopwatch(nvrbench::Bench_Host& host) : m_host(host)
    {
        const host::Status status = host.server().subscribe(
            "root/norvane", "NVRHBA_AlertIndication", [this](const host::Indication&) { came(); }, m_id);
        if (!status.ok()) throw std::runtime_error(status.message);
        host.server().settle();
    }
    ~Stopwatch() { m_host.server().unsubscribe(m_id); }

    /// Sends `count` events, one each `interval`, and gives how long each took, in seconds.
    std::vector<double> measure(std::size_t count, Clock::duration interval)
    {
        m_came.clear();
        m_came.reserve(count);
        std::vector<Clock::time_point> sent;
        Clock::time_point due = Clock::now();
        for (std::size_t i = 0; i < count; i++) {
            std::this_thread::sleep_until(due);
            due += interval;
            sent.push_back(Clock::now());
            if (nvrsim_event("0", i % 2 ? 514 : 513, 0) != 1) throw std::runtime_error("nobody listens");
        }
        std::unique_lock<std::mutex> lock(m_mutex);
        m_changed.wait(lock, [&] { return m_came.size() == count; });
        std::vector<double> seconds;
        for (std::size_t i = 0; i < count; i++)
            seconds.push_back(std::chrono::duration<double>(m_came[i] - sent[i]).count());
        return seconds;
    }

private:
    void came()
    {
        const Clock::time_point now = Clock::now();
        std::lock_guard<std::mutex> lock(m_mutex);
        m_came.push_back(now);
        m_changed.notify_all();
    }

    nvrbench::Bench_Host& m_host;
    int m_id = 0;
    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::vector<Clock::time_point> m_came;
};

/// The time shown is the median; arguments are events a second, and how many.
void event_to_delivery(benchmark::State& state)
{
    nvrbench::Bench_Host host(4);
    (void)host.enumerate("NVRHBA_FCPort");
    Stopwatch watch(host);
    watch.measure(2, std::chrono::milliseconds(1)); // the first ones meet cold code
    double worst = 0;
    for (auto _ : state) {
        std::vector<double> seconds = watch.measure(static_cast<std::size_t>(state.range(1)),
                                                    std::chrono::microseconds(1000000 / state.range(0)));
        std::sort(seconds.begin(), seconds.end());
        state.SetIterationTime(seconds[seconds.size() / 2]);
        worst = std::max(worst, seconds.back());
    }
    state.counters["worst_us"] = worst * 1e6;
}
BENCHMARK(event_to_delivery)
    ->Args({1, 10})
    ->Args({100, 20})
    ->Args({1000, 5000})
    ->Iterations(1)
    ->UseManualTime()
    ->Unit(benchmark::kMicrosecond);

} // namespace
