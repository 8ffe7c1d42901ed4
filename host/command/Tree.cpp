#include "host/command/Tree.h"

#include "host/command/Listing.h"
#include "host/command/Table.h"
#include "host/command/Verbs.h"
#include "host/command/Views.h"
#include "host/command/Walk.h"

#include <nlohmann/json.hpp>

namespace host {
namespace {

using Json = nlohmann::ordered_json;

std::string line(const std::vector<std::string>& parts)
{
    std::string text;
    for (const std::string& part : parts)
        text += (text.empty() ? "" : "  ") + printable(part);
    return text;
}

/// Prints nodes with the rules that lead to them.
class Tree_Printer {
public:
    Tree_Printer(const Schema& schema, std::ostream& out) : m_schema(schema), m_out(out) {}

    void print(const Host_Node& host)
    {
        m_out << printable(host_name(host)) << "\n";
        below(host.adapters, "", [&](const Adapter_Node& adapter, const std::string& margin) {
            m_out << line(facts(adapter)) << "\n";
            below(adapter.ports, margin, [&](const Port_Node& port, const std::string& inner) {
                m_out << line(facts(port, m_schema)) << "\n";
                print_targets(port, inner);
            });
        });
    }

private:
    void print_targets(const Port_Node& port, const std::string& margin)
    {
        below(port.targets, margin, [&](const Target_Node& target, const std::string& inner) {
            m_out << line(facts(target, m_schema)) << "\n";
            below(target.units, inner,
                  [&](const Unit_Node& unit, const std::string&) { m_out << line(facts(unit, m_schema)) << "\n"; });
        });
    }

    template <class Node, class Print>
    void below(const std::vector<Node>& nodes, const std::string& margin, const Print& print)
    {
        for (const Node& node : nodes) {
            const bool last = &node == &nodes.back();
            m_out << margin << (last ? "└─ " : "├─ ");
            print(node, margin + (last ? "   " : "│  "));
        }
    }

    const Schema& m_schema;
    std::ostream& m_out;
};

/// A row for each node that has none below it, with those above it.
Listing rows(const Walk& walk)
{
    Listing listing({{"host", "HOST"},
                     {"adapter", "ADAPTER"},
                     {"port", "PORT"},
                     {"target", "TARGET"},
                     {"lun", "LUN"},
                     {"unit", "UNIT"},
                     {"device", "DEVICE"}});
    for (const Host_Node& host : walk.hosts) {
        const std::string top = host_name(host);
        if (host.adapters.empty()) listing.add({top});
        for (const Adapter_Node& adapter : host.adapters) {
            const std::string tag = adapter.package.get("Tag").as_text();
            if (adapter.ports.empty()) listing.add({top, tag});
            for (const Port_Node& port : adapter.ports) {
                const std::string name = port.port.get("DeviceID").as_text();
                if (port.targets.empty()) listing.add({top, tag, name});
                for (const Target_Node& target : port.targets) {
                    if (target.units.empty()) listing.add({top, tag, name, target.name});
                    for (const Unit_Node& unit : target.units)
                        listing.add({top, tag, name, target.name, unit.number, unit.unit.get("DeviceID").as_text(),
                                     unit.device});
                }
            }
        }
    }
    return listing;
}

Json to_json(const Walk& walk)
{
    Json hosts = Json::array();
    for (const Host_Node& host : walk.hosts) {
        Json adapters = Json::array();
        for (const Adapter_Node& adapter : host.adapters) {
            Json ports = Json::array();
            for (const Port_Node& port : adapter.ports) {
                Json targets = Json::array();
                for (const Target_Node& target : port.targets) {
                    Json units = Json::array();
                    for (const Unit_Node& unit : target.units)
                        units.push_back({{"lun", unit.number}, {"unit", host::to_json(unit.unit)}});
                    targets.push_back({{"wwpn", target.name},
                                       {"endpoint", host::to_json(target.endpoint)},
                                       {"units", std::move(units)}});
                }
                ports.push_back({{"port", host::to_json(port.port)}, {"targets", std::move(targets)}});
            }
            adapters.push_back({{"package", host::to_json(adapter.package)}, {"ports", std::move(ports)}});
        }
        hosts.push_back({{"path", host.path.to_text()}, {"adapters", std::move(adapters)}});
    }
    return hosts;
}

} // namespace

int show_tree(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    const Walk walk = walk_hosts(server, options.name_space);
    if (options.json) {
        if (!walk.status.ok()) return tell_failure(walk.status, options, out, complaints);
        out << json_text({{"status", 0}, {"hosts", to_json(walk)}});
        return 0;
    }
    if (options.csv) {
        out << rows(walk).csv();
        return walk.status.ok() ? 0 : tell_failure(walk.status, options, out, complaints);
    }
    Tree_Printer printer(server.schema(), out);
    for (const Host_Node& host : walk.hosts)
        printer.print(host);
    // What was found before a failure is shown, and then the failure.
    if (!walk.status.ok()) return tell_failure(walk.status, options, out, complaints);
    if (walk.hosts.empty()) out << "no adapter is there\n";
    return 0;
}

} // namespace host
