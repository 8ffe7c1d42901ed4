// What the diagnostics cost: to publish them for so many ports, and to keep what runs leave. Times are processor time
// of the process, the simulated libraries included, so that other work on the machine counts little.
#include <cstdio>
#include <ctime>
#include <exception>
#include <malloc.h>
#include <unistd.h>

#include "agent/Agent_Wait.h"
#include "agent/Clock.h"
#include "bench/Bench_Host.h"
#include "classes/NVRHBA_ConcreteJob.h"
#include "classes/NVRHBA_DiagnosticsLog.h"
#include "classes/NVRHBA_FCHBADiagnosticSettingData.h"
#include "classes/NVRHBA_JobSettingData.h"
#include "classes/NVRHBA_PortController.h"
#include "diagnostics/NVRHBA_DiagnosticsLog_Provider.h"
#include "diagnostics/NVR_DiagTestFunc.h"
#include "diagnostics/NVR_Diagnostics.h"
#include "foundation/NVR_Common.h"
#include "simulator/nvrsim.h"
#include "tests/support/private_host_setup.h"

using namespace cimple;

namespace {

constexpr char test_name[] = "NVR:FCHBA Internal Loopback Test";

double cpu_seconds()
{
    timespec now;
    clock_gettime(CLOCK_PROCESS_CPUTIME_ID, &now);
    return static_cast<double>(now.tv_sec) + static_cast<double>(now.tv_nsec) / 1e9;
}

double heap_kilobytes()
{
    return static_cast<double>(mallinfo2().uordblks) / 1024;
}

/// An agent that has read its host.
class Loaded_Agent {
public:
    explicit Loaded_Agent(unsigned ports)
    {
        nvrbench::prepare_host(ports);
        if (ProviderAgent::load() != 0) throw std::runtime_error("the agent does not load");
        get().BuildCimpleInfo();
        while (get().m_bDataFetchRunning)
            usleep(1000);
    }
    ~Loaded_Agent() { ProviderAgent::unload(); }

    ProviderAgent& get() { return *ProviderAgent::GetInstance(); }
};

void measure_feature(unsigned ports)
{
    Loaded_Agent agent(ports);
    const Agent_Locks locks(agent.get(), Words::silent);
    NVR_Diagnostics::ClearDiagnosticClassMaps(agent.get(), 0);
    const double empty = heap_kilobytes();
    const unsigned rounds = 2000 / ports + 1;
    const auto calls = nvrsim_calls(nullptr);
    const double start = cpu_seconds();
    for (unsigned round = 0; round < rounds; round++) {
        NVR_Diagnostics::ClearDiagnosticClassMaps(agent.get(), 0);
        if (NVR_Diagnostics::CreateFCHBADiagnosticClassFeature(agent.get()) != 0) throw std::runtime_error("no tests");
    }
    const double milliseconds = (cpu_seconds() - start) * 1000 / rounds;
    std::printf("%6u ports  %8.3f ms  %8.4f ms a port  %8.1f kB  %8.1f kB a port  %5.1f library calls\n", ports,
                milliseconds, milliseconds / ports, heap_kilobytes() - empty, (heap_kilobytes() - empty) / ports,
                static_cast<double>(nvrsim_calls(nullptr) - calls) / rounds);
}

/// Runs the test, with overrides or without; the heap that each run leaves, before and after its log is cleared.
void measure_runs(unsigned runs, bool overridden)
{
    Loaded_Agent agent(2);
    HBA_WWN port = {};
    Property<uint32> answer = {};
    double before = 0, kept = 0, cleared = 0, milliseconds = 0;
    {
        const Agent_Locks locks(agent.get(), Words::silent);
        auto* setting = NVR_Diagnostics::getDefaultNVRHBA_FCHBADiagnosticSettingDataInstance(agent.get(), test_name);
        setting->OverridedSettingData.set(overridden ? 1u : 0u);
        const auto* jobs = NVR_Diagnostics::getDefaultNVRHBA_JobSettingDataInstance(agent.get());
        const auto* controller = agent.get().m_NVRHBA_PortController_map[0];
        string2HBAName(&port, controller->DeviceID.value.c_str());
        before = heap_kilobytes();
        const double start = cpu_seconds();
        for (unsigned run = 0; run < runs; run++) {
            Diagnostic_Run work = {agent.get(), port, *setting, *jobs, controller, {}};
            if (NVR_DiagTestFunc::LoopBackTest(work, LOOPBACK_INTERNAL) != 0 || !work.job)
                throw std::runtime_error("the test does not run");
        }
        milliseconds = (cpu_seconds() - start) * 1000 / runs;
        kept = heap_kilobytes();
    }
    NVRHBA_DiagnosticsLog_Provider logs;
    Ref<NVRHBA_DiagnosticsLog> log(create_as<NVRHBA_DiagnosticsLog>());
    log->InstanceID.set(test_name);
    const double start = cpu_seconds();
    logs.ClearLog(log.get(), answer);
    const double clearing = (cpu_seconds() - start) * 1000;
    if (answer.null || answer.value != 0) throw std::runtime_error("the log is not cleared");
    cleared = heap_kilobytes();
    std::printf("%6u runs %s  %8.3f ms a run  kept %6.2f kB a run  after ClearLog %6.2f kB a run  ClearLog %8.2f ms\n",
                runs, overridden ? "with overrides" : "with defaults ", milliseconds, (kept - before) / runs,
                (cleared - before) / runs, clearing);
}

} // namespace

int main(int, char** argv)
{
    try {
        nvrtest::enter_private_host(argv);
        agent_sleep = [](uint64) {};
        for (const unsigned ports : {2u, 16u, 128u})
            measure_feature(ports);
        for (const bool overridden : {false, true})
            measure_runs(1000, overridden);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "nvr_bench_diagnostics: %s\n", error.what());
        return 1;
    }
    return 0;
}
