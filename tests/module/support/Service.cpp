#include "tests/module/support/Service.h"

#include <cctype>
#include <cstdio>
#include <stdexcept>

#include "simulator/Calls.h"

namespace nvrtest {

namespace {

// A refresh asks the server for profiles, and a server with pooled threads may take the one that has just become free.
constexpr char up_call[] = "NVRHBA_RegisteredProfile_Provider::enum_instances()";
constexpr char gate_begin[] = "PERF: ---BuildCimpleInfo BEGIN---";

bool starts_with(const std::string& text, const char* start)
{
    return text.rfind(start, 0) == 0;
}

// The word for a gate that ends with this line; empty for lines in its middle.
std::string gate_that_ends_with(const std::string& line)
{
    if (line == "PERF: ---No timeout BuildCimpleInfo END---") return gate;
    if (line == "PERF: ---Created DataFetch_Handler thread -- BuildCimpleInfo END---") return gate_refreshing;
    if (line == "PERF: ---DataFetch_Handler thread already running -BuildCimpleInfo END---") return gate_running;
    return {};
}

// As Id2HBAName writes it: a text that is too short ends behind its last character, or behind the colon there.
std::string with_colons(const std::string& digits)
{
    std::string text;
    for (char digit : digits) {
        if (text.size() == 23) break;
        text += digit;
        if (text.size() % 3 == 2 && text.size() != 23) text += ':';
    }
    return text;
}

host::Path first_path(Rig& rig, const std::string& class_name, std::size_t place)
{
    const host::Answer names = rig.names(class_name);
    if (!names.ok() || names.paths.size() <= place)
        throw std::runtime_error("there is no such " + class_name + ": " + names.status.message);
    return names.paths[place];
}

} // namespace

const host::Value& Called::out(const std::string& name) const
{
    static const host::Value none;
    for (const host::Named_Value& one : answer.out)
        if (host::same_name(one.name, name)) return one.value;
    return none;
}

Service::Service(Rig& rig, const std::string& class_name, const std::string& name) : m_rig(rig)
{
    const host::Answer names = rig.names(class_name);
    for (const host::Path& path : names.paths) {
        const host::Value* key = path.find("Name");
        if (!name.empty() && !(key && key->as_text() == name)) continue;
        m_path = path;
        return;
    }
    throw std::runtime_error("there is no service " + class_name + ' ' + name + ": " + names.status.message);
}

Service::~Service()
{
    try {
        m_rig.settle();
    } catch (const std::runtime_error& error) {
        ADD_FAILURE() << error.what();
    }
}

Called Service::call(const std::string& method, const Arguments& arguments)
{
    return call_on(m_path, method, arguments);
}

Called Service::call_on(const host::Path& path, const std::string& method, const Arguments& arguments)
{
    m_rig.settle();
    const std::streamoff before = m_rig.log_size();
    Called called;
    called.answer = m_rig.server().call(path, method, arguments);
    called.words = words_of_thread(m_rig.lines_from(before));
    return called;
}

host::Path Service::stranger() const
{
    host::Path path = m_path;
    path.set("Name", host::Value::string("Nobody"));
    return path;
}

host::Value port(Rig& rig, std::size_t place)
{
    return host::Value::reference(first_path(rig, "NVRHBA_FCPort", place));
}

host::Value port_with_id(Rig& rig, const host::Value& device_id)
{
    host::Path path = first_path(rig, "NVRHBA_FCPort", 0);
    path.set("DeviceID", device_id);
    return host::Value::reference(path);
}

host::Value unknown_port(Rig& rig)
{
    return port_with_id(rig, host::Value::string("10000000C9FFFFFF"));
}

host::Value no_port(Rig& rig)
{
    return host::Value::reference(first_path(rig, "NVRHBA_PortController", 0));
}

Words words_of_thread(const std::vector<Trace_Line>& lines)
{
    Words words;
    bool in_gate = false;
    for (const Trace_Line& line : lines) {
        if (line.thread != lines.front().thread || line.words == up_call) continue;
        if (starts_with(line.words, "ProviderAgent::addRef[")) continue;
        if (line.words == gate_begin) in_gate = true;
        if (!in_gate) {
            words.push_back(line.words);
            continue;
        }
        const std::string end = gate_that_ends_with(line.words);
        if (end.empty()) continue;
        words.push_back(end);
        in_gate = false;
    }
    return words;
}

Words joined(const std::vector<Words>& parts)
{
    Words all;
    for (const Words& part : parts)
        all.insert(all.end(), part.begin(), part.end());
    return all;
}

Words known_port()
{
    return {"Checking the FCPort", "Valid FCPort WWPN Passed"};
}

Words no_known_port()
{
    return {"Checking the FCPort", "Could not find the passed FCPort in the map"};
}

Words converted(const std::string& digits)
{
    const std::string name = with_colons(digits);
    // Two places for each byte, without a leading zero.
    std::string bytes;
    for (std::size_t i = 0; i + 1 < digits.size(); i += 2) {
        char byte[8];
        std::snprintf(byte, sizeof byte, " %2x", static_cast<unsigned>(std::stoul(digits.substr(i, 2), nullptr, 16)));
        bytes += byte;
    }
    return {
        "Entering NVR_MethodWrapper::Id2HBAName",  "DeviceID is:: " + digits, "HBA Name is:: " + name,
        "Entering NVR_MethodWrapper::str2HBAName", "wwpn:( " + name + " ) ",  "After tokenizing wwpn:(" + bytes + " )"};
}

Words not_converted(const std::string& text)
{
    const std::string name = with_colons(text);
    Words words = {"Entering NVR_MethodWrapper::Id2HBAName", "DeviceID is:: " + text, "HBA Name is:: " + name,
                   "Entering NVR_MethodWrapper::str2HBAName"};
    if (name.size() == 23) words.push_back("wwpn:( " + name + " ) ");
    words.push_back("INVALID HBA Name");
    return words;
}

Words local()
{
    return {"Entering NVR_MethodWrapper::Validatewwpn()", "RM_IsLocalHBA: status=0"};
}

Words not_local()
{
    return {"Entering NVR_MethodWrapper::Validatewwpn()", "RM_IsLocalHBA: status=0", "HBA IS NOT LOCAL",
            "INVALID wwpn"};
}

std::string status_line(std::uint32_t status)
{
    char text[RM_STATUS_TEXT_SIZE] = {};
    nvrsim_RM_StatusString(status, text, sizeof text);
    return "Status: <" + std::to_string(status) + '>' + (*text ? ':' + std::string(text) : std::string());
}

} // namespace nvrtest
