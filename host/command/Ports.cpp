#include "host/command/Ports.h"

#include "host/command/Class_Reader.h"
#include "host/command/Listing.h"
#include "host/command/Verbs.h"
#include "host/command/Views.h"

#include <nlohmann/json.hpp>

#include <algorithm>

namespace host {
namespace {

/// Properties of the port itself.
struct Port_Field {
    const char *property, *key, *label;
};
constexpr Port_Field port_fields[] = {
    {"DeviceID", "wwpn", "Port name"},
    {"FCID", "fcid", "Port ID"},
    {"PortType", "type", "Port type"},
    {"OperationalStatus", "state", "State"},
    {"Speed", "speed", "Speed"},
    {"MaxSpeed", "maxSpeed", "Supported speeds"},
    {"FabricName", "fabric", "Fabric name"},
    {"SupportedFC4Types", "supportedFC4Types", "Supported FC-4 types"},
    {"ActiveFC4Types", "activeFC4Types", "Active FC-4 types"},
    {"SupportedMaximumTransmissionUnit", "maxFrameSize", "Maximum frame size"},
    {"NumberOfDiscoveredPorts", "discoveredPorts", "Discovered ports"},
};

struct Counter_Field {
    const char *property, *key, *label;
    unsigned scale = 1; ///< what the library's counter was multiplied by
};
constexpr Counter_Field counter_fields[] = {
    {"PacketsTransmitted", "txFrames", "Frames sent"},
    {"PacketsReceived", "rxFrames", "Frames received"},
    {"BytesTransmitted", "txBytes", "Bytes sent", 4},
    {"BytesReceived", "rxBytes", "Bytes received", 4},
    {"LIPCount", "lips", "LIPs"},
    {"NOSCount", "nos", "NOS"},
    {"ErrorFrames", "errorFrames", "Error frames"},
    {"DumpedFrames", "dumpedFrames", "Dumped frames"},
    {"LinkFailures", "linkFailures", "Link failures"},
    {"LossOfSyncCounter", "lossOfSync", "Losses of sync"},
    {"LossOfSignalCounter", "lossOfSignal", "Losses of signal"},
    {"PrimitiveSeqProtocolErrCount", "protocolErrors", "Protocol errors"},
    {"InvalidTransmissionWords", "invalidWords", "Invalid words"},
    {"CRCErrors", "crcErrors", "CRC errors"},
};

constexpr char not_reported[] = "not reported";

/// Libraries set counters that they do not have to all ones, of 32 or of 64 bits.
bool is_all_ones(std::uint64_t value, unsigned scale)
{
    return value == 0xFFFFFFFFull * scale || value == 0xFFFFFFFFFFFFFFFFull * scale;
}

std::vector<Listing::Field> fields()
{
    std::vector<Listing::Field> all = {{"device", "Device"}, {"wwnn", "Node name"}};
    for (const Port_Field& field : port_fields)
        all.push_back({field.key, field.label});
    for (const auto& [key, label] : {std::pair{"model", "Model"}, std::pair{"serial", "Serial number"},
                                     std::pair{"firmware", "Firmware"}, std::pair{"driver", "Driver"}})
        all.push_back({key, label});
    for (const Counter_Field& field : counter_fields)
        all.push_back({field.key, field.label});
    return all;
}

class Ports {
public:
    Ports(Host& server, const std::string& name_space) : m_schema(server.schema()), m_reader(server, name_space)
    {
        const std::vector<Instance> ports = m_reader.all("NVRHBA_FCPort");
        m_controllers = m_reader.ties("NVRHBA_ControlledBy", {"Dependent", "DeviceID"}, {"Antecedent", "DeviceID"});
        m_tags = m_reader.ties("NVRHBA_Realizes", {"Dependent", "DeviceID"}, {"Antecedent", "Tag"});
        m_identities =
            m_reader.ties("NVRHBA_ElementSoftwareIdentity", {"Dependent", "DeviceID"}, {"Antecedent", "InstanceID"});
        m_packages = m_reader.by_key({"NVRHBA_PhysicalPackage"}, "Tag");
        m_software = m_reader.by_key({"NVRHBA_SoftwareIdentity"}, "InstanceID");
        m_statistics = m_reader.by_key({"NVRHBA_FCPortStatistics"}, "ElementName");
        for (const Instance& port : ports)
            add(port);
    }

    const Listing& listing() const { return m_listing; }
    const Status& status() const { return m_reader.status(); }

private:
    /// The element of a list of texts whose neighbour list calls it so.
    static std::string described(const Instance& instance, const char* description)
    {
        const std::vector<Value>& names = instance.get("IdentifyingDescriptions").elements();
        const std::vector<Value>& values = instance.get("OtherIdentifyingInfo").elements();
        for (std::size_t i = 0; i < std::min(names.size(), values.size()); ++i)
            if (names[i].as_text() == description) return values[i].as_text();
        return "";
    }

    /// Of the software on the controller, the one of this kind.
    const Instance& software(const std::string& controller, std::uint64_t kind) const
    {
        const auto [first, last] = m_identities.equal_range(controller);
        for (auto each = first; each != last; ++each) {
            const Instance& identity = at(m_software, each->second);
            for (const Value& classification : identity.get("Classifications").elements())
                if (classification.as_uint() == kind) return identity;
        }
        static const Instance none;
        return none;
    }

    Listing::Cell cell(const Instance& instance, const char* property) const
    {
        const Class_Record* record = m_schema.find(instance.path.class_name);
        const Value& value = instance.get(property);
        return {value_text(record ? record->property(property) : nullptr, value), value};
    }

    static Listing::Cell counter(const Instance& statistics, const Counter_Field& field)
    {
        const Value& value = statistics.get(field.property);
        if (value.is_null() || is_all_ones(value.as_uint(), field.scale)) return {not_reported, Value()};
        return {value.to_text(), value};
    }

    void add(const Instance& port)
    {
        constexpr std::uint64_t driver_kind = 2, firmware_kind = 10;
        const std::string wwpn = port.get("DeviceID").as_text();
        const std::string controller = at(m_controllers, wwpn);
        const std::string tag = at(m_tags, controller);
        const Instance& package = at(m_packages, tag);
        const std::string device = described(port, "OS Device Name");

        std::vector<Listing::Cell> row = {device.substr(device.rfind('/') + 1), tag};
        for (const Port_Field& field : port_fields)
            row.push_back(cell(port, field.property));
        Listing::Cell& fastest = row[2 + max_speed_field];
        if (!fastest.shown.empty() && fastest.shown != "-") fastest.shown = "up to " + fastest.shown;
        row.push_back(cell(package, "Model"));
        row.push_back(cell(package, "SerialNumber"));
        row.push_back(cell(software(controller, firmware_kind), "VersionString"));
        row.push_back(cell(software(controller, driver_kind), "ElementName"));
        const Instance& statistics = at(m_statistics, wwpn);
        for (const Counter_Field& field : counter_fields)
            row.push_back(counter(statistics, field));
        m_listing.add(std::move(row));
    }

    static constexpr std::size_t max_speed_field = 5;
    static_assert(port_fields[max_speed_field].key[0] == 'm' && port_fields[max_speed_field].key[3] == 'S');

    const Schema& m_schema;
    Class_Reader m_reader;
    Class_Reader::Ties m_controllers, m_tags, m_identities;
    Class_Reader::By_Key m_packages, m_software, m_statistics;
    Listing m_listing{fields()};
};

} // namespace

int show_ports(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    const Ports ports(server, options.name_space);
    const Listing& listing = ports.listing();
    if (options.json) {
        if (!ports.status().ok()) return tell_failure(ports.status(), options, out, complaints);
        out << json_text({{"status", 0}, {"ports", listing.json()}});
        return 0;
    }
    out << (options.csv ? listing.csv() : listing.blocks());
    if (!ports.status().ok()) return tell_failure(ports.status(), options, out, complaints);
    if (listing.empty() && !options.csv) out << "no port is there\n";
    return 0;
}

} // namespace host
