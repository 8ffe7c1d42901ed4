#include "host/command/Verbs.h"

#include "host/PathText.h"
#include "host/command/Actions.h"
#include "host/command/Arguments.h"
#include "host/command/Check.h"
#include "host/command/Diagnostics.h"
#include "host/command/Graph.h"
#include "host/command/Keys.h"
#include "host/command/Listing.h"
#include "host/command/Logs.h"
#include "host/command/Paths.h"
#include "host/command/Ports.h"
#include "host/command/Serve.h"
#include "host/command/Table.h"
#include "host/command/Traversal.h"
#include "host/command/Tree.h"
#include "host/command/Views.h"

#include <nlohmann/json.hpp>

#include <algorithm>

namespace host {
namespace {

using Json = nlohmann::ordered_json;

/// One run of the command; each verb prints and answers the exit status.
class Run {
public:
    Run(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
        : m_server(server), m_options(options), m_out(out), m_complaints(complaints)
    {
    }

    int verb()
    {
        if (m_options.action) return run_action(m_server, m_options, m_out, m_complaints);
        if (m_options.verb == "diag") return run_diagnostics(m_server, m_options, m_out, m_complaints);
        if (m_options.verb == "classes") return classes();
        if (m_options.verb == "tree") return show_tree(m_server, m_options, m_out, m_complaints);
        if (m_options.verb == "graph") return draw_graph(m_server, m_options, m_out, m_complaints);
        if (m_options.verb == "serve") return serve(m_server, m_options, m_out, m_complaints);
        if (m_options.verb == "paths") return show_paths(m_server, m_options, m_out, m_complaints);
        if (m_options.verb == "ports") return show_ports(m_server, m_options, m_out, m_complaints);
        if (m_options.verb == "check") return check_associations(m_server, m_options, m_out, m_complaints);
        if (m_options.verb == "log") return run_log(m_server, m_options, m_out, m_complaints);
        if (m_options.verb == "driverlog") return show_driver_log(m_server, m_options, m_out, m_complaints);
        if (m_options.verb == "listen") return listen(m_server, m_options, m_out, m_complaints);
        Path_Parse object = parse_path(m_options.object, &m_server.schema(), m_options.name_space);
        if (!object.ok) return wrong(quote(m_options.object) + ": " + object.error);
        m_path = object.path;
        m_class = m_server.schema().find(m_path.class_name);
        if (!m_class)
            return failed({CMPI_RC_ERR_INVALID_CLASS, "there is no class " + m_path.class_name, Fault::request});
        if (m_options.verb == "enum") return enumerate();
        if (m_options.verb == "names") return names();
        if (m_options.verb == "get") return get();
        if (m_options.verb == "set") return set();
        if (m_options.verb == "call") return call();
        if (std::string missing = missing_keys(); !missing.empty()) return wrong(missing);
        return traverse(m_server, m_path, m_options, m_out, m_complaints);
    }

private:
    int wrong(const std::string& text) { return tell_wrong(text, m_complaints); }
    int failed(const Status& status) { return tell_failure(status, m_options, m_out, m_complaints); }

    Property_List wanted() const
    {
        if (m_options.properties.empty()) return std::nullopt;
        return m_options.properties;
    }

    /// Properties that the class does not have are told before anything is loaded. Empty if all are known.
    std::string unknown_property() const
    {
        for (const std::string& name : m_options.properties) {
            bool known = m_class->property(name);
            for (const Class_Record* each : m_server.schema().family(*m_class))
                known = known || each->property(name);
            if (!known) return m_class->name + " has no property " + name;
        }
        return "";
    }

    int classes();
    int enumerate();
    int names();
    int get();
    int set();
    int call();
    /// Keys that the path lacks, for verbs that need an instance. Empty if none.
    std::string missing_keys() const;

    Host& m_server;
    const Options& m_options;
    std::ostream& m_out;
    std::ostream& m_complaints;
    Path m_path;
    const Class_Record* m_class = nullptr;
};

std::string kinds_text(unsigned kinds)
{
    std::string text;
    constexpr std::pair<unsigned, const char*> names[] = {{instance_kind, "instance"},
                                                          {association_kind, "association"},
                                                          {method_kind, "method"},
                                                          {property_kind, "property"},
                                                          {indication_kind, "indication"}};
    for (const auto& [bit, name] : names)
        if (kinds & bit) text += (text.empty() ? "" : " ") + std::string(name);
    return text;
}

int Run::classes()
{
    const std::string pattern = lower_case(m_options.object);
    const std::vector<Registration> served = m_server.registrations();
    Listing listing(
        {{"class", "CLASS"}, {"superclass", "SUPERCLASS"}, {"kinds", "SERVED AS"}, {"namespaces", "NAMESPACES"}});
    Json json = Json::array();
    for (const Class_Record* record : m_server.schema().classes()) {
        if (lower_case(record->name).find(pattern) == std::string::npos) continue;
        auto found = std::find_if(served.begin(), served.end(),
                                  [&](const Registration& each) { return same_name(each.class_name, record->name); });
        if (found == served.end() && !m_options.all) continue;
        std::string spaces, kinds;
        Json space_list = Json::array();
        if (found != served.end()) {
            kinds = kinds_text(found->kinds);
            for (const std::string& space : found->name_spaces) {
                spaces += (spaces.empty() ? "" : " ") + space;
                space_list.push_back(space);
            }
        }
        const std::string super = record->super ? record->super->name : "";
        listing.add({record->name, super, kinds, spaces});
        json.push_back({{"class", record->name}, {"superclass", super}, {"kinds", kinds}, {"namespaces", space_list}});
    }
    if (m_options.json)
        m_out << json_text({{"status", 0}, {"classes", json}});
    else if (m_options.csv)
        m_out << listing.csv();
    else if (listing.empty())
        m_out << "no class has " << quote(m_options.object) << " in its name\n";
    else
        m_out << listing.table(page_width);
    return 0;
}

int Run::enumerate()
{
    if (std::string unknown = unknown_property(); !unknown.empty()) return wrong(unknown);
    Answer answer = m_server.enumerate(m_path.name_space, m_class->name, wanted());
    if (m_options.json) {
        if (!answer.ok()) return failed(answer.status);
        Json instances = Json::array();
        for (const Instance& instance : answer.instances)
            instances.push_back(to_json(instance));
        m_out << json_text({{"status", 0}, {"instances", instances}});
        return 0;
    }
    if (m_options.csv) {
        m_out << instance_listing(answer.instances, m_server.schema(), m_options.properties, m_options.all).csv();
        return answer.ok() ? 0 : failed(answer.status);
    }
    if (m_options.all) {
        const char* between = "";
        for (const Instance& instance : answer.instances) {
            m_out << between << property_list(instance, m_server.schema(), false);
            between = "\n";
        }
    } else {
        m_out << instance_table(answer.instances, m_server.schema(), m_options.properties);
    }
    // What came before a failure is shown, and then the failure.
    if (!answer.ok()) return failed(answer.status);
    if (answer.instances.empty()) m_out << "no instances of " << m_class->name << " in " << m_path.name_space << "\n";
    return 0;
}

int Run::names()
{
    Answer answer = m_server.names(m_path.name_space, m_class->name);
    if (m_options.json) {
        if (!answer.ok()) return failed(answer.status);
        Json paths = Json::array();
        for (const Path& path : answer.paths)
            paths.push_back(path.to_text());
        m_out << json_text({{"status", 0}, {"paths", paths}});
        return 0;
    }
    m_out << path_lines(answer.paths, m_options);
    if (!answer.ok()) return failed(answer.status);
    if (answer.paths.empty() && !m_options.csv)
        m_out << "no instances of " << m_class->name << " in " << m_path.name_space << "\n";
    return 0;
}

std::string Run::missing_keys() const
{
    std::string missing;
    for (const Element_Record& property : m_class->properties)
        if (property.key && !m_path.find(property.name)) missing += (missing.empty() ? "" : ", ") + property.name;
    if (missing.empty()) return "";
    return "an object path of " + m_class->name + " also needs " + missing + " (nvrcim names " + m_class->name +
           " shows whole paths)";
}

int Run::get()
{
    if (std::string missing = missing_keys(); !missing.empty()) return wrong(missing);
    if (std::string unknown = unknown_property(); !unknown.empty()) return wrong(unknown);
    Answer answer = m_server.get(m_path, wanted());
    if (!answer.ok()) return failed(answer.status);
    const Instance& instance = answer.instances.front();
    if (m_options.json)
        m_out << json_text({{"status", 0}, {"instance", to_json(instance)}});
    else if (m_options.csv)
        m_out << instance_listing({instance}, m_server.schema(), m_options.properties, true).csv();
    else
        m_out << property_list(instance, m_server.schema(), m_options.all);
    return 0;
}

std::vector<Named_Value> properties_named(const Instance& instance, const std::vector<std::string>& names)
{
    std::vector<Named_Value> properties;
    for (const std::string& name : names)
        properties.push_back({name, instance.get(name)});
    return properties;
}

int Run::set()
{
    if (std::string missing = missing_keys(); !missing.empty()) return wrong(missing);
    Instance instance;
    instance.path = m_path;
    instance.properties = m_path.keys;
    std::vector<std::string> names;
    for (const std::string& text : m_options.arguments) {
        std::string name, value;
        if (!split_argument(text, name, value)) return wrong(quote(text) + " is not property=value");
        const Element_Record* property = m_class->property(name);
        if (!property) return wrong(m_class->name + " has no property " + name);
        if (property->key) return wrong(property->name + " is a key, and keys cannot change");
        Argument_Parse argument = parse_argument(*property, value, m_server.schema(), m_path.name_space);
        if (!argument.ok) return wrong(argument.error);
        instance.set(property->name, argument.argument.value);
        names.push_back(property->name);
    }
    Answer answer = names.size() == 1 ? m_server.set_property(m_path, names[0], instance.get(names[0]))
                                      : m_server.modify(instance, names);
    if (!answer.ok()) return failed(answer.status);
    if (m_options.json) m_out << json_text({{"status", 0}});
    if (m_options.csv) m_out << csv_record(properties_named(instance, names));
    for (const std::string& name : names)
        if (!m_options.json && !m_options.csv)
            m_out << m_class->name << "." << name << " = "
                  << printable(value_text_with_number(m_class->property(name), instance.get(name))) << "\n";
    return 0;
}

int Run::call()
{
    const Method_Record* method = m_class->method(m_options.method);
    if (!method) {
        std::string known;
        for (const Method_Record& each : m_class->methods)
            known += (known.empty() ? "" : ", ") + each.name;
        return wrong(m_class->name + " has no method " + m_options.method +
                     (known.empty() ? "; it has none at all" : "; it has " + known));
    }
    if (std::string missing = missing_keys(); !missing.empty() && !method->is_static) return wrong(missing);
    std::vector<Named_Value> in;
    for (const std::string& text : m_options.arguments) {
        std::string name, value;
        if (!split_argument(text, name, value)) return wrong(quote(text) + " is not name=value");
        const Element_Record* parameter = method->find_parameter(name);
        if (!parameter) return wrong(method->name + " has no parameter " + name);
        if (!parameter->in) return wrong(parameter->name + " is an output of " + method->name);
        Argument_Parse argument = parse_argument(*parameter, value, m_server.schema(), m_path.name_space);
        if (!argument.ok) return wrong(argument.error);
        in.push_back(argument.argument);
    }
    Answer answer = m_server.call(m_path, method->name, in);
    if (!answer.ok()) return failed(answer.status);
    if (m_options.json) {
        Json out = Json::object();
        for (const Named_Value& each : answer.out)
            out[each.name] = to_json(each.value);
        m_out << json_text({{"status", 0}, {"returnValue", to_json(answer.value)}, {"out", out}});
        return 0;
    }
    if (m_options.csv) {
        answer.out.insert(answer.out.begin(), {"returnValue", answer.value});
        m_out << csv_record(answer.out);
        return 0;
    }
    Element_Record result;
    result.words = method->words;
    m_out << method->name << " returned " << printable(value_text_with_number(&result, answer.value)) << "\n";
    for (const Named_Value& each : answer.out)
        m_out << "  " << each.name << " = "
              << printable(value_text_with_number(method->find_parameter(each.name), each.value)) << "\n";
    return 0;
}

} // namespace

std::string complaint(const Status& status)
{
    const std::string name = status_name(status.code) + " (" + std::to_string(status.code) + ")";
    const std::string tail = status.message.empty() ? "" : ": " + status.message;
    switch (status.fault) {
    case Fault::request:
        return "nvrcim: wrong request" + (tail.empty() ? ": " + name : tail);
    case Fault::module:
        return "nvrcim: the module fails" + tail;
    case Fault::server:
        return "nvrcim: the server fails" + tail;
    default:
        return "nvrcim: the provider answers " + name + tail;
    }
}

std::string path_lines(const std::vector<Path>& paths, const Options& options)
{
    Listing listing(std::vector<Listing::Field>{{"path", ""}});
    std::string text;
    for (const Path& path : paths) {
        if (options.csv)
            listing.add({path.to_text()});
        else
            text += printable(path.to_text()) + "\n";
    }
    return options.csv ? listing.csv() : text;
}

int tell_wrong(const std::string& text, std::ostream& complaints)
{
    complaints << "nvrcim: wrong command: " << printable(text) << "\n";
    return usage_error;
}

int tell_failure(const Status& status, const Options& options, std::ostream& out, std::ostream& complaints)
{
    out.flush(); // what came before the failure is seen before it
    complaints << printable(complaint(status)) << "\n";
    if (options.json)
        out << json_text({{"status", status.code}, {"name", status_name(status.code)}, {"message", status.message}});
    return status.code < 0 || status.code > 255 ? 255 : status.code;
}

int find_port(Host& server, const Options& options, const char* class_name, const char* unnamed, Path& found,
              std::ostream& out, std::ostream& complaints)
{
    const Answer names = server.names(options.name_space, class_name);
    if (!names.ok()) return tell_failure(names.status, options, out, complaints);
    std::string known;
    for (const Path& path : names.paths) {
        const std::string name = key_text(path, "DeviceID");
        known += (known.empty() ? "" : ", ") + name;
        if (options.port.empty() ? names.paths.size() > 1 : plain_name(options.port) != plain_name(name)) continue;
        found = path;
        return 0;
    }
    if (options.port.empty() && !known.empty())
        return tell_wrong(std::string(unnamed) + "; there are " + known, complaints);
    const std::string missing = known.empty() ? "this host has no Fibre Channel port"
                                              : "there is no port " + options.port + "; there are " + known;
    return tell_failure({CMPI_RC_ERR_NOT_FOUND, missing, Fault::request}, options, out, complaints);
}

int run_verb(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    return Run(server, options, out, complaints).verb();
}

} // namespace host
