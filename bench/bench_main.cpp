// main() of the figures: in a private host, so that neither the machine's settings nor its libraries count.
#include <cstdlib>
#include <exception>
#include <iostream>

#include <benchmark/benchmark.h>

#include "bench/Bench_Host.h"
#include "tests/support/private_host_setup.h"

int main(int argc, char** argv)
{
    try {
        nvrtest::enter_private_host(argv);
        if (const char* ports = std::getenv("NVR_BENCH_FIRST_ANSWER"))
            return nvrbench::answer_first(static_cast<unsigned>(std::strtoul(ports, nullptr, 10)));
        benchmark::Initialize(&argc, argv);
        if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 1;
        benchmark::RunSpecifiedBenchmarks();
        benchmark::Shutdown();
    } catch (const std::exception& error) {
        std::cerr << "nvr_bench: " << error.what() << '\n';
        return 1;
    }
    return 0;
}
