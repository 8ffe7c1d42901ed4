// The host, its faults and its calls as text, for tools and tests.
#include "simulator/Control.h"

#include <nlohmann/json.hpp>

#include <sstream>

namespace nvrsim {

namespace {

using Json = nlohmann::ordered_json;

Json describe(const Port& port)
{
    Json json;
    json["number"] = port.ordinal;
    json["wwpn"] = to_text(port.current.wwpn);
    json["wwnn"] = to_text(port.current.wwnn);
    json["state"] = port.state;
    json["enabled"] = port.enabled;
    json["speed"] = port.speed;
    json["fc_id"] = port.fcId;
    json["beacon"] = port.beacon == RM_BEACON_ON ? "on" : port.beacon == RM_BEACON_OFF ? "off" : "unavailable";
    json["boot_code"] = port.bootCode;
    json["resets"] = port.resets;
    json["retention"] = port.retention;
    json["targets"] = port.targets.size();
    json["paths"] = port.paths();
    json["dumps"] = port.dumps;
    json["virtual_ports"] = port.vports.size();
    if (port.pending) json["pending"] = to_text(port.pending->names.wwpn);
    return json;
}

} // namespace

std::string describe_state()
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    Json json;
    json["scenario"] = simulator.sourceName;
    json["error"] = simulator.error;
    json["open_handles"] = simulator.handles.size();
    json["faults"] = simulator.faults.size();
    json["adapters"] = Json::array();
    for (const Adapter& adapter : simulator.host.adapters) {
        Json one;
        one["name"] = adapter.name;
        one["present"] = adapter.present;
        one["model"] = adapter.model;
        one["serial_number"] = adapter.serialNumber;
        one["firmware_version"] = adapter.firmwareVersion;
        one["tag_flag"] = adapter.tagFlag;
        one["tags"] = adapter.tags.size();
        one["ports"] = Json::array();
        for (const Port& port : adapter.ports)
            one["ports"].push_back(describe(port));
        json["adapters"].push_back(std::move(one));
    }
    // Texts of a scenario may hold any byte; what is no UTF-8 is replaced, not thrown over.
    return json.dump(2, ' ', false, Json::error_handler_t::replace) + "\n";
}

std::string describe_counters()
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    Json json = Json::object();
    for (size_t i = 0; i < static_cast<size_t>(Call_Id::count); ++i)
        if (simulator.counters[i]) json[to_text(static_cast<Call_Id>(i))] = simulator.counters[i];
    return json.dump(2) + "\n";
}

std::string describe_log()
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    std::ostringstream text;
    for (const Log_Entry& entry : simulator.log)
        text << to_text(entry.id) << ' ' << (entry.port ? to_text(entry.port) : "-") << ' ' << entry.result << '\n';
    return text.str();
}

std::string describe_faults()
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    std::ostringstream text;
    size_t number = 0;
    for (const Fault& fault : simulator.faults) {
        text << ++number << ' ' << fault.call;
        if (fault.ordinal) text << " port=" << *fault.ordinal;
        if (fault.wwpn) text << " port=" << to_text(*fault.wwpn);
        if (fault.number) text << " number=" << *fault.number;
        if (fault.status) text << " status=" << *fault.status;
        if (fault.delay) text << " delay_ms=" << fault.delay;
        if (fault.value) text << " value=" << *fault.value;
        if (fault.damage != Damage::none) text << " damage=" << to_text(fault.damage);
        if (fault.absent) text << " absent";
        if (fault.throws) text << " throws";
        if (fault.vanish) text << " vanish";
        text << " from=" << fault.from;
        if (fault.times != UINT64_MAX) text << " times=" << fault.times;
        text << " seen=" << fault.seen << " hits=" << fault.hits << " changed=" << fault.changed << '\n';
    }
    return text.str();
}

} // namespace nvrsim
