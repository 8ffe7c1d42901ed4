// What it costs to have the driver's lines read from a large log, and what the lines then cost in memory.
#include <algorithm>
#include <atomic>
#include <fstream>
#include <stdexcept>
#include <string>
#include <thread>
#include <unistd.h>

#include <benchmark/benchmark.h>

#include "bench/Bench_Host.h"

namespace {

constexpr char system_log[] = "/var/log/messages";

double resident_kilobytes()
{
    std::ifstream statm("/proc/self/statm");
    double size = 0, resident = 0;
    statm >> size >> resident;
    return resident * static_cast<double>(sysconf(_SC_PAGESIZE)) / 1024;
}

/// One line of a hundred is the driver's.
void write_log(std::size_t megabytes)
{
    const std::string head = "Nov 21 12:00:00 storage1 kernel: ";
    const std::string tail = "0000:05:00.0: a message of the usual length, told again and again, and numbered ";
    std::ofstream file(system_log, std::ios::binary | std::ios::trunc);
    std::size_t size = 0;
    for (std::size_t number = 0; size < megabytes * 1000000; number++) {
        const std::string line = head + (number % 100 ? "other " : "tsfc ") + tail + std::to_string(number) + '\n';
        file << line;
        size += line.size();
    }
}

host::Path driver_log(nvrbench::Bench_Host& host)
{
    for (const host::Instance& log : host.enumerate("NVRHBA_RecordLog").instances)
        if (log.get("InstanceID").as_text().find("FC Driver") != std::string::npos) return log.path;
    throw std::runtime_error("there is no driver's log");
}

/// The highest resident memory while it lives, above what there was.
class Peak {
public:
    Peak() : m_before(resident_kilobytes()), m_thread([this] { watch(); }) {}
    double end()
    {
        m_over = true;
        m_thread.join();
        return m_highest - m_before;
    }

private:
    void watch()
    {
        while (!m_over) {
            m_highest = std::max(m_highest, resident_kilobytes());
            std::this_thread::sleep_for(std::chrono::microseconds(200));
        }
    }

    const double m_before;
    double m_highest = 0;
    std::atomic<bool> m_over{false};
    std::thread m_thread;
};

void read_driver_log(benchmark::State& state)
{
    nvrbench::Bench_Host host(4);
    const host::Path log = driver_log(host);
    const auto request = [&](unsigned wanted) {
        const host::Answer answer = host.server().call(
            log, "RequestStateChange", {{"RequestedState", host::Value::uint16(static_cast<std::uint16_t>(wanted))}});
        if (!answer.ok() || answer.value.as_uint() != 0) throw std::runtime_error("the log refuses");
    };
    write_log(static_cast<std::size_t>(state.range(0)));
    double peak = 0, held = 0;
    for (auto _ : state) {
        const double before = resident_kilobytes();
        Peak watch;
        const auto start = std::chrono::steady_clock::now();
        request(2);
        state.SetIterationTime(std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
        peak = std::max(peak, watch.end());
        held = std::max(held, resident_kilobytes() - before);
        if (host.enumerate("NVRHBA_FCDriverLogEntry").instances.size() != 200)
            throw std::runtime_error("not 200 lines");
        request(3);
    }
    state.counters["peak_kB"] = peak;
    state.counters["held_kB"] = held;
    unlink(system_log);
}
BENCHMARK(read_driver_log)->Arg(10)->Arg(200)->Iterations(3)->UseManualTime()->Unit(benchmark::kMillisecond);

} // namespace
