// What a slow library costs other clients: enumerations while a refresh waits for calls of five milliseconds each, and
// the same without a refresh.
#include <algorithm>
#include <chrono>
#include <string>
#include <thread>
#include <vector>

#include <benchmark/benchmark.h>

#include "bench/Bench_Host.h"
#include "simulator/nvrsim.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/simulator.h"

namespace {

using Clock = std::chrono::steady_clock;

double microseconds_of(nvrbench::Bench_Host& host, const std::string& name)
{
    const auto start = Clock::now();
    (void)host.enumerate(name);
    return std::chrono::duration<double, std::micro>(Clock::now() - start).count();
}

// A refresh runs on a thread that the server has lent a context.
bool is_refreshing(nvrbench::Bench_Host& host)
{
    return host.server().report().contexts_not_detached != 0;
}

// Questions that are asked from the refresh's first call of the library until its end.
std::vector<double> asked_during_a_refresh(nvrbench::Bench_Host& host, const std::string& name)
{
    const std::uint64_t calls = nvrsim_calls(nullptr);
    std::thread first_client([&] {
        while (nvrsim_calls(nullptr) == calls) { // a refresh that is at its end takes the new time for its own
            nvrtest::advance_clock(std::chrono::minutes(31));
            (void)host.enumerate("NVRHBA_Product");
        }
    });
    while (nvrsim_calls(nullptr) == calls)
        std::this_thread::yield();
    std::vector<double> taken;
    do
        taken.push_back(microseconds_of(host, name));
    while (is_refreshing(host));
    first_client.join();
    return taken;
}

void enumerate_during_a_refresh(benchmark::State& state, const char* name, bool refreshes)
{
    nvrbench::Bench_Host host(4, 2, 2);
    (void)host.enumerate("NVRHBA_StorageVolume");
    nvrtest::add_fault("call = \"*\", delay_ms = 5");
    std::vector<double> taken;
    for (auto _ : state) {
        if (refreshes) {
            taken = asked_during_a_refresh(host, name);
        } else {
            taken.push_back(microseconds_of(host, name));
            benchmark::DoNotOptimize(is_refreshing(host)); // which moves memory too
        }
    }
    nvrtest::clear_faults();
    std::sort(taken.begin(), taken.end());
    state.counters["median_us"] = taken[taken.size() / 2];
    state.counters["worst_us"] = taken.back();
}

#define NVR_QUESTION(name)                                                                                             \
    BENCHMARK_CAPTURE(enumerate_during_a_refresh, name##_quiet, "NVRHBA_" #name, false)->Iterations(1000);             \
    BENCHMARK_CAPTURE(enumerate_during_a_refresh, name, "NVRHBA_" #name, true)->Iterations(1)
NVR_QUESTION(RegisteredProfile);
NVR_QUESTION(LogEntry);
NVR_QUESTION(FCPort);
NVR_QUESTION(StorageVolume);
#undef NVR_QUESTION

} // namespace
