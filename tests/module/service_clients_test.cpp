// Services and their clients: several at once, an instance of another class, a server in each manner.
#include <future>
#include <string>
#include <thread>

#include <gmock/gmock.h>

#include "tests/module/support/Entries.h"
#include "tests/module/support/Service.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Value;
using testing::IsEmpty;

namespace {

constexpr char wwn_class[] = "NVRHBA_FCHBAWWNService";
constexpr char boot_class[] = "NVRHBA_BootBIOSService";

/// For each thread the places in the trace where a service of it held the agent: from its first words behind the gate
/// to its last. Each call logs two lines that nobody else does.
struct Hold {
    std::size_t from, to;
};

std::vector<Hold> holds(const std::vector<Trace_Line>& lines, const std::string& first, const std::string& last)
{
    std::vector<Hold> all;
    for (std::size_t i = 0; i < lines.size(); i++) {
        if (lines[i].words == first) all.push_back({i, lines.size()});
        if (lines[i].words == last && !all.empty()) all.back().to = i;
    }
    return all;
}

} // namespace

class ServiceClients : public Every_Manner {};
NVR_THREADS_IN_EVERY_MANNER(ServiceClients);

// Two providers run in parallel, but the agent's locks let one service in at a time.
TEST_P(ServiceClients, OfTwoServicesTakeTurnsAndBothFinish)
{
    Rig rig({*GetParam()});
    Service names(rig, wwn_class), boot(rig, boot_class);
    const Value target = port(rig);
    rig.settle();
    const std::streamoff before = rig.log_size();
    // Each call is held up in the library while the other client knocks.
    add_fault("call = \"RM_ReadWWN\", delay_ms = 20");
    add_fault("call = \"RM_SetBootBiosState\", delay_ms = 20");
    constexpr int rounds = 5;
    const auto ask = [&](const host::Path& path, const char* method) {
        return std::async(std::launch::async, [&rig, &target, path, method] {
            int done = 0;
            for (int i = 0; i < rounds; i++) {
                const host::Answer answer =
                    rig.server().call(path, method, {{"Target", target}, {"Type", Value::uint16(2)}});
                done += answer.ok() && answer.value == Value::uint32(0);
            }
            return done;
        });
    };
    const auto switch_on = [&] {
        return std::async(std::launch::async, [&rig, &target, path = boot.path()] {
            int done = 0;
            for (int i = 0; i < rounds; i++) {
                const host::Answer answer = rig.server().call(path, "EnableBootBIOS", {{"Target", target}});
                done += answer.ok() && answer.value == Value::uint32(0);
            }
            return done;
        });
    };
    auto first = ask(names.path(), "ReadWWN");
    auto second = switch_on();
    EXPECT_EQ(first.get(), rounds);
    EXPECT_EQ(second.get(), rounds);

    const std::vector<Trace_Line> lines = rig.lines_from(before);
    const auto readings = holds(lines, "Reading Factory Default WWNs.", "WWNN: 20:00:00:00:c9:a0:00:01");
    const auto switchings = holds(lines, "entering NVR_MethodWrapper::nvrcimSetBootBiosState",
                                  "NVRHBA_BootBIOSService_Provider::nvrcimSetBootBiosState O.K.");
    ASSERT_EQ(readings.size(), std::size_t(rounds));
    ASSERT_EQ(switchings.size(), std::size_t(rounds));
    for (const Hold& reading : readings)
        for (const Hold& switching : switchings)
            EXPECT_TRUE(reading.to < switching.from || switching.to < reading.from)
                << reading.from << " to " << reading.to << " and " << switching.from << " to " << switching.to;
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

// Refreshes go on beside services that ask for them, and enumerations in between see whole hosts.
TEST_P(ServiceClients, ThatAskForRefreshesDoNotKeepOthersFromAsking)
{
    Rig rig({*GetParam()});
    Service names(rig, wwn_class);
    const Value target = port(rig);
    auto changes = std::async(std::launch::async, [&] {
        int done = 0;
        for (int i = 0; i < 20; i++) {
            const host::Answer answer = rig.server().call(names.path(), "RestoreWWN", {{"Target", target}});
            done += answer.ok() && answer.value == Value::uint32(0);
        }
        return done;
    });
    int whole = 0;
    for (int i = 0; i < 20; i++)
        whole += rig.enumerate("NVRHBA_FCPort").instances.size() == 4;
    EXPECT_EQ(changes.get(), 20);
    EXPECT_EQ(whole, 20);
    rig.settle();
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

// A change of names from end to end: asked for, activated by a reset, and published by the refresh that the reset asks
// for.
TEST_P(ServiceClients, SeeANewNameAfterTheResetThatActivatesIt)
{
    Rig rig({*GetParam()});
    Service names(rig, wwn_class);
    Service firmware(rig, "NVRHBA_SoftwareInstallationService", "NVRHBA_FCSoftwareInstallationService");
    const Value target = port(rig, 1);
    const Called changed = names.call("ChangeWWN", {{"Target", target},
                                                    {"NewWWPN", Value::string("10000000C9A0F001")},
                                                    {"NewWWNN", Value::string("20000000C9A0F001")},
                                                    {"Type", Value::uint16(1)}});
    EXPECT_THAT(changed, returned(0));
    EXPECT_EQ(changed.out("WWNOperationStatus"), Value::uint16(8));
    rig.settle();
    const auto second = [&rig] { return rig.enumerate("NVRHBA_FCPort").instances.at(1).get("DeviceID").as_text(); };
    EXPECT_EQ(second(), second_port);

    EXPECT_THAT(firmware.call("ResetHBA", {{"Target", target}}), returned(0));
    rig.settle();
    EXPECT_EQ(second(), "10000000C9A0F001");
    // The old name is none any more, the new one is.
    EXPECT_THAT(names.call("ReadWWN", {{"Target", target}, {"Type", Value::uint16(3)}}), returned(32968));
    const Called read = names.call("ReadWWN", {{"Target", port(rig, 1)}, {"Type", Value::uint16(3)}});
    EXPECT_EQ(read.out("WWNN").as_text(), "20:00:00:00:c9:a0:f0:01");
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

// A server routes by class. A module that is handed a path of another class looks the method up there.
TEST(ServiceClientsOfAnotherClass, FindNoMethod)
{
    Rig rig;
    Service names(rig, wwn_class);
    const host::Answer ports = rig.names("NVRHBA_FCPort");
    const std::string device_id = ports.paths.at(0).find("DeviceID")->as_text();
    Entries entries;
    rig.settle();
    rig.forget_words();
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        for (const char* service : {wwn_class, boot_class}) {
            CMPIMethodMI* mi = entries.methods(service, broker, context);
            ASSERT_TRUE(mi) << service;
            CMPIStatus status = {CMPI_RC_OK, nullptr};
            CMPIObjectPath* path = broker->eft->newObjectPath(broker, "root/norvane", "NVRHBA_FCPort", &status);
            ASSERT_TRUE(path);
            path->ft->addKey(path, "DeviceID", reinterpret_cast<const CMPIValue*>(device_id.c_str()), CMPI_chars);
            CMPIArgs* in = broker->eft->newArgs(broker, &status);
            CMPIArgs* out = broker->eft->newArgs(broker, &status);
            CMPIValue target;
            target.ref = path;
            in->ft->addArg(in, "Target", &target, CMPI_ref);
            const char* method = service == wwn_class ? "GetWWNCapability" : "GetBootBIOSStatus";
            const CMPIStatus called = mi->ft->invokeMethod(mi, context, nullptr, path, method, in, out);
            EXPECT_EQ(called.rc, CMPI_RC_ERR_METHOD_NOT_FOUND) << service;
            in->ft->release(in);
            out->ft->release(out);
            path->ft->release(path);
            mi->ft->cleanup(mi, context, 1);
        }
    });
    for (const std::string& word : rig.words())
        EXPECT_THAT(word, testing::StartsWith("ProviderAgent::")); // it was loaded, and no more
}
