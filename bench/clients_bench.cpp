// Eight classes, each enumerated once: by one client after the other, or by eight clients at once. The ratio of the two
// times is what the second core brings.
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
    for (auto _ : state) {
        if (state.range(0) == 1) {
            for (const char* name : classes)
                (void)host.enumerate(name);
            continue;
        }
        std::vector<std::thread> threads;
        for (const char* name : classes)
            threads.emplace_back([&host, name] { (void)host.enumerate(name); });
        for (std::thread& thread : threads)
            thread.join();
    }
}
BENCHMARK(clients)->Arg(1)->Arg(8)->UseRealTime()->Unit(benchmark::kMillisecond);

} // namespace
