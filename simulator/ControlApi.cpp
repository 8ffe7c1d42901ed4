// nvrsim.h: the control API of the core.
#include "simulator/nvrsim.h"

#include "simulator/Control.h"
#include "simulator/Events.h"
#include "simulator/Firmware.h"
#include "simulator/Names.h"

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <utility>

using namespace nvrsim;

namespace {

size_t give(const std::string& text, char* buffer, size_t size)
{
    if (buffer && size) {
        const size_t used = std::min(text.size(), size - 1);
        std::memcpy(buffer, text.data(), used);
        buffer[used] = '\0';
    }
    return text.size();
}

/// The C boundary: what is thrown becomes a failure.
template <class Result, class Work>
Result guarded(Result failed, Work work)
{
    try {
        return work();
    } catch (const std::exception& fault) {
        control_failure(fault.what());
        return failed;
    }
}

std::string as_text(const char* text)
{
    return text ? text : "";
}

template <class Load>
int load(Load load)
{
    return guarded(-1, [&] {
        Simulator& simulator = Simulator::instance();
        std::string error;
        {
            std::lock_guard<std::mutex> lock(simulator.mutex);
            load(simulator);
            error = simulator.error;
        }
        control_failure(error); // an empty one clears the last
        return error.empty() ? 0 : -1;
    });
}

} // namespace

extern "C" {

NVRSIM_EXPORT int nvrsim_load(const char* path)
{
    return load([&](Simulator& simulator) { simulator.load_file(as_text(path)); });
}

NVRSIM_EXPORT int nvrsim_load_text(const char* toml, const char* name)
{
    return load([&](Simulator& simulator) { simulator.load_text(as_text(toml), name ? name : "text"); });
}

NVRSIM_EXPORT int nvrsim_reset(void)
{
    return load([](Simulator& simulator) { simulator.reload(); });
}

NVRSIM_EXPORT size_t nvrsim_error(char* buffer, size_t size)
{
    return guarded<size_t>(0, [&] { return give(control_error(), buffer, size); });
}

NVRSIM_EXPORT int nvrsim_fault(const char* table)
{
    return guarded(-1, [&] {
        Fault fault = parse_fault(as_text(table));
        Simulator& simulator = Simulator::instance();
        std::lock_guard<std::mutex> lock(simulator.mutex);
        simulator.faults.push_back(std::move(fault));
        return static_cast<int>(simulator.faults.size());
    });
}

NVRSIM_EXPORT void nvrsim_clear_faults(void)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    simulator.clear_faults();
}

NVRSIM_EXPORT size_t nvrsim_faults(char* buffer, size_t size)
{
    return guarded<size_t>(0, [&] { return give(describe_faults(), buffer, size); });
}

NVRSIM_EXPORT int nvrsim_would_change(const char* table)
{
    return guarded(-1, [&] {
        const Fault fault = parse_fault(as_text(table));
        Simulator& simulator = Simulator::instance();
        std::lock_guard<std::mutex> lock(simulator.mutex);
        return static_cast<int>(simulator.would_change(fault));
    });
}

NVRSIM_EXPORT uint64_t nvrsim_calls(const char* operation)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    uint64_t calls = 0;
    for (size_t i = 0; i < static_cast<size_t>(Call_Id::count); ++i)
        if (!operation || std::strcmp(operation, to_text(static_cast<Call_Id>(i))) == 0) calls += simulator.counters[i];
    return calls;
}

NVRSIM_EXPORT size_t nvrsim_most_at_once(void)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    return std::exchange(simulator.mostAtOnce, simulator.underWay);
}

NVRSIM_EXPORT void nvrsim_time_calls(int on)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    simulator.timesCalls = on != 0;
    simulator.callNanoseconds = 0;
}

NVRSIM_EXPORT double nvrsim_call_seconds(void)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    return static_cast<double>(simulator.callNanoseconds) * 1e-9;
}

NVRSIM_EXPORT size_t nvrsim_log(char* buffer, size_t size)
{
    return guarded<size_t>(0, [&] { return give(describe_log(), buffer, size); });
}

NVRSIM_EXPORT void nvrsim_clear_log(void)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    simulator.log.clear();
}

NVRSIM_EXPORT size_t nvrsim_open_handles(void)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    return simulator.handles.size();
}

NVRSIM_EXPORT size_t nvrsim_callbacks(void)
{
    return Events::instance().registered();
}

NVRSIM_EXPORT int nvrsim_link(const char* port, int up)
{
    return guarded(-1, [&] {
        std::string error;
        return set_link(as_text(port), up != 0, error) ? 0 : control_failure(error);
    });
}

NVRSIM_EXPORT int nvrsim_event(const char* port, uint32_t type, uint32_t fabric_port_id)
{
    return guarded(-1, [&] {
        const int called = send_event(as_text(port), type, fabric_port_id);
        return called < 0 ? control_failure("there is no port " + as_text(port)) : called;
    });
}

NVRSIM_EXPORT void nvrsim_drain_events(void)
{
    Events::instance().drain();
}

NVRSIM_EXPORT size_t nvrsim_threads(void)
{
    return Events::instance().threads();
}

NVRSIM_EXPORT size_t nvrsim_get(const char* port, const char* name, char* buffer, size_t size)
{
    return guarded<size_t>(0, [&] {
        std::string value;
        return get_value(as_text(port), as_text(name), value) ? give(value, buffer, size) : 0;
    });
}

NVRSIM_EXPORT int nvrsim_set(const char* port, const char* name, uint64_t value)
{
    return guarded(-1, [&] {
        std::string error;
        return set_value(as_text(port), as_text(name), value, error) ? 0 : control_failure(error);
    });
}

NVRSIM_EXPORT void nvrsim_reboot(void)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    for (Adapter& adapter : simulator.host.adapters)
        for (Port& port : adapter.ports)
            activate_names(adapter, port);
    simulator.host.reindex();
}

NVRSIM_EXPORT size_t nvrsim_state(char* buffer, size_t size)
{
    return guarded<size_t>(0, [&] { return give(describe_state(), buffer, size); });
}

NVRSIM_EXPORT size_t nvrsim_generate(uint32_t ports, uint32_t targets, uint32_t luns, char* buffer, size_t size)
{
    return guarded<size_t>(0, [&] { return give(generate_scenario(ports, targets, luns), buffer, size); });
}

NVRSIM_EXPORT int nvrsim_make_firmware(const char* path, const char* version, uint32_t payload)
{
    return guarded(-1, [&] {
        const std::string image = make_firmware(as_text(version), payload);
        std::FILE* file = std::fopen(as_text(path).c_str(), "wb");
        if (!file) return control_failure("cannot write " + as_text(path));
        const bool written = std::fwrite(image.data(), 1, image.size(), file) == image.size();
        return std::fclose(file) == 0 && written ? 0 : control_failure("cannot write " + as_text(path));
    });
}

NVRSIM_EXPORT size_t nvrsim_command(const char* line, char* buffer, size_t size)
{
    return guarded<size_t>(0, [&] { return give(run_command(as_text(line)), buffer, size); });
}

} // extern "C"
