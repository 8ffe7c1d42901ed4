#include "host/command/Walk.h"

#include "host/command/Views.h"

#include <algorithm>
#include <cstdio>
#include <unordered_map>
#include <utility>

namespace host {
namespace {

constexpr const char* routes = "CIM_SCSIInitiatorTargetLogicalUnitPath";

/// One walk; the first failure ends it.
class Walker {
public:
    Walker(Host& server, const std::string& name_space) : m_server(server), m_name_space(name_space) {}

    Walk go()
    {
        Answer packaging = m_server.enumerate(m_name_space, "NVRHBA_SystemPackaging");
        note(packaging.status);
        std::unordered_map<std::string, bool> known;
        for (const Instance& each : packaging.instances) {
            const Path* host = each.get("Dependent").as_path();
            if (!host || !known.emplace(identity(*host), true).second) continue;
            m_walk.hosts.emplace_back();
            m_walk.hosts.back().path = *host;
            adapters(m_walk.hosts.back());
        }
        return std::move(m_walk);
    }

private:
    void note(const Status& status)
    {
        if (m_walk.status.ok()) m_walk.status = status;
    }

    std::vector<Instance> beside(const Path& from, const char* association, const char* role, const char* result_role)
    {
        if (!m_walk.status.ok()) return {};
        Answer answer = m_server.associators(from, association, "", role, result_role);
        note(answer.status);
        return std::move(answer.instances);
    }

    void adapters(Host_Node& host)
    {
        for (Instance& package : beside(host.path, "NVRHBA_SystemPackaging", "Dependent", "Antecedent")) {
            Adapter_Node adapter{std::move(package), {}};
            for (const Instance& controller :
                 beside(adapter.package.path, "NVRHBA_Realizes", "Antecedent", "Dependent"))
                for (Instance& port : beside(controller.path, "NVRHBA_ControlledBy", "Antecedent", "Dependent")) {
                    adapter.ports.push_back({std::move(port), {}});
                    targets(adapter.ports.back());
                }
            host.adapters.push_back(std::move(adapter));
        }
    }

    void targets(Port_Node& port)
    {
        for (const Instance& initiator :
             beside(port.port.path, "NVRHBA_DeviceSAPImplementation", "Antecedent", "Dependent"))
            units(port, initiator.path);
    }

    /// Three requests for all routes of an initiator, then joined: a request for each target would read the module's
    /// whole list of routes each time.
    void units(Port_Node& port, const Path& initiator)
    {
        std::unordered_map<std::string, Instance> ends;
        for (const char* role : {"Target", "LogicalUnit"})
            for (Instance& end : beside(initiator, routes, "Initiator", role))
                ends.emplace(identity(end.path), std::move(end));
        if (!m_walk.status.ok()) return;
        Answer all = m_server.references(initiator, routes, "Initiator");
        note(all.status);

        std::unordered_map<std::string, std::size_t> places;
        for (const Instance& route : all.instances) {
            const Path* target = route.get("Target").as_path();
            const Path* unit = route.get("LogicalUnit").as_path();
            const auto endpoint = target ? ends.find(identity(*target)) : ends.end();
            if (endpoint == ends.end()) continue;
            const std::string& name = endpoint->second.get("TargetWWPN").as_text();
            const auto [place, fresh] = places.emplace(name, port.targets.size());
            if (fresh) port.targets.push_back({name, endpoint->second, {}});
            const auto found = unit ? ends.find(identity(*unit)) : ends.end();
            if (found == ends.end()) continue;
            const std::string& text = endpoint->second.get("Name").as_text();
            port.targets[place->second].units.push_back(
                {number(text.substr(text.rfind(':') + 1)), device_name(endpoint->second), found->second});
        }
        for (Target_Node& target : port.targets)
            std::stable_sort(target.units.begin(), target.units.end(), [](const Unit_Node& a, const Unit_Node& b) {
                return std::pair(a.number.size(), a.number) < std::pair(b.number.size(), b.number);
            });
    }

    /// The number that people know for eight bytes of FCP addressing, if it is of the peripheral or the flat kind.
    static std::string number(const std::string& bytes)
    {
        unsigned first = 0;
        char rest[13] = "";
        const bool plain = bytes.size() == 16 && std::sscanf(bytes.c_str(), "%4x%12s", &first, rest) == 2 &&
                           std::string(rest) == "000000000000" && first < 0x8000;
        return plain ? std::to_string(first & 0x3FFF) : bytes;
    }

    Host& m_server;
    const std::string m_name_space;
    Walk m_walk;
};

std::string text_of(const Instance& instance, const Schema& schema, const char* property)
{
    const Class_Record* record = schema.find(instance.path.class_name);
    const Value& value = instance.get(property);
    return value.is_null() ? "" : value_text(record ? record->property(property) : nullptr, value);
}

/// "port 0" from "port" and a value; nothing without a value.
std::string named(const char* name, const std::string& value)
{
    return value.empty() ? "" : name + (" " + value);
}

std::vector<std::string> without_empty(std::vector<std::string> parts)
{
    parts.erase(std::remove(parts.begin(), parts.end(), ""), parts.end());
    return parts;
}

} // namespace

Walk walk_hosts(Host& server, const std::string& name_space)
{
    return Walker(server, name_space).go();
}

std::string device_name(const Instance& endpoint)
{
    const std::vector<Value>& names = endpoint.get("OtherIdentifyingInfo").elements();
    return names.empty() ? "" : names.front().as_text();
}

std::string size_text(const Value& bytes)
{
    if (bytes.is_null()) return "";
    constexpr const char* names[] = {"B", "KiB", "MiB", "GiB", "TiB", "PiB", "EiB"};
    double size = static_cast<double>(bytes.as_uint());
    std::size_t unit = 0;
    // By the rounded value: what would read "1024 MiB" is "1 GiB".
    while (size >= 1023.95 && unit + 1 < std::size(names)) {
        size /= 1024;
        ++unit;
    }
    char text[32];
    std::snprintf(text, sizeof text, "%.1f", size);
    std::string number = text;
    if (number.size() > 2 && number.compare(number.size() - 2, 2, ".0") == 0) number.resize(number.size() - 2);
    return number + " " + names[unit];
}

std::string identity(const Path& path)
{
    std::vector<std::string> keys;
    for (const Named_Value& key : path.keys) {
        const std::string value = key.value.as_path() ? identity(*key.value.as_path()) : key.value.to_text();
        // With its length in front no value can pass for two.
        keys.push_back(lower_case(key.name) + "=" + std::to_string(value.size()) + ":" + value);
    }
    std::sort(keys.begin(), keys.end());
    std::string text = lower_case(path.class_name);
    for (const std::string& key : keys)
        text += "," + key;
    return text;
}

std::string host_name(const Host_Node& host)
{
    const Value* name = host.path.find("Name");
    return name ? name->to_text() : host.path.class_name;
}

std::vector<std::string> facts(const Adapter_Node& adapter)
{
    const Instance& package = adapter.package;
    return without_empty({package.get("Manufacturer").as_text() + " " + package.get("Model").as_text(),
                          named("serial", package.get("SerialNumber").as_text()),
                          named("node", package.get("Tag").as_text())});
}

std::vector<std::string> facts(const Port_Node& port, const Schema& schema)
{
    return without_empty({named("port", text_of(port.port, schema, "PortNumber")),
                          text_of(port.port, schema, "DeviceID"), text_of(port.port, schema, "OperationalStatus"),
                          text_of(port.port, schema, "Speed"),
                          named("fabric", text_of(port.port, schema, "FabricName")),
                          named("address", text_of(port.port, schema, "FCID"))});
}

std::vector<std::string> facts(const Target_Node& target, const Schema& schema)
{
    return without_empty({"target " + target.name, text_of(target.endpoint, schema, "OperationalStatus"),
                          named("address", text_of(target.endpoint, schema, "FCID"))});
}

std::vector<std::string> facts(const Unit_Node& unit, const Schema& schema)
{
    std::string kind = unit.unit.get("ElementName").as_text();
    // "Storage Volume: 3" and "Tape Drive 3" end in the number that the operating system has for it.
    kind.erase(kind.find_last_not_of("0123456789: ") + 1);
    return without_empty({"LUN " + unit.number, kind, text_of(unit.unit, schema, "OperationalStatus"),
                          size_text(unit.unit.get("Capacity")), unit.device});
}

} // namespace host
