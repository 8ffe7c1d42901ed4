// What holds for every method of every service: whom it is meant for, in what case it is called, what becomes of a
// library that throws, whether it asks for a refresh, and that it shares the agent with all others.
#include <algorithm>
#include <filesystem>
#include <future>
#include <set>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/module/support/Expected.h"
#include "tests/module/support/Firmware.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Value;
using testing::IsEmpty;

namespace {

constexpr char image_path[] = "/var/log/an.image";
constexpr char table_path[] = "/var/log/a.table";
constexpr char dump_folder[] = "/var/log/dumps";

struct Method {
    const char* service;
    const char* name;
    /// All but the Target, so that a call is done.
    Arguments others;
    /// The return values without a Target, for one of another class, for one that is no port of the host, and for a
    /// port that is not local.
    unsigned no_target, no_port, unknown, not_local;
    /// A refresh is asked for when it is done.
    bool refreshes;
    /// What it does in the end.
    const char* library_call;
};

std::vector<Method> methods()
{
    const char* const names = "NVRHBA_FCHBAWWNService";
    const char* const firmware = "NVRHBA_SoftwareInstallationService";
    const char* const params = "NVRHBA_FCHBADriverParamService";
    const char* const boot = "NVRHBA_BootBIOSService";
    const char* const tags = "NVRHBA_FCTagService";
    const char* const dumps = "NVRHBA_DumpService";
    const auto type = [](std::uint16_t value) { return host::Named_Value{"Type", Value::uint16(value)}; };
    std::vector<Value> bytes;
    for (const char byte : image(new_version, 10))
        bytes.push_back(Value::uint8(static_cast<std::uint8_t>(byte)));
    const Arguments image_bytes = {{"Image", Value::array(CMPI_uint8, bytes)},
                                   {"InstallOptions", options_value({32768})},
                                   {"InstallOptionsValues", texts_value({"a.copy"})}};
    const Arguments new_names = {
        {"NewWWPN", Value::string("10000000C9A0F001")}, {"NewWWNN", Value::string("20000000C9A0F001")}, type(1)};
    return {
        {names, "ChangeWWN", new_names, 32968, 32968, 32968, 0, true, "RM_ChangeWWN"},
        {names, "RestoreWWN", {type(0)}, 32968, 32968, 32968, 0, true, "RM_RestoreWWN"},
        {names, "ReadWWN", {type(2)}, 32968, 32968, 32968, 0, false, "RM_ReadWWN"},
        {names, "GetWWNCapability", {}, 32968, 32968, 32968, 0, false, "RM_GetWWNCapability"},
        {firmware,
         "InstallFromURI",
         {{"URI", Value::string(image_path)}},
         4097,
         32968,
         32968,
         40001,
         true,
         "RM_DownloadFirmware"},
        {firmware, "InstallFromByteStream", image_bytes, 4097, 32968, 32968, 40001, true, "RM_DownloadFirmware"},
        {firmware, "ResetHBA", {}, 32968, 32968, 32968, 40001, true, "RM_ResetHBA"},
        {firmware,
         "SetPortEnabled",
         {{"PortEnabled", Value::boolean(true)}},
         32968,
         32968,
         32968,
         0,
         false,
         "RM_SetPortEnabled"},
        {params,
         "SetDriverParameter",
         {{"strParam", Value::string("lun-queue-depth")}, {"strValue", Value::string("64")}},
         32968,
         32968,
         32968,
         40001,
         false,
         "RM_SetDriverParam"},
        {boot, "EnableBootBIOS", {}, 32968, 32968, 32968, 40001, false, "RM_SetBootBiosState"},
        {boot, "DisableBootBIOS", {}, 32968, 32968, 32968, 40001, false, "RM_SetBootBiosState"},
        {boot, "GetBootBIOSStatus", {}, 32968, 32968, 32968, 40001, false, "RM_GetAttributeValue"},
        {tags, "GetGlobalFlag", {}, 4097, 4097, 32968, 0, false, "CPQFC_QoSGetGlobalFlag"},
        {tags, "SetGlobalFlag", {{"State", Value::uint32(1)}}, 4097, 4097, 32968, 0, false, "CPQFC_QoSSetGlobalFlag"},
        {tags,
         "GetConfigTable",
         {{"URI", Value::string("a.table")}},
         4097,
         4097,
         32968,
         0,
         false,
         "CPQFC_QoSGetConfig"},
        {tags,
         "SetConfigTable",
         {{"URI", Value::string(table_path)}},
         4097,
         4097,
         32968,
         0,
         false,
         "CPQFC_QoSSetConfig"},
        {dumps, "GenerateDump", {}, 32968, 32968, 32968, 40001, false, "RM_GenerateDump"},
        {dumps, "GetDumpFileNames", {}, 32968, 32968, 32968, 40001, false, "RM_GetDumpFileNames"},
        {dumps, "DeleteDump", {}, 32968, 32968, 32968, 40001, false, "RM_DeleteDumpFiles"},
    };
}

std::string name_of(const Method& method)
{
    return std::string(method.service) + ' ' + method.name;
}

/// Two adapters with a port each; the first is tagged and has a folder for its dumps.
class Host {
public:
    explicit Host(const host::Manner& manner = host::Manner::strict(), const char* settings = "")
        : rig((prepare(), Rig_Options{manner, scenario, settings}))
    {
    }

    /// A call with this Target.
    Called call(const Method& method, const Value& target) { return call(method, method.name, &target); }
    Called call(const Method& method) { return call(method, port(rig)); }
    Called call(const Method& method, const std::string& name, const Value* target)
    {
        Arguments arguments = method.others;
        if (target) arguments.push_back({"Target", *target});
        return Service(rig, method.service).call(name, arguments);
    }
    std::size_t ports() { return rig.enumerate("NVRHBA_FCPort").instances.size(); }

private:
    static void prepare()
    {
        for (const char* folder : {firmware_folder, dump_folder})
            std::filesystem::create_directories(folder);
        std::filesystem::current_path(firmware_folder);
        write_image(image_path);
        write_file(table_path,
                   "<ApexConfig><theSystem><ApexVersion/><CreationDate/><HostName/><Adapter/></theSystem>"
                   "<Configuration><numberOfEntries>1</numberOfEntries><Row><src_wwpn>10000000C9A00001</src_wwpn>"
                   "<tgt_wwpn>50060E8005A10000</tgt_wwpn><tag>1</tag></Row></Configuration></ApexConfig>");
    }
    static constexpr char scenario[] =
        "[[adapter]]\n[[adapter.port]]\ndump_directory = \"/var/log/dumps\"\n[[adapter.tag]]\n"
        "source = \"10000000C9A00001\"\ntarget = \"50060E8005A10000\"\ntag = 5\n[[adapter]]\n";

public:
    Rig rig;
};

} // namespace

TEST(EveryServiceTable, HasEachMethodThatIsServed)
{
    std::set<std::string> known;
    for (const Method& method : methods())
        known.insert(name_of(method));
    for (const auto& row : expected_rows("unsupported_methods.txt"))
        known.insert(row.at(0) + ' ' + row.at(1));
    std::set<std::string> services;
    for (const Method& method : methods())
        services.insert(method.service);
    for (const std::string& service : services)
        for (const host::Method_Record& method : module_schema()->find(service)->methods)
            // Where it is served, it does nothing, and that is tested service by service.
            if (method.name != "StartService") {
                EXPECT_EQ(known.count(service + ' ' + method.name), 1u) << service << ' ' << method.name;
            }
}

class EveryService : public Every_Manner {};
NVR_IN_EVERY_MANNER(EveryService);

TEST_P(EveryService, IsMeantForPortsOfTheHost)
{
    Host host(*GetParam());
    const Value null = Value::null_of(CMPI_ref), foreign = no_port(host.rig), unknown = unknown_port(host.rig);
    for (const Method& method : methods()) {
        const std::uint64_t before = calls(method.library_call);
        EXPECT_THAT(host.call(method, method.name, nullptr), returned(method.no_target)) << name_of(method);
        EXPECT_THAT(host.call(method, null), returned(method.no_target)) << name_of(method);
        EXPECT_THAT(host.call(method, foreign), returned(method.no_port)) << name_of(method);
        EXPECT_THAT(host.call(method, unknown), returned(method.unknown)) << name_of(method);
        const Value target = port(host.rig);
        Arguments arguments = method.others;
        arguments.push_back({"Target", target});
        Service service(host.rig, method.service);
        EXPECT_THAT(service.call_on(service.stranger(), method.name, arguments), returned(33068)) << name_of(method);
        EXPECT_EQ(calls(method.library_call), before) << name_of(method);
    }
    EXPECT_EQ(host.ports(), 2u);
    EXPECT_THAT(names_in(firmware_folder), IsEmpty());
    EXPECT_THAT(names_in(dump_folder), IsEmpty());
    EXPECT_THAT(host.rig.server().report().violations, IsEmpty());
}

// Some ask the library whether the port is local; for the others it has to say so itself.
TEST_P(EveryService, AsksWhetherThePortIsLocalOrDoesNot)
{
    for (const Method& method : methods()) {
        Host host(*GetParam());
        const Value target = port(host.rig);
        host.rig.settle();
        const std::uint64_t asked = calls("RM_IsLocalHBA"), before = calls(method.library_call);
        set_port(0, "local", 0);
        EXPECT_THAT(host.call(method, target), returned(method.not_local)) << name_of(method);
        if (method.not_local == 0) continue;
        EXPECT_EQ(calls("RM_IsLocalHBA"), asked + 1) << name_of(method);
        EXPECT_EQ(calls(method.library_call), before) << name_of(method);
        EXPECT_THAT(names_in(firmware_folder), IsEmpty());
    }
}

TEST_P(EveryService, TakesItsMethodsInAnyCase)
{
    for (const Method& method : methods()) {
        Host host(*GetParam());
        std::string lower = method.name, upper = method.name;
        std::transform(lower.begin(), lower.end(), lower.begin(), [](unsigned char c) { return std::tolower(c); });
        std::transform(upper.begin(), upper.end(), upper.begin(), [](unsigned char c) { return std::toupper(c); });
        const Value target = port(host.rig);
        for (const std::string& name : {lower, upper}) {
            const std::uint64_t before = calls(method.library_call);
            EXPECT_THAT(host.call(method, name, &target), returned(0)) << name_of(method);
            EXPECT_GT(calls(method.library_call), before) << name_of(method);
        }
    }
}

// An adapter that has gone shows whether somebody asked for a refresh: until then the port is published.
TEST_P(EveryService, HasTheNextEnumerationShowWhatItChanged)
{
    for (const Method& method : methods()) {
        Host host(*GetParam());
        ASSERT_EQ(host.ports(), 2u);
        set_port(1, "present", 0);
        EXPECT_THAT(host.call(method), returned(0)) << name_of(method);
        EXPECT_EQ(host.ports(), method.refreshes ? 1u : 2u) << name_of(method);
        host.rig.settle();
        EXPECT_EQ(host.ports(), method.refreshes ? 1u : 2u) << name_of(method);
    }
}

TEST(EveryServiceInstall, WithAResetAsksForNoRefresh)
{
    for (const Method& method : methods()) {
        if (std::string(method.name).find("Install") != 0) continue;
        Host host;
        ASSERT_EQ(host.ports(), 2u);
        set_port(1, "present", 0);
        Method resetting = method;
        auto& others = resetting.others;
        const auto options = std::find_if(others.begin(), others.end(),
                                          [](const host::Named_Value& one) { return one.name == "InstallOptions"; });
        if (options == others.end())
            others.push_back({"InstallOptions", options_value({2})});
        else
            options->value = options_value({32768, 2});
        EXPECT_THAT(host.call(resetting), returned(0)) << name_of(method);
        EXPECT_EQ(port_value(0, "resets"), "1") << name_of(method);
        EXPECT_EQ(host.ports(), 2u) << name_of(method);
    }
}

// A port that the library does not call local, for whatever reason, is none: the status itself is told by nobody.
TEST(EveryServiceStatuses, OfTheQuestionForLocalPortsAreOne)
{
    Host host;
    ASSERT_EQ(host.ports(), 2u);
    host.rig.settle(); // a refresh makes some of the calls too
    for (const Method& method : methods()) {
        if (method.not_local == 0) continue;
        const std::uint64_t before = calls(method.library_call);
        for (unsigned status = 1; status <= 260; status++) {
            clear_faults();
            add_fault("call = 'RM_IsLocalHBA', status = " + std::to_string(status));
            EXPECT_THAT(host.call(method), returned(40001)) << name_of(method) << ' ' << status;
        }
        EXPECT_EQ(calls(method.library_call), before) << name_of(method);
    }
}

TEST(EveryServiceStatuses, OfEachStepOfAnInstallComeBackBehindFortyThousand)
{
    Host host;
    for (const Method& method : methods()) {
        if (std::string(method.name).find("Install") != 0) continue;
        const bool from_uri = method.name == std::string("InstallFromURI");
        for (const char* call : {"RM_ImportHBAFileA", "RM_VerifyFirmwareA", "RM_DownloadFirmware"})
            for (unsigned status = 1; status <= 260; status++) {
                clear_faults();
                add_fault("call = '" + std::string(call) + "', status = " + std::to_string(status));
                EXPECT_THAT(host.call(method), returned(from_uri && status == 247 ? 0 : 40000 + status))
                    << name_of(method) << ' ' << call;
            }
        EXPECT_THAT(names_in(firmware_folder), IsEmpty());
    }
}

// Whatever comes out of the library, and be it out of the end of a look at an adapter, the server gets an answer,
// nothing stays locked or on the disk, and the next call is done.
TEST(EveryServiceThrown, IsOutlived)
{
    for (const Method& method : methods()) {
        Host host(host::Manner::strict(), refreshing_settings);
        const Value target = port(host.rig);
        for (const char* thrower : {"*", "RM_*"})
            for (unsigned from = 1; from <= 4; from++) {
                add_fault("call = '" + std::string(thrower) + "', throws = true, from = " + std::to_string(from));
                const Called called = host.call(method, target);
                EXPECT_TRUE(called.answer.ok() || called.answer.status.code == CMPI_RC_ERR_FAILED) << name_of(method);
                host.rig.settle();
                EXPECT_THAT(names_in(firmware_folder), IsEmpty()) << name_of(method) << ' ' << thrower << from;
                clear_faults();
                host.rig.refresh(); // the last one may have found no port
            }
        EXPECT_THAT(host.call(method, target), returned(0)) << name_of(method);
        EXPECT_THAT(host.rig.server().report().violations, IsEmpty());
    }
}

TEST_P(EveryService, TakesTurnsWithAllOthers)
{
    Host host(*GetParam());
    // Names are changed at a port that nobody resets, and a port is enabled whose boot code nobody enables.
    const auto stands_alone = [](const Method& method) {
        const std::string call = method.library_call;
        return call == "RM_ChangeWWN" || call == "RM_RestoreWWN" || call == "RM_SetPortEnabled";
    };
    const Value first = port(host.rig, 0), second = port(host.rig, 1);
    const std::vector<Method> all = methods();
    std::vector<host::Path> paths;
    for (const Method& method : all)
        paths.push_back(Service(host.rig, method.service).path());
    host.rig.settle();
    add_fault("call = 'RM_*', delay_ms = 1");
    nvrsim_most_at_once();
    constexpr std::size_t rounds = 3;
    std::vector<std::future<std::size_t>> clients;
    for (std::size_t i = 0; i < all.size(); i++)
        clients.push_back(std::async(std::launch::async, [&, i] {
            Arguments arguments = all[i].others;
            arguments.push_back({"Target", stands_alone(all[i]) ? second : first});
            std::size_t done = 0;
            for (std::size_t round = 0; round < rounds; round++) {
                const host::Answer answer = host.rig.server().call(paths[i], all[i].name, arguments);
                done += answer.ok() && answer.value == Value::uint32(0);
            }
            return done;
        }));
    for (std::size_t i = 0; i < all.size(); i++)
        EXPECT_EQ(clients[i].get(), rounds) << name_of(all[i]);
    host.rig.settle();
    EXPECT_EQ(nvrsim_most_at_once(), 1u) << "another was in the library meanwhile";
    EXPECT_THAT(host.rig.server().report().violations, IsEmpty());
}
