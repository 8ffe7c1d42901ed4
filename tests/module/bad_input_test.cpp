// Lies of the libraries and the devices, one by one: what the module publishes of them, and that nothing of it stays.
#include <cstdint>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/module/support/Rig.h"
#include "tests/support/simulator.h"
#include "tests/support/trace.h"

using namespace nvrtest;

namespace {

constexpr char volume_class[] = "NVRHBA_StorageVolume";
constexpr char port_class[] = "NVRHBA_FCPort";

/// Two ports that see one target of two units.
constexpr char sound[] = "[[adapter]]\n[[adapter]]\n[[target]]\nluns = 2\n";

std::string unit(const std::string& keys)
{
    return "[[adapter]]\n[[target]]\nluns = 0\n[[target.lun]]\n" + keys;
}

/// What is seen of a class: how many instances, and a property of the first one.
struct Sight {
    const char* class_name;
    std::size_t instances;
    const char* property = nullptr;
    std::string value = {};
};

struct Lie {
    const char* label;
    std::string scenario;
    std::vector<const char*> faults;
    std::vector<Sight> sights;
    std::vector<std::string> words;

    friend void PrintTo(const Lie& lie, std::ostream* os) { *os << lie.label; }
};

const std::string all_ones_page = "page83 = \"00 83 FF FF 01 03 00 FF 60" + [] {
    std::string bytes;
    for (int i = 0; i < 246; i++)
        bytes += " FF";
    return bytes;
}() + "\"\n";

const Lie lies[] = {
    // Behind the two true entries all are zeros: the third becomes a unit, the fourth is its twin and ends the update.
    {"AMappingOfFourBillionEntries",
     sound,
     {R"(call = "HBA_GetFcpTargetMapping", value = 4294967295)"},
     {{port_class, 2}, {volume_class, 3}},
     {"All Ok ...break ", "Insert Failed : m_NVRHBA_SCSIProtocolEndpoint_map"}},
    {"AMappingLargerThanItsBuffer",
     sound,
     {R"(call = "HBA_GetFcpTargetMapping", value = 257)"},
     {{port_class, 2}, {volume_class, 3}},
     {"Insert Failed : m_NVRHBA_SCSIProtocolEndpoint_map"}},
    {"AMappingOfNoEntries",
     sound,
     {R"(call = "HBA_GetFcpTargetMapping", value = 0)"},
     {{port_class, 2}, {volume_class, 0}},
     {"HBA_GetFcpTargetMapping_t() found no target mappings"}},
    {"AMappingThatNeedsFourBillionEntries",
     sound,
     {R"(call = "HBA_GetFcpTargetMapping", status = 7, value = 4294967295)"},
     {{port_class, 2}, {volume_class, 0}},
     {"Increasing the buffer to = -1", "Could not allocate memory..break "}},
    {"AMappingThatNeedsNothing",
     sound,
     {R"(call = "HBA_GetFcpTargetMapping", status = 7, value = 0)"},
     {{port_class, 2}, {volume_class, 0}},
     {"Increasing the buffer to = 0"}},
    {"AnIdentifierLongerThanItsField",
     unit("page83 = \"00 83 00 20 01 03 00 18 60 01 02 03 04 05 06 07 08 09 0A 0B 0C 0D 0E 0F 10 11 12 13 14 15 16 "
          "17\"\n"),
     {},
     {{volume_class, 1, "DeviceID", "10000000C9A00001_50060E8005A10000__0000000000000000"},
      {volume_class, 1, "Name", "0102030405060708090A0B0C0D0E0F1011121314151617"}},
     {"INVALID Descriptor"}},
    {"AnIdentificationOf255Bytes",
     unit(all_ones_page),
     {},
     {{volume_class, 1, "DeviceID", "10000000C9A00001_50060E8005A10000__0000000000000000"},
      {volume_class, 1, "NameFormat", "9"}},
     {"INVALID Descriptor"}},
    {"AnIdentificationOf255BytesThatIsNotSent",
     unit("page83 = \"00 83 00 FF 01 03 00 FF 60 AB CD\"\n"),
     {},
     {{volume_class, 1, "DeviceID", "10000000C9A00001_50060E8005A10000__0000000000000000"}},
     {"INVALID Descriptor"}},
    {"ADeviceTypeAbove31",
     unit("inquiry = \"FF 00 05 12 5B 00 00 00 56\"\n"),
     {},
     {{"NVRHBA_StorageExtent", 1, "ElementName", "Unknown device 0"},
      {"NVRHBA_StorageExtent", 1, "DeviceType", "31"},
      {volume_class, 0}},
     {"Target 0 is of type 31."}},
    {"AWalkOverProductDataThatNeverEnds",
     sound,
     {R"(call = "RM_GetNextVpdEntry", value = 1)"},
     {{port_class, 2}, {"NVRHBA_VitalProductData", 2}, {volume_class, 4}},
     {}},
    {"ParametersThatAreNone",
     sound,
     {R"(call = "RM_GetDriverParams", value = 0)", R"(call = "RM_GetDriverParamsGlobal", value = 0)"},
     {{port_class, 2}, {"NVRHBA_DriverParams", 0}, {"NVRHBA_DriverParamGlobal", 0}, {volume_class, 4}},
     {}},
    {"FourBillionParameters",
     sound,
     {R"(call = "RM_GetDriverParams", value = 4294967295)", R"(call = "RM_GetDriverParamsGlobal", value = 4294967295)"},
     {{port_class, 2}, {volume_class, 4}},
     {}},
    {"ParametersThatNeedRoomForFourBillion",
     sound,
     {R"(call = "RM_GetDriverParams", status = 7, value = 4294967295)",
      R"(call = "RM_GetDriverParamsGlobal", status = 191, value = 4294967295)"},
     {{port_class, 2}, {"NVRHBA_DriverParams", 0}, {"NVRHBA_DriverParamGlobal", 0}, {volume_class, 4}},
     {}},
    // The twin's device is the first thing of it that is refused.
    {"TwoPortsOfOneName",
     "allow_twins = true\n[[adapter]]\n[[adapter]]\n[[adapter.port]]\nwwpn = \"10000000C9A00001\"\n[[target]]\nluns = "
     "2\n",
     {},
     {{port_class, 1}},
     {"Insert Failed : m_NVRHBA_PCIDevice_map"}},
    {"TwoTargetsWithTheSameEverything",
     "allow_twins = true\n[[adapter]]\n[[target]]\nluns = 1\n"
     "[[target]]\nwwpn = \"50060E8005A10000\"\nwwnn = \"50060E8005A1FF00\"\nluns = 1\n",
     {},
     {{port_class, 1}, {volume_class, 1}, {"NVRHBA_SCSIProtocolEndpoint", 1}},
     {"Insert Failed : m_NVRHBA_SCSIProtocolEndpoint_map"}},
};

void expect_sound(Rig& rig)
{
    clear_faults();
    load_scenario(sound);
    rig.refresh();
    EXPECT_EQ(rig.enumerate(port_class).instances.size(), 2u);
    EXPECT_EQ(rig.enumerate(volume_class).instances.size(), 4u);
}

} // namespace

class A_Lie : public testing::TestWithParam<Lie> {};

TEST_P(A_Lie, IsPublishedForWhatItIsAndForgotten)
{
    const Lie& lie = GetParam();
    Rig rig({host::Manner::strict(), lie.scenario, refreshing_settings});
    for (const char* fault : lie.faults)
        add_fault(fault);
    for (const Sight& sight : lie.sights) {
        const host::Answer answer = rig.enumerate(sight.class_name);
        EXPECT_THAT(answer, succeeded()) << sight.class_name;
        ASSERT_EQ(answer.instances.size(), sight.instances) << sight.class_name;
        if (sight.property) {
            EXPECT_EQ(answer.instances[0].get(sight.property).to_text(), sight.value);
        }
    }
    rig.wait_for_refreshes(1);
    EXPECT_THAT(rig.words(), contains_in_order(lie.words));
    EXPECT_EQ(fault_hits() != 0, !lie.faults.empty());
    EXPECT_LE(calls("RM_GetNextVpdEntry"), 4u * 256);
    expect_sound(rig);
    rig.stop();
    EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
}

INSTANTIATE_TEST_SUITE_P(Told, A_Lie, testing::ValuesIn(lies),
                         [](const auto& info) { return std::string(info.param.label); });

/// A call that fills its texts without an end, and where one of them is published: with so many characters.
struct Endless {
    const char* call;
    const char* class_name;
    const char* property;
    std::size_t characters;
};

TEST(TextsWithoutATerminator, EndWithTheirField)
{
    const Endless texts[] = {
        {"HBA_GetFcpTargetMapping", "NVRHBA_SCSIProtocolEndpoint", "OtherIdentifyingInfo", 256},
        {"HBA_GetAdapterPortAttributes", port_class, "OtherIdentifyingInfo", 256},
        {"RM_GetNextVpdEntry", port_class, "OtherIdentifyingInfo", 256},
        {"RM_GetDriverParams", "NVRHBA_DriverParams", "InstanceID", 17 + 32},
        {"RM_DiagGetLoadListParams", "NVRHBA_FlashImageSoftwareIdentity", "VersionString", 32},
    };
    for (const Endless& text : texts) {
        SCOPED_TRACE(text.call);
        Rig rig({host::Manner::strict(), sound});
        add_fault("call = \"" + std::string(text.call) + "\", damage = \"unterminated\"");
        const host::Answer answer = rig.enumerate(text.class_name);
        ASSERT_FALSE(answer.instances.empty());
        EXPECT_GT(fault_hits(), 0u);
        std::size_t longest = 0;
        const host::Value value = answer.instances.front().get(text.property);
        if (value.type() == CMPI_stringA) {
            for (const host::Value& element : value.elements())
                longest = std::max(longest, element.as_text().size());
        } else {
            longest = value.as_text().size();
        }
        EXPECT_EQ(longest, text.characters) << value.to_text();
        for (const std::string& class_name : rig.classes())
            EXPECT_TRUE(class_name == "NVRHBA_AlertIndication" || rig.names(class_name).ok()) << class_name;
        clear_faults();
    }
}

TEST(TextsWithoutATerminator, OfAnAdaptersNameLeaveItUnopened)
{
    Rig rig({host::Manner::strict(), sound});
    add_fault(R"(call = "HBA_GetAdapterName", damage = "unterminated")");
    EXPECT_THAT(rig.enumerate(port_class), succeeded());
    EXPECT_EQ(rig.enumerate(port_class).instances.size(), 0u);
    EXPECT_EQ(fault_hits(), 2u);
}

// Before its first call, between any two of them, and behind the last: the other adapter is published whole each time.
TEST(AnAdapterThatVanishes, TakesNothingWithItButItself)
{
    Rig rig({host::Manner::strict(), sound, refreshing_settings});
    ASSERT_EQ(rig.enumerate(volume_class).instances.size(), 4u);
    const std::string other = "10000000C9A00001";
    const auto of_other = [&](const host::Answer& answer, const char* property) {
        std::size_t count = 0;
        for (const host::Instance& instance : answer.instances)
            count += instance.get(property).as_text().compare(0, other.size(), other) == 0;
        return count;
    };
    unsigned call = 1;
    for (std::uint64_t hits = 1; hits != 0; call++) {
        SCOPED_TRACE("before its call " + std::to_string(call));
        add_fault("call = \"*\", port = 1, times = 1, vanish = true, from = " + std::to_string(call));
        rig.refresh();
        hits = fault_hits();
        clear_faults();
        const host::Answer ports = rig.enumerate(port_class), volumes = rig.enumerate(volume_class);
        EXPECT_EQ(of_other(ports, "DeviceID"), 1u);
        EXPECT_EQ(of_other(volumes, "DeviceID"), 2u);
        EXPECT_LE(ports.instances.size(), 2u);
        EXPECT_LE(volumes.instances.size(), 4u);
        EXPECT_EQ(nvrsim_open_handles(), 0u);
        ASSERT_EQ(nvrsim_set("1", "present", 1), 0);
        ASSERT_LT(call, 1000u);
    }
    EXPECT_GT(call, 20u) << "a refresh makes more calls about an adapter";
    expect_sound(rig);
}
