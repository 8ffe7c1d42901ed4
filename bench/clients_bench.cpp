// Each of eight clients enumerates all of eight classes, beginning with a class of its own; or one client does all
// that, one after the other. The ratio of the two times is what the second core brings. That all clients have as much
// to do keeps both cores busy to the end.
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

void clients(benchmark::State& state)
{
    nvrbench::Bench_Host host(400);
    for (const char* name : classes)
        (void)host.enumerate(name);
    constexpr std::size_t count = std::size(classes);
    // The host hands each result on at once, as a server does that writes to its client.
    const host::Result_Sink nowhere{[](host::Instance&&) {}, [](host::Path&&) {}};
    const auto client = [&](std::size_t number) {
        for (std::size_t i = 0; i < count; i++)
            (void)host.server().enumerate("root/norvane", classes[(number + i) % count], {}, &nowhere);
    };
    for (auto _ : state) {
        if (state.range(0) == 1) {
            for (std::size_t number = 0; number < count; number++)
                client(number);
            continue;
        }
        std::vector<std::thread> threads;
        for (std::size_t number = 0; number < count; number++)
            threads.emplace_back(client, number);
        for (std::thread& thread : threads)
            thread.join();
    }
}
BENCHMARK(clients)->Arg(1)->Arg(8)->UseRealTime()->Unit(benchmark::kMillisecond);

} // namespace
