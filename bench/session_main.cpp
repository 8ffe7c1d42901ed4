// The trace of a scripted session, apart from times, processes and thread numbers: two builds of the module that show
// the same differ in nothing that a client, an operator or a reader of the trace can see.
//
//     nvr_session > before; ...; nvr_session > after; diff before after
//     nvr_session other/libnorvane_fc_provider.so
//
// What the module writes to standard output comes first, in its place between the answers; then the lines of the trace:
// those of the requests, and those of each refresh, which has a thread of its own.
#include <cstdint>
#include <cstdio>
#include <exception>
#include <iostream>
#include <regex>
#include <string>
#include <vector>

#include "host/Host.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Rig.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/private_host_setup.h"
#include "tests/support/simulator.h"
#include "tests/support/trace.h"

namespace {

using namespace nvrtest;

// The host as it is later: a port, units and a target have come, another target has gone.
constexpr char other_san[] = R"(
[[adapter]]

[[adapter]]

[[target]]
name = "disk array"
luns = 4

[[target]]
name = "another disk array"
luns = 2
)";

// Counters and times of change are of the moment.
bool is_of_the_moment(const std::string& class_name)
{
    return class_name == "NVRHBA_FCPortStatistics" || class_name == "NVRHBA_LogEntry";
}

void tell(const std::string& what, const host::Answer& answer)
{
    std::printf("== %s: %s\n", what.c_str(), host::status_name(answer.status.code).c_str());
    for (const host::Instance& instance : answer.instances) {
        std::printf("%s\n", instance.path.to_text().c_str());
        if (is_of_the_moment(instance.path.class_name))
            for (const host::Named_Value& property : instance.properties)
                std::printf("%s\n", property.name.c_str());
        else
            std::fputs(to_lines(what, {instance}).c_str(), stdout);
    }
    for (const host::Path& path : answer.paths)
        std::printf("%s\n", path.to_text().c_str());
}

std::vector<std::string> classes(host::Host& server, host::Provider_Kind kind)
{
    std::vector<std::string> names;
    for (const host::Registration& registration : server.registrations())
        if (registration.kinds & kind) names.push_back(registration.class_name);
    return names;
}

// One class after the other: a server asks all of them in an order of its own.
void traverse(Rig& rig, const host::Path& from)
{
    host::Host& server = rig.server();
    for (const std::string& through : classes(server, host::association_kind)) {
        tell("associators", server.associators(from, through));
        tell("associator names", server.associator_names(from, through));
        tell("references", server.references(from, through));
        tell("reference names", server.reference_names(from, through));
    }
}

void enumerate_all(Rig& rig)
{
    for (const std::string& name : classes(rig.server(), host::instance_kind))
        tell("all " + name, rig.enumerate(name));
}

void get_all(Rig& rig)
{
    for (const std::string& name : classes(rig.server(), host::instance_kind)) {
        const host::Answer names = rig.names(name);
        tell(name, names);
        for (const host::Path& path : names.paths)
            tell("get " + name, rig.server().get(path));
    }
}

void ask_for_properties(Rig& rig)
{
    const std::vector<std::string> some = {"Description", "DeviceID", "Speed", "NoSuchProperty"}, none;
    for (const char* name : {"NVRHBA_StorageVolume", "NVRHBA_SCSIInitiatorTargetStorageVolumePath", "NVRHBA_FCPort"})
        for (const std::vector<std::string>& properties : {some, none}) {
            const host::Answer answer = rig.enumerate(name, properties);
            tell("some of " + std::string(name), answer);
            tell("some of one", rig.server().get(answer.instances.at(0).path, properties));
        }
}

void set_current(Rig& rig, std::size_t place, std::uint32_t value)
{
    host::Instance setting = rig.enumerate("NVRHBA_ProviderConfigSetting").instances.at(place);
    setting.set("current", host::Value::uint32(value));
    tell("change", rig.server().modify(setting, std::vector<std::string>{"current"}));
}

void hold_session(Rig& rig)
{
    tell("ports", rig.enumerate("NVRHBA_FCPort"));
    rig.wait_for_refreshes(1);
    get_all(rig);
    enumerate_all(rig);
    ask_for_properties(rig);
    for (const char* name : {"NVRHBA_StorageVolume", "NVRHBA_SCSIProtocolInitiatorEndpoint", "NVRHBA_FCPort"})
        traverse(rig, rig.names(name).paths.at(0));
    const host::Path tape = rig.names("NVRHBA_TapeDrive").paths.at(0);
    host::Path nobody = rig.names("NVRHBA_StorageVolume").paths.at(0);
    nobody.keys.back().value = host::Value::string("nobody");
    tell("nobody", rig.server().get(nobody));
    traverse(rig, nobody);

    // A refresh that finds the same host, of the SAN alone; then one that finds another host.
    rig.refresh();
    enumerate_all(rig);
    set_current(rig, 0, 7);
    set_current(rig, 1, 1);
    load_scenario(other_san);
    rig.refresh();
    enumerate_all(rig);
    tell("a unit of before", rig.server().get(tape));
    traverse(rig, rig.names("NVRHBA_StorageVolume").paths.back());
}

std::string without_times(std::string words)
{
    static const std::regex time("[0-9]{14}\\.[0-9]{6}[-+:][0-9]{3}"),
        process("(Loaded\\[|RM_INIT_LIB_(DONE_)?)[0-9]+");
    return std::regex_replace(std::regex_replace(words, time, "TIME"), process, "$1PROCESS");
}

void tell_lines(const char* what, const std::vector<std::string>& lines)
{
    std::printf("== %s\n", what);
    for (const std::string& line : lines)
        std::printf("%s\n", line.c_str());
}

// What a refresh asks of the server, the server may ask of the module, on another thread, while the refresh waits.
bool is_asked_by_refresh(const std::string& words)
{
    return words.rfind("NVRHBA_RegisteredProfile_Provider::", 0) == 0 || words.rfind("ProviderAgent::addRef", 0) == 0;
}

// The server's threads have names that come again, so what counts is what runs: a refresh, or a request, one at a time.
void tell_trace()
{
    std::vector<std::string> requests;
    std::vector<std::vector<std::string>> refreshes;
    std::string refreshing; // the thread's name
    for (const Trace_Line& line : trace_file_lines(trace_path)) {
        if (line.words == "PERF: DataFetch_Handler Thread BEGIN") {
            refreshing = line.thread;
            refreshes.emplace_back();
        }
        const bool is_refresh = !refreshing.empty() && (line.thread == refreshing || is_asked_by_refresh(line.words));
        (is_refresh ? refreshes.back() : requests).push_back(without_times(line.words));
        if (line.words == "PERF: DataFetch_Handler Thread END") refreshing.clear();
    }
    tell_lines("trace of the requests", requests);
    for (const std::vector<std::string>& refresh : refreshes)
        tell_lines("trace of a refresh", refresh);
}

} // namespace

int main(int argc, char** argv)
{
    try {
        nvrtest::enter_private_host(argv);
        stop_clock();
        Rig_Options options;
        options.scenario = "small";
        options.manner.parallel_subclasses = false; // for one order
        if (argc > 1) options.module = argv[1];
        Rig rig(options);
        hold_session(rig);
        rig.stop();
        tell_trace();
    } catch (const std::exception& error) {
        std::cerr << "nvr_session: " << error.what() << '\n';
        return 1;
    }
    return 0;
}
