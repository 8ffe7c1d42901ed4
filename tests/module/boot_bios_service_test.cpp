// The boot code of an adapter, switched and read through the service.
#include <gmock/gmock.h>

#include "tests/module/support/Service.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Value;
using testing::IsEmpty;

namespace {

constexpr char service_class[] = "NVRHBA_BootBIOSService";

/// A method, and its own words.
struct Method {
    const char* name;
    const char* entry;
    const char* no_target;
};

constexpr Method enable = {"EnableBootBIOS", "NVRHBA_BootBIOSService_Provider::EnableBootBIOS()",
                           "NVRHBA_BootBIOSService_Provider EnableBootBIOS invald fc port ...return"};
constexpr Method disable = {"DisableBootBIOS", "NVRHBA_BootBIOSService_Provider::DisableBootBIOS()",
                            "NVRHBA_BootBIOSService_Provider DisableBooTBIOSinvald fc port ...return"};
constexpr Method get_status = {"GetBootBIOSStatus", "NVRHBA_BootBIOSService_Provider::GetBootBIOSStatus",
                               "NVRHBA_BootBIOSService_Provider GetBootBIOS invald fc port ...return"};

Words opened(const Method& method, const std::string& device_id = first_port)
{
    return joined({{method.entry, gate}, known_port(), converted(device_id)});
}

/// What switching logs behind that, up to the library's call; `is_local` puts the question and its answer in between.
Words switching(const Method& method, const Words& is_local, const std::string& device_id = first_port)
{
    return joined({opened(method, device_id),
                   {std::string("Entering ") + method.entry + ": nvrcimSetBootBiosState",
                    "entering NVR_MethodWrapper::nvrcimSetBootBiosState"},
                   is_local});
}

Words reading(const Words& is_local, const std::string& device_id = first_port)
{
    return joined({opened(get_status, device_id), {"entering NVR_MethodWrapper::nvrcimGetBootBiosState"}, is_local});
}

Words state_is(unsigned value)
{
    return {"_BootCodeEnabled: [ " + std::to_string(value) + " ]",
            "********* biosState Value: " + std::to_string(value),
            "NVRHBA_BootBIOSService_Provider::GetBootBIOSStatus O.K."};
}

const std::string set_done = "NVRHBA_BootBIOSService_Provider::nvrcimSetBootBiosState O.K.";
const std::string set_failed = "NVRHBA_BootBIOSService_Provider::nvrcimSetBootBiosState failed";
const std::string get_failed = "NVRHBA_BootBIOSService_Provider::nvrcimGetBootBiosState failed";

} // namespace

class BootBiosService : public Every_Manner {};
NVR_IN_EVERY_MANNER(BootBiosService);

TEST_P(BootBiosService, IsStartedWithoutAWord)
{
    Rig rig({*GetParam()});
    Service service(rig, service_class);
    for (const char* name : {"StartService", "startservice", "STARTSERVICE"}) {
        const Called called = service.call(name);
        EXPECT_THAT(called, returned(0)) << name;
        EXPECT_THAT(called.words, IsEmpty());
    }
}

TEST_P(BootBiosService, SwitchesTheBootCodeAndReadsIt)
{
    Rig rig({*GetParam()});
    Service service(rig, service_class);
    const Called enabled = service.call("EnableBootBIOS", {{"Target", port(rig)}});
    EXPECT_THAT(enabled, returned(0));
    EXPECT_EQ(enabled.words, joined({switching(enable, local()), {"CtrlWord is  E", set_done}}));
    EXPECT_EQ(port_value(0, "boot_code"), "1");
    const Called on = service.call("GetBootBIOSStatus", {{"Target", port(rig)}});
    EXPECT_THAT(on, returned(0));
    EXPECT_EQ(on.out("nBootBIOSStatus"), Value::uint32(1));
    EXPECT_EQ(on.words, joined({reading(local()), state_is(1)}));

    const Called disabled = service.call("DisableBootBIOS", {{"Target", port(rig)}});
    EXPECT_THAT(disabled, returned(0));
    EXPECT_EQ(disabled.words, joined({switching(disable, local()), {"CtrlWord is  D", set_done}}));
    EXPECT_EQ(port_value(0, "boot_code"), "0");
    const Called off = service.call("GetBootBIOSStatus", {{"Target", port(rig)}});
    EXPECT_EQ(off.out("nBootBIOSStatus"), Value::uint32(0));
    EXPECT_EQ(off.words, joined({reading(local()), state_is(0)}));
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(BootBiosService, TakesMethodsAndArgumentsInAnyCase)
{
    Rig rig({*GetParam()});
    Service service(rig, service_class);
    EXPECT_THAT(service.call("enablebootbios", {{"TARGET", port(rig, 2)}}), returned(0));
    const Called told = service.call("GETBOOTBIOSSTATUS", {{"target", port(rig, 2)}});
    EXPECT_EQ(told.out("nBootBIOSStatus"), Value::uint32(1));
    EXPECT_THAT(service.call("disableBOOTbios", {{"tARGET", port(rig, 2)}}), returned(0));
}

TEST_P(BootBiosService, RefusesWhatItIsNotMeantFor)
{
    Rig rig({*GetParam()});
    Service service(rig, service_class);
    for (const Method& method : {enable, disable, get_status}) {
        const Arguments without_target[] = {{}, {{"Target", Value::null_of(CMPI_ref)}}, {{"Target", no_port(rig)}}};
        for (const Arguments& arguments : without_target) {
            const Called called = service.call(method.name, arguments);
            EXPECT_THAT(called, returned(32968)) << method.name;
            EXPECT_EQ(called.words, (Words{method.entry, gate, method.no_target}));
        }
        for (const Value& target : {unknown_port(rig), port_with_id(rig, Value::string(""))}) {
            const Called called = service.call(method.name, {{"Target", target}});
            EXPECT_THAT(called, returned(32968)) << method.name;
            EXPECT_EQ(called.words, joined({{method.entry, gate},
                                            no_known_port(),
                                            {"NVRHBA_BootBIOSService_Provider invald fc port ...return"}}));
            EXPECT_TRUE(called.out("nBootBIOSStatus").is_null());
        }
        const Called called = service.call_on(service.stranger(), method.name, {{"Target", unknown_port(rig)}});
        EXPECT_THAT(called, returned(33068)) << method.name;
        EXPECT_EQ(called.words, (Words{method.entry, gate, "Invalid instance of Boot BIOS Service"}));
    }
    EXPECT_EQ(calls("RM_SetBootBiosState"), 0u);
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(BootBiosService, RefusesAPortThatIsNotLocal)
{
    Rig rig({*GetParam()});
    Service service(rig, service_class);
    set_port(1, "local", 0);
    for (const Method& method : {enable, disable}) {
        const Called called = service.call(method.name, {{"Target", port(rig, 1)}});
        EXPECT_THAT(called, returned(40001)) << method.name;
        EXPECT_EQ(called.words, joined({switching(method, not_local(), second_port), {set_failed}}));
    }
    const Called called = service.call("GetBootBIOSStatus", {{"Target", port(rig, 1)}});
    EXPECT_THAT(called, returned(40001));
    EXPECT_EQ(called.words, joined({reading(not_local(), second_port), {get_failed}}));
    EXPECT_TRUE(called.out("nBootBIOSStatus").is_null());
    EXPECT_EQ(calls("RM_SetBootBiosState"), 0u);
}

TEST(BootBiosServiceSwitching, PassesEachStatusOfTheLibraryOn)
{
    Rig rig({host::Manner::strict(), "small"});
    Service service(rig, service_class);
    const Value target = port(rig);
    for (unsigned status = 1; status <= 260; status++) {
        clear_faults();
        add_fault("call = \"RM_SetBootBiosState\", status = " + std::to_string(status));
        const Method& method = status % 2 ? enable : disable;
        const std::uint64_t before = calls("RM_SetBootBiosState");
        const Called called = service.call(method.name, {{"Target", target}});
        EXPECT_THAT(called, returned(40000 + status));
        EXPECT_EQ(called.words,
                  joined({switching(method, local()), {status % 2 ? "CtrlWord is  E" : "CtrlWord is  D", set_failed}}));
        EXPECT_EQ(calls("RM_SetBootBiosState"), before + 1);
    }
}

TEST(BootBiosServiceReading, TellsOneFailureForEachStatusOfTheLibrary)
{
    Rig rig({host::Manner::strict(), "small"});
    Service service(rig, service_class);
    const Value target = port(rig);
    for (unsigned status = 1; status <= 260; status++) {
        clear_faults();
        add_fault("call = \"RM_GetHBAAttributes\", status = " + std::to_string(status));
        const Called called = service.call("GetBootBIOSStatus", {{"Target", target}});
        EXPECT_THAT(called, returned(40001));
        EXPECT_TRUE(called.out("nBootBIOSStatus").is_null());
        EXPECT_EQ(called.words,
                  joined({reading(local()),
                          {"ERROR: RM_GetHBAAttributes call failed (" + std::to_string(status) + ")", get_failed}}));
    }
}

TEST(BootBiosServiceReading, TellsTheAttributeAsItIs)
{
    Rig rig;
    Service service(rig, service_class);
    set_port(0, "attribute:532", 4294967295);
    Called called = service.call("GetBootBIOSStatus", {{"Target", port(rig)}});
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.out("nBootBIOSStatus"), Value::uint32(4294967295));

    // A block without it, and one that is no block, read as 0.
    add_fault("call = \"RM_GetAttributeValue\", number = 532, status = 2");
    called = service.call("GetBootBIOSStatus", {{"Target", port(rig)}});
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.out("nBootBIOSStatus"), Value::uint32(0));
    EXPECT_EQ(called.words,
              joined({reading(local()),
                      {"ERROR: RM_GetHBAAttributeValue HA__BootCodeEnabled call failed (2)",
                       "********* biosState Value: 0", "NVRHBA_BootBIOSService_Provider::GetBootBIOSStatus O.K."}}));
    clear_faults();
    add_fault("call = \"RM_GetHBAAttributes\", damage = \"garbage\"");
    called = service.call("GetBootBIOSStatus", {{"Target", port(rig)}});
    EXPECT_THAT(called, returned(0));
    EXPECT_EQ(called.out("nBootBIOSStatus"), Value::uint32(0));
}

TEST(BootBiosServiceRefresh, IsNotAskedFor)
{
    Rig rig;
    Service service(rig, service_class);
    rig.settle();
    const std::size_t before = rig.refreshes();
    EXPECT_THAT(service.call("EnableBootBIOS", {{"Target", port(rig)}}), returned(0));
    EXPECT_THAT(service.call("GetBootBIOSStatus", {{"Target", port(rig)}}), returned(0));
    EXPECT_THAT(service.call("DisableBootBIOS", {{"Target", port(rig)}}), returned(0));
    rig.settle();
    EXPECT_EQ(rig.refreshes(), before);
}
