#include "simulator/Control.h"

#include "simulator/Events.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <sstream>

namespace nvrsim {

namespace {

struct Failure {
    std::mutex mutex;
    std::string text;
};

Failure& last_failure()
{
    static Failure* const failure = new Failure;
    return *failure;
}

bool parse_number(const std::string& text, uint64_t& number)
{
    char* end = nullptr;
    errno = 0;
    number = std::strtoull(text.c_str(), &end, 0);
    return !text.empty() && text[0] != '-' && !*end && errno == 0;
}

} // namespace

int control_failure(const std::string& reason)
{
    Failure& failure = last_failure();
    std::lock_guard<std::mutex> lock(failure.mutex);
    failure.text = reason;
    return -1;
}

std::string control_error()
{
    {
        Failure& failure = last_failure();
        std::lock_guard<std::mutex> lock(failure.mutex);
        if (!failure.text.empty()) return failure.text;
    }
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    return simulator.error; // of a scenario that the environment names
}

Port* find_port(Simulator& simulator, const std::string& port, Adapter** owner)
{
    uint64_t ordinal;
    if (port.size() < 16 && parse_number(port, ordinal)) {
        return ordinal > UINT32_MAX ? nullptr : simulator.host.port(static_cast<uint32_t>(ordinal), owner);
    }
    Wwn wwpn;
    if (!parse_wwn(port, wwpn)) return nullptr;
    // Also the ports of adapters that are out of the host, so that they can come back.
    for (Adapter& adapter : simulator.host.adapters)
        for (Port& one : adapter.ports)
            if (one.current.wwpn == wwpn) {
                if (owner) *owner = &adapter;
                return &one;
            }
    return nullptr;
}

int send_event(const std::string& port, uint32_t type, uint32_t fabricPortId, uint32_t times)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    const Port* found = find_port(simulator, port);
    if (!found) return -1;
    size_t called = 0;
    for (uint32_t i = 0; i < times; ++i)
        called += Events::instance().post(found->current.wwpn, type, fabricPortId);
    return static_cast<int>(called);
}

bool set_link(const std::string& port, bool up, std::string& error)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    Port* found = find_port(simulator, port);
    if (!found) {
        error = "there is no port " + port;
        return false;
    }
    found->state = up ? HBA_PORTSTATE_ONLINE : HBA_PORTSTATE_LINKDOWN;
    found->speed = up ? found->linkUpSpeed : 0;
    Events::instance().post(found->current.wwpn, up ? HBA_EVENT_PORT_ONLINE : HBA_EVENT_PORT_OFFLINE, found->fcId);
    return true;
}

bool set_value(const std::string& port, const std::string& name, uint64_t value, std::string& error)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    Adapter* adapter = nullptr;
    Port* found = find_port(simulator, port, &adapter);
    if (!found) {
        error = "there is no port " + port;
        return false;
    }
    const auto word = static_cast<uint32_t>(value);
    uint64_t number = 0;
    if (name == "state") {
        found->state = word;
    } else if (name == "speed") {
        found->speed = found->linkUpSpeed = word;
    } else if (name == "fc_id") {
        found->fcId = word;
    } else if (name == "beacon") {
        found->beacon = word;
    } else if (name == "enabled") {
        found->enabled = value != 0;
    } else if (name == "boot_code") {
        found->bootCode = word;
        found->adapterAttributes[RM_ATTR_BOOT_CODE_ENABLED] = encode32(word);
    } else if (name == "retention") {
        found->retention = word;
    } else if (name == "local") {
        found->local = value != 0;
    } else if (name == "loopback_plug") {
        found->loopbackPlug = value != 0;
    } else if (name == "present") {
        adapter->present = value != 0;
        simulator.host.reindex();
    } else if (name.compare(0, 10, "statistic:") == 0 && parse_number(name.substr(10), number) && number <= 0xFFFF) {
        found->statistics[static_cast<uint16_t>(number)] = encode64(value);
    } else if (name.compare(0, 10, "attribute:") == 0 && parse_number(name.substr(10), number) && number <= 0xFFFF) {
        found->adapterAttributes[static_cast<uint16_t>(number)] = encode32(word);
    } else {
        error = "a port has no settable value \"" + name + "\"";
        return false;
    }
    return true;
}

bool get_value(const std::string& port, const std::string& name, std::string& value)
{
    Simulator& simulator = Simulator::instance();
    std::lock_guard<std::mutex> lock(simulator.mutex);
    Adapter* adapter = nullptr;
    const Port* found = find_port(simulator, port, &adapter);
    if (!found) return false;
    if (name == "wwpn")
        value = to_text(found->current.wwpn);
    else if (name == "wwnn")
        value = to_text(found->current.wwnn);
    else if (name == "state")
        value = std::to_string(found->state);
    else if (name == "speed")
        value = std::to_string(found->speed);
    else if (name == "fc_id")
        value = std::to_string(found->fcId);
    else if (name == "beacon")
        value = std::to_string(found->beacon);
    else if (name == "enabled")
        value = found->enabled ? "1" : "0";
    else if (name == "boot_code")
        value = std::to_string(found->bootCode);
    else if (name == "resets")
        value = std::to_string(found->resets);
    else if (name == "retention")
        value = std::to_string(found->retention);
    else if (name == "pending")
        value = found->pending ? to_text(found->pending->names.wwpn) : "none";
    else if (name == "firmware")
        value = adapter->firmwareVersion;
    else if (name == "test")
        value = found->diagnostics.lastStart.empty() ? "none" : found->diagnostics.lastStart;
    else if (name == "present")
        value = adapter->present ? "1" : "0";
    else if (name == "targets")
        value = std::to_string(found->targets.size());
    else if (name == "paths")
        value = std::to_string(found->paths());
    else
        return false;
    return true;
}

std::string generate_scenario(uint32_t ports, uint32_t targets, uint32_t luns)
{
    std::ostringstream text;
    text << "# " << ports << " ports, each with " << targets << " targets of " << luns
         << " logical units: " << uint64_t(ports) * targets * luns << " paths.\n"
         << "[generate]\n"
         << "ports = " << ports << "\ntargets = " << targets << "\nluns = " << luns << "\n";
    return text.str();
}

std::string run_command(const std::string& line)
{
    std::istringstream words(line);
    std::string command, first, second, third, fourth;
    words >> command;
    const auto rest = [&words] {
        std::string text;
        std::getline(words >> std::ws, text);
        return text;
    };
    std::string error;
    if (command == "ping") return "ok\n";
    if (command == "state") return "ok\n" + describe_state();
    if (command == "counters") return "ok\n" + describe_counters();
    if (command == "log") return "ok\n" + describe_log();
    if (command == "faults") return "ok\n" + describe_faults();
    if (command == "fault") {
        try {
            Fault fault = parse_fault(rest());
            Simulator& simulator = Simulator::instance();
            std::lock_guard<std::mutex> lock(simulator.mutex);
            simulator.faults.push_back(fault);
            return "ok\n" + std::to_string(simulator.faults.size()) + "\n";
        } catch (const Scenario_Error& wrong) {
            return std::string("error ") + wrong.what() + "\n";
        }
    }
    Simulator& simulator = Simulator::instance();
    if (command == "clear-faults" || command == "clear-log" || command == "reset" || command == "load") {
        const std::string path = command == "load" ? rest() : std::string();
        std::lock_guard<std::mutex> lock(simulator.mutex);
        if (command == "clear-faults") simulator.clear_faults();
        if (command == "clear-log") simulator.log.clear();
        const bool good = command == "reset"  ? simulator.reload()
                          : command == "load" ? simulator.load_file(path)
                                              : true;
        return good ? "ok\n" : "error " + simulator.error + "\n";
    }
    if (command == "link" && words >> first >> second && (first == "up" || first == "down"))
        return set_link(second, first == "up", error) ? "ok\n" : "error " + error + "\n";
    uint64_t number = 0, fabric = 0;
    if (command == "event" && words >> first >> second && parse_number(second, number) && number <= UINT32_MAX) {
        if (words >> third && (!parse_number(third, fabric) || fabric > UINT32_MAX))
            return "error \"" + third + "\" is no fabric port identifier\n";
        uint64_t times = 1;
        if (words >> fourth && (!parse_number(fourth, times) || times < 1 || times > longest_burst))
            return "error a burst has 1 to " + std::to_string(longest_burst) + " events\n";
        const int called = send_event(first, static_cast<uint32_t>(number), static_cast<uint32_t>(fabric),
                                      static_cast<uint32_t>(times));
        return called < 0 ? "error there is no port " + first + "\n" : "ok\n" + std::to_string(called) + "\n";
    }
    if (command == "set" && words >> first >> second >> third && parse_number(third, number))
        return set_value(first, second, number, error) ? "ok\n" : "error " + error + "\n";
    if (command == "get" && words >> first >> second) {
        std::string value;
        return get_value(first, second, value) ? "ok\n" + value + "\n"
                                               : "error there is no value \"" + second + "\" of port " + first + "\n";
    }
    return "error unknown command or wrong arguments: " + line.substr(0, 200) + "\n";
}

} // namespace nvrsim
