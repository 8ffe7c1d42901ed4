#include "host/command/Paths.h"

#include "host/command/Class_Reader.h"
#include "host/command/Listing.h"
#include "host/command/Verbs.h"
#include "host/command/Views.h"
#include "host/command/Walk.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <limits>

namespace host {
namespace {

std::string trimmed(const std::string& text)
{
    const std::size_t first = text.find_first_not_of(' ');
    return first == std::string::npos ? "" : text.substr(first, text.find_last_not_of(' ') - first + 1);
}

/// The number at the end of a text: units are named "Storage Volume: 3" after the operating system's number.
std::string last_number(const std::string& text)
{
    return text.substr(text.find_last_not_of("0123456789") + 1);
}

/// The vendor, which stands before the product in "VENDOR PRODUCT Revision ...".
std::string vendor_of(const std::string& inquiry, const std::string& product)
{
    const std::string before = trimmed(inquiry.substr(0, inquiry.rfind(" Revision ")));
    const std::size_t size = before.size() - std::min(before.size(), product.size());
    return before.compare(size, std::string::npos, product) == 0 ? trimmed(before.substr(0, size)) : "";
}

/// What the unit's own pages call it: "INITIATOR_TARGET_IDENTIFIER_LUN" is the key of its instance.
std::string identifier_of(const std::string& device_id)
{
    const std::size_t target = device_id.find('_');
    const std::size_t first = target == std::string::npos ? target : device_id.find('_', target + 1);
    const std::size_t last = device_id.rfind('_');
    return first == std::string::npos || last <= first ? "" : device_id.substr(first + 1, last - first - 1);
}

class Paths {
public:
    Paths(Host& server, const std::string& name_space) : m_reader(server, name_space)
    {
        const std::vector<Instance> routes = m_reader.all("CIM_SCSIInitiatorTargetLogicalUnitPath");
        if (!routes.empty()) read_ends();
        for (const Instance& route : routes)
            add(route);
    }

    const Listing& listing() const { return m_listing; }
    const Status& status() const { return m_reader.status(); }

private:
    void read_ends()
    {
        m_endpoints = m_reader.by_key({"NVRHBA_SCSIProtocolEndpoint"}, "Name");
        m_units = m_reader.by_key({"NVRHBA_StorageVolume", "NVRHBA_LogicalDisk", "NVRHBA_TapeDrive",
                                   "NVRHBA_StorageExtent", "NVRHBA_SCSIArbitraryLogicalUnit"},
                                  "DeviceID");
        m_ports = m_reader.by_key({"NVRHBA_FCPort"}, "DeviceID");
        m_controllers = m_reader.ties("NVRHBA_ControlledBy", {"Dependent", "DeviceID"}, {"Antecedent", "DeviceID"});
        m_packages = m_reader.ties("NVRHBA_Realizes", {"Dependent", "DeviceID"}, {"Antecedent", "Tag"});
    }

    void add(const Instance& route)
    {
        const std::string local = key_of(route.get("Initiator"), "Name");
        const Instance& endpoint = at(m_endpoints, key_of(route.get("Target"), "Name"));
        const std::string device_id = key_of(route.get("LogicalUnit"), "DeviceID");
        const Instance& unit = at(m_units, device_id);
        const std::string product = trimmed(endpoint.get("ElementName").as_text());
        const std::string number = last_number(unit.get("ElementName").as_text());
        const Value& bus = endpoint.get("SCSIBusNumber");
        const Value& target = endpoint.get("SCSITargetNumber");
        const bool addressed = !bus.is_null() && !target.is_null() && !number.empty();
        const Value& capacity = unit.get("Capacity");
        m_listing.add({device_name(endpoint),
                       addressed ? bus.to_text() + ":" + target.to_text() + ":" + number : "",
                       local,
                       at(m_packages, at(m_controllers, local)),
                       at(m_ports, local).get("FabricName").as_text(),
                       endpoint.get("TargetWWPN").as_text(),
                       identifier_of(device_id),
                       vendor_of(endpoint.get("Description").as_text(), product),
                       product,
                       {size_text(capacity), capacity}});
    }

    Class_Reader m_reader;
    Class_Reader::By_Key m_endpoints, m_units, m_ports;
    Class_Reader::Ties m_controllers, m_packages;
    Listing m_listing{{{"device", "DEVICE"},
                       {"address", "BUS:TARGET:LUN"},
                       {"localWWPN", "LOCAL WWPN"},
                       {"localWWNN", "LOCAL WWNN"},
                       {"fabric", "FABRIC"},
                       {"targetWWPN", "TARGET WWPN"},
                       {"identifier", "LUN IDENTIFIER"},
                       {"vendor", "VENDOR"},
                       {"product", "PRODUCT"},
                       {"size", "SIZE"}}};
};

} // namespace

int show_paths(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    const Paths paths(server, options.name_space);
    const Listing& listing = paths.listing();
    if (options.json) {
        if (!paths.status().ok()) return tell_failure(paths.status(), options, out, complaints);
        out << json_text({{"status", 0}, {"paths", listing.json()}});
        return 0;
    }
    // A name that is cut is no use to anyone, so that rows are as wide as they must be.
    out << (options.csv ? listing.csv() : listing.table(std::numeric_limits<std::size_t>::max()));
    if (!paths.status().ok()) return tell_failure(paths.status(), options, out, complaints);
    if (listing.empty() && !options.csv) out << "no logical unit is there\n";
    return 0;
}

} // namespace host
