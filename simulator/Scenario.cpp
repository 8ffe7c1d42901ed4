#include "simulator/Scenario.h"

#include "simulator/PortReader.h"

#include <algorithm>
#include <cstring>

namespace nvrsim {

namespace {

constexpr uint64_t mostAdapters = 65536;
constexpr uint64_t mostLuns = 65536;
constexpr uint64_t mostUnits = 1 << 20; // of the whole host: more than that would eat up the process's memory
constexpr uint64_t mostViews = 1 << 22; // of a target by a port

struct Seen_Target {
    std::shared_ptr<Target> target;
    std::vector<uint32_t> ordinals; // of the ports that see it
    bool byAll = true;
};

/// Reads one document. Order matters: adapters before targets, since targets name the ports that see them.
class Reader {
public:
    Reader(const toml::table& document, const std::string& file) : m_root(file, document), m_file(file) {}

    Scenario read()
    {
        if (const toml::table* defaults = m_root.table("defaults")) {
            Fields fields(m_file, *defaults);
            m_adapterDefaults = fields.table("adapter");
            m_portDefaults = fields.table("port");
            m_targetDefaults = fields.table("target");
            m_lunDefaults = fields.table("lun");
            fields.refuse_unknown();
        }
        m_scenario.host.globalParams = default_params();
        if (const toml::table* host = m_root.table("host")) {
            Fields fields(m_file, *host);
            read_params(fields, "global_params", m_scenario.host.globalParams);
            fields.refuse_unknown();
        }
        for (const toml::table* table : m_root.tables("adapter"))
            read_adapter(*table);
        read_generated_adapters();
        refuse_twins();
        for (const toml::table* table : m_root.tables("target"))
            read_target(*table);
        read_generated_targets();
        for (const toml::table* table : m_root.tables("fault"))
            m_scenario.faults.push_back(read_fault(m_file, *table));
        m_root.refuse_unknown();
        connect();
        m_scenario.host.reindex();
        return std::move(m_scenario);
    }

private:
    void read_adapter(const toml::table& table)
    {
        Fields fields(m_file, table, m_adapterDefaults);
        uint64_t count = 1;
        fields.number("count", count, 1, mostAdapters);
        for (uint64_t i = 0; i < count; ++i) {
            const auto number = static_cast<uint32_t>(m_scenario.host.adapters.size());
            if (number >= mostAdapters) fields.fail("too many adapters");
            Adapter adapter = default_adapter(number);
            read_adapter_fields(fields, adapter, count > 1 ? number : UINT32_MAX);
            uint32_t plainPorts = 1;
            const auto ports = fields.tables("port");
            if (!ports.empty()) plainPorts = 0;
            fields.number("ports", plainPorts, 0, 256);
            if (!ports.empty() && fields.has("ports"))
                fields.fail("give either \"ports\" or [[adapter.port]], not both");
            for (const toml::table* port : ports)
                add_port(adapter, *port);
            for (uint32_t p = 0; p < plainPorts; ++p)
                add_port(adapter, m_nothing);
            if (!fields.has("node_wwn") && !adapter.ports.empty()) adapter.nodeWwn = adapter.ports[0].current.wwnn;
            m_scenario.host.adapters.push_back(std::move(adapter));
        }
        fields.refuse_unknown();
    }

    void add_port(Adapter& adapter, const toml::table& table)
    {
        Port port = default_port(m_ports, static_cast<uint32_t>(adapter.ports.size()));
        // Ports of one adapter name share its node name, as the interface has it.
        if (!adapter.ports.empty()) port.factory.wwnn = port.current.wwnn = adapter.ports[0].current.wwnn;
        Fields fields(m_file, table, m_portDefaults);
        read_port(fields, port);
        fields.refuse_unknown();
        complete_attributes(adapter, port);
        ++m_ports;
        adapter.ports.push_back(std::move(port));
    }

    void read_target(const toml::table& table)
    {
        Fields fields(m_file, table, m_targetDefaults);
        uint64_t count = 1;
        fields.number("count", count, 1, 65536);
        for (uint64_t i = 0; i < count; ++i) {
            Seen_Target seen = make_target();
            Target& target = *seen.target;
            fields.text("name", target.name);
            fields.wwn("wwpn", target.wwpn);
            fields.wwn("wwnn", target.wwnn);
            fields.number("fc_id", target.fcId, 0, 0xFFFFFF);
            if (count > 1) {
                if (fields.has("wwpn")) target.wwpn += i;
                if (fields.has("fc_id")) target.fcId += static_cast<uint32_t>(i);
            }
            if (const toml::array* ports = fields.array("seen_by")) read_seen_by(fields, *ports, seen);
            Lun_Numbers numbers;
            uint32_t luns = fields.has("lun") ? 0 : 1;
            fields.number("luns", luns, 0, mostLuns);
            refuse_too_many(fields, luns * (count - i));
            for (uint32_t n = 0; n < luns; ++n)
                add_lun(fields, target, n, m_nothing, numbers);
            for (const toml::table* lun : fields.tables("lun")) {
                Fields inner(m_file, *lun, m_lunDefaults);
                uint32_t number = static_cast<uint32_t>(target.luns.size());
                inner.number("number", number);
                uint32_t many = 1;
                inner.number("count", many, 1, mostLuns);
                for (uint32_t n = 0; n < many; ++n)
                    add_lun(inner, target, number + n, *lun, numbers);
            }
            index(fields, target);
            keep(fields, std::move(seen));
        }
        fields.refuse_unknown();
    }

    void read_seen_by(Fields& fields, const toml::array& ports, Seen_Target& seen)
    {
        seen.byAll = false;
        for (const toml::node& node : ports) {
            if (node.is_integer()) {
                const uint64_t ordinal = fields.to_number(node, "seen_by", 0, UINT32_MAX);
                if (ordinal >= m_ports)
                    fields.fail(node, "there is no port " + std::to_string(ordinal) + ", only " +
                                          std::to_string(m_ports) + " ports, counted from 0");
                seen.ordinals.push_back(static_cast<uint32_t>(ordinal));
                continue;
            }
            const Wwn wwpn = fields.to_wwn(node, "seen_by");
            bool known = false;
            for (const Adapter& adapter : m_scenario.host.adapters)
                for (const Port& port : adapter.ports)
                    if (port.current.wwpn == wwpn) {
                        seen.ordinals.push_back(port.ordinal);
                        known = true;
                    }
            if (!known) fields.fail(node, "no port has the name " + to_text(wwpn));
        }
    }

    using Lun_Numbers = std::unordered_map<uint32_t, size_t>; // place of each unit of a target, by its number here

    /// Before they are made, so that no refusal costs the memory first.
    void refuse_too_many(const Fields& at, uint64_t units) const
    {
        if (m_units + units > mostUnits) at.fail("too many logical units: more than " + std::to_string(mostUnits));
    }

    /// A number that the target has already replaces that unit.
    void add_lun(const Fields& at, Target& target, uint32_t number, const toml::table& table, Lun_Numbers& numbers)
    {
        refuse_too_many(at, 1);
        ++m_units;
        Lun lun = default_lun(target, number);
        if (&table != &m_nothing || m_lunDefaults) { // plain units, of which there can be many, are as they are
            Fields fields(m_file, table, m_lunDefaults);
            read_lun(fields, lun);
            fields.refuse_unknown();
        }
        const auto [place, isNew] = numbers.emplace(number, target.luns.size());
        if (isNew)
            target.luns.push_back(std::move(lun));
        else
            target.luns[place->second] = std::move(lun);
    }

    void index(const Fields& fields, Target& target)
    {
        target.byFcpLun.reserve(target.luns.size());
        for (uint32_t i = 0; i < target.luns.size(); ++i) {
            uint64_t key;
            std::memcpy(&key, target.luns[i].fcpLun.data(), sizeof key);
            if (!target.byFcpLun.emplace(key, i).second && !m_allowTwins)
                fields.fail("two logical units of target " + to_text(target.wwpn) + " have the same FCP LUN");
        }
    }

    Seen_Target make_target()
    {
        const auto number = static_cast<uint32_t>(m_targets.size());
        Seen_Target seen;
        seen.target = std::make_shared<Target>();
        seen.target->name = "target" + std::to_string(number);
        seen.target->wwpn = firstTargetPort + number;
        seen.target->wwnn = firstTargetNode + number;
        seen.target->fcId = 0x020000 + number;
        return seen;
    }

    void keep(const Fields& at, Seen_Target seen)
    {
        m_views += seen.byAll ? m_ports : seen.ordinals.size();
        if (m_views > mostViews)
            at.fail("too many targets: more than " + std::to_string(mostViews) + " views of one by a port");
        m_targets.push_back(std::move(seen));
    }

    void read_generated_adapters()
    {
        const toml::table* table = m_root.table("generate");
        if (!table) return;
        Fields fields(m_file, *table);
        uint32_t ports = 1, each = 1;
        fields.number("ports", ports, 0, mostAdapters);
        fields.number("ports_per_adapter", each, 1, 256);
        fields.number("targets", m_generatedTargets, 0, 65536);
        fields.number("luns", m_generatedLuns, 0, mostLuns);
        fields.refuse_unknown();
        for (uint32_t made = 0; made < ports;) {
            Adapter adapter = default_adapter(static_cast<uint32_t>(m_scenario.host.adapters.size()));
            Fields none(m_file, m_nothing, m_adapterDefaults);
            read_adapter_fields(none, adapter, static_cast<uint32_t>(m_scenario.host.adapters.size()));
            for (uint32_t p = 0; p < each && made < ports; ++p, ++made)
                add_port(adapter, m_nothing);
            if (!none.has("node_wwn")) adapter.nodeWwn = adapter.ports[0].current.wwnn;
            m_scenario.host.adapters.push_back(std::move(adapter));
        }
    }

    void read_generated_targets()
    {
        const toml::table* table = m_root.table("generate");
        if (!table) return;
        const Fields fields(m_file, *table);
        refuse_too_many(fields, uint64_t(m_generatedTargets) * m_generatedLuns);
        for (uint32_t t = 0; t < m_generatedTargets; ++t) {
            Seen_Target seen = make_target();
            Lun_Numbers numbers;
            seen.target->luns.reserve(m_generatedLuns);
            for (uint32_t n = 0; n < m_generatedLuns; ++n)
                add_lun(fields, *seen.target, n, m_nothing, numbers);
            index(fields, *seen.target);
            keep(fields, std::move(seen));
        }
    }

    void refuse_twins()
    {
        m_root.boolean("allow_twins", m_allowTwins);
        if (m_allowTwins) return;
        std::set<std::string> adapters;
        std::set<Wwn> ports;
        for (const Adapter& adapter : m_scenario.host.adapters) {
            if (!adapters.insert(adapter.name).second)
                m_root.fail("two adapters have the name \"" + adapter.name + "\" (allow_twins = true permits it)");
            for (const Port& port : adapter.ports)
                if (!ports.insert(port.current.wwpn).second)
                    m_root.fail("two ports have the name " + to_text(port.current.wwpn) +
                                " (allow_twins = true permits it)");
        }
    }

    void connect()
    {
        uint32_t path = 0;
        for (Adapter& adapter : m_scenario.host.adapters)
            for (Port& port : adapter.ports)
                for (const Seen_Target& seen : m_targets) {
                    if (!seen.byAll &&
                        std::find(seen.ordinals.begin(), seen.ordinals.end(), port.ordinal) == seen.ordinals.end())
                        continue;
                    port.targetByWwpn.emplace(seen.target->wwpn, static_cast<uint32_t>(port.targets.size()));
                    port.targets.push_back(seen.target);
                    port.firstPath.push_back(path);
                    path += static_cast<uint32_t>(seen.target->luns.size());
                }
    }

    Fields m_root;
    const std::string& m_file;
    Scenario m_scenario;
    std::vector<Seen_Target> m_targets;
    uint32_t m_ports = 0;
    uint64_t m_units = 0, m_views = 0;
    uint32_t m_generatedTargets = 0, m_generatedLuns = 0;
    bool m_allowTwins = false;
    const toml::table m_nothing;
    const toml::table* m_adapterDefaults = nullptr;
    const toml::table* m_portDefaults = nullptr;
    const toml::table* m_targetDefaults = nullptr;
    const toml::table* m_lunDefaults = nullptr;
};

} // namespace

Scenario parse_scenario(const std::string& text, const std::string& name)
{
    try {
        const toml::table document = toml::parse(text);
        return Reader(document, name).read();
    } catch (const toml::parse_error& error) {
        scenario_fault(name, error.source(), std::string(error.description()));
    }
}

Fault parse_fault(const std::string& text)
{
    static const std::string name = "fault";
    try {
        const toml::table document = toml::parse("fault = { " + text + " }");
        return read_fault(name, *document["fault"].as_table());
    } catch (const toml::parse_error& error) {
        scenario_fault(name, error.source(), std::string(error.description()));
    }
}

} // namespace nvrsim
