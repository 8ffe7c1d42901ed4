#include "tests/soak/Load.h"

#include <algorithm>
#include <filesystem>

#include "simulator/nvrsim.h"
#include "tests/module/support/Firmware.h"
#include "tests/module/support/Service_Methods.h"
#include "tests/support/private_host.h"

namespace soak {

using host::Path;
using host::Value;

namespace {

constexpr char name_space[] = "root/norvane";
constexpr char alert_class[] = "NVRHBA_AlertIndication";
constexpr char settings_class[] = "NVRHBA_ProviderConfigSetting";
constexpr char image_file[] = "an.image", table_file[] = "a.table";
constexpr std::size_t most_subscriptions = 8;

struct Setting {
    const char* name;
    std::uint32_t value; ///< the default
    std::uint32_t most;
    bool is_of_adapters; ///< whether a refresh reads them
};
constexpr Setting settings[] = {
    {"cachetimeout", 10, 30, false},
    {"adapterrefresh", 0, 1, true},
    {"sanrefresh", 1, 1, false},
};

constexpr char table[] = "<ApexConfig><theSystem><ApexVersion/><CreationDate/><HostName/><Adapter/></theSystem>"
                         "<Configuration><numberOfEntries>1</numberOfEntries><Row><src_wwpn>10000000C9A00001</src_wwpn>"
                         "<tgt_wwpn>50060E8005A10000</tgt_wwpn><tag>1</tag></Row></Configuration></ApexConfig>";

Path path_in(const std::string& class_name)
{
    Path path;
    path.name_space = name_space;
    path.class_name = class_name;
    return path;
}

Value embedded(const char* class_name, const Value& id, const char* property, Value value)
{
    host::Instance instance;
    instance.path = path_in(class_name);
    instance.set("InstanceID", id);
    instance.set(property, std::move(value));
    return Value::instance(instance);
}

host::Instance setting(const std::string& name, std::uint32_t value)
{
    host::Instance instance;
    instance.path = path_in(settings_class);
    instance.path.set("InstanceID", Value::string("Norvane HBA Provider:" + name));
    instance.set("InstanceID", *instance.path.find("InstanceID"));
    instance.set("current", Value::uint32(value));
    return instance;
}

bool is_change(const std::string& method)
{
    if (method == "RunDiagnosticService") return true;
    static const std::vector<nvrtest::Service_Method> all = nvrtest::service_methods();
    return std::any_of(all.begin(), all.end(),
                       [&](const nvrtest::Service_Method& one) { return one.refreshes && one.name == method; });
}

const host::Property_List current_alone = std::vector<std::string>{"current"};

} // namespace

Load::Load(nvrtest::Rig& rig, nvrtest::Watch& watch, Counts& counts, const Season& season)
    : m_rig(rig), m_watch(watch), m_counts(counts), m_season(season)
{
    std::filesystem::create_directories(folder);
    std::filesystem::current_path(folder);
    restore_files();
    for (const host::Registration& registration : rig.server().registrations()) {
        const Class one = {registration.class_name, registration.kinds};
        if (one.kinds & host::instance_kind) m_classes.push_back(one);
        if (one.kinds & host::association_kind) m_associations.push_back(one);
        if (!(one.kinds & host::method_kind)) continue;
        for (const host::Method_Record& method : nvrtest::module_schema()->find(one.name)->methods) {
            const int status = rig.server().call(path_in(one.name), method.name).status.code;
            if (status == CMPI_RC_OK) m_methods.push_back({one.name, &method, is_change(method.name)});
        }
    }
    restore_settings();
}

template <class Request>
host::Answer Load::ask(const std::string& what, Request request)
{
    const nvrtest::Watch::Turn turn(m_watch, what);
    host::Answer answer = request(m_rig.server());
    m_counts.requests++;
    m_counts.errors += !answer.ok();
    return answer;
}

void Load::act(Random& random)
{
    const std::size_t kind = random.below(100);
    if (kind < 35) return read(random);
    if (kind < 50) return get(random);
    if (kind < 65) return traverse(random);
    if (kind < 72) return modify(random);
    if (kind < 90) return call(random);
    if (kind < 94) return subscribe(random);
    if (kind < 97) return unsubscribe();
    reach_too_far(random);
}

void Load::read(Random& random)
{
    const std::string& name = random.pick(m_classes).name;
    if (random.chance(30)) {
        ask("names of " + name, [&](host::Host& server) { return server.names(name_space, name); });
        return;
    }
    host::Property_List properties;
    if (random.chance(30)) {
        properties.emplace();
        for (const host::Element_Record& property : nvrtest::module_schema()->find(name)->properties)
            if (random.chance(20)) properties->push_back(property.name);
    }
    ask("enumerate " + name, [&](host::Host& server) { return server.enumerate(name_space, name, properties); });
}

Path Load::path_of(const std::string& class_name, Random& random)
{
    const auto names =
        ask("names of " + class_name, [&](host::Host& server) { return server.names(name_space, class_name); });
    if (!names.paths.empty()) return random.pick(names.paths);
    Path nobody = path_in(class_name);
    nobody.set("InstanceID", Value::string("nobody"));
    return nobody;
}

void Load::get(Random& random)
{
    const Path path = path_of(random.pick(m_classes).name, random);
    ask("get " + path.to_text(), [&](host::Host& server) { return server.get(path); });
}

void Load::traverse(Random& random)
{
    const std::string start = random.pick(m_classes).name;
    const Path path = path_of(start, random);
    // Through one association class most times: through all of them it takes a hundred times as long.
    const std::string through = random.chance(90) ? random.pick(m_associations).name : "";
    const std::size_t kind = random.below(4);
    ask("traverse " + through + " from " + path.to_text(), [&](host::Host& server) {
        switch (kind) {
        case 0:
            return server.associators(path, through);
        case 1:
            return server.associator_names(path, through);
        case 2:
            return server.references(path, through);
        default:
            return server.reference_names(path, through);
        }
    });
}

void Load::modify(Random& random)
{
    const Setting& one = random.pick(settings);
    // Some are out of range.
    const auto value = static_cast<std::uint32_t>(random.below(one.most + 2));
    if (m_season.has_unloads) {
        set(one.name, value);
        return;
    }
    if (one.is_of_adapters) return; // the season's
    set(one.name, value);
    read(random);
    set(one.name, one.value);
}

bool Load::set(const char* name, std::uint32_t value)
{
    const host::Instance changed = setting(name, value);
    const auto answer =
        ask(std::string("modify ") + name, [&](host::Host& server) { return server.modify(changed, current_alone); });
    return answer.ok();
}

void Load::call(Random& random)
{
    const Method& method = random.pick(m_methods);
    if (method.is_change && !m_season.has_changes) return read(random);
    const Path target = path_of(method.class_name, random);
    Arguments arguments;
    for (const host::Element_Record& parameter : method.record->parameters)
        if (parameter.in && random.chance(95))
            arguments.push_back({parameter.name, argument(parameter, target, random)});
    ask("call " + method.class_name + '.' + method.record->name,
        [&](host::Host& server) { return server.call(target, method.record->name, arguments); });
}

Value Load::argument(const host::Element_Record& parameter, const Path& target, Random& random)
{
    const std::string& name = parameter.name;
    if (name == "Target") return Value::reference(path_of("NVRHBA_FCPort", random));
    if (name == "ManagedElement") return Value::reference(path_of("NVRHBA_PortController", random));
    if (name == "URI") {
        const char* const files[] = {image_file, table_file, "another.table", "/nowhere/a.file", ""};
        return Value::string(random.pick(files));
    }
    if (name == "Image") {
        std::vector<Value> bytes;
        for (const char byte : nvrtest::image(nvrtest::new_version, 10))
            bytes.push_back(Value::uint8(static_cast<std::uint8_t>(byte)));
        return Value::array(CMPI_uint8, bytes);
    }
    if (name == "InstallOptions")
        return nvrtest::options_value(random.chance(50) ? std::vector<std::uint16_t>{32768}
                                                        : std::vector<std::uint16_t>{32768, 2});
    if (name == "InstallOptionsValues") return nvrtest::texts_value({"a.copy"});
    if (name == "NewWWPN" || name == "NewWWNN")
        return Value::string((name == "NewWWPN" ? "10000000C9A0F00" : "20000000C9A0F00") +
                             std::to_string(random.below(10)));
    if (name == "strParam") return Value::string("lun-queue-depth");
    if (name == "strValue") return Value::string(std::to_string(random.below(300)));
    const Value* test = target.find("Name");
    if (name == "DiagnosticSettings" && test)
        return embedded("NVRHBA_FCHBADiagnosticSettingData", *test, "LoopControlParameter",
                        Value::array(CMPI_string, {Value::string("3")}));
    if (name == "JobSettings")
        return embedded("NVRHBA_JobSettingData", Value::string("NVR:FCHBA JobSettingData"), "DeleteOnCompletion",
                        Value::boolean(random.chance(50)));
    return plain_value(parameter.type, random);
}

Value Load::plain_value(CMPIType type, Random& random)
{
    if (type & CMPI_ARRAY) {
        const auto element = static_cast<CMPIType>(type & ~CMPI_ARRAY);
        std::vector<Value> elements;
        for (std::size_t i = random.below(4); i > 0; i--)
            elements.push_back(plain_value(element, random));
        return Value::array(element, elements);
    }
    if (type == CMPI_boolean) return Value::boolean(random.chance(50));
    if (host::is_integer(type)) return Value::integer(type, random.below(6));
    if (type == CMPI_string) return Value::string(std::string(random.below(300), 'x'));
    if (type == CMPI_dateTime) return Value::datetime("00000000000100.000000:000");
    if (type == CMPI_ref) return Value::reference(path_of(random.pick(m_classes).name, random));
    return Value::null_of(type);
}

void Load::subscribe(Random& random)
{
    {
        const std::lock_guard<std::mutex> lock(m_mutex);
        if (m_subscriptions.size() >= most_subscriptions) return;
    }
    int id = 0;
    const std::string query = random.chance(50) ? "SELECT * FROM NVRHBA_AlertIndication" : "";
    const auto subscribed = ask("subscribe", [&](host::Host& server) {
        host::Answer answer;
        answer.status = server.subscribe(
            name_space, alert_class, [this](const host::Indication&) { m_counts.alerts++; }, id, query);
        return answer;
    });
    if (!subscribed.ok()) return;
    const std::lock_guard<std::mutex> lock(m_mutex);
    m_subscriptions.push_back(id);
}

void Load::unsubscribe()
{
    int id = 0;
    {
        const std::lock_guard<std::mutex> lock(m_mutex);
        if (m_subscriptions.empty()) return;
        id = m_subscriptions.front();
        m_subscriptions.erase(m_subscriptions.begin());
    }
    ask("unsubscribe", [&](host::Host& server) {
        host::Answer answer;
        answer.status = server.unsubscribe(id);
        return answer;
    });
}

void Load::unsubscribe_all()
{
    m_rig.server().settle();
    while (!m_subscriptions.empty())
        unsubscribe();
}

void Load::meet_alert()
{
    Random any(0);
    subscribe(any);
    m_rig.server().settle();
    nvrsim_event("0", 513, 0);
    nvrsim_drain_events();
    unsubscribe();
    m_rig.server().settle();
}

// What no client may have.
void Load::reach_too_far(Random& random)
{
    const std::string name = random.pick(m_classes).name;
    const Path path = path_of(name, random);
    host::Instance instance;
    instance.path = path;
    instance.properties = path.keys;
    ask("create " + name, [&](host::Host& server) { return server.create(instance); });
    ask("modify " + name, [&](host::Host& server) { return server.modify(instance); });
    ask("delete " + name, [&](host::Host& server) { return server.remove(path); });
    ask("query " + name, [&](host::Host& server) { return server.exec_query(name_space, name, "SELECT", "WQL"); });
    ask("no such method of " + name, [&](host::Host& server) { return server.call(path, "NoSuchMethod"); });
}

bool Load::restore_settings()
{
    bool all = true;
    for (const Setting& one : settings)
        all &= set(one.name, one.is_of_adapters ? m_season.reads_adapters : one.value);
    return all;
}

bool Load::have_adapters_read()
{
    const auto services = m_rig.names("NVRHBA_FCHBAWWNService"), ports = m_rig.names("NVRHBA_FCPort");
    if (services.paths.empty() || ports.paths.empty()) return false;
    const Arguments arguments = {{"Target", Value::reference(ports.paths[0])}, {"Type", Value::uint16(0)}};
    const auto restored = ask(
        "call RestoreWWN", [&](host::Host& server) { return server.call(services.paths[0], "RestoreWWN", arguments); });
    return restored.ok() && !restored.value.is_null() && restored.value.as_uint() == 0;
}

void Load::restore_files()
{
    for (const auto& entry : std::filesystem::directory_iterator(folder))
        std::filesystem::remove_all(entry.path());
    nvrtest::write_image(image_file);
    nvrtest::write_file(std::string(folder) + '/' + table_file, table);
}

std::string Load::all_names()
{
    std::string all;
    for (const Class& one : m_classes) {
        const auto names =
            ask("names of " + one.name, [&](host::Host& server) { return server.names(name_space, one.name); });
        for (const Path& path : names.paths)
            all += path.to_text() + '\n';
    }
    return all;
}

} // namespace soak
