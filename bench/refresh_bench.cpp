// A refresh of the adapters over libraries that answer at once: from the question that starts it to the new instances.
#include <chrono>
#include <stdexcept>
#include <string>
#include <thread>

#include <benchmark/benchmark.h>

#include "bench/Bench_Host.h"
#include "bench/Heap_Window.h"
#include "simulator/nvrsim.h"
#include "tests/module/support/Test_Clock.h"

namespace {

// An association of the host with one instance, in which each refresh shows the host's new name.
constexpr char witness[] = "NVRHBA_HostedFCHBAWWNService";

void rename_host(host::Host& server, const std::string& name)
{
    host::Instance host;
    host.path.name_space = "root/ibmse";
    host.path.class_name = "IBMSD_ComputerSystem";
    host.set("CreationClassName", host::Value::string("IBMSD_ComputerSystem"));
    host.set("Name", host::Value::string(name));
    server.clear_instances();
    server.add_instance(host);
}

bool shows(const host::Answer& answer, const std::string& name)
{
    if (answer.instances.empty()) return false;
    const host::Path* host = answer.instances.front().get("Antecedent").as_path();
    const host::Value* key = host ? host->find("Name") : nullptr;
    return key && key->as_text() == name;
}

// Seconds from the question that starts a refresh to the answer that shows it. A refresh that still ran when the
// time-out passed takes the new time for its own end; then nothing starts, and the next time-out is due.
double seconds_of_a_refresh(nvrbench::Bench_Host& host, const std::string& name)
{
    using Clock = std::chrono::steady_clock;
    for (int attempt = 0; attempt < 10; attempt++) {
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
        nvrtest::advance_clock(std::chrono::minutes(31));
        const auto start = Clock::now();
        while (Clock::now() - start < std::chrono::seconds(20))
            if (shows(host.enumerate(witness), name))
                return std::chrono::duration<double>(Clock::now() - start).count();
    }
    throw std::runtime_error("no refresh came");
}

void refresh(benchmark::State& state)
{
    nvrbench::Bench_Host host(static_cast<unsigned>(state.range(0)));
    (void)host.enumerate(witness);
    unsigned round = 0;
    std::uint64_t calls = nvrsim_calls(nullptr);
    const auto once = [&] {
        const std::string name = "host" + std::to_string(++round);
        rename_host(host.server(), name);
        return seconds_of_a_refresh(host, name);
    };
    for (auto _ : state)
        state.SetIterationTime(once());
    calls = nvrsim_calls(nullptr) - calls;
    {
        const nvrbench::Heap_Window window;
        (void)once();
        state.counters["peak_kB"] = window.peak_kilobytes();
        state.counters["kept_kB"] = window.held_kilobytes();
    }
    state.counters["library_calls"] = static_cast<double>(calls) / static_cast<double>(state.iterations());
    state.counters["per_port"] =
        benchmark::Counter(static_cast<double>(state.range(0)),
                           benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
}
BENCHMARK(refresh)->Arg(4)->Arg(100)->Arg(1000)->UseManualTime()->Unit(benchmark::kMillisecond);

} // namespace
