#include "host/command/Check.h"

#include "host/command/Listing.h"
#include "host/command/Table.h"
#include "host/command/Views.h"
#include "host/command/Walk.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <map>
#include <set>
#include <unordered_map>
#include <unordered_set>

namespace host {
namespace {

using Json = nlohmann::ordered_json;
using Identities = std::unordered_set<std::string>;

/// Ends that need not exist: records that never are instances, and those that a cleared log leaves behind.
bool is_loose_by_design(const Class_Record& association, const std::string& role)
{
    return association.is_a("NVRHBA_CorrespondingSettingDataRecord") ||
           (association.is_a("NVRHBA_DriverRecordLogManagesRecord") && same_name(role, "Record"));
}

/// What was counted of one association class.
struct Counts {
    std::string class_name;
    std::size_t instances = 0;
    std::size_t found = 0;   ///< ends that exist
    std::size_t foreign = 0; ///< ends that other providers publish
    std::size_t loose = 0;   ///< ends that are missing by design
    std::size_t faults = 0;

    void add(const Counts& other)
    {
        instances += other.instances;
        found += other.found;
        foreign += other.foreign;
        loose += other.loose;
        faults += other.faults;
    }
};

/// An end of some instances of one class, and where a traversal from it must lead.
struct Near_End {
    std::string role;
    Path path;
    std::map<std::string, Path> far, associations; ///< by identity
};

class Checker {
public:
    explicit Checker(Host& server) : m_server(server), m_registrations(server.registrations()) {}

    void run()
    {
        for (const Registration& each : m_registrations) {
            const Class_Record* record = m_server.schema().find(each.class_name);
            if (record && record->association && (each.kinds & association_kind) && !each.name_spaces.empty())
                check(*record, each.name_spaces.front());
        }
    }

    const std::vector<Counts>& counts() const { return m_counts; }
    const std::vector<std::string>& faults() const { return m_faults; }

private:
    void fault(const std::string& text)
    {
        m_counts.back().faults += 1;
        m_faults.push_back(m_counts.back().class_name + ": " + text);
    }

    void check(const Class_Record& record, const std::string& name_space)
    {
        m_counts.emplace_back();
        m_counts.back().class_name = record.name;
        const Answer answer = m_server.enumerate(name_space, record.name);
        if (!answer.ok()) fault("enumeration ends with " + told(answer.status));

        std::vector<Near_End> nears;
        std::unordered_map<std::string, std::size_t> places;
        for (const Instance& instance : answer.instances) {
            // Instances of subclasses are checked with their own class.
            if (!same_name(instance.path.class_name, record.name)) continue;
            m_counts.back().instances += 1;
            std::vector<std::pair<const Element_Record*, const Path*>> ends;
            for (const Element_Record& property : record.properties) {
                if (property.type != CMPI_ref) continue;
                // A key may stand in the path alone.
                const Value* value = instance.find(property.name);
                if (!value) value = instance.path.find(property.name);
                const Path* end = value ? value->as_path() : nullptr;
                if (end)
                    ends.emplace_back(&property, end);
                else
                    fault(property.name + " is null in " + instance.path.to_text());
            }
            for (const auto& [property, end] : ends) {
                check_end(record, *property, *end, name_space);
                const std::string near = identity(*end);
                const auto [place, fresh] = places.emplace(property->name + " " + near, nears.size());
                if (fresh) nears.push_back({property->name, *end, {}, {}});
                Near_End& entry = nears[place->second];
                entry.associations.emplace(identity(instance.path), instance.path);
                for (const auto& [other, far] : ends)
                    // An association of an object with itself has no far end.
                    if (other != property && identity(*far) != near) entry.far.emplace(identity(*far), *far);
            }
        }
        for (const Near_End& near : nears)
            check_traversals(record, near, name_space);
    }

    void check_end(const Class_Record& record, const Element_Record& property, const Path& end,
                   const std::string& name_space)
    {
        if (!is_served(end.class_name)) {
            if (is_foreign(property, end))
                m_counts.back().foreign += 1;
            else
                fault(property.name + " is of a class that nobody serves: " + end.to_text());
            return;
        }
        const Identities& there = instances(end.name_space.empty() ? name_space : end.name_space, end.class_name);
        if (there.count(identity(end)) != 0)
            m_counts.back().found += 1;
        else if (is_loose_by_design(record, property.name))
            m_counts.back().loose += 1;
        else
            fault(property.name + " does not exist: " + end.to_text());
    }

    void check_traversals(const Class_Record& record, const Near_End& near, const std::string& name_space)
    {
        Path from = near.path;
        if (from.name_space.empty()) from.name_space = name_space;
        const Answer far = m_server.associator_names(from, record.name, "", near.role);
        compare("associators", near, from, far, near.far);
        const Answer associations = m_server.reference_names(from, record.name, near.role);
        compare("references", near, from, associations, near.associations);
    }

    void compare(const std::string& verb, const Near_End& near, const Path& from, const Answer& answer,
                 const std::map<std::string, Path>& expected)
    {
        const std::string start = verb + " of the " + near.role + " " + from.to_text();
        if (!answer.ok()) return fault(start + " end with " + told(answer.status));
        Identities there;
        for (const Path& path : answer.paths)
            there.insert(identity(path));
        for (const auto& [text, path] : expected)
            if (there.count(text) == 0) fault(start + " lack " + path.to_text());
    }

    bool is_served(const std::string& class_name) const
    {
        return std::any_of(m_registrations.begin(), m_registrations.end(), [&](const Registration& each) {
            return (each.kinds & instance_kind) && same_name(each.class_name, class_name);
        });
    }

    /// Hosts, and the profiles that the module's own refer to.
    bool is_foreign(const Element_Record& property, const Path& end) const
    {
        const Schema& schema = m_server.schema();
        return schema.is_a(end.class_name, "CIM_ComputerSystem") ||
               schema.is_a(property.reference_class, "CIM_ComputerSystem") ||
               same_name(property.reference_class, "CIM_RegisteredProfile");
    }

    /// All instances of a class, read once.
    const Identities& instances(const std::string& name_space, const std::string& class_name)
    {
        const auto [place, fresh] = m_instances.try_emplace(lower_case(name_space + ":" + class_name));
        if (!fresh) return place->second;
        const Answer answer = m_server.names(name_space, class_name);
        if (!answer.ok())
            fault("the names of " + class_name + " in " + name_space + " end with " + told(answer.status));
        for (const Path& path : answer.paths)
            place->second.insert(identity(path));
        return place->second;
    }

    static std::string told(const Status& status)
    {
        return status_name(status.code) + (status.message.empty() ? "" : " (" + status.message + ")");
    }

    Host& m_server;
    const std::vector<Registration> m_registrations;
    std::unordered_map<std::string, Identities> m_instances;
    std::vector<Counts> m_counts;
    std::vector<std::string> m_faults;
};

Listing class_listing(const std::vector<Counts>& counts)
{
    Listing listing({{"association", "ASSOCIATION"},
                     {"instances", "INSTANCES"},
                     {"endsFound", "ENDS FOUND"},
                     {"endsOfOthers", "OF OTHERS"},
                     {"endsLooseByDesign", "LOOSE"},
                     {"faults", "FAULTS"}});
    for (const Counts& each : counts) {
        std::vector<Listing::Cell> row = {each.class_name};
        for (std::size_t number : {each.instances, each.found, each.foreign, each.loose, each.faults})
            row.emplace_back(std::to_string(number), Value::uint64(number));
        listing.add(std::move(row));
    }
    return listing;
}

Json to_json(const Counts& counts)
{
    return {{"instances", counts.instances},
            {"endsFound", counts.found},
            {"endsOfOthers", counts.foreign},
            {"endsLooseByDesign", counts.loose},
            {"faults", counts.faults}};
}

std::string counted(std::size_t count, const char* one, const char* many)
{
    return std::to_string(count) + " " + (count == 1 ? one : many);
}

} // namespace

int check_associations(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    Checker checker(server);
    checker.run();
    const std::vector<Counts>& counts = checker.counts();
    Counts sum;
    std::size_t filled = 0;
    for (const Counts& each : counts) {
        sum.add(each);
        filled += each.instances != 0;
    }
    const int status = sum.faults == 0 ? 0 : CMPI_RC_ERR_FAILED;
    if (options.json) {
        Json classes = Json::object(), faults = Json::array();
        for (const Counts& each : counts)
            classes[each.class_name] = to_json(each);
        for (const std::string& fault : checker.faults())
            faults.push_back(fault);
        out << json_text({{"status", status}, {"sum", to_json(sum)}, {"classes", classes}, {"faults", faults}});
        return status;
    }
    if (options.csv) {
        out << class_listing(counts).csv();
        for (const std::string& fault : checker.faults())
            complaints << printable(fault) << "\n";
        return status;
    }
    if (options.all) out << class_listing(counts).table(page_width) << "\n";
    for (const std::string& fault : checker.faults())
        out << printable(fault) << "\n";
    out << counted(counts.size(), "association class", "association classes") << ", " << filled << " with instances; "
        << counted(sum.instances, "instance", "instances") << "; ends: " << sum.found << " found, " << sum.foreign
        << " of other providers, " << sum.loose << " loose by design; " << counted(sum.faults, "fault", "faults")
        << "\n";
    return status;
}

} // namespace host
