// One enumeration of the ports: the module against a provider written by hand in C, on the same broker.
#include <dlfcn.h>
#include <set>
#include <stdexcept>
#include <string>

#include <benchmark/benchmark.h>

#include "bench/Bench_Host.h"
#include "bench/Heap_Window.h"
#include "tests/module/support/Rig.h"

namespace {

constexpr char name_space[] = "root/norvane";
constexpr char port_class[] = "NVRHBA_FCPort";

void ask(benchmark::State& state, host::Host& server)
{
    const auto ports = static_cast<std::size_t>(state.range(0));
    std::size_t properties = 0;
    for (auto _ : state) {
        const host::Answer answer = server.enumerate(name_space, port_class);
        if (answer.instances.size() != ports) throw std::runtime_error("not all ports were told");
        properties = answer.instances.front().properties.size();
    }
    state.counters["per_instance"] = benchmark::Counter(
        static_cast<double>(ports), benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
    state.counters["peak_kB"] = nvrbench::peak_kilobytes_of([&] { (void)server.enumerate(name_space, port_class); });
    state.counters["properties"] = static_cast<double>(properties);
}

void enumerate_module(benchmark::State& state)
{
    nvrbench::Bench_Host host(static_cast<unsigned>(state.range(0)));
    (void)host.enumerate(port_class);
    ask(state, host.server());
}

/// Once: what the module's ports carry.
const std::set<std::string>& module_shape()
{
    static const std::set<std::string> shape = [] {
        nvrbench::Bench_Host host(4);
        return nvrbench::shape_of(host.server(), port_class);
    }();
    return shape;
}

void enumerate_floor(benchmark::State& state)
{
    const std::set<std::string>& shape = module_shape(); // before the floor: its module has ended then
    void* library = dlopen(NVR_FLOOR, RTLD_NOW | RTLD_LOCAL);
    if (!library) throw std::runtime_error(dlerror());
    const auto set_ports = reinterpret_cast<void (*)(unsigned)>(dlsym(library, "floor_instances"));
    set_ports(static_cast<unsigned>(state.range(0)));
    {
        host::Host server(nvrtest::module_schema());
        server.add({port_class, "NVRHBA_FCPort_Provider", NVR_FLOOR, host::instance_kind, {name_space}, false});
        nvrbench::require_same(shape, nvrbench::shape_of(server, port_class));
        ask(state, server);
    }
    dlclose(library);
}

// The caller waits while the request runs on a thread of its own: wall time is what counts.
BENCHMARK(enumerate_floor)->Arg(4)->Arg(100)->Arg(1000)->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(enumerate_module)->Arg(4)->Arg(100)->Arg(1000)->UseRealTime()->Unit(benchmark::kMicrosecond);

} // namespace
