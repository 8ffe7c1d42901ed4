// From dlopen to the first answer: time and memory, in a fresh process each.
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <stdexcept>
#include <string>
#include <unistd.h>

#include <benchmark/benchmark.h>

#include "bench/Bench_Host.h"
#include "tests/module/support/Rig.h"

namespace nvrbench {

namespace {

double resident_kilobytes()
{
    std::ifstream statm("/proc/self/statm");
    double size = 0, resident = 0;
    statm >> size >> resident;
    return resident * static_cast<double>(sysconf(_SC_PAGESIZE)) / 1024;
}

struct First_Answer {
    double seconds = 0, kilobytes = 0;
};

First_Answer in_a_fresh_process(unsigned ports)
{
    const std::string command =
        "NVR_BENCH_FIRST_ANSWER=" + std::to_string(ports) + " /proc/" + std::to_string(getpid()) + "/exe";
    FILE* child = popen(command.c_str(), "r");
    First_Answer answer;
    const bool is_read = child && std::fscanf(child, "%lf %lf", &answer.seconds, &answer.kilobytes) == 2;
    if (!child || pclose(child) != 0 || !is_read) throw std::runtime_error("the fresh process failed");
    return answer;
}

void first_answer(benchmark::State& state)
{
    First_Answer answer;
    for (auto _ : state) {
        answer = in_a_fresh_process(static_cast<unsigned>(state.range(0)));
        state.SetIterationTime(answer.seconds);
    }
    state.counters["kB"] = answer.kilobytes;
}
BENCHMARK(first_answer)->Arg(4)->Arg(100)->Arg(1000)->UseManualTime()->Unit(benchmark::kMillisecond);

} // namespace

int answer_first(unsigned ports)
{
    prepare_host(ports);
    host::Host server(nvrtest::module_schema());
    const double before = resident_kilobytes();
    const auto start = std::chrono::steady_clock::now();
    std::string error;
    if (server.add_module(NVR_MODULE, "root/norvane", &error) == 0) throw std::runtime_error(error);
    const std::size_t answered = server.enumerate("root/norvane", "NVRHBA_FCPort").instances.size();
    const std::chrono::duration<double> taken = std::chrono::steady_clock::now() - start;
    if (answered != ports) throw std::runtime_error("not all ports were told");
    std::printf("%.9f %.0f\n", taken.count(), resident_kilobytes() - before);
    std::fflush(stdout);
    server.stop();
    return 0;
}

} // namespace nvrbench
