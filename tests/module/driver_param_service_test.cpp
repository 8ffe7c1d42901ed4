// The driver's parameters, set by the service: what reaches the library, and what comes back.
#include <gmock/gmock.h>

#include "simulator/Calls.h"
#include "tests/module/support/Service.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Value;
using testing::Contains;
using testing::ElementsAre;
using testing::Not;

namespace {

constexpr char entry[] = "NVRHBA_FCHBADriverParamService_Provider::SetDriverParameter()";
constexpr char provider_failed[] = "NVRHBA_FCHBADriverParamService_Provider::nvrcimSetDriverParam failed";

Arguments arguments(const Value& target, const std::string& name, const std::string& value, bool permanent = false,
                    bool global = false)
{
    return {{"Target", target},
            {"bPermanent", Value::boolean(permanent)},
            {"bGlobal", Value::boolean(global)},
            {"strParam", Value::string(name)},
            {"strValue", Value::string(value)}};
}

/// Up to the library operation's own entry.
Words begun(const std::string& id = first_port)
{
    return joined({{entry, gate},
                   known_port(),
                   {id},
                   converted(id),
                   {"Entering NVRHBA_FCHBADriverParamService_Provider::SetDriverParam(): nvrcimSetDriverParam",
                    "NVR_MethodWrapper::nvrcimSetDriverParam()"}});
}

/// From there to the library's call.
Words asked(const std::string& flags, const std::string& name, const std::string& value, int code)
{
    return joined(
        {local(),
         {"nvrcimSetDriverParam Parameters ::",
          flags + " pDriverParam=" + name + " pVal=" + value + ", deviceID=" + first_port,
          "pParamStr:[" + name + "=" + value + "], Ccw:[" + std::to_string(code) + "]", "Calling RM_SetDriverParam"}});
}

/// The simulated driver's record of a parameter, of the host's ports in order or of all.
RM_DRIVERPARAM record(const std::string& name, unsigned port, bool global = false)
{
    HBA_WWN wwn = {{0x10, 0, 0, 0, 0xC9, 0xA0, 0, static_cast<HBA_UINT8>(port + 1)}};
    std::vector<RM_DRIVERPARAM> list(200);
    uint32_t count = 200;
    const uint32_t status = global ? nvrsim_RM_GetDriverParamsGlobal(wwn, list.data(), &count)
                                   : nvrsim_RM_GetDriverParams(wwn, list.data(), &count);
    EXPECT_EQ(status, 0u);
    for (uint32_t i = 0; i < count; i++)
        if (list[i].name == name) return list[i];
    throw std::runtime_error("there is no parameter " + name);
}

} // namespace

class DriverParamService : public Every_Manner {
protected:
    Rig rig{{*GetParam()}};
    Service service{rig, "NVRHBA_FCHBADriverParamService"};
};
NVR_IN_EVERY_MANNER(DriverParamService);

TEST_P(DriverParamService, SetsAParameterOfOnePortAndAsksForNoRefresh)
{
    const Called called = service.call("SetDriverParameter", arguments(port(rig), "lun-queue-depth", "64"));
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.words, joined({begun(),
                                    asked("CW1=0 CW2=0", "lun-queue-depth", "64", 0),
                                    {"NVRHBA_FCHBADriverParamService_Provider::nvrcimSetDriverParam Succeeded"}}));
    EXPECT_EQ(record("lun-queue-depth", 0).currentValue, 64u);
    EXPECT_EQ(record("lun-queue-depth", 0).defaultValue, 30u);
    EXPECT_EQ(record("lun-queue-depth", 1).currentValue, 30u);
    EXPECT_EQ(record("lun-queue-depth", 0, true).currentValue, 30u);
}

TEST_P(DriverParamService, GlobalAndPermanentMakeTheCode)
{
    struct Row {
        bool global, permanent;
        int code;
    };
    for (const Row& row : {Row{false, false, 0}, Row{false, true, 1}, Row{true, false, 2}, Row{true, true, 3}}) {
        const std::string value = std::to_string(40 + row.code);
        const std::string flags = "CW1=" + std::to_string(row.global) + " CW2=" + std::to_string(row.permanent);
        const Called called =
            service.call("SetDriverParameter", arguments(port(rig), "nodev-tmo", value, row.permanent, row.global));
        EXPECT_THAT(called, returned(0));
        EXPECT_EQ(called.words, joined({begun(),
                                        asked(flags, "nodev-tmo", value, row.code),
                                        {"NVRHBA_FCHBADriverParamService_Provider::nvrcimSetDriverParam Succeeded"}}));
        EXPECT_EQ(record("nodev-tmo", 0).currentValue, 40u + static_cast<unsigned>(row.code));
    }
    // What the last ones reached: all ports, and their lasting values.
    EXPECT_EQ(record("nodev-tmo", 3).currentValue, 43u);
    EXPECT_EQ(record("nodev-tmo", 3).defaultValue, 43u);
    EXPECT_EQ(record("nodev-tmo", 0, true).defaultValue, 43u);
}

TEST_P(DriverParamService, PublishesTheNewValueWithTheNextRefresh)
{
    ASSERT_THAT(service.call("SetDriverParameter", arguments(port(rig), "lun-queue-depth", "99")), returned(0));
    rig.refresh();
    bool found = false;
    for (const host::Instance& param : rig.enumerate("NVRHBA_DriverParams").instances)
        if (param.get("InstanceID").as_text() == std::string(first_port) + ":lun-queue-depth") {
            found = true;
            EXPECT_EQ(param.get("current").as_uint(), 99u);
        }
    EXPECT_TRUE(found);
}

TEST_P(DriverParamService, AnswersInAnyCase)
{
    const Called called = service.call("SETdriverPARAMETER", arguments(port(rig), "lun-queue-depth", "65"));
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(record("lun-queue-depth", 0).currentValue, 65u);
    EXPECT_THAT(service.call("startservice"), returned(0));
}

TEST_P(DriverParamService, ATargetThatIsNoPortIsRefused)
{
    const Words null_target = {entry, gate,
                               "NVRHBA_FCHBADriverParamService_Provider SetDriverParameter invald fc port ...return"};
    Called called = service.call("SetDriverParameter");
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(called.words, null_target);
    // One of another class never gets past the conversion of arguments.
    called = service.call("SetDriverParameter", arguments(no_port(rig), "lun-queue-depth", "64"));
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(called.words, null_target);

    called = service.call("SetDriverParameter", arguments(unknown_port(rig), "lun-queue-depth", "64"));
    EXPECT_THAT(called, returned(32968));
    EXPECT_EQ(
        called.words,
        joined({{entry, gate}, no_known_port(), {"NVRHBA_FCHBADriverParamService_Provider invald fc port ...return"}}));
    EXPECT_EQ(calls("RM_SetDriverParam"), 0u);
}

TEST_P(DriverParamService, APortThatIsNotLocalIsRefused)
{
    add_fault("call = \"RM_IsLocalHBA\", value = 0");
    const Called called = service.call("SetDriverParameter", arguments(port(rig), "lun-queue-depth", "64"));
    EXPECT_THAT(called, returned(40001));
    EXPECT_EQ(called.words, joined({begun(), not_local(), {provider_failed}}));
    EXPECT_EQ(calls("RM_SetDriverParam"), 0u);
}

TEST_P(DriverParamService, AnotherServiceIsRefused)
{
    const Called called =
        service.call_on(service.stranger(), "SetDriverParameter", arguments(port(rig), "lun-queue-depth", "64"));
    EXPECT_THAT(called, returned(33068));
    EXPECT_EQ(called.words, Words({entry, gate, "Invalid instance of HBA Driver Parameter Service"}));
    EXPECT_EQ(calls("RM_SetDriverParam"), 0u);
}

TEST_P(DriverParamService, TextsThatAreMissingAreRefused)
{
    Called called = service.call("SetDriverParameter", {{"Target", port(rig)}});
    EXPECT_THAT(called, returned(40001));
    EXPECT_EQ(called.words,
              joined({begun(), local(), {"Null pointer assignment in argument pDriverParam", provider_failed}}));
    called = service.call("SetDriverParameter", {{"Target", port(rig)}, {"strParam", Value::string("x")}});
    EXPECT_THAT(called, returned(40001));
    EXPECT_EQ(called.words, joined({begun(), local(), {"Null pointer assignment in argument pVal", provider_failed}}));
    EXPECT_EQ(calls("RM_SetDriverParam"), 0u);
}

TEST_P(DriverParamService, FlagsThatAreMissingAreFalse)
{
    const Called called = service.call(
        "SetDriverParameter",
        {{"Target", port(rig)}, {"strParam", Value::string("lun-queue-depth")}, {"strValue", Value::string("66")}});
    EXPECT_THAT(called, returned(0));
    EXPECT_THAT(called.words, Contains("pParamStr:[lun-queue-depth=66], Ccw:[0]"));
}

TEST_P(DriverParamService, ValuesAreTheLibrarysToRefuse)
{
    struct Row {
        const char* name;
        const char* value;
    };
    for (const Row& row : {Row{"lun-queue-depth", "0"}, Row{"lun-queue-depth", "513"}, Row{"lun-queue-depth", "many"},
                           Row{"lun-queue-depth", ""}, Row{"", "64"}, Row{"nobody", "1"}, Row{"lun-queue-depth=", "64"},
                           Row{"lun-queue-depth", "%s%n"}}) {
        const Called called = service.call("SetDriverParameter", arguments(port(rig), row.name, row.value));
        EXPECT_THAT(called, returned(40004)) << row.name << '=' << row.value;
        EXPECT_EQ(called.words, joined({begun(),
                                        asked("CW1=0 CW2=0", row.name, row.value, 0),
                                        {"RM_SetDriverParam fails with status : 4", provider_failed}}))
            << row.name << '=' << row.value;
    }
    EXPECT_EQ(record("lun-queue-depth", 0).currentValue, 30u);
}

TEST_P(DriverParamService, TextsThatDoNotFitAreRefused)
{
    // With the sign between them, 255 characters.
    const std::string name(100, 'n'), value(154, '1');
    EXPECT_THAT(service.call("SetDriverParameter", arguments(port(rig), name, value)), returned(40004));
    EXPECT_EQ(calls("RM_SetDriverParam"), 1u);
    for (const std::string& longer : {value + "1", std::string(65536, '1')}) {
        const Called called = service.call("SetDriverParameter", arguments(port(rig), name, longer));
        EXPECT_THAT(called, returned(40001)) << longer.size();
        EXPECT_THAT(called.words, Not(Contains("Calling RM_SetDriverParam")));
        ASSERT_GE(called.words.size(), 2u);
        EXPECT_EQ(called.words[called.words.size() - 2], "INVALID pParamStr");
        EXPECT_EQ(called.words.back(), provider_failed);
    }
    EXPECT_THAT(service.call("SetDriverParameter", arguments(port(rig), std::string(65536, 'n'), "1")),
                returned(40001));
    EXPECT_EQ(calls("RM_SetDriverParam"), 1u);
}

TEST(DriverParamServiceStatuses, EachComesBackAbove40000)
{
    Rig rig;
    Service service(rig, "NVRHBA_FCHBADriverParamService");
    const Arguments all = arguments(port(rig), "lun-queue-depth", "64", true, true);
    for (std::uint32_t status = 1; status <= 260; status++) {
        clear_faults();
        add_fault("call = \"RM_SetDriverParam\", status = " + std::to_string(status));
        const Called called = service.call("SetDriverParameter", all);
        EXPECT_THAT(called, returned(40000 + status));
        EXPECT_EQ(called.words,
                  joined({begun(),
                          asked("CW1=1 CW2=1", "lun-queue-depth", "64", 3),
                          {"RM_SetDriverParam fails with status : " + std::to_string(status), provider_failed}}));
        clear_faults();
        add_fault("call = \"RM_IsLocalHBA\", status = " + std::to_string(status));
        EXPECT_THAT(service.call("SetDriverParameter", all), returned(40001)) << status;
    }
    EXPECT_EQ(record("lun-queue-depth", 0).currentValue, 30u);
}

TEST(DriverParamServiceStatuses, AMissingFunctionIsStatusOne)
{
    Rig rig;
    Service service(rig, "NVRHBA_FCHBADriverParamService");
    add_fault("call = \"RM_SetDriverParam\", absent = true");
    EXPECT_THAT(service.call("SetDriverParameter", arguments(port(rig), "lun-queue-depth", "64")), returned(40001));
}
