// What the second core brings to eight clients, in two ways.
#include <array>
#include <chrono>
#include <iterator>
#include <string>
#include <thread>
#include <vector>

#include <benchmark/benchmark.h>

#include "bench/Bench_Host.h"

namespace {

// Classes with one instance a port.
constexpr const char* classes[] = {
    "NVRHBA_PortController",
    "NVRHBA_SCSIProtocolController",
    "NVRHBA_SCSIProtocolInitiatorEndpoint",
    "NVRHBA_PCIDevice",
    "NVRHBA_Transceiver",
    "NVRHBA_PhysicalPackage",
    "NVRHBA_Product",
    "NVRHBA_VitalProductData",
};

constexpr std::size_t count = std::size(classes);

// The host hands each result on at once, as a server does that writes to its client.
const host::Result_Sink nowhere{[](host::Instance&&) {}, [](host::Path&&) {}};

void ask(nvrbench::Bench_Host& host, std::size_t number)
{
    (void)host.server().enumerate("root/norvane", classes[number % count], {}, &nowhere);
}

template <class Body>
void on_all_clients(Body body)
{
    std::vector<std::thread> threads;
    for (std::size_t number = 0; number < count; number++)
        threads.emplace_back(body, number);
    for (std::thread& thread : threads)
        thread.join();
}

// Each enumerates all classes, beginning with one of its own; or one client does all that, one after the other. The
// ratio of the two times is the gain: that all have as much to do keeps both cores busy to the end.
void clients(benchmark::State& state)
{
    nvrbench::Bench_Host host(400);
    const auto client = [&](std::size_t number) {
        for (std::size_t i = 0; i < count; i++)
            ask(host, number + i);
    };
    for (std::size_t number = 0; number < count; number++)
        ask(host, number);
    for (auto _ : state) {
        if (state.range(0) != 1)
            on_all_clients(client);
        else
            for (std::size_t number = 0; number < count; number++)
                client(number);
    }
}
BENCHMARK(clients)->Arg(1)->Arg(8)->UseRealTime()->Unit(benchmark::kMillisecond);

// Each enumerates its own class again and again for a time. `gain` adds up, over the clients, how fast each is to what
// it reaches alone on the machine: classes differ in what they cost.
void clients_of_a_class_each(benchmark::State& state)
{
    using Clock = std::chrono::steady_clock;
    constexpr std::chrono::milliseconds slice(200);
    nvrbench::Bench_Host host(400);
    const auto rate_until = [&](std::size_t number, Clock::time_point end) {
        const auto start = Clock::now();
        double done = 0;
        do {
            ask(host, number);
            done++;
        } while (Clock::now() < end);
        return done / std::chrono::duration<double>(Clock::now() - start).count();
    };
    for (std::size_t number = 0; number < count; number++)
        ask(host, number);
    double gain = 0;
    for (auto _ : state) {
        std::array<double, count> alone{}, together{};
        for (std::size_t number = 0; number < count; number++)
            alone[number] = rate_until(number, Clock::now() + slice);
        const auto end = Clock::now() + count * slice;
        on_all_clients([&](std::size_t number) { together[number] = rate_until(number, end); });
        for (std::size_t number = 0; number < count; number++)
            gain += together[number] / alone[number];
    }
    state.counters["gain"] = benchmark::Counter(gain, benchmark::Counter::kAvgIterations);
}
BENCHMARK(clients_of_a_class_each)->UseRealTime()->Unit(benchmark::kMillisecond)->Iterations(1);

} // namespace
