#include "simulator/Simulator.h"

#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <sstream>

namespace nvrsim {

namespace {

constexpr uint32_t mostHandles = 0xFFFF; // the Common HBA API keeps sixteen bits of a plug-in's handle

} // namespace

bool Fault::concerns(const char* name) const
{
    if (!call.empty() && call.back() == '*') return std::strncmp(name, call.c_str(), call.size() - 1) == 0;
    return call == name;
}

const char* to_text(Damage damage)
{
    static const char* const words[] = {"none", "garbage", "truncated", "ones", "zeros", "null", "unterminated"};
    return words[static_cast<size_t>(damage)];
}

const char* to_text(Call_Id id)
{
    static const char* const names[] = {
#define NVRSIM_NAME(result, name, missing, parameters, arguments) #name,
        NVRSIM_ALL_OPERATIONS(NVRSIM_NAME)
#undef NVRSIM_NAME
    };
    return names[static_cast<size_t>(id)];
}

int64_t monotonic_milliseconds()
{
    return std::chrono::duration_cast<std::chrono::milliseconds>(std::chrono::steady_clock::now().time_since_epoch())
        .count();
}

Simulator& Simulator::instance()
{
    static Simulator* const simulator = new Simulator;
    return *simulator;
}

Simulator::Simulator()
{
    const char* path = std::getenv("NVRSIM_SCENARIO");
    if (path && *path && !load_file(path)) std::fprintf(stderr, "nvrsim: %s\n", error.c_str());
}

void Simulator::clear_faults()
{
    faults.clear();
    ++faultClearings;
    faultsCleared.notify_all();
}

bool Simulator::would_change(const Fault& fault) const
{
    uint64_t seen = 0;
    for (const Log_Entry& entry : log) {
        if (!fault.concerns(to_text(entry.id)) || ++seen < fault.from) continue;
        if (fault.throws || fault.absent || fault.delay) return true;
        if (fault.status && (*fault.status != entry.result || (!fault.writes() && entry.gifts))) return true;
        int changed = (fault.value ? number_gift | count_gift : 0) | (fault.vanish ? adapter_gift : 0);
        if (fault.damage == Damage::unterminated)
            changed |= text_gift;
        else if (fault.damage == Damage::null)
            changed |= number_gift | bytes_gift | place_gift;
        else if (fault.damage != Damage::none)
            changed |= bytes_gift;
        return entry.gifts & changed;
    }
    return false;
}

void Simulator::clear()
{
    host = Host();
    clear_faults();
    error.clear();
    handles.clear();
    std::memset(counters, 0, sizeof counters);
    log.clear();
    refreshes = 0;
}

bool Simulator::load_file(const std::string& path)
{
    std::ifstream file(path, std::ios::binary);
    std::ostringstream text;
    if (file) text << file.rdbuf();
    if (!file || !text) {
        clear();
        haveSource = false;
        error = path + ":0: cannot read the file";
        return false;
    }
    return load_text(text.str(), path);
}

bool Simulator::load_text(const std::string& text, const std::string& name)
{
    // Copies first: the arguments may be members of this object.
    std::string keptText = text, keptName = name;
    clear();
    try {
        Scenario scenario = parse_scenario(keptText, keptName);
        host = std::move(scenario.host);
        faults = std::move(scenario.faults);
    } catch (const std::exception& fault) {
        error = fault.what();
    }
    sourceText.swap(keptText);
    sourceName.swap(keptName);
    haveSource = true;
    return error.empty();
}

bool Simulator::reload()
{
    if (haveSource) return load_text(sourceText, sourceName);
    clear();
    return true;
}

uint32_t Simulator::open(const std::string& adapterName, bool tags)
{
    if (handles.size() >= mostHandles) return 0;
    while (handles.count(nextHandle))
        nextHandle = nextHandle % mostHandles + 1;
    const uint32_t handle = nextHandle;
    handles.emplace(handle, std::make_pair(adapterName, tags));
    nextHandle = nextHandle % mostHandles + 1;
    return handle;
}

Adapter* Simulator::adapter_of(uint32_t handle, bool tags)
{
    const auto found = handles.find(handle);
    return found == handles.end() || found->second.second != tags ? nullptr : host.find(found->second.first);
}

Adapter* Simulator::present(uint32_t index)
{
    for (Adapter& adapter : host.adapters)
        if (adapter.present && index-- == 0) return &adapter;
    return nullptr;
}

uint32_t Simulator::count_present() const
{
    uint32_t count = 0;
    for (const Adapter& adapter : host.adapters)
        count += adapter.present;
    return count;
}

} // namespace nvrsim
