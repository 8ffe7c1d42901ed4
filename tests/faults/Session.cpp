#include "tests/faults/Session.h"

#include <atomic>
#include <chrono>
#include <memory>
#include <stdexcept>
#include <thread>

#include "host/PathText.h"
#include "simulator/nvrsim.h"
#include "tests/module/support/Firmware.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Quiet_Output.h"
#include "tests/module/support/Service_Methods.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

namespace nvrtest {

namespace {

using host::Value;

constexpr char name_space[] = "root/norvane";
constexpr char alert_class[] = "NVRHBA_AlertIndication";
constexpr char provider_log[] = "NVRHBA:ProviderLog:";
constexpr std::uint16_t enabled = 2, disabled = 3;
constexpr char system_log[] = "/var/log/messages";

// Small, and with all that the module reads: a tagged port with dumps and a virtual port, one with a loopback plug.
const std::string scenario = std::string(serving_adapter) + R"(
[[adapter.port.vport]]
[adapter.port.vpd]
entries = [["PN", "FC2162"], ["V1", "an entry of the maker"]]
[[adapter]]
[[adapter.port]]
loopback_plug = true
vpd = false
[[target]]
luns = 1
[[target.lun]]
number = 1
device_type = 1
)";
constexpr std::size_t plugged = 1;
constexpr char target_name[] = "50060E8005A10000";
const char* const ports[] = {first_port, second_port};

Rig_Options rig_options()
{
    prepare_service_files();
    write_file(system_log, "Nov 21 kernel: tsfc one\nNov 21 kernel: other\nNov 21 kernel: tsfc two\n");
    Rig_Options options;
    options.manner = host::Manner::strict();
    options.scenario = scenario;
    return options;
}

// A path as the module writes it.
host::Path path_of(const std::string& text)
{
    const host::Path_Parse parsed = host::parse_path(text, module_schema().get(), name_space);
    if (!parsed.ok) throw std::runtime_error(text + ": " + parsed.error);
    return parsed.path;
}

// Of a class with a system's keys; `key` is the last one.
host::Path path_in_system(const std::string& class_name, const std::string& key, const std::string& value)
{
    return path_of(class_name + '.' + key + "=\"" + value +
                   "\",SystemCreationClassName=\"CIM_ComputerSystem\",SystemName=\"" + rig_host_name +
                   "\",CreationClassName=\"" + class_name + '"');
}

host::Path path_with_id(const std::string& class_name, const std::string& id)
{
    return path_of(class_name + ".InstanceID=\"" + id + '"');
}

Value reference_to(const char* class_name, const char* device_id)
{
    return Value::reference(path_in_system(class_name, "DeviceID", device_id));
}

// Instances change by their key and what is set.
host::Instance change(host::Path path, const std::string& property, const Value& value)
{
    host::Instance instance;
    for (const host::Named_Value& key : path.keys)
        instance.set(key.name, key.value);
    instance.path = std::move(path);
    instance.set(property, value);
    return instance;
}

host::Path path_of_log(const char* name)
{
    return path_with_id("NVRHBA_RecordLog", std::string(name) + rig_host_name);
}

// Of the one instance that such a service has.
std::string name_of(const std::string& service)
{
    return service == "NVRHBA_SoftwareInstallationService" ? "NVRHBA_FCSoftwareInstallationService" : service;
}

std::string title_of_test(const std::string& name)
{
    return "NVR:FCHBA " + name + " Test";
}

bool is_of_the_moment(const std::string& class_name)
{
    for (const char* name : {alert_class, "NVRHBA_LogEntry", "NVRHBA_RecordLogManagesRecord"})
        if (class_name == name) return true;
    return false;
}

} // namespace

const std::vector<Session::Part>& Session::parts()
{
    static const std::vector<Part> all = {
        {"load", &Session::load},
        {"enumerations", &Session::enumerate_all},
        {"traversals", &Session::traverse_all},
        {"services", &Session::call_services},
        {"modifications", &Session::modify_instances},
        {"diagnostics", &Session::run_diagnostics},
        {"logs", &Session::steer_logs},
        {"alerts", &Session::receive_alerts},
        {"refresh", &Session::refresh},
        {"unload", &Session::unload},
    };
    return all;
}

const Session::Part& Session::part(const std::string& name)
{
    for (const Part& one : parts())
        if (name == one.name) return one;
    throw std::runtime_error("the session has no part " + name);
}

Session::Session(std::function<void(const std::string&)> before_request)
    : m_before_request(std::move(before_request)), m_rig(rig_options())
{
    stop_clock();
}

void Session::run(const Part& part)
{
    advance_clock(std::chrono::seconds(11)); // live values are older than they may be
    (this->*part.run)();
}

std::string Session::published()
{
    clear_faults();
    load_scenario(scenario);
    refresh();
    std::string text;
    for (const std::string& name : m_rig.classes())
        text += published(name);
    return text;
}

std::string Session::published(const std::string& class_name)
{
    if (class_name == alert_class) return {};
    if (m_before_request) m_before_request("enumerate " + class_name + " of the sound host");
    const host::Answer answer = m_rig.enumerate(class_name);
    if (!answer.ok()) throw std::runtime_error(class_name + " does not answer: " + answer.status.message);
    m_rig.settle();
    return is_of_the_moment(class_name) ? std::string() : to_lines(class_name, answer.instances);
}

std::vector<std::string> Session::serve_clients()
{
    const std::size_t before = m_failures.size();
    receive_alerts();
    call_service(service_methods().back());
    run_diagnostic("Echo");
    return {m_failures.begin() + static_cast<std::ptrdiff_t>(before), m_failures.end()};
}

host::Answer Session::ask(const std::string& what, const std::function<host::Answer(host::Host&)>& request)
{
    if (m_before_request) m_before_request(what);
    host::Answer answer = request(m_rig.server());
    if (!answer.ok())
        m_failures.push_back(what + ": " + std::to_string(answer.status.code) + ' ' + answer.status.message);
    m_rig.settle();
    return answer;
}

bool Session::call(const host::Path& path, const std::string& method, const std::vector<host::Named_Value>& arguments)
{
    const std::string what = path.class_name + '.' + method;
    const host::Answer answer = ask(what, [&](host::Host& server) { return server.call(path, method, arguments); });
    const bool is_done = answer.value == Value::uint32(0);
    if (answer.ok() && !is_done) m_failures.push_back(what + " returned " + answer.value.to_text());
    return answer.ok() && is_done;
}

// The first request comes while nothing has been read, the next one while its refresh reads the SAN.
void Session::load()
{
    if (m_before_request) m_before_request("the first request");
    for (const char* name : {"NVRHBA_PortController", "NVRHBA_StorageVolume"}) {
        const host::Answer answer = m_rig.enumerate(name);
        if (!answer.ok()) m_failures.push_back(std::string("first ") + name + ": " + answer.status.message);
    }
    m_rig.settle();
}

void Session::enumerate_all()
{
    for (const std::string& name : m_rig.classes()) {
        if (name == alert_class) continue;
        ask("enumerate " + name, [&](host::Host& server) { return server.enumerate(name_space, name); });
    }
}

// One instance of each class, and each association from both ends of one.
void Session::traverse_all()
{
    const Quiet_Output quiet;
    for (const host::Registration& registration : m_rig.server().registrations()) {
        const std::string& name = registration.class_name;
        if (name == alert_class) continue;
        const host::Answer names =
            ask("names of " + name, [&](host::Host& server) { return server.names(name_space, name); });
        if (names.paths.empty()) continue;
        const host::Path& first = names.paths.front();
        ask("get " + name, [&](host::Host& server) { return server.get(first); });
        if (!(registration.kinds & host::association_kind)) continue;
        for (const host::Named_Value& key : first.keys)
            if (const host::Path* end = key.value.as_path()) traverse(*end, name);
    }
    traverse(path_in_system("NVRHBA_FCPort", "DeviceID", "nobody"), "");
}

void Session::traverse(const host::Path& source, const std::string& through)
{
    const std::string from = " of " + source.class_name + " through " + through;
    ask("associators" + from, [&](host::Host& server) { return server.associators(source, through); });
    ask("associator names" + from, [&](host::Host& server) { return server.associator_names(source, through); });
    ask("references" + from, [&](host::Host& server) { return server.references(source, through); });
    ask("reference names" + from, [&](host::Host& server) { return server.reference_names(source, through); });
}

void Session::call_services()
{
    for (const Service_Method& method : service_methods())
        call_service(method);
}

void Session::call_service(const Service_Method& method)
{
    Arguments arguments = method.others;
    arguments.push_back({"Target", reference_to("NVRHBA_FCPort", first_port)});
    call(path_in_system(method.service, "Name", name_of(method.service)), method.name, arguments);
}

void Session::modify_instances()
{
    const host::Path port = path_in_system("NVRHBA_FCPort", "DeviceID", first_port);
    modify(port, "LocationIndicator", Value::uint16(2));
    modify(port, "LocationIndicator", Value::uint16(3));
    modify(path_with_id("NVRHBA_DumpData", std::string("NVRHBA_DumpData::") + first_port), "RetentionCount",
           Value::uint32(7));
    set_time_out(7);
    set_time_out(time_out);
}

bool Session::modify(const host::Path& path, const std::string& property, const Value& value)
{
    const auto request = [&](host::Host& server) {
        return server.modify(change(path, property, value), std::vector<std::string>{property});
    };
    return ask("modify " + path.class_name, request).ok();
}

void Session::set_time_out(unsigned minutes)
{
    const host::Path setting = path_with_id("NVRHBA_ProviderConfigSetting", "Norvane HBA Provider:cachetimeout");
    m_settings.note_time_out(minutes, modify(setting, "current", Value::uint32(minutes)));
}

void Session::run_diagnostic(const std::string& name)
{
    const bool needs_plug = name == "External Loopback";
    host::Instance settings;
    settings.path = path_of("NVRHBA_FCHBADiagnosticSettingData");
    settings.set("InstanceID", Value::string(title_of_test(name)));
    settings.set("LoopControlParameter", texts_value({"3"}));
    settings.set("TargetDevice", Value::string(target_name));
    call(path_in_system("NVRHBA_FCHBADiagnosticTest", "Name", title_of_test(name)), "RunDiagnosticService",
         {{"ManagedElement", reference_to("NVRHBA_PortController", ports[needs_plug ? plugged : 0])},
          {"DiagnosticSettings", Value::instance(settings)}});
}

void Session::run_diagnostics()
{
    for (const char* name : {"Beacon", "Status", "Reset", "Self", "External Loopback", "Host Loopback",
                             "Internal Loopback", "Ping", "Echo"}) {
        run_diagnostic(name);
        const std::string test = title_of_test(name);
        call(path_in_system("NVRHBA_HelpService", "Name", test), "GetHelp",
             {{"RequestedDocument", Value::string(test)},
              {"Format", Value::uint16(1)},
              {"RequestedDelivery", Value::uint16(1)}});
    }
    for (const char* name : {"NVRHBA_ConcreteJob", "NVRHBA_DiagnosticCompletionRecord", "NVRHBA_LogManagesRecord"})
        ask(std::string("enumerate ") + name, [&](host::Host& server) { return server.enumerate(name_space, name); });
    call(path_with_id("NVRHBA_DiagnosticsLog", "NVR:FCHBA Echo Test"), "ClearLog", {});
}

void Session::steer_logs()
{
    const host::Path driver_log = path_of_log("NVR: FC Driver Record Log:");
    call(driver_log, "RequestStateChange", {{"RequestedState", Value::uint16(enabled)}});
    ask("the driver's lines",
        [](host::Host& server) { return server.enumerate(name_space, "NVRHBA_FCDriverLogEntry"); });
    call(driver_log, "ClearLog", {});
    call(path_of_log(provider_log), "SetLogParams",
         {{"LogLevel", Value::uint16(5)}, {"LogMode", Value::uint16(2)}, {"TracePath", Value::string(trace_path)}});
    set_log_state(false);
    set_log_state(true);
}

void Session::set_log_state(bool is_enabled)
{
    const auto state = Value::uint16(is_enabled ? enabled : disabled);
    const bool is_told = call(path_of_log(provider_log), "RequestStateChange", {{"RequestedState", state}});
    m_settings.note_log_state(is_enabled, is_told);
}

void Session::receive_alerts()
{
    if (m_before_request) m_before_request("subscribe");
    const std::streamoff start = m_rig.log_size();
    // An alert may come when all this is over: who could not unsubscribe still gets them.
    const auto delivered = std::make_shared<std::atomic<int>>(0);
    int id = 0;
    const auto count = [delivered](const host::Indication&) { ++*delivered; };
    const host::Status subscribed = m_rig.server().subscribe(name_space, alert_class, count, id);
    if (!subscribed.ok()) m_failures.push_back("subscribe: " + subscribed.message);
    m_rig.server().settle();
    m_rig.settle();
    // As many as there are callbacks for the port: it may have none when its registration failed.
    constexpr std::uint32_t link_up = 514;
    if (m_before_request) m_before_request("alerts");
    const int each = nvrsim_event("0", link_up, 0);
    nvrsim_link("0", 0);
    nvrsim_link("0", 1);
    nvrsim_drain_events();
    if (subscribed.ok()) {
        // Of a port that the last refresh did not find there are none.
        const auto taken = [&] {
            int waits = 0;
            for (const Trace_Line& line : m_rig.lines_from(start))
                waits += line.words == "waiting for signal to occur";
            return waits - 1;
        };
        while (*delivered < 3 * each && taken() < 3 * each)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
        if (*delivered != 3) m_failures.push_back(std::to_string(*delivered) + " alerts came");
        if (m_before_request) m_before_request("unsubscribe");
        const host::Status unsubscribed = m_rig.server().unsubscribe(id);
        if (!unsubscribed.ok()) m_failures.push_back("unsubscribe: " + unsubscribed.message);
    }
    m_rig.server().settle();
    m_rig.settle();
}

// None comes where the management library could not be started.
void Session::refresh()
{
    advance_clock(std::chrono::minutes(31));
    ask("a refresh", [](host::Host& server) { return server.enumerate(name_space, "NVRHBA_ProviderConfigSetting"); });
}

void Session::unload()
{
    if (m_before_request) m_before_request("the unload");
    m_rig.stop();
}

} // namespace nvrtest
