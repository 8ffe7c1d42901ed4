// What holds for every method of every service: whom it is meant for, in what case it is called, what becomes of a
// library that throws, whether it asks for a refresh, and that it shares the agent with all others.
#include <algorithm>
#include <future>
#include <set>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/module/support/Expected.h"
#include "tests/module/support/Firmware.h"
#include "tests/module/support/Service_Methods.h"
#include "tests/support/Cases.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Value;
using testing::IsEmpty;

namespace {

using Method = Service_Method;

std::string name_of(const Method& method)
{
    return std::string(method.service) + ' ' + method.name;
}

/// Two adapters with a port each; the first is tagged and has a folder for its dumps.
class Host {
public:
    explicit Host(const host::Manner& manner = host::Manner::strict(), const char* settings = "")
        : rig((prepare_service_files(), Rig_Options{manner, std::string(serving_adapter) + "[[adapter]]\n", settings}))
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

    Rig rig;
};

} // namespace

TEST(EveryServiceTable, HasEachMethodThatIsServed)
{
    std::set<std::string> known;
    for (const Method& method : service_methods())
        known.insert(name_of(method));
    for (const auto& row : expected_rows("unsupported_methods.txt"))
        known.insert(row.at(0) + ' ' + row.at(1));
    std::set<std::string> services;
    for (const Method& method : service_methods())
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
    for (const Method& method : service_methods()) {
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
    for (const Method& method : service_methods()) {
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
    for (const Method& method : service_methods()) {
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
    for (const Method& method : service_methods()) {
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
    for (const Method& method : service_methods()) {
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
    const unsigned each = each_of_cases(1, 26); // other ones for the next method
    Host host;
    ASSERT_EQ(host.ports(), 2u);
    host.rig.settle();                   // a refresh makes some of the calls too,
    const Value target = port(host.rig); // and a look at the ports every ten seconds
    unsigned first = 0;
    for (const Method& method : service_methods()) {
        if (method.not_local == 0) continue;
        const std::uint64_t before = calls(method.library_call);
        for (unsigned status = first++ % each + 1; status <= 260; status += each) {
            clear_faults();
            add_fault("call = 'RM_IsLocalHBA', status = " + std::to_string(status));
            EXPECT_THAT(host.call(method, target), returned(40001)) << name_of(method) << ' ' << status;
        }
        EXPECT_EQ(calls(method.library_call), before) << name_of(method);
    }
}

TEST(EveryServiceStatuses, OfEachStepOfAnInstallComeBackBehindFortyThousand)
{
    const unsigned each = each_of_cases(1, 13); // 247 is among them
    Host host;
    for (const Method& method : service_methods()) {
        if (std::string(method.name).find("Install") != 0) continue;
        const bool from_uri = method.name == std::string("InstallFromURI");
        for (const char* call : {"RM_ImportHBAFileA", "RM_VerifyFirmwareA", "RM_DownloadFirmware"})
            for (unsigned status = each; status <= 260; status += each) {
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
    for (const Method& method : service_methods()) {
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
    const std::vector<Method> all = service_methods();
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
