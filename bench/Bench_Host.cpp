#include "bench/Bench_Host.h"

#include <algorithm>
#include <cstdlib>
#include <iterator>
#include <stdexcept>
#include <vector>

#include "simulator/nvrsim.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

namespace nvrbench {

namespace {

constexpr char name_space[] = "root/norvane";

/// What is in one and not in the other.
std::string missing(const std::set<std::string>& from, const std::set<std::string>& other)
{
    std::vector<std::string> lines;
    std::set_difference(from.begin(), from.end(), other.begin(), other.end(), std::back_inserter(lines));
    std::string text;
    for (const std::string& line : lines)
        text += "\n  " + line;
    return text.empty() ? " nothing" : text;
}

} // namespace

void prepare_host(unsigned ports, unsigned targets, unsigned luns)
{
    nvrtest::compose_libraries({"HBAAPI", "lrmapi", "rmapi", "tssdm"});
    nvrtest::remove(nvrtest::dmp_path);
    // One side of the refresh at a time, so that its cost can be told.
    const bool has_san = targets != 0;
    nvrtest::write_file(nvrtest::conf_path,
                        has_san ? "NVR_PROVIDER_REFRESH_ADAPTERDATA = FALSE\nNVR_PROVIDER_REFRESH_SANDATA = TRUE\n"
                                : "NVR_PROVIDER_REFRESH_ADAPTERDATA = TRUE\nNVR_PROVIDER_REFRESH_SANDATA = FALSE\n");
    std::string scenario(nvrsim_generate(ports, targets, luns, nullptr, 0) + 1, '\0');
    scenario.resize(nvrsim_generate(ports, targets, luns, scenario.data(), scenario.size()));
    nvrtest::load_scenario(scenario);
}

Bench_Host::Bench_Host(unsigned ports, unsigned targets, unsigned luns)
    : m_server((prepare_host(ports, targets, luns), nvrtest::module_schema()))
{
    const char* other = std::getenv("NVR_BENCH_MODULE");
    std::string error;
    if (m_server.add_module(other ? other : NVR_MODULE, name_space, &error) == 0) throw std::runtime_error(error);
}

host::Answer Bench_Host::enumerate(const std::string& class_name)
{
    host::Answer answer = m_server.enumerate(name_space, class_name);
    if (!answer.ok()) throw std::runtime_error(class_name + ": " + answer.status.message);
    return answer;
}

std::set<std::string> shape_of(host::Host& server, const std::string& class_name)
{
    std::set<std::string> shape;
    std::size_t properties = 0, keys = 0;
    bool same = true;
    const auto hold = [&same](std::size_t& first, std::size_t size) {
        const bool is_first = first == 0;
        if (is_first) first = size;
        same = same && first == size;
        return is_first;
    };
    const host::Result_Sink sink{[&](host::Instance&& instance) {
                                     if (!hold(properties, instance.properties.size())) return;
                                     for (const auto& [name, value] : instance.properties) {
                                         std::string line = name + " " + host::type_name(value.type());
                                         if (value.is_array()) line += " " + std::to_string(value.elements().size());
                                         shape.insert(value.is_null() ? line + " NULL" : line);
                                     }
                                 },
                                 [&](host::Path&& path) {
                                     if (!hold(keys, path.keys.size())) return;
                                     for (const auto& [name, value] : path.keys)
                                         shape.insert("key " + name + " " + host::type_name(value.type()));
                                 }};
    const host::Answer instances = server.enumerate(name_space, class_name, {}, &sink);
    const host::Answer names = server.names(name_space, class_name, &sink);
    if (!instances.ok() || !names.ok() || instances.handed_on == 0 || names.handed_on != instances.handed_on)
        throw std::runtime_error(class_name + ": not all instances have names");
    if (!same) throw std::runtime_error(class_name + ": not all instances carry as much");
    const host::Report report = server.report();
    if (report.violation_count != 0)
        throw std::runtime_error(class_name + ": the server has seen rules broken:\n" + report.to_text());
    return shape;
}

void require_same(const std::set<std::string>& module, const std::set<std::string>& floor)
{
    if (module == floor) return;
    throw std::runtime_error("the hand-written provider returns something else\nthe module alone:" +
                             missing(module, floor) + "\nthe other alone:" + missing(floor, module));
}

} // namespace nvrbench
