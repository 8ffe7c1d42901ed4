// How long a service keeps the agent for itself: the time for which it holds the three locks of the agent wait, over a
// library that answers at once. Linked from the rooms, so that the first of the three can be watched.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <exception>
#include <functional>
#include <stdexcept>
#include <string>
#include <vector>

#include <pthread.h>
#include <unistd.h>

#include "agent/ProviderAgent.h"
#include "agent/instance_table.h"
#include "classes/NVRHBA_DumpData.h"
#include "classes/NVRHBA_DumpService.h"
#include "classes/NVRHBA_FCPort.h"
#include "services/NVRHBA_BootBIOSService_Provider.h"
#include "services/NVRHBA_DumpData_Provider.h"
#include "services/NVRHBA_DumpService_Provider.h"
#include "services/NVRHBA_FCHBADriverParamService_Provider.h"
#include "services/NVRHBA_FCHBAWWNService_Provider.h"
#include "services/NVRHBA_FCPort_Provider.h"
#include "services/NVRHBA_FCTagService_Provider.h"
#include "services/NVRHBA_SoftwareInstallationService_Provider.h"
#include "simulator/nvrsim.h"
#include "tests/support/private_host_setup.h"
#include "tests/support/simulator.h"

using namespace cimple;

namespace {

using Clock = std::chrono::steady_clock;

// The first lock of the agent wait is the first taken and the last given back. Its own thread alone looks at these.
const void* watched = nullptr;
thread_local bool is_caller = false;
thread_local Clock::time_point taken;
thread_local Clock::duration held{};

bool is_watched(const pthread_mutex_t* mutex)
{
    const auto* place = reinterpret_cast<const char*>(mutex);
    const auto* start = static_cast<const char*>(watched);
    return is_caller && start && place >= start && place < start + sizeof(Mutex);
}

} // namespace

extern "C" int __real_pthread_mutex_lock(pthread_mutex_t* mutex);
extern "C" int __real_pthread_mutex_unlock(pthread_mutex_t* mutex);

extern "C" int __wrap_pthread_mutex_lock(pthread_mutex_t* mutex)
{
    const int status = __real_pthread_mutex_lock(mutex);
    if (is_watched(mutex)) taken = Clock::now();
    return status;
}

extern "C" int __wrap_pthread_mutex_unlock(pthread_mutex_t* mutex)
{
    if (is_watched(mutex)) held += Clock::now() - taken;
    return __real_pthread_mutex_unlock(mutex);
}

namespace {

template <class T>
Property<T> value(const T& value)
{
    return {value, 0};
}

/// Waits until no refresh runs: what one holds is no service's time.
void settle(ProviderAgent& agent)
{
    while (agent.m_bDataFetchRunning || agent.m_bAdapterRefreshPending)
        ::usleep(100);
}

/// `call` gives the return value, which must be 0: a refused call would hold the agent for less.
void measure(const char* name, unsigned ports, const std::function<uint32()>& call)
{
    constexpr int rounds = 100;
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    std::vector<double> times;
    for (int i = 0; i < rounds; i++) {
        settle(agent);
        held = {};
        if (const uint32 refusal = call())
            throw std::runtime_error(std::string(name) + " answered " + std::to_string(refusal));
        times.push_back(std::chrono::duration<double, std::micro>(held).count());
    }
    std::sort(times.begin(), times.end());
    std::printf("%-20s %6u %10.1f %10.1f %10.1f\n", name, ports, times[rounds / 2], times[rounds * 99 / 100],
                times.back());
}

void measure_services(unsigned ports)
{
    std::string scenario(nvrsim_generate(ports, 0, 0, nullptr, 0) + 1, '\0');
    scenario.resize(nvrsim_generate(ports, 0, 0, scenario.data(), scenario.size()));
    nvrtest::compose_libraries();
    nvrtest::load_scenario(scenario);
    ProviderAgent::load();
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    watched = &agent.m_AdapterDataReadyMutex;
    agent.BuildCimpleInfo();
    settle(agent);

    // The last port is the one that a walk finds last.
    const Ref<NVRHBA_FCPort> port(clone_as(agent.m_NVRHBA_FCPort_map[ports - 1]));
    Property<uint32> result{}, number{};
    Property<uint16> status{};
    Property<String> wwpn{}, wwnn{};

    NVRHBA_FCHBAWWNService_Provider names;
    const Ref<NVRHBA_FCHBAWWNService> wwn(clone_as(agent.m_NVRHBA_FCHBAWWNService_map[0]));
    measure("ReadWWN", ports, [&] {
        names.ReadWWN(wwn.get(), port.get(), value<uint16>(3), wwpn, wwnn, status, result);
        return result.value;
    });
    measure("GetWWNCapability", ports, [&] {
        names.GetWWNCapability(wwn.get(), port.get(), number, result);
        return result.value;
    });
    measure("ChangeWWN", ports, [&] {
        names.ChangeWWN(wwn.get(), port.get(), value<String>("10000000C9FFFF01"), value<String>("20000000C9FFFF01"),
                        value<uint16>(0), status, result);
        return result.value;
    });
    measure("RestoreWWN", ports, [&] {
        names.RestoreWWN(wwn.get(), port.get(), value<uint16>(0), status, result);
        return result.value;
    });

    NVRHBA_BootBIOSService_Provider boot;
    const Ref<NVRHBA_BootBIOSService> bios(clone_as(agent.m_NVRHBA_BootBIOSService_map[0]));
    measure("GetBootBIOSStatus", ports, [&] {
        boot.GetBootBIOSStatus(bios.get(), port.get(), number, result);
        return result.value;
    });
    measure("EnableBootBIOS", ports, [&] {
        boot.EnableBootBIOS(bios.get(), port.get(), result);
        return result.value;
    });
    measure("DisableBootBIOS", ports, [&] {
        boot.DisableBootBIOS(bios.get(), port.get(), result);
        return result.value;
    });

    NVRHBA_FCPort_Provider beacon;
    const Ref<NVRHBA_FCPort> wish(clone_as(port.get()));
    set(wish->LocationIndicator, 2);
    measure("LocationIndicator", ports,
            [&] { return static_cast<uint32>(beacon.modify_instance(wish.get(), wish.get())); });

    NVRHBA_SoftwareInstallationService_Provider firmware;
    const Ref<NVRHBA_SoftwareInstallationService> install(clone_as(agent.m_NVRHBA_SoftwareInstallationService_map[0]));
    measure("SetPortEnabled", ports, [&] {
        firmware.SetPortEnabled(install.get(), port.get(), value<boolean>(true), result);
        return result.value;
    });

    measure("ResetHBA", ports, [&] {
        firmware.ResetHBA(install.get(), port.get(), result);
        return result.value;
    });

    NVRHBA_FCPort* target = port.get();
    Property<boolean> no = value<boolean>(false);
    Property<String> name = value<String>("lun-queue-depth"), depth = value<String>("64");
    NVRHBA_FCHBADriverParamService_Provider params;
    const Ref<NVRHBA_FCHBADriverParamService> param(clone_as(agent.m_NVRHBA_FCHBADriverParamService_map[0]));
    measure("SetDriverParameter", ports, [&] {
        params.SetDriverParameter(param.get(), target, no, no, name, depth, result);
        return result.value;
    });

    NVRHBA_FCTagService_Provider tags;
    const Ref<NVRHBA_FCTagService> tag(clone_as(agent.m_NVRHBA_FCTagService_map[0]));
    measure("GetGlobalFlag", ports, [&] {
        tags.GetGlobalFlag(tag.get(), target, number, result);
        return result.value;
    });
    measure("SetGlobalFlag", ports, [&] {
        tags.SetGlobalFlag(tag.get(), target, number, result);
        return result.value;
    });

    NVRHBA_DumpService_Provider dumps;
    const Ref<NVRHBA_DumpService> dump(clone_as(agent.m_NVRHBA_DumpService_map[0]));
    Property<Array<String>> files{};
    measure("GenerateDump", ports, [&] {
        dumps.GenerateDump(dump.get(), target, result);
        return result.value;
    });
    measure("GetDumpFileNames", ports, [&] {
        dumps.GetDumpFileNames(dump.get(), target, files, result);
        return result.value;
    });
    measure("DeleteDump", ports, [&] {
        dumps.DeleteDump(dump.get(), target, result);
        return result.value;
    });
    NVRHBA_DumpData_Provider settings;
    const Ref<NVRHBA_DumpData> data(clone_as(agent.m_NVRHBA_DumpData_map[ports - 1]));
    uint32 kept = 1;
    measure("RetentionCount", ports, [&] {
        kept = kept % 20 + 1; // another one each time, so that all of them are built anew
        set(data->RetentionCount, kept);
        return static_cast<uint32>(settings.modify_instance(data.get(), data.get()));
    });

    settle(agent);
    watched = nullptr;
    ProviderAgent::unload();
}

} // namespace

int main(int count, char** arguments)
{
    try {
        nvrtest::enter_private_host(arguments);
        is_caller = true;
        std::printf("%-20s %6s %10s %10s %10s   (microseconds)\n", "held by", "ports", "median", "99 %", "most");
        if (count < 2) {
            measure_services(4);
            measure_services(100);
        }
        for (int i = 1; i < count; i++)
            measure_services(static_cast<unsigned>(std::strtoul(arguments[i], nullptr, 10)));
    } catch (const std::exception& error) {
        std::fprintf(stderr, "nvr_hold: %s\n", error.what());
        return 1;
    }
    return 0;
}
