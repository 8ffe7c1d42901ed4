// The beacon of a port, switched by a change of its LocationIndicator.
#include <gmock/gmock.h>

#include "tests/module/support/Entries.h"
#include "tests/module/support/Service.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using host::Value;
using testing::IsEmpty;
using namespace std::chrono_literals;

namespace {

constexpr char port_class[] = "NVRHBA_FCPort";
constexpr char property[] = "LocationIndicator";
const std::vector<std::string> only_indicator = {property};

/// A change and the words of its thread.
struct Changed {
    host::Answer answer;
    Words words;
};

Changed modify(Rig& rig, const host::Instance& port, host::Property_List properties = only_indicator)
{
    rig.settle();
    const std::streamoff before = rig.log_size();
    Changed changed;
    changed.answer = rig.server().modify(port, std::move(properties));
    changed.words = words_of_thread(rig.lines_from(before));
    return changed;
}

host::Instance port_with(Rig& rig, const Value& indicator, std::size_t place = 0)
{
    host::Instance port = rig.enumerate(port_class).instances.at(place);
    port.set(property, indicator);
    return port;
}

host::Instance port_with(Rig& rig, unsigned indicator, std::size_t place = 0)
{
    return port_with(rig, Value::uint16(static_cast<std::uint16_t>(indicator)), place);
}

Value shown(Rig& rig, std::size_t place = 0)
{
    return rig.enumerate(port_class).instances.at(place).get(property);
}

const Words start = {gate, "NVRHBA_FCPort_Provider::modify_instance"};

Words switched(unsigned value, const std::string& device_id = first_port)
{
    return joined({start,
                   {"Input BeaconState : " + std::to_string(value)},
                   converted(device_id),
                   {"NVR_DiagTestFunc::SetBeaconState"}});
}

const Words done = {"Successfully set the beacon state", "Beacon state modified successfully"};

} // namespace

class FcPortBeacon : public Every_Manner {};
NVR_IN_EVERY_MANNER(FcPortBeacon);

TEST_P(FcPortBeacon, IsSwitchedOnAndOff)
{
    Rig rig({*GetParam()});
    EXPECT_EQ(shown(rig), Value::uint16(3));
    const Changed on = modify(rig, port_with(rig, 2));
    EXPECT_THAT(on.answer, succeeded());
    EXPECT_EQ(on.words, joined({switched(2), done}));
    EXPECT_EQ(port_value(0, "beacon"), "3");
    EXPECT_EQ(shown(rig), Value::uint16(2));
    EXPECT_EQ(shown(rig, 1), Value::uint16(3));

    const Changed off = modify(rig, port_with(rig, 3));
    EXPECT_THAT(off.answer, succeeded());
    EXPECT_EQ(off.words, joined({switched(3), done}));
    EXPECT_EQ(port_value(0, "beacon"), "2");
    EXPECT_EQ(shown(rig), Value::uint16(3));
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(FcPortBeacon, IsSwitchedByAWholeInstanceToo)
{
    Rig rig({*GetParam()});
    const Changed on = modify(rig, port_with(rig, 2, 1), {});
    EXPECT_THAT(on.answer, succeeded());
    EXPECT_EQ(on.words, joined({switched(2, second_port), done}));
    EXPECT_EQ(port_value(1, "beacon"), "3");
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
}

TEST_P(FcPortBeacon, StaysAsTheLibraryTellsItAfterARefresh)
{
    Rig rig({*GetParam(), "typical", refreshing_settings});
    EXPECT_THAT(modify(rig, port_with(rig, 2)).answer, succeeded());
    rig.refresh();
    EXPECT_EQ(shown(rig), Value::uint16(2));
    set_port(0, "beacon", 2);
    rig.refresh();
    EXPECT_EQ(shown(rig), Value::uint16(3));
}

TEST_P(FcPortBeacon, HasNoOtherValues)
{
    Rig rig({*GetParam()});
    for (unsigned value : {0u, 1u, 4u, 5u, 65535u}) {
        const Changed changed = modify(rig, port_with(rig, value));
        EXPECT_THAT(changed.answer, failed_with(CMPI_RC_ERR_INVALID_PARAMETER)) << value;
        EXPECT_EQ(changed.words, joined({start,
                                         {"Input BeaconState : " + std::to_string(value),
                                          "Invalid LocationIndicator, Valid values are '2' or '3'"}}));
    }
    EXPECT_EQ(calls("RM_DiagBeacon"), 0u);
    EXPECT_EQ(shown(rig), Value::uint16(3));
}

// Nothing else of a port can be changed, and a request that does not change the beacon is refused.
TEST_P(FcPortBeacon, IsAllThatCanBeChanged)
{
    Rig rig({*GetParam()});
    host::Instance port = port_with(rig, 2);
    port.set("Description", Value::string("another one"));
    const Changed other = modify(rig, port, std::vector<std::string>{"Description"});
    EXPECT_THAT(other.answer, failed_with(CMPI_RC_ERR_INVALID_PARAMETER));
    EXPECT_EQ(other.words, start);
    EXPECT_THAT(modify(rig, port, std::vector<std::string>{}).answer, failed_with(CMPI_RC_ERR_INVALID_PARAMETER));
    const Changed null = modify(rig, port_with(rig, Value::null_of(CMPI_uint16)));
    EXPECT_THAT(null.answer, failed_with(CMPI_RC_ERR_INVALID_PARAMETER));
    EXPECT_EQ(null.words, start);
    EXPECT_THAT(modify(rig, port_with(rig, Value::null_of(CMPI_uint16)), {}).answer,
                failed_with(CMPI_RC_ERR_INVALID_PARAMETER));
    EXPECT_EQ(calls("RM_DiagBeacon"), 0u);

    // Beside the beacon, other properties are passed over.
    EXPECT_THAT(modify(rig, port, {}).answer, succeeded());
    EXPECT_NE(rig.enumerate(port_class).instances.at(0).get("Description").as_text(), "another one");
}

TEST_P(FcPortBeacon, OfAnUnknownPortIsRefused)
{
    Rig rig({*GetParam()});
    host::Instance port = port_with(rig, 2);
    for (const char* key : {"DeviceID", "SystemName", "CreationClassName", "SystemCreationClassName"}) {
        host::Instance stranger = port;
        stranger.set(key, Value::string("Nobody"));
        stranger.path.set(key, Value::string("Nobody"));
        const Changed changed = modify(rig, stranger);
        EXPECT_THAT(changed.answer, failed_with(CMPI_RC_ERR_INVALID_PARAMETER)) << key;
        EXPECT_EQ(changed.words, joined({start, {"Invalid instance of NVRHBA_FCPort Data"}})) << key;
    }
    EXPECT_EQ(calls("RM_DiagBeacon"), 0u);
}

// It is not asked whether the port is local.
TEST_P(FcPortBeacon, OfAPortThatIsNotLocalIsTheLibrarysToRefuse)
{
    Rig rig({*GetParam()});
    const host::Instance on = port_with(rig, 2);
    rig.settle();
    const std::uint64_t asked = calls("RM_IsLocalHBA");
    set_port(0, "local", 0);
    const Changed changed = modify(rig, on);
    EXPECT_THAT(changed.answer, succeeded());
    EXPECT_EQ(changed.words, joined({switched(2), done}));
    EXPECT_EQ(calls("RM_IsLocalHBA"), asked);
}

// A server routes by class; an instance of another known class that reaches the module all the same is not read as a
// port.
TEST(FcPortBeaconOfAnotherClass, IsRefused)
{
    Rig rig;
    const host::Path port = rig.names(port_class).paths.at(0);
    Entries entries;
    rig.settle();
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        CMPIInstanceMI* mi = entries.instances(port_class, broker, context);
        ASSERT_TRUE(mi);
        // One with the same key, and one of a class that is far smaller.
        for (const char* other : {"NVRHBA_PortController", "NVRHBA_ControlledBy", "CIM_FCPort"}) {
            CMPIStatus status = {CMPI_RC_OK, nullptr};
            CMPIObjectPath* path = broker->eft->newObjectPath(broker, "root/norvane", other, &status);
            ASSERT_TRUE(path) << other;
            const std::string device_id = port.find("DeviceID")->as_text();
            path->ft->addKey(path, "DeviceID", reinterpret_cast<const CMPIValue*>(device_id.c_str()), CMPI_chars);
            CMPIInstance* instance = broker->eft->newInstance(broker, path, &status);
            ASSERT_TRUE(instance) << other;
            CMPIValue on;
            on.uint16 = 2;
            instance->ft->setProperty(instance, property, &on, CMPI_uint16);
            EXPECT_EQ(mi->ft->modifyInstance(mi, context, nullptr, path, instance, nullptr).rc,
                      CMPI_RC_ERR_INVALID_PARAMETER)
                << other;
            instance->ft->release(instance);
            path->ft->release(path);
        }
        mi->ft->cleanup(mi, context, 1);
    });
    EXPECT_EQ(rig.count_words("Invalid instance of NVRHBA_FCPort Data"), 3u);
    EXPECT_EQ(calls("RM_DiagBeacon"), 0u);
}

TEST(FcPortBeaconFailures, AreNotPassedOn)
{
    Rig rig({host::Manner::strict(), "small"});
    const host::Instance on = port_with(rig, 2), off = port_with(rig, 3);
    for (unsigned status = 1; status <= 260; status++) {
        clear_faults();
        add_fault("call = \"RM_DiagBeacon\", status = " + std::to_string(status));
        const bool light = status % 2;
        const Changed changed = modify(rig, light ? on : off);
        EXPECT_THAT(changed.answer, succeeded()) << status;
        EXPECT_EQ(changed.words,
                  joined({switched(light ? 2 : 3),
                          {light ? "Failed to set the beacon state to 3 " : "Failed to set the beacon state to 2 "},
                          done}));
        EXPECT_EQ(shown(rig), Value::uint16(light ? 2 : 3));
    }
}

TEST(FcPortBeaconFailures, ShowTheWishUntilTheNextRefresh)
{
    Rig rig({host::Manner::strict(), "typical", refreshing_settings});
    add_fault("call = \"RM_DiagBeacon\", status = 63");
    EXPECT_THAT(modify(rig, port_with(rig, 2)).answer, succeeded());
    EXPECT_EQ(shown(rig), Value::uint16(2));
    EXPECT_EQ(port_value(0, "beacon"), "2");
    rig.refresh();
    EXPECT_EQ(shown(rig), Value::uint16(3));
}

// The beacon is read when the ports are built, and each port tells its own.
TEST(FcPortBeaconState, IsReadFromTheLibrary)
{
    const struct {
        const char* fault;
        const char* words;
        unsigned value;
    } rows[] = {
        {"status = 2", "Beaconing not supported on host or adapter", 4},
        {"status = 63", "Diagnostics not available", 4},
        {"status = 1", "Unable to get the beacon state", 0},
        {"status = 64", "Unable to get the beacon state", 0},
        {"value = 1", "Beacon state = 'Not available'\n", 0},
        {"value = 2", "Beacon state = 'Off'\n", 3},
        {"value = 3", "Beacon state = 'On'\n", 2},
        {"value = 4", "Beacon state = 'Unknown'\n", 0},
        {"value = 4294967295", "Beacon state = 'Unknown'\n", 0},
    };
    Rig rig({host::Manner::strict(), "typical", refreshing_settings});
    ASSERT_EQ(rig.enumerate(port_class).instances.size(), 4u);
    for (const auto& row : rows) {
        clear_faults();
        add_fault(std::string("call = \"RM_DiagBeaconState\", port = 0, ") + row.fault);
        rig.forget_words();
        rig.refresh();
        EXPECT_EQ(shown(rig), Value::uint16(static_cast<std::uint16_t>(row.value))) << row.fault;
        EXPECT_EQ(shown(rig, 1), Value::uint16(3)) << row.fault;
        EXPECT_THAT(rig.words(), testing::Contains(row.words)) << row.fault;
    }
}
