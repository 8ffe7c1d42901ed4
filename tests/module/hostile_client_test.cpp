// A client, or a server, that means ill: every operation of every class with arguments that are missing, null, foreign,
// of other types and huge. Each call is answered, and afterwards an honest client sees what it saw before.
#include <algorithm>
#include <atomic>
#include <cstdint>
#include <dlfcn.h>
#include <filesystem>
#include <functional>
#include <initializer_list>
#include <limits>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/module/support/Entries.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Service.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/Cases.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Path;
using host::Value;
using testing::IsEmpty;

namespace {

constexpr char folder[] = "/var/log/hostile";
constexpr char alert_class[] = "NVRHBA_AlertIndication";
/// The thread sanitizer takes a hundred times as long over large copies.
const std::size_t very_long = 1024 * 1024 / each_of_cases(1, 16);

Path nobody_of(const std::string& class_name)
{
    Path path;
    path.name_space = "root/norvane";
    path.class_name = class_name;
    return path;
}

Value many(std::size_t count, CMPIType element, const Value& value)
{
    return Value::array(element, std::vector<Value>(count, value));
}

/// An instance that holds one that holds one.
Value nest(unsigned depth)
{
    host::Instance instance;
    instance.path = nobody_of("NVRHBA_JobSettingData");
    instance.set("InstanceID", depth > 0 ? nest(depth - 1) : Value::string("the innermost"));
    return Value::instance(instance);
}

Value reference_within(unsigned depth)
{
    Path path = nobody_of("NVRHBA_ControlledBy");
    path.set("Antecedent", depth > 0 ? reference_within(depth - 1) : Value::string("the innermost"));
    return Value::reference(path);
}

/// One value of each type, and some that are broken within.
std::vector<Value> strange_values()
{
    Path elsewhere = nobody_of("NVRHBA_FCPort");
    elsewhere.name_space = "root/nowhere";
    elsewhere.set("DeviceID", Value::string("10000000C9A00001"));
    Path unknown = nobody_of("CIM_NoSuchClass");
    unknown.set("Name", Value::null_of(CMPI_string));
    Path bare;
    host::Instance foreign;
    foreign.path = unknown;
    foreign.set("Name", Value::uint64(1));
    const Value text = Value::string("%s%n%x \x01\xff\r\n\"<&>");
    return {
        Value(),
        Value::null_of(CMPI_string),
        Value::null_of(CMPI_ref),
        Value::null_of(CMPI_stringA),
        Value::boolean(true),
        Value::uint8(255),
        Value::uint16(65535),
        Value::uint32(4294967295u),
        Value::uint64(std::numeric_limits<std::uint64_t>::max()),
        Value::sint64(std::numeric_limits<std::int64_t>::min()),
        Value::real(CMPI_real64, std::numeric_limits<double>::quiet_NaN()),
        Value::integer(CMPI_char16, 0xD800),
        text,
        Value::string(""),
        Value::datetime("99999999999999.999999:000"),
        Value::datetime("no time at all"),
        Value::reference(elsewhere),
        Value::reference(unknown),
        Value::reference(bare),
        Value::reference(nobody_of("NVRHBA_FCPort")),
        Value::instance(foreign),
        Value::array(CMPI_string, {text, Value::null_of(CMPI_string), text}),
        Value::array(CMPI_string, {}),
        Value::array(CMPI_uint8, {Value::uint8(0)}),
        Value::array(CMPI_boolean, {Value::boolean(true)}),
        Value::array(CMPI_ref, {Value::reference(unknown), Value::null_of(CMPI_ref)}),
        Value::array(CMPI_instance, {Value::instance(foreign)}),
        Value::array(CMPI_dateTime, {Value::datetime("no time at all")}),
    };
}

std::vector<Value> huge_values()
{
    Path path = nobody_of("NVRHBA_FCPort");
    path.set("DeviceID", Value::string(std::string(very_long, '1')));
    return {
        Value::string(std::string(very_long, 'A')),
        many(very_long / 10, CMPI_uint8, Value::uint8(7)),
        many(very_long / 100, CMPI_string, Value::string("text")),
        many(100, CMPI_ref, Value::reference(nobody_of("NVRHBA_FCPort"))),
        Value::reference(path),
        reference_within(60),
        nest(60),
    };
}

/// What the tables are handed that no server makes of a client's request.
struct Foreign {
    explicit Foreign(const CMPIBroker* broker)
    {
        const CMPIBrokerEncFT& eft = *broker->eft;
        CMPIStatus status = {CMPI_RC_OK, nullptr};
        const std::string huge(very_long, '/');
        for (const auto& [name_space, name] : std::initializer_list<std::pair<std::string, std::string>>{
                 {"root/norvane", "NVRHBA_Product"},
                 {"root/norvane", "NVRHBA_ControlledBy"},
                 {"root/nowhere", "NVRHBA_Product"},
                 {"root/nowhere", "NVRHBA_ControlledBy"},
                 {"", "NVRHBA_Product"},
                 {"", "NVRHBA_ControlledBy"},
                 {"root/norvane", huge},
                 {huge, "NVRHBA_Product"},
             })
            if (CMPIObjectPath* path = eft.newObjectPath(broker, name_space.c_str(), name.c_str(), &status)) {
                paths.push_back(path);
                CMPIInstance* instance = eft.newInstance(broker, path, &status);
                if (instance) instances.push_back(instance);
            }
        const auto add = [&](CMPIType type) -> CMPIValue& {
            values.push_back({{}, type});
            return values.back().first;
        };
        add(CMPI_uint64).uint64 = std::numeric_limits<std::uint64_t>::max();
        add(CMPI_boolean).boolean = 77;
        add(CMPI_string).string = text = eft.newString(broker, std::string(very_long, 't').c_str(), &status);
        add(CMPI_string).string = nullptr;
        add(CMPI_ref).ref = paths.front();
        add(CMPI_ref).ref = nullptr;
        add(CMPI_instance).inst = instances.front();
        add(CMPI_uint8A).array = array = eft.newArray(broker, 10000, CMPI_uint8, &status);
        add(CMPI_stringA).array = array; // it is not
        add(CMPI_null);
        add(CMPI_dateTime).dateTime = nullptr;
    }
    void release() const
    {
        text->ft->release(text);
        array->ft->release(array);
        for (CMPIInstance* instance : instances)
            instance->ft->release(instance);
        for (CMPIObjectPath* path : paths)
            path->ft->release(path);
    }

    std::vector<CMPIObjectPath*> paths;
    std::vector<CMPIInstance*> instances;
    std::vector<std::pair<CMPIValue, CMPIType>> values;

private:
    CMPIString* text;
    CMPIArray* array;
};

/// Takes whatever it is given.
struct Unread_Result : CMPIResult {
    Unread_Result() : CMPIResult{nullptr, &table} {}

    template <class... Given>
    static CMPIStatus take(const CMPIResult* result, Given...)
    {
        if (sizeof...(Given) == 1) static_cast<const Unread_Result*>(result)->objects++;
        return {CMPI_RC_OK, nullptr};
    }
    static CMPIResult* clone(const CMPIResult*, CMPIStatus*) { return nullptr; }

    static inline CMPIResultFT table = {CMPICurrentVersion,
                                        [](CMPIResult*) -> CMPIStatus {
                                            return {CMPI_RC_OK, nullptr};
                                        },
                                        &clone,
                                        &take<const CMPIValue*, CMPIType>,
                                        &take<const CMPIInstance*>,
                                        &take<const CMPIObjectPath*>,
                                        &take<>,
                                        &take<const CMPIError*>};
    mutable std::size_t objects = 0; // that it was given, beside data
};

/// The record of an exported factory that gets no broker, no context and no place for a status; null if there is none.
template <class Record>
Record* made_of_nothing(const Entries& entries, const std::string& factory)
{
    const auto make = reinterpret_cast<Record* (*)(const CMPIBroker*, const CMPIContext*, CMPIStatus*)>(
        ::dlsym(entries.handle(), factory.c_str()));
    return make ? make(nullptr, nullptr, nullptr) : nullptr;
}

class Hostile : public testing::Test {
protected:
    Hostile()
    {
        std::filesystem::create_directories(folder);
        std::filesystem::current_path(folder);
        m_before = whole_host();
        m_ports = rig.names("NVRHBA_FCPort").paths;
        rig.server().reset_report();
    }

    /// All that an honest client reads. Counters and states change by asking, so that the clock moves on first.
    std::string whole_host()
    {
        rig.refresh();
        std::string text;
        advance_clock(std::chrono::seconds(11));
        for (const std::string& name : instance_classes()) {
            const host::Answer answer = rig.enumerate(name);
            EXPECT_THAT(answer, succeeded()) << name;
            text += to_lines(name, answer.instances);
        }
        return text;
    }

    void TearDown() override
    {
        rig.settle();
        load_scenario("small"); // a client may change an adapter
        for (const auto& [name, value] : {std::pair("cachetimeout", 10u), {"adapterrefresh", 1u}, {"sanrefresh", 1u}}) {
            host::Instance setting;
            setting.path = nobody_of("NVRHBA_ProviderConfigSetting");
            setting.set("InstanceID", Value::string(std::string("Norvane HBA Provider:") + name));
            setting.path.keys = setting.properties;
            setting.set("current", Value::uint32(value));
            EXPECT_THAT(rig.server().modify(setting, std::vector<std::string>{"current"}), succeeded());
        }
        rig.refresh();
        EXPECT_EQ(difference(m_before, whole_host()), "");
        rig.stop();
        const host::Report report = rig.server().report();
        EXPECT_THAT(report.violations, IsEmpty());
        EXPECT_EQ(left_beside_strings(report) + report.clones_alive(), 0u) << report.to_text();
        EXPECT_EQ(report.contexts_not_detached, 0u);
        EXPECT_EQ(nvrsim_open_handles(), 0u);
        EXPECT_GT(m_calls, 0u);
    }

    std::vector<std::string> instance_classes()
    {
        std::vector<std::string> names = rig.classes();
        names.erase(std::remove(names.begin(), names.end(), alert_class), names.end());
        return names;
    }

    /// Those that the calls go to: all, or each so many from the first on. The tests begin at different ones, so that
    /// each class is met by some.
    std::vector<std::string> asked_classes(std::size_t each = 1, std::size_t first = 0)
    {
        return sample(instance_classes(), each, first);
    }

    std::vector<std::string> classes_with_methods(std::size_t each = 1, std::size_t first = 0)
    {
        std::vector<std::string> names = instance_classes();
        const auto has_none = [](const std::string& name) { return module_schema()->find(name)->methods.empty(); };
        names.erase(std::remove_if(names.begin(), names.end(), has_none), names.end());
        return sample(names, each, first);
    }

    static std::vector<std::string> sample(const std::vector<std::string>& all, std::size_t each, std::size_t first)
    {
        std::vector<std::string> some;
        for (std::size_t at = first % each; at < all.size(); at += each)
            some.push_back(all[at]);
        return some;
    }

    /// Any answer will do that is the module's own: no exception came out of it.
    void expect_answer(const host::Answer& answer, const std::string& what)
    {
        m_calls++;
        EXPECT_NE(answer.status.fault, host::Fault::module) << what << ": " << answer.status.message;
        EXPECT_NE(answer.status.fault, host::Fault::server) << what << ": " << answer.status.message;
    }

    /// Something that the method may take: a port that there is, a text that looks like a name.
    Value plausible(const host::Element_Record& parameter)
    {
        const CMPIType type = parameter.type;
        if (type == CMPI_ref) return Value::reference(m_ports.at(0));
        if (type & CMPI_ARRAY) {
            host::Element_Record element = parameter;
            element.type = static_cast<CMPIType>(type & ~CMPI_ARRAY);
            return Value::array(element.type, {plausible(element)});
        }
        if (type == CMPI_boolean) return Value::boolean(false);
        if (host::is_integer(type)) return Value::integer(type, 1);
        if (type == CMPI_dateTime) return Value::datetime("00000000000001.000000:000");
        return type == CMPI_string ? Value::string("10000000C9A0F001") : Value::null_of(type);
    }

    void call_with_each(const Path& target, const host::Method_Record& method, const std::vector<Value>& values)
    {
        Arguments good;
        for (const host::Element_Record& parameter : method.parameters)
            good.push_back({parameter.name, plausible(parameter)});
        const auto call = [&](const Arguments& arguments, const std::string& what) {
            expect_answer(rig.server().call(target, method.name, arguments),
                          target.class_name + '.' + method.name + ' ' + what);
        };
        call({}, "without arguments");
        call(good, "with all");
        for (std::size_t i = 0; i < good.size(); i++) {
            Arguments others = good;
            others.erase(others.begin() + static_cast<std::ptrdiff_t>(i));
            call(others, "without " + good[i].name);
            for (std::size_t at = 0; at < values.size(); at++) {
                others = good;
                others[i].value = values[at];
                call(others, good[i].name + " = value " + std::to_string(at));
            }
        }
    }

    /// In four threads, each class in one of them.
    void in_threads(const std::vector<std::string>& names, const std::function<void(const std::string&)>& body)
    {
        std::atomic<std::size_t> next{0};
        std::vector<std::thread> threads;
        for (int i = 0; i < 4; i++)
            threads.emplace_back([&] {
                for (std::size_t at = next++; at < names.size(); at = next++)
                    body(names[at]);
            });
        for (std::thread& thread : threads)
            thread.join();
    }

    /// The functions of the indication table, with that record and with none. All filters are allowed, whoever asks;
    /// alerts need a thread, which needs a context.
    static void call_with_nothing(const CMPIIndicationMIFT& ft, CMPIIndicationMI* mi, const CMPIContext* context)
    {
        for (CMPIIndicationMI* whose : {mi, static_cast<CMPIIndicationMI*>(nullptr)}) {
            const CMPIrc rc = whose ? CMPI_RC_OK : CMPI_RC_ERR_FAILED;
            EXPECT_EQ(ft.authorizeFilter(whose, context, nullptr, nullptr, nullptr, nullptr).rc, CMPI_RC_OK);
            EXPECT_EQ(ft.mustPoll(whose, context, nullptr, nullptr, nullptr).rc, CMPI_RC_OK);
            EXPECT_EQ(ft.activateFilter(whose, context, nullptr, nullptr, nullptr, 0).rc, rc);
            EXPECT_EQ(ft.enableIndications(whose, context).rc, context ? rc : CMPI_RC_ERR_FAILED);
            EXPECT_EQ(ft.disableIndications(whose, context).rc, rc);
            EXPECT_EQ(ft.deActivateFilter(whose, context, nullptr, nullptr, nullptr, 0).rc, rc);
        }
    }

    Path some_path(const std::string& class_name)
    {
        const std::vector<Path> paths = rig.names(class_name).paths;
        return paths.empty() ? nobody_of(class_name) : paths.front();
    }

    Rig rig{{host::Manner::strict(), "small", refreshing_settings}};
    std::vector<Path> m_ports;
    std::atomic<std::size_t> m_calls{0};

private:
    std::string m_before;
};

} // namespace

TEST_F(Hostile, ArgumentsOfEveryMethodAreMissingOrOfAnotherType)
{
    const std::vector<Value> values = strange_values();
    in_threads(classes_with_methods(each_of_cases(1, 6)), [&](const std::string& name) {
        const Path target = some_path(name);
        for (const host::Method_Record& method : module_schema()->find(name)->methods)
            call_with_each(target, method, values);
    });
    EXPECT_GT(m_calls, 4000u / each_of_cases(1, 12));
}

TEST_F(Hostile, ArgumentsOfEveryServedMethodAreHuge)
{
    const std::vector<Value> values = huge_values();
    for (const std::string& name : classes_with_methods(each_of_cases(1, 6), 3)) {
        const Path target = some_path(name);
        for (const host::Method_Record& method : module_schema()->find(name)->methods)
            if (rig.server().call(target, method.name).status.code != CMPI_RC_ERR_NOT_SUPPORTED)
                call_with_each(target, method, values);
    }
    EXPECT_GT(m_calls, 20u);
}

TEST_F(Hostile, MethodsThatNobodyHasAndArgumentsThatNobodyAskedFor)
{
    Arguments superfluous;
    for (int i = 0; i < 10000; i++)
        superfluous.push_back({"No" + std::to_string(i), Value::uint32(1)});
    superfluous.push_back({std::string(very_long, 'n'), Value::string("")});
    superfluous.push_back({"return_value", Value::string("")});
    superfluous.push_back({"", Value()});
    for (const std::string& name : asked_classes(each_of_cases(1, 6), 1)) {
        const Path target = some_path(name);
        for (const std::string& method : {std::string(), name, std::string("return_value"), std::string("%n%s")})
            expect_answer(rig.server().call(target, method), name + '.' + method);
        const auto& methods = module_schema()->find(name)->methods;
        if (methods.empty() || methods.front().parameters.empty()) continue;
        expect_answer(rig.server().call(target, std::string(very_long, 'm')), name);
        expect_answer(rig.server().call(target, methods.back().name, superfluous), name + '.' + methods.back().name);
    }
}

TEST_F(Hostile, KeysAreMissingSuperfluousHugeOrOfAnotherType)
{
    const std::vector<Value> values = strange_values();
    const Value huge = Value::string(std::string(very_long, 'k'));
    in_threads(asked_classes(each_of_cases(1, 6), 2), [&](const std::string& name) {
        const Path good = some_path(name);
        std::vector<Path> paths = {nobody_of(name)};
        for (std::size_t i = 0; i < good.keys.size(); i++) {
            Path path = good;
            path.keys.erase(path.keys.begin() + static_cast<std::ptrdiff_t>(i));
            paths.push_back(path);
            for (const Value& value : values) {
                path = good;
                path.keys[i].value = value;
                paths.push_back(path);
            }
        }
        Path more = good;
        for (int i = 0; i < 1000; i++)
            more.keys.push_back({"More" + std::to_string(i), Value::string("x")});
        paths.push_back(more);
        Path large = good;
        for (host::Named_Value& key : large.keys)
            key.value = huge;
        large.keys.push_back({std::string(very_long, 'n'), Value()});
        paths.push_back(large);
        for (std::size_t at = 0; at < paths.size(); at++) {
            const Path& path = paths[at];
            const std::string what = name + ", path " + std::to_string(at);
            expect_answer(rig.server().get(path), "get " + what);
            expect_answer(rig.server().remove(path), "delete " + what);
            expect_answer(rig.server().reference_names(path, "NVRHBA_ControlledBy"), "references of " + what);
        }
    });
}

TEST_F(Hostile, PropertiesOfEveryClassAreOfAnotherTypeOrUnknown)
{
    const std::vector<Value> strange = strange_values(), huge = huge_values();
    in_threads(asked_classes(each_of_cases(1, 6), 3), [&](const std::string& name) {
        const bool can_change =
            name == "NVRHBA_ProviderConfigSetting" || name == "NVRHBA_FCPort" || name == "NVRHBA_DumpData";
        std::vector<Value> values = strange;
        const Path path = some_path(name);
        for (std::size_t at = 0; at < values.size(); at++) {
            const Value& value = values[at];
            host::Instance instance;
            instance.path = path;
            for (const host::Element_Record& property : module_schema()->find(name)->properties)
                instance.set(property.name, value);
            instance.set("NoSuchProperty", value);
            const std::string what = name + ": all are value " + std::to_string(at);
            expect_answer(rig.server().modify(instance), "modify " + what);
            expect_answer(rig.server().modify(instance, std::vector<std::string>{"NoSuchProperty"}), "modify " + what);
            expect_answer(rig.server().create(instance), "create " + what);
        }
        host::Instance empty;
        empty.path = nobody_of(name);
        expect_answer(rig.server().modify(empty), "modify nothing of " + name);
        expect_answer(rig.server().create(empty), "create nothing of " + name);
        if (!can_change) return;
        // One property at a time, the others in order.
        for (const host::Element_Record& property : module_schema()->find(name)->properties) {
            values = strange;
            if (property.key || property.writable) values.insert(values.end(), huge.begin(), huge.end());
            for (const Value& value : values) {
                host::Instance instance;
                instance.path = path;
                instance.properties = path.keys;
                instance.set(property.name, value);
                expect_answer(rig.server().modify(instance), "modify " + name + '.' + property.name);
            }
        }
    });
}

TEST_F(Hostile, ListsOfPropertiesAreLong)
{
    std::vector<std::string> names(100000, "DeviceID");
    for (std::size_t i = 0; i < names.size(); i += 2)
        names[i] = "No" + std::to_string(i);
    names.push_back(std::string(very_long, 'p'));
    for (const std::string& name : asked_classes(each_of_cases(1, 6), 4))
        expect_answer(rig.enumerate(name, std::vector<std::string>{"", "%n", "DeviceID", "deviceid", name}), name);
    for (const char* name : {"NVRHBA_FCPort", "NVRHBA_ControlledBy", "NVRHBA_ProviderConfigSetting"}) {
        expect_answer(rig.enumerate(name, names), name);
        expect_answer(rig.server().get(some_path(name), names), name);
    }
    EXPECT_THAT(rig.server().references(m_ports.at(0), "NVRHBA_ControlledBy", "", names), succeeded());
}

TEST_F(Hostile, TraversalsAskForWhatThereIsNot)
{
    const std::string huge(very_long, 'r');
    std::vector<Path> starts = {m_ports.at(0), nobody_of("NVRHBA_FCPort"), nobody_of("NVRHBA_ControlledBy")};
    starts.push_back(m_ports.at(0));
    starts.back().set("DeviceID", Value::string(huge));
    const std::string words[] = {"", "Antecedent", "CIM_ManagedElement", "NoSuch", "%n%s", huge};
    for (const char* through : {"NVRHBA_ControlledBy", "NVRHBA_HostedService", "NVRHBA_ElementConformsToProfile"})
        for (const Path& start : starts)
            for (const std::string& role : words) {
                expect_answer(rig.server().associators(start, through, "", role, ""), through);
                expect_answer(rig.server().associators(start, through, "", "", role), through);
                expect_answer(rig.server().associator_names(start, through, role, role, role), through);
                expect_answer(rig.server().references(start, through, role), through);
                expect_answer(rig.server().reference_names(start, through, role), through);
            }
}

// ---- Straight at the tables, with what no server hands over.

TEST_F(Hostile, EveryFunctionOfEveryTableIsCalledWithNothing)
{
    Entries entries;
    const char* const nothing[] = {nullptr};
    const char** const none = const_cast<const char**>(nothing);
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        const CMPIContext* const contexts[] = {context, nullptr};
        for (const std::string& name : rig.classes()) {
            SCOPED_TRACE(name);
            CMPIInstanceMI* instances = entries.instances(name, broker, context);
            CMPIMethodMI* methods = entries.methods(name, broker, context);
            CMPIAssociationMI* ends = entries.associations(name, broker, context);
            CMPIIndicationMI* alerts = entries.indications(name, broker, context);
            EXPECT_EQ(alerts != nullptr, name == alert_class);
            for (const CMPIContext* ctx : contexts) {
                if (instances) {
                    for (CMPIInstanceMI* mi : {instances, static_cast<CMPIInstanceMI*>(nullptr)}) {
                        const CMPIInstanceMIFT& ft = *instances->ft;
                        EXPECT_NE(ft.enumerateInstanceNames(mi, ctx, nullptr, nullptr).rc, CMPI_RC_OK);
                        EXPECT_NE(ft.enumerateInstances(mi, ctx, nullptr, nullptr, none).rc, CMPI_RC_OK);
                        EXPECT_NE(ft.getInstance(mi, ctx, nullptr, nullptr, none).rc, CMPI_RC_OK);
                        EXPECT_NE(ft.createInstance(mi, ctx, nullptr, nullptr, nullptr).rc, CMPI_RC_OK);
                        EXPECT_NE(ft.modifyInstance(mi, ctx, nullptr, nullptr, nullptr, none).rc, CMPI_RC_OK);
                        EXPECT_NE(ft.deleteInstance(mi, ctx, nullptr, nullptr).rc, CMPI_RC_OK);
                        EXPECT_NE(ft.execQuery(mi, ctx, nullptr, nullptr, nullptr, nullptr).rc, CMPI_RC_OK);
                    }
                }
                if (methods)
                    for (CMPIMethodMI* mi : {methods, static_cast<CMPIMethodMI*>(nullptr)}) {
                        const auto call = methods->ft->invokeMethod;
                        EXPECT_NE(call(mi, ctx, nullptr, nullptr, nullptr, nullptr, nullptr).rc, CMPI_RC_OK);
                    }
                // A class that is not found has no ends: that is an answer.
                if (ends)
                    for (CMPIAssociationMI* mi : {ends, static_cast<CMPIAssociationMI*>(nullptr)}) {
                        const CMPIAssociationMIFT& ft = *ends->ft;
                        const CMPIrc rc = mi ? CMPI_RC_OK : CMPI_RC_ERR_FAILED;
                        EXPECT_EQ(
                            ft.associators(mi, ctx, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr, none).rc, rc);
                        EXPECT_EQ(ft.associatorNames(mi, ctx, nullptr, nullptr, nullptr, nullptr, nullptr, nullptr).rc,
                                  rc);
                        EXPECT_EQ(ft.references(mi, ctx, nullptr, nullptr, nullptr, nullptr, none).rc, rc);
                        EXPECT_EQ(ft.referenceNames(mi, ctx, nullptr, nullptr, nullptr, nullptr).rc, rc);
                    }
                if (alerts) call_with_nothing(*alerts->ft, alerts, ctx);
                m_calls++;
            }
            const auto clean_up = [](auto* mi) {
                if (!mi) return;
                EXPECT_EQ(mi->ft->cleanup(nullptr, nullptr, 0).rc, CMPI_RC_OK);
                EXPECT_EQ(mi->ft->cleanup(mi, nullptr, 0).rc, CMPI_RC_OK);
            };
            clean_up(instances);
            clean_up(methods);
            clean_up(ends);
            clean_up(alerts);
        }
    });
}

TEST_F(Hostile, PathsOfOtherClassesAndArgumentsOfNobodyComeStraightToTheTables)
{
    Entries entries;
    const Unread_Result unread;
    const std::string huge(very_long, 'w');
    const std::vector<std::string> asked = asked_classes(each_of_cases(1, 6), 5);
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        CMPIStatus status = {CMPI_RC_OK, nullptr};
        const Foreign foreign(broker);
        const std::pair<const CMPIContext*, const CMPIResult*> without_one[] = {{nullptr, &unread}, {context, nullptr}};
        for (const std::string& name : asked) {
            SCOPED_TRACE(name);
            CMPIObjectPath* own = broker->eft->newObjectPath(broker, "root/norvane", name.c_str(), &status);
            std::vector<CMPIObjectPath*> paths = foreign.paths;
            paths.push_back(own);
            if (CMPIInstanceMI* mi = entries.instances(name, broker, context)) {
                const CMPIInstanceMIFT& ft = *mi->ft;
                CMPIInstance* instance = broker->eft->newInstance(broker, own, &status);
                ASSERT_TRUE(instance);
                for (CMPIObjectPath* path : paths) {
                    ft.enumerateInstanceNames(mi, context, &unread, path);
                    ft.enumerateInstances(mi, context, &unread, path, nullptr);
                    ft.getInstance(mi, context, &unread, path, nullptr);
                    ft.createInstance(mi, context, &unread, path, instance);
                    ft.modifyInstance(mi, context, &unread, path, instance, nullptr);
                    ft.deleteInstance(mi, context, &unread, path);
                    ft.execQuery(mi, context, &unread, path, "SELECT", "no:such");
                }
                for (CMPIInstance* other : foreign.instances) {
                    ft.createInstance(mi, context, &unread, own, other);
                    ft.modifyInstance(mi, context, &unread, own, other, nullptr);
                }
                EXPECT_NE(ft.createInstance(mi, context, &unread, own, nullptr).rc, CMPI_RC_OK);
                EXPECT_NE(ft.modifyInstance(mi, context, &unread, own, nullptr, nullptr).rc, CMPI_RC_OK);
                for (const auto& [ctx, result] : without_one) {
                    ft.enumerateInstanceNames(mi, ctx, result, own);
                    ft.enumerateInstances(mi, ctx, result, own, nullptr);
                    ft.getInstance(mi, ctx, result, own, nullptr);
                    ft.createInstance(mi, ctx, result, own, instance);
                    ft.modifyInstance(mi, ctx, result, own, instance, nullptr);
                    ft.deleteInstance(mi, ctx, result, own);
                }
                EXPECT_EQ(ft.cleanup(mi, context, 0).rc, CMPI_RC_OK);
                instance->ft->release(instance);
            }
            if (CMPIMethodMI* mi = entries.methods(name, broker, context)) {
                for (const host::Method_Record& method : module_schema()->find(name)->methods) {
                    CMPIArgs* out = broker->eft->newArgs(broker, &status);
                    for (CMPIObjectPath* path : paths)
                        mi->ft->invokeMethod(mi, context, &unread, path, method.name.c_str(), nullptr, out);
                    // Each parameter in turn is each of the values, and then all of them are.
                    for (const auto& [value, type] : foreign.values)
                        for (std::size_t one = 0; one <= method.parameters.size(); one++) {
                            CMPIArgs* in = broker->eft->newArgs(broker, &status);
                            for (std::size_t at = 0; at < method.parameters.size(); at++)
                                if (at == one || one == method.parameters.size())
                                    in->ft->addArg(in, method.parameters[at].name.c_str(), &value, type);
                            mi->ft->invokeMethod(mi, context, &unread, own, method.name.c_str(), in, out);
                            in->ft->release(in);
                        }
                    for (const auto& [ctx, result] : without_one)
                        mi->ft->invokeMethod(mi, ctx, result, own, method.name.c_str(), nullptr, out);
                    mi->ft->invokeMethod(mi, context, &unread, own, method.name.c_str(), nullptr, nullptr);
                    out->ft->release(out);
                }
                EXPECT_NE(mi->ft->invokeMethod(mi, context, &unread, own, nullptr, nullptr, nullptr).rc, CMPI_RC_OK);
                EXPECT_EQ(mi->ft->cleanup(mi, context, 0).rc, CMPI_RC_OK);
            }
            if (CMPIAssociationMI* mi = entries.associations(name, broker, context)) {
                const CMPIAssociationMIFT& ft = *mi->ft;
                for (CMPIObjectPath* path : paths)
                    for (const char* any : {"", "NVRHBA_FCPort", path == own ? huge.c_str() : "%n%s"}) {
                        ft.associators(mi, context, &unread, path, name.c_str(), any, any, "", nullptr);
                        ft.associatorNames(mi, context, &unread, path, any, any, "", any);
                        ft.references(mi, context, &unread, path, name.c_str(), any, nullptr);
                        ft.referenceNames(mi, context, &unread, path, any, "");
                    }
                for (const auto& [ctx, result] : without_one) {
                    ft.associators(mi, ctx, result, own, nullptr, nullptr, nullptr, nullptr, nullptr);
                    ft.associatorNames(mi, ctx, result, own, nullptr, nullptr, nullptr, nullptr);
                    ft.references(mi, ctx, result, own, nullptr, nullptr, nullptr);
                    ft.referenceNames(mi, ctx, result, own, nullptr, nullptr);
                }
                EXPECT_EQ(ft.cleanup(mi, context, 0).rc, CMPI_RC_OK);
            }
            own->ft->release(own);
            m_calls++;
        }
        foreign.release();
    });
    EXPECT_GT(m_calls, 20u);
}

TEST_F(Hostile, EveryFactoryIsCalledWithNothing)
{
    rig.restart(); // or each provider has the server's broker already
    Entries entries;
    const Unread_Result unread;
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        CMPIStatus status = {CMPI_RC_OK, nullptr};
        std::vector<std::function<CMPIStatus()>> clean_ups; // at the end, so that the host is read only once
        const auto keep = [&](auto* mi) { clean_ups.push_back([=] { return mi->ft->cleanup(mi, nullptr, 0); }); };
        for (const std::string& name : rig.classes()) {
            SCOPED_TRACE(name);
            CMPIObjectPath* own = broker->eft->newObjectPath(broker, "root/norvane", name.c_str(), &status);
            CMPIInstance* instance = broker->eft->newInstance(broker, own, &status);
            const std::string factory = name + "_Create_";
            auto* instances = made_of_nothing<CMPIInstanceMI>(entries, factory + "InstanceMI");
            auto* methods = made_of_nothing<CMPIMethodMI>(entries, factory + "MethodMI");
            auto* ends = made_of_nothing<CMPIAssociationMI>(entries, factory + "AssociationMI");
            auto* alerts = made_of_nothing<CMPIIndicationMI>(entries, factory + "IndicationMI");
            EXPECT_TRUE(instances || alerts);
            for (const CMPIContext* ctx : {context, static_cast<const CMPIContext*>(nullptr)}) {
                if (instances) {
                    const CMPIInstanceMIFT& ft = *instances->ft;
                    ft.enumerateInstanceNames(instances, ctx, &unread, own);
                    ft.enumerateInstances(instances, ctx, &unread, own, nullptr);
                    EXPECT_NE(ft.getInstance(instances, ctx, &unread, own, nullptr).rc, CMPI_RC_OK);
                    EXPECT_NE(ft.createInstance(instances, ctx, &unread, own, instance).rc, CMPI_RC_OK);
                    EXPECT_NE(ft.modifyInstance(instances, ctx, &unread, own, instance, nullptr).rc, CMPI_RC_OK);
                    EXPECT_NE(ft.deleteInstance(instances, ctx, &unread, own).rc, CMPI_RC_OK);
                }
                if (methods)
                    for (const host::Method_Record& method : module_schema()->find(name)->methods) {
                        CMPIArgs* in = broker->eft->newArgs(broker, &status);
                        CMPIArgs* out = broker->eft->newArgs(broker, &status);
                        methods->ft->invokeMethod(methods, ctx, &unread, own, method.name.c_str(), in, out);
                        in->ft->release(in);
                        out->ft->release(out);
                    }
                if (ends) {
                    const CMPIAssociationMIFT& ft = *ends->ft;
                    ft.associators(ends, ctx, &unread, own, nullptr, nullptr, nullptr, nullptr, nullptr);
                    ft.associatorNames(ends, ctx, &unread, own, nullptr, nullptr, nullptr, nullptr);
                    ft.references(ends, ctx, &unread, own, nullptr, nullptr, nullptr);
                    ft.referenceNames(ends, ctx, &unread, own, nullptr, nullptr);
                }
                if (alerts) {
                    const CMPIIndicationMIFT& ft = *alerts->ft;
                    EXPECT_EQ(ft.activateFilter(alerts, ctx, nullptr, nullptr, own, 1).rc, CMPI_RC_OK);
                    EXPECT_NE(ft.enableIndications(alerts, ctx).rc, CMPI_RC_OK) << "no thread could deliver any";
                    nvrsim_event("0", 513, 0);
                    nvrsim_drain_events();
                    EXPECT_EQ(ft.deActivateFilter(alerts, ctx, nullptr, nullptr, own, 1).rc, CMPI_RC_OK);
                    EXPECT_EQ(ft.disableIndications(alerts, ctx).rc, CMPI_RC_OK);
                }
                m_calls++;
            }
            if (instances) keep(instances);
            if (methods) keep(methods);
            if (ends) keep(ends);
            if (alerts) keep(alerts);
            instance->ft->release(instance);
            own->ft->release(own);
        }
        for (const auto& clean_up : clean_ups)
            EXPECT_EQ(clean_up().rc, CMPI_RC_OK);
    });
    EXPECT_EQ(unread.objects, 0u) << "nobody could have made them";
}

TEST_F(Hostile, FiltersOfAnyClassAndQueryComeAndGoInAnyOrder)
{
    Entries entries;
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        CMPIIndicationMI* mi = entries.indications(alert_class, broker, context);
        ASSERT_TRUE(mi);
        const CMPIIndicationMIFT& ft = *mi->ft;
        CMPIStatus status = {CMPI_RC_OK, nullptr};
        const auto at = [&](const std::string& name_space) {
            return broker->eft->newObjectPath(broker, name_space.c_str(), "CIM_NoSuchClass", &status);
        };
        for (int round = 0; round < 3; round++) {
            EXPECT_EQ(ft.disableIndications(mi, context).rc, CMPI_RC_OK) << "they are not enabled";
            CMPIObjectPath* nowhere = at("root/nowhere");
            EXPECT_EQ(ft.deActivateFilter(mi, context, nullptr, nullptr, nowhere, 1).rc, CMPI_RC_OK) << "it is not";
            call_with_nothing(ft, mi, nullptr);
            for (const char* query : {"", "SELECT", "%n%s", "SELECT * FROM CIM_NoSuchClass WHERE \"\0"}) {
                CMPISelectExp* filter = broker->eft->newSelectExp(broker, query, "no:such", nullptr, &status);
                EXPECT_EQ(ft.authorizeFilter(mi, context, filter, "NoSuch", nowhere, "nobody").rc, CMPI_RC_OK);
                EXPECT_EQ(ft.activateFilter(mi, context, filter, "", nowhere, 1).rc, CMPI_RC_OK);
                if (filter) filter->ft->release(filter);
            }
            for (int i = 0; i < 1000; i++) {
                CMPIObjectPath* path = at("root/" + std::to_string(i));
                EXPECT_EQ(ft.activateFilter(mi, context, nullptr, nullptr, path, 1).rc, CMPI_RC_OK);
                path->ft->release(path);
            }
            EXPECT_EQ(ft.enableIndications(mi, context).rc, CMPI_RC_OK);
            EXPECT_EQ(ft.enableIndications(mi, context).rc, CMPI_RC_OK) << "twice";
            nvrsim_event("0", 513, 0); // to all thousand
            nvrsim_drain_events();
            for (int i = 0; i < 1005; i++) {
                CMPIObjectPath* path = at(i < 1000 ? "root/" + std::to_string(i) : "root/nowhere");
                EXPECT_EQ(ft.deActivateFilter(mi, context, nullptr, nullptr, path, 1).rc, CMPI_RC_OK);
                path->ft->release(path);
            }
            EXPECT_EQ(ft.disableIndications(mi, context).rc, CMPI_RC_OK);
            nowhere->ft->release(nowhere);
            m_calls++;
        }
        EXPECT_EQ(ft.cleanup(mi, nullptr, 0).rc, CMPI_RC_OK);
    });
}
