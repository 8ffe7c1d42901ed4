#include "host/command/Graph.h"

#include "host/command/Table.h"
#include "host/command/Verbs.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fstream>
#include <map>
#include <spawn.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

extern char** environ;

namespace host {
namespace {

/// Colours that stay apart from each other, also for eyes that confuse red and green; one for each fabric, in turn.
constexpr const char* fabric_colours[] = {"#0072b2", "#d55e00", "#009e73", "#cc79a7", "#e69f00", "#56b4e9"};
constexpr const char* quiet = "#5f6b7a";

/// Text inside a label of Graphviz's HTML kind, which takes no empty one.
std::string escaped(const std::string& text)
{
    if (text.empty()) return " ";
    std::string out;
    for (char c : printable(text)) {
        if (c == '&')
            out += "&amp;";
        else if (c == '<')
            out += "&lt;";
        else if (c == '>')
            out += "&gt;";
        else if (c == '"')
            out += "&quot;";
        else
            out += c;
    }
    return out;
}

std::string row(const std::string& html)
{
    return "<tr><td align=\"left\">" + html + "</td></tr>";
}

std::string bold(const std::string& text)
{
    return "<b>" + escaped(text) + "</b>";
}

std::string small(const std::string& text)
{
    return std::string("<font point-size=\"10\" color=\"") + quiet + "\">" + escaped(text) + "</font>";
}

std::string table_label(const std::string& rows)
{
    return "<<table border=\"0\" cellborder=\"0\" cellspacing=\"0\" cellpadding=\"2\">" + rows + "</table>>";
}

/// The first fact as a title, each of the others on a line below it.
std::string label(const std::vector<std::string>& facts)
{
    std::string rows;
    for (const std::string& fact : facts)
        rows += row(&fact == &facts.front() ? bold(fact) : small(fact));
    return table_label(rows);
}

/// A target port as all ports of the host see it together.
struct Shared_Target {
    const Target_Node* node;
    std::string id;
    std::vector<std::pair<std::string, std::vector<std::string>>> units; ///< (number and name, facts)

    /// Another route to a unit only adds the name that the operating system has for it there.
    void add(const Unit_Node& unit, const Schema& schema)
    {
        const std::string key = unit.number + " " + unit.unit.get("ElementName").as_text();
        std::vector<std::string> parts = facts(unit, schema);
        auto known = std::find_if(units.begin(), units.end(), [&](const auto& each) { return each.first == key; });
        if (known == units.end())
            units.emplace_back(key, std::move(parts));
        else if (!unit.device.empty())
            known->second.push_back(unit.device);
    }
};

class Graph_Writer {
public:
    explicit Graph_Writer(const Schema& schema) : m_schema(schema) {}

    std::string write(const Walk& walk)
    {
        m_text = "digraph san {\n"
                 "  graph [rankdir=LR, bgcolor=\"white\", pad=0.4, nodesep=0.25, ranksep=1.4, fontname=\"Helvetica\"]\n"
                 "  node [shape=box, style=\"rounded,filled\", fillcolor=\"white\", color=\"#9aa5b1\", penwidth=1.2, "
                 "fontname=\"Helvetica\", fontsize=12]\n"
                 "  edge [arrowhead=none, penwidth=1.6, color=\"#9aa5b1\"]\n";
        for (const Host_Node& host : walk.hosts)
            add(host);
        for (const Shared_Target& target : m_targets)
            add(target);
        return m_text + m_edges + "}\n";
    }

private:
    std::string fresh(const char* sort) { return sort + std::to_string(m_count++); }

    void add(const Host_Node& host)
    {
        const std::string id = fresh("host");
        m_text +=
            "  " + id + " [fillcolor=\"#e8eef5\", label=" + label(std::vector<std::string>{host_name(host)}) + "]\n";
        for (const Adapter_Node& adapter : host.adapters)
            add(adapter, id);
    }

    void add(const Adapter_Node& adapter, const std::string& host)
    {
        m_text += "  subgraph cluster_" + fresh("adapter") +
                  " {\n    graph [style=\"rounded,filled\", color=\"#c3ccd6\", "
                  "fillcolor=\"#f5f7fa\", margin=14, label=" +
                  label(facts(adapter)) + "]\n";
        std::vector<std::string> ids;
        for (const Port_Node& port : adapter.ports) {
            ids.push_back(fresh("port"));
            m_text += "    " + ids.back() + " [color=\"" + colour(port) +
                      "\", penwidth=2, label=" + label(facts(port, m_schema)) + "]\n";
            for (const Target_Node& target : port.targets)
                m_edges += "  " + ids.back() + " -> " + shared(target) + " [tailport=e, headport=w, color=\"" +
                           colour(port) + "\"]\n";
        }
        // An adapter without ports must have a node all the same, or its frame is not drawn.
        if (ids.empty()) {
            ids.push_back(fresh("none"));
            m_text +=
                "    " + ids.back() + " [style=dashed, label=" + label(std::vector<std::string>{"no ports"}) + "]\n";
        }
        m_text += "  }\n";
        for (const std::string& id : ids)
            m_edges += "  " + host + " -> " + id + " [tailport=e, headport=w]\n";
    }

    /// The node of a target port, made when the first port of the host sees it.
    std::string shared(const Target_Node& target)
    {
        const auto [place, fresh_one] = m_places.emplace(target.name, m_targets.size());
        if (fresh_one) m_targets.push_back({&target, fresh("target"), {}});
        Shared_Target& all = m_targets[place->second];
        for (const Unit_Node& unit : target.units)
            all.add(unit, m_schema);
        return all.id;
    }

    void add(const Shared_Target& target)
    {
        std::vector<std::string> title = facts(*target.node, m_schema);
        std::string rows = row(bold(title.front()));
        title.erase(title.begin());
        std::string rest = target.node->endpoint.get("ElementName").as_text();
        rest.erase(rest.find_last_not_of(' ') + 1); // the product, as wide as an inquiry has it
        for (const std::string& part : title)
            rest += (rest.empty() ? "" : "  ") + part;
        rows += row(small(rest)) + (target.units.empty() ? "" : "<hr/>");
        for (const auto& [key, parts] : target.units) {
            std::string details;
            for (std::size_t i = 1; i < parts.size(); ++i)
                details += "  " + parts[i];
            rows += row(bold(parts.front()) + small(details));
        }
        m_text += "  " + target.id + " [fillcolor=\"#fdf8ee\", label=" + table_label(rows) + "]\n";
    }

    /// One colour for the ports and routes of each fabric.
    std::string colour(const Port_Node& port)
    {
        const std::string& fabric = port.port.get("FabricName").as_text();
        const auto place = m_fabrics.emplace(fabric, m_fabrics.size()).first;
        return fabric_colours[place->second % std::size(fabric_colours)];
    }

    const Schema& m_schema;
    std::string m_text, m_edges;
    std::size_t m_count = 0;
    std::vector<Shared_Target> m_targets;
    std::map<std::string, std::size_t> m_places, m_fabrics;
};

std::string reason(int error)
{
    return std::strerror(error);
}

/// Lets Graphviz draw; empty if it did, else what went wrong.
std::string run_dot(const std::string& graph, const std::string& format, const std::string& file)
{
    // A file in memory instead of a pipe: it needs no second thread to fill it, and breaks under nobody.
    const int input = memfd_create("graph", MFD_CLOEXEC);
    if (input < 0) return "there is no place for the graph: " + reason(errno);
    for (std::size_t done = 0; done < graph.size();) {
        const ssize_t written = write(input, graph.data() + done, graph.size() - done);
        if (written < 0 && errno == EINTR) continue;
        if (written < 0) {
            const std::string text = "there is no place for the graph: " + reason(errno);
            close(input);
            return text;
        }
        done += static_cast<std::size_t>(written);
    }
    lseek(input, 0, SEEK_SET);

    posix_spawn_file_actions_t actions;
    posix_spawn_file_actions_init(&actions);
    posix_spawn_file_actions_adddup2(&actions, input, STDIN_FILENO);
    std::string type = "-T" + format, program = "dot", option = "-o", target = file;
    char* arguments[] = {program.data(), type.data(), option.data(), target.data(), nullptr};
    pid_t child = -1;
    const int error = posix_spawnp(&child, "dot", &actions, nullptr, arguments, environ);
    posix_spawn_file_actions_destroy(&actions);
    close(input);
    if (error == ENOENT)
        return "Graphviz is not there: its program dot is not in PATH. Install the package graphviz, or name a file "
               "that "
               "ends in .dot for the plain graph";
    if (error != 0) return "Graphviz cannot be started: " + reason(error);
    int status = 0;
    while (waitpid(child, &status, 0) < 0)
        if (errno != EINTR) return "Graphviz is lost: " + reason(errno);
    if (WIFEXITED(status) && WEXITSTATUS(status) == 0) return "";
    return "Graphviz could not draw " + file;
}

std::string write_file(const std::string& text, const std::string& file)
{
    std::ofstream out(file, std::ios::binary);
    out << text;
    out.close();
    return out ? "" : "your file " + file + " cannot be written";
}

std::string ending(const std::string& file)
{
    const std::size_t dot = file.rfind('.');
    return dot == std::string::npos ? "" : lower_case(file.substr(dot + 1));
}

} // namespace

std::string dot_text(const Walk& walk, const Schema& schema)
{
    return Graph_Writer(schema).write(walk);
}

int draw_graph(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    const std::string format = ending(options.file);
    if (format != "svg" && format != "png" && format != "dot")
        return tell_wrong("a picture's name ends in .svg, .png or .dot: " + options.file, complaints);
    const Walk walk = walk_hosts(server, options.name_space);
    if (!walk.status.ok()) return tell_failure(walk.status, options, out, complaints);
    const std::string graph = dot_text(walk, server.schema());
    const std::string wrong = format == "dot" ? write_file(graph, options.file) : run_dot(graph, format, options.file);
    if (wrong.empty()) return 0;
    complaints << "nvrcim: " << printable(wrong) << "\n";
    return CMPI_RC_ERR_FAILED;
}

} // namespace host
