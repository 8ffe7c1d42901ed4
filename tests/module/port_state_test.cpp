// Adapters reset and ports switched by the firmware service, and two clients that do so at once.
#include <thread>

#include <gmock/gmock.h>

#include "tests/module/support/Firmware.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::IsEmpty;

namespace {

Words reset_opening()
{
    return {"Entering ResetHBA", gate};
}

const std::string reset_failed =
    "NVRHBA_SoftwareInstallationService_Provider::nvrcimResetHBA failed for target " + std::string(first_port);
const std::string reset_refused = "NVRHBA_SoftwareInstallationService_Provider invald port ...return";

Words known_logical_port()
{
    return {"Checking the FCPort", "Valid WWPN Passed"};
}

/// The words of a switch of the first port up to the library's answer.
Words switching(bool enable)
{
    const std::string flag = enable ? "1" : "0";
    return joined({{gate},
                   known_logical_port(),
                   {"Input PortEnable : " + flag, "Inside SetPortEnabled " + std::string(first_port) + " " + flag},
                   converted(first_port),
                   {"Invoking RM_SetPortEnabled API "}});
}

const std::string switched = "NVRHBA_SoftwareInstallationService_Provider::SetPortEnabled for target " +
                             std::string(first_port) + " is Successful. ";
const std::string not_switched =
    "NVRHBA_SoftwareInstallationService_Provider::SetPortEnabled failed for target " + std::string(first_port);

Called set_enabled(Firmware_Host& host, bool enable)
{
    return host.service.call("SetPortEnabled",
                             {{"Target", host.target()}, {"PortEnabled", host::Value::boolean(enable)}});
}

} // namespace

class Firmware_Service : public Every_Manner {};
NVR_IN_EVERY_MANNER(Firmware_Service);

TEST_P(Firmware_Service, IsStartedWithoutAWord)
{
    Firmware_Host host(*GetParam());
    for (const char* name : {"StartService", "startservice", "STARTSERVICE"}) {
        const Called called = host.service.call(name);
        EXPECT_THAT(called, returned(0)) << name;
        EXPECT_THAT(called.words, IsEmpty());
    }
}

TEST_P(Firmware_Service, ResetsAnAdapterAndReadsItAnew)
{
    Firmware_Host host(*GetParam());
    for (const char* name : {"ResetHBA", "resethba", "RESETHBA"}) {
        const Called called = host.service.call(name, {{"Target", host.target()}});
        EXPECT_THAT(called, returned(0));
        EXPECT_EQ(called.words, joined({reset_opening(),
                                        known_port(),
                                        converted(first_port),
                                        {"NVR_MethodWrapper::nvrcimReset"},
                                        local(),
                                        {"WWN 10:00:00:00:C9:A0:00:01 is reset",
                                         "NVRHBA_SoftwareInstallationService_Provider::nvrcimResetHBA for target " +
                                             std::string(first_port) + " is Successful.. Updating the Provider Data",
                                         gate_refreshing}}));
    }
    EXPECT_EQ(port_value(0, "resets"), "3");
    EXPECT_EQ(port_value(1, "resets"), "0");
    EXPECT_THAT(host.rig.server().report().violations, IsEmpty());
}

TEST_P(Firmware_Service, RefusesToResetWhatItDoesNotKnow)
{
    Firmware_Host host(*GetParam());
    Called called = host.service.call_on(host.service.stranger(), "ResetHBA");
    EXPECT_THAT(called, returned(33068));
    EXPECT_EQ(called.words, joined({reset_opening(), {"Invalid instance of Software Installation Service"}}));
    // A reference to another class does not reach the service.
    for (const Arguments& arguments : {Arguments{}, Arguments{{"Target", host::Value::null_of(CMPI_ref)}},
                                       Arguments{{"Target", no_port(host.rig)}}}) {
        called = host.service.call("ResetHBA", arguments);
        EXPECT_THAT(called, returned(32968));
        EXPECT_EQ(called.words, joined({reset_opening(), {reset_refused}}));
    }
    called = host.service.call("ResetHBA", {{"Target", unknown_port(host.rig)}});
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(called.words, joined({reset_opening(), no_known_port(), {reset_refused}}));
    EXPECT_EQ(calls("RM_ResetHBA"), 0u);
}

TEST_P(Firmware_Service, AResetThatFailsIsToldWithItsStatus)
{
    Firmware_Host host(*GetParam());
    const Words begin =
        joined({reset_opening(), known_port(), converted(first_port), {"NVR_MethodWrapper::nvrcimReset"}});
    add_fault("call = 'RM_IsLocalHBA', value = 0");
    Called called = host.service.call("ResetHBA", {{"Target", host.target()}});
    EXPECT_THAT(called, returned(40001));
    EXPECT_EQ(called.words, joined({begin, not_local(), {reset_failed}}));
    clear_faults();
    add_fault("call = 'RM_ResetHBA', absent = true");
    EXPECT_THAT(host.service.call("ResetHBA", {{"Target", host.target()}}), returned(40001));
    clear_faults();
    add_fault("call = 'RM_ResetHBA', status = 64");
    called = host.service.call("ResetHBA", {{"Target", host.target()}});
    EXPECT_THAT(called, returned(40064));
    EXPECT_EQ(called.words, joined({begin, local(), {status_line(64), reset_failed}}));
}

TEST_P(Firmware_Service, SwitchesAPortOffAndOn)
{
    Firmware_Host host(*GetParam());
    for (const bool enable : {false, true}) {
        const Called called = set_enabled(host, enable);
        EXPECT_THAT(called, returned(0));
        EXPECT_EQ(called.words, joined({switching(enable),
                                        {"Please reset the HBA to activate the new setting\n",
                                         "Exiting SetPortEnabled in SetPortEnabled \n", switched}}));
        EXPECT_EQ(port_value(0, "enabled"), enable ? "1" : "0");
    }
    EXPECT_THAT(
        host.service.call("setportenabled", {{"Target", host.target()}, {"PortEnabled", host::Value::boolean(true)}}),
        returned(0));
}

TEST_P(Firmware_Service, TellsOfAResetOnlyWhereOneIsNeeded)
{
    Firmware_Host host(*GetParam(), "[[adapter]]\n[[adapter.port]]\nenable_needs_reset = false\n");
    const Called called = set_enabled(host, false);
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, joined({switching(false), {"Exiting SetPortEnabled in SetPortEnabled \n", switched}}));
}

TEST_P(Firmware_Service, BootCodeKeepsAPortAsItIs)
{
    Firmware_Host host(*GetParam(), "[[adapter]]\n[[adapter.port]]\nboot_code = 1\n");
    const Called called = set_enabled(host, false);
    EXPECT_THAT(called, returned(40221));
    EXPECT_EQ(called.words, joined({switching(false),
                                    {"\nERROR: FMCMD_SetPortEnabled ",
                                     "One or more Port Functions have Boot Code enabled. Enable through EnableBootCode",
                                     "Please disable Boot Code and try again.\n", not_switched}}));
    EXPECT_EQ(port_value(0, "enabled"), "1");
}

TEST_P(Firmware_Service, RefusesToSwitchWhatItDoesNotKnow)
{
    Firmware_Host host(*GetParam());
    const host::Value on = host::Value::boolean(true);
    Called called = host.service.call_on(host.service.stranger(), "SetPortEnabled", {{"PortEnabled", on}});
    EXPECT_THAT(called, returned(33068));
    EXPECT_EQ(called.words, (Words{gate, "Invalid instance of Software Installation Service"}));
    for (const Arguments& arguments : {Arguments{}, Arguments{{"Target", host::Value::null_of(CMPI_ref)}},
                                       Arguments{{"Target", no_port(host.rig)}}}) {
        called = host.service.call("SetPortEnabled", arguments);
        EXPECT_THAT(called, returned(32968));
        EXPECT_EQ(called.words, (Words{gate, "Invalid Port is passed"}));
    }
    called = host.service.call("SetPortEnabled", {{"Target", unknown_port(host.rig)}, {"PortEnabled", on}});
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(called.words,
              (Words{gate, "Checking the FCPort", "Could not find the passed LogicalPort in the provider resource map",
                     "NVRHBA_SoftwareInstallationService_Provider invalid port passed"}));
    for (const Arguments& arguments :
         {Arguments{{"Target", host.target()}},
          Arguments{{"Target", host.target()}, {"PortEnabled", host::Value::null_of(CMPI_boolean)}}}) {
        called = host.service.call("SetPortEnabled", arguments);
        EXPECT_THAT(called, returned(32968));
        EXPECT_EQ(called.words, joined({{gate}, known_logical_port()})) << "no value is refused without a word";
    }
    EXPECT_EQ(calls("RM_SetPortEnabled"), 0u);
}

TEST(Firmware_Service_Once, EachStatusOfResetAndSwitchComesBackBehindFortyThousand)
{
    Firmware_Host host;
    for (std::uint32_t status = 1; status <= 260; status++) {
        clear_faults();
        add_fault("call = 'RM_ResetHBA', status = " + std::to_string(status));
        add_fault("call = 'RM_SetPortEnabled', status = " + std::to_string(status));
        Called called = host.service.call("ResetHBA", {{"Target", host.target()}});
        EXPECT_THAT(called, returned(40000 + status));
        EXPECT_EQ(called.words.end()[-2], status_line(status));
        called = set_enabled(host, true);
        EXPECT_THAT(called, returned(40000 + status));
        if (status == 221) continue;
        EXPECT_EQ(called.words, joined({switching(true),
                                        {"\nERROR: FMCMD_SetPortEnabled: " + std::to_string(status),
                                         "RM_SetPortEnabled() Failed.\n", not_switched}}));
    }
}

TEST_P(Firmware_Service, ClientsThatCallAtOnceWaitForEachOther)
{
    Firmware_Host host(*GetParam());
    write_image("an.image");
    const host::Value target = host.target(), other = host.target(1);
    host::Host& server = host.rig.server();
    const host::Path path = host.service.path();
    std::vector<std::thread> clients;
    std::vector<host::Answer> answers(9);
    for (std::size_t i = 0; i < answers.size(); i += 3) {
        clients.emplace_back([&, i] {
            answers[i] =
                server.call(path, "InstallFromURI", {{"URI", host::Value::string("an.image")}, {"Target", target}});
        });
        clients.emplace_back([&, i] { answers[i + 1] = server.call(path, "ResetHBA", {{"Target", other}}); });
        clients.emplace_back([&, i] {
            answers[i + 2] =
                server.call(path, "SetPortEnabled", {{"Target", other}, {"PortEnabled", host::Value::boolean(true)}});
        });
    }
    for (std::thread& client : clients)
        client.join();
    for (const host::Answer& answer : answers) {
        ASSERT_THAT(answer, succeeded());
        EXPECT_EQ(answer.value.as_uint(), 0u);
    }
    host.rig.settle();
    EXPECT_EQ(port_value(1, "resets"), "3");
    EXPECT_EQ(port_value(0, "firmware"), new_version);
    EXPECT_THAT(server.report().violations, IsEmpty());
}
