#include "host/command/Traversal.h"

#include "host/command/Table.h"
#include "host/command/Verbs.h"
#include "host/command/Views.h"

#include <nlohmann/json.hpp>

namespace host {
namespace {

using Json = nlohmann::ordered_json;

Answer ask(Host& server, const Path& path, const Options& o)
{
    Property_List properties;
    if (!o.properties.empty()) properties = o.properties;
    if (o.verb == "references")
        return o.names_only ? server.reference_names(path, o.association_class, o.role)
                            : server.references(path, o.association_class, o.role, properties);
    return o.names_only
               ? server.associator_names(path, o.association_class, o.result_class, o.role, o.result_role)
               : server.associators(path, o.association_class, o.result_class, o.role, o.result_role, properties);
}

void print_json(const Answer& answer, bool names_only, std::ostream& out)
{
    Json list = Json::array();
    for (const Path& path : answer.paths)
        list.push_back(path.to_text());
    for (const Instance& instance : answer.instances)
        list.push_back(to_json(instance));
    out << json_text({{"status", 0}, {names_only ? "paths" : "instances", list}});
}

void print_text(const Answer& answer, const Options& options, const Schema& schema, std::ostream& out)
{
    if (options.csv && !options.names_only) {
        out << instance_listing(answer.instances, schema, options.properties, options.all).csv();
        return;
    }
    out << path_lines(answer.paths, options);
    if (!options.all) {
        out << instance_table(answer.instances, schema, options.properties);
        return;
    }
    const char* between = "";
    for (const Instance& instance : answer.instances) {
        out << between << property_list(instance, schema, false);
        between = "\n";
    }
}

} // namespace

int traverse(Host& server, const Path& path, const Options& options, std::ostream& out, std::ostream& complaints)
{
    const Answer answer = ask(server, path, options);
    if (options.json) {
        if (!answer.ok()) return tell_failure(answer.status, options, out, complaints);
        print_json(answer, options.names_only, out);
        return 0;
    }
    print_text(answer, options, server.schema(), out);
    // What came before a failure is shown, and then the failure.
    if (!answer.ok()) return tell_failure(answer.status, options, out, complaints);
    if (answer.instances.empty() && answer.paths.empty() && !options.csv)
        out << (options.verb == "references" ? "no association holds it\n" : "no association ties anything to it\n");
    return 0;
}

} // namespace host
