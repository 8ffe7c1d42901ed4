// The trace of a scripted session, apart from times, processes and thread numbers: two builds of the module that show
// the same differ in nothing that a client, an operator or a reader of the trace can see.
//
//     nvr_session > before; ...; nvr_session > after; diff before after
//     nvr_session other/libnorvane_fc_provider.so
//
// What the module writes to standard output comes first, in its place between the answers; then the lines of the trace,
// thread by thread in the order of their first lines.
#include <cstdio>
#include <exception>
#include <iostream>
#include <regex>
#include <string>
#include <vector>

#include "host/Host.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host_setup.h"
#include "tests/support/trace.h"

namespace {

using namespace nvrtest;

void tell(const std::string& what, const host::Answer& answer)
{
    std::printf("== %s: %s\n", what.c_str(), host::status_name(answer.status.code).c_str());
    std::fputs(to_lines(what, answer.instances).c_str(), stdout);
    for (const host::Path& path : answer.paths)
        std::printf("%s\n", path.to_text().c_str());
}

// One class after the other: a server asks all of them in an order of its own.
void traverse(host::Host& server, const host::Path& from)
{
    for (const host::Registration& registration : server.registrations()) {
        if (!(registration.kinds & host::association_kind)) continue;
        const std::string& through = registration.class_name;
        tell("associators", server.associators(from, through));
        tell("associator names", server.associator_names(from, through));
        tell("references", server.references(from, through));
        tell("reference names", server.reference_names(from, through));
    }
}

void hold_session(Rig& rig)
{
    host::Host& server = rig.server();
    tell("ports", rig.enumerate("NVRHBA_FCPort"));
    rig.wait_for_refreshes(1);
    for (const host::Registration& registration : server.registrations()) {
        if (!(registration.kinds & host::instance_kind)) continue;
        const std::string& name = registration.class_name;
        // Counters and times of change are of the moment.
        if (name == "NVRHBA_FCPortStatistics" || name == "NVRHBA_LogEntry") continue;
        const host::Answer names = rig.names(name);
        tell(name, names);
        for (const host::Path& path : names.paths)
            tell("get " + name, server.get(path));
    }
    for (const char* name : {"NVRHBA_StorageVolume", "NVRHBA_SCSIProtocolInitiatorEndpoint", "NVRHBA_FCPort"})
        traverse(server, rig.names(name).paths.at(0));
    host::Path nobody = rig.names("NVRHBA_StorageVolume").paths.at(0);
    nobody.keys.back().value = host::Value::string("nobody");
    tell("nobody", server.get(nobody));
    traverse(server, nobody);
    host::Instance setting = rig.enumerate("NVRHBA_ProviderConfigSetting").instances.at(0);
    setting.set("current", host::Value::uint32(7));
    tell("change", server.modify(setting, std::vector<std::string>{"current"}));
}

std::string without_times(std::string words)
{
    static const std::regex time("[0-9]{14}\\.[0-9]{6}[-+:][0-9]{3}"),
        process("(Loaded\\[|RM_INIT_LIB_(DONE_)?)[0-9]+");
    return std::regex_replace(std::regex_replace(words, time, "TIME"), process, "$1PROCESS");
}

void tell_trace()
{
    std::vector<std::pair<std::string, std::vector<std::string>>> threads;
    for (const Trace_Line& line : trace_file_lines(trace_path)) {
        auto thread = threads.begin();
        while (thread != threads.end() && thread->first != line.thread)
            ++thread;
        if (thread == threads.end()) thread = threads.insert(thread, {line.thread, {}});
        thread->second.push_back(without_times(line.words));
    }
    for (const auto& thread : threads) {
        std::puts("== a thread");
        for (const std::string& words : thread.second)
            std::printf("%s\n", words.c_str());
    }
}

} // namespace

int main(int argc, char** argv)
{
    try {
        nvrtest::enter_private_host(argv);
        Rig_Options options;
        options.scenario = "small";
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
