// What the port walk reads from the hardware: modules, vital product data, flash images.

#include <unistd.h>

#include "simulator/nvrsim.h"
#include "tests/agent/expect_rows.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::Not;
using testing::SizeIs;

namespace {

class PortData : public LoadedHost {
protected:
    Ref<Instance> transceiver(const std::string& keys)
    {
        port("transceiver = { " + keys + " }\n");
        return only(agent().m_NVRHBA_Transceiver_map);
    }
    /// That the walk went on and ended well.
    void expect_whole_port()
    {
        EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
        EXPECT_EQ(agent().m_NVRHBA_DeviceSAPImplementation_map.size(), 1u);
        EXPECT_THAT(words(), Contains("PERF: updateAdapterMaps: cleanExit"));
    }
};

std::string page(const std::string& hex)
{
    std::string all = hex;
    all.append(512 - hex.size(), '0');
    return '"' + all + '"';
}

std::string zeros(unsigned bytes)
{
    return std::string(2 * bytes, '0');
}

} // namespace

TEST_F(PortData, ATransceiverShowsItsModule)
{
    const Ref<Instance> made = transceiver(
        "vendor = \"MAKER\", part_number = \"PN-1\", revision = \"B\", serial = \"SN42\", date_code = \"230714AB\", "
        "oui = 0x01C9AB, wavelength = 850, identifier = 3, ext_identifier = 4, connector = 7, temperature = 35.5, "
        "vcc = 3.3, tx_bias = 6.5, tx_power = 0.58, rx_power = 0.4321");
    expect_rows(made.get(), {
                                {"CreationClassName", "NVRHBA_Transceiver"},
                                {"Description", "Norvane PhysicalComponent Data"},
                                {"OperationalStatus", "{0}"},
                                {"StatusDescriptions", "{unknown}"},
                                {"Manufacturer", "MAKER           "},
                                {"OUI", "01-C9-ab"},
                                {"PartNumber", "PN-1            "},
                                {"Version", "B   "},
                                {"SerialNumber", "SN42            "},
                                {"Tag", "10000000C9A00001:SN42            "},
                                {"ManufactureDate", "20230714000000.000000+000"},
                                {"Temperature", "35.5"},
                                {"TemperatureUnit", "Celsius"},
                                {"Vcc", "3.3"},
                                {"TxBiasCurrent", "6.5"},
                                {"TxPower", "0.58"},
                                {"RxPower", "0.4321"},
                                {"Identifier", "3"},
                                {"ExtIdentifier", "4"},
                                {"Connector", "7"},
                                {"WaveLength", "850"},
                                {"Model", "null"},
                            });
    const Ref<Instance> component = only(agent().m_NVRHBA_TransceiverComponent_map);
    expect_rows(component.get(), {});
    EXPECT_EQ(end(component.get(), "GroupComponent", "Tag"), "20000000C9A00001");
    EXPECT_EQ(end(component.get(), "PartComponent", "Tag"), "10000000C9A00001:SN42            ");
    EXPECT_THAT(words(), contains_in_order(
                             {"RM_GetSffData succesful", "PhysicalComponentInstance for : 10000000C9A00001",
                              "VendorName: MAKER           ", "VendorOUI: 01-C9-ab", "VendorPN: PN-1            ",
                              "VendorRev: B   ", "VendorSN: SN42            #", "DateCode: 230714AB",
                              "ManufactureDate: 20230714000000.000000+000", "Temperature: 35.50  C", "Vcc:  3.30   V",
                              "TxBiasCurrent: 6.50   mA", "TxPower: 0.58   mW", "RxPower: 0.43   mW", "Identifier: 3h",
                              "ExtIdentifier: 4h", "Connector: 7h", "Wavelength: 850 nm", "Success..."}));
}

TEST_F(PortData, AModuleWithoutDiagnosticsLeavesItsReadingsNull)
{
    expect_rows(transceiver("diagnostics = false, serial = \"SN42\"").get(), {
                                                                                 {"Temperature", "null"},
                                                                                 {"TemperatureUnit", "Celsius"},
                                                                                 {"Vcc", "null"},
                                                                                 {"TxBiasCurrent", "null"},
                                                                                 {"TxPower", "null"},
                                                                                 {"RxPower", "null"},
                                                                                 {"SerialNumber", "SN42            "},
                                                                             });
    EXPECT_THAT(words(), Not(Contains(testing::StartsWith("Temperature:"))));
}

TEST_F(PortData, APageFromRealHardwareIsReplayed)
{
    // External calibration: the temperature's slope 2, the received power 0.5 x + 10, all other terms 0.
    const std::string a0 = page("030407" + zeros(89) + "58");
    const std::string a2 = page(zeros(56) + zeros(12) + "3F000000" + "41200000" + zeros(8) + "02000000" + zeros(8) +
                                "1000" + zeros(6) + "07D0");
    expect_rows(transceiver("a0 = " + a0 + ", a2 = " + a2).get(), {
                                                                      {"Identifier", "3"},
                                                                      {"Manufacturer", ""},
                                                                      {"Tag", "10000000C9A00001:"},
                                                                      {"ManufactureDate", "null"},
                                                                      {"Temperature", "32"},
                                                                      {"Vcc", "0"},
                                                                      {"TxBiasCurrent", "0"},
                                                                      {"TxPower", "0"},
                                                                      {"RxPower", "0.101"},
                                                                  });
}

TEST_F(PortData, ADateCodeThatIsNoneLeavesTheDateNull)
{
    EXPECT_EQ(value(transceiver("date_code = \"23-7-14\"").get(), "ManufactureDate"), "null");
    const std::vector<std::string> told = words();
    EXPECT_THAT(told, Contains("DateCode: 23-7-14 "));
    EXPECT_THAT(told, Not(Contains(testing::StartsWith("ManufactureDate:"))));
}

TEST_F(PortData, APortWithoutTransceiverIsPublishedAllTheSame)
{
    port("transceiver = false\n");
    EXPECT_THAT(plain(agent().m_NVRHBA_Transceiver_map), SizeIs(0));
    EXPECT_EQ(agent().m_NVRHBA_TransceiverComponent_map.size(), 0u);
    const std::vector<std::string> told = words();
    EXPECT_THAT(told, contains_in_order({"Unable to obtain transceiver data for this host bus adapter.",
                                         "Failed Creating NVRVCNA_Transceiver", "PERF: updateAdapterMaps: cleanExit"}));
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
}

TEST_F(PortData, DamagedPagesHarmNothing)
{
    for (const char* damage : {"garbage", "ones", "zeros", "null"}) {
        SCOPED_TRACE(damage);
        port("");
        fault(std::string("call = \"RM_GetSffData\", damage = \"") + damage + "\"");
        refresh();
        EXPECT_THAT(plain(agent().m_NVRHBA_Transceiver_map), SizeIs(1));
        expect_whole_port();
    }
    fault("call = \"RM_GetSffData\", value = 4294967295");
    refresh();
    expect_whole_port();
}

TEST_F(PortData, VitalProductDataHaveAPropertyEach)
{
    port("vpd = { product = \"The adapter\", entries = [[\"PN\", \"pn\"], [\"SN\", \"sn\"], [\"V0\", \"0\"], "
         "[\"V1\", \"1\"], [\"V2\", \"2\"], [\"V3\", \"3\"], [\"V4\", \"4\"], [\"V5\", \"5\"], [\"VB\", \"b\"], "
         "[\"V6\", \"6\"], [\"EC\", \"ec\"], [\"YA\", \"\"]] }\n");
    expect_rows(only(agent().m_NVRHBA_VitalProductData_map).get(), {
                                                                       {"InstanceID", first_wwpn},
                                                                       {"ProductName", "The adapter"},
                                                                       {"PartNumber", "pn"},
                                                                       {"VPDSerialNumber", "sn"},
                                                                       {"FieldV0", "0"},
                                                                       {"FieldV1", "1"},
                                                                       {"FieldV2", "2"},
                                                                       {"FieldV3", "3"},
                                                                       {"FieldV4", "4"},
                                                                       {"FieldV5", "5"},
                                                                       {"FieldVB", "b"},
                                                                       {"VPDTags", "{V6,EC,YA}"},
                                                                       {"VPDTagValues", "{6,ec,}"},
                                                                   });
    const Ref<Instance> link = only(agent().m_NVRHBA_ElementVPD_map);
    expect_rows(link.get(), {});
    EXPECT_EQ(end(link.get(), "SettingData", "InstanceID"), first_wwpn);
    EXPECT_EQ(end(link.get(), "ManagedElement", "DeviceID"), "10000000C9A00001:0xF162");
    EXPECT_THAT(words(), contains_in_order(
                             {"Inside CreateVPD", "\x82\x82--The adapter", "PN--pn", "SN--sn", "YA--", "FC Port # 0"}));
}

TEST_F(PortData, VitalProductDataHaveNamesWithTheirPort)
{
    port("vpd = { product = \"The adapter\", entries = [[\"CP\", \"cp\"], [\"EC\", \"ec\"], [\"FG\", \"fg\"], "
         "[\"LC\", \"lc\"], [\"MN\", \"mn\"], [\"PG\", \"pg\"], [\"PN\", \"pn\"], [\"SN\", \"sn\"], "
         "[\"V0\", \"v0\"]] }\n");
    const Ref<Instance> made = only(agent().m_NVRHBA_FCPort_map);
    EXPECT_THAT(value(made.get(), "OtherIdentifyingInfo"),
                testing::StartsWith("{The adapter,cp,ec,fg,lc,mn,pg,pn,sn,v0,"));
    EXPECT_EQ(value(made.get(), "IdentifyingDescriptions"),
              "{VPD:PRODUCT_NAME,VPD:EXT_CAPABILITY,VPD:EC_LEVEL,VPD:FABRIC_GEOGRAPHY,VPD:LOCATION,"
              "VPD:MANUFACTURER_ID,VPD:PCI_GEOGRAPHY,VPD:PART_NUMBER,VPD:SERIAL_NUMBER,VPD:V0,OS Device Name,"
              "NORVANE:IEEE_ADDRESS}");
}

TEST_F(PortData, VitalProductDataWithoutOtherTagsHaveNoList)
{
    port("vpd = { product = \"\", entries = [[\"SN\", \"sn\"]] }\n");
    expect_rows(only(agent().m_NVRHBA_VitalProductData_map).get(), {
                                                                       {"ProductName", "null"},
                                                                       {"PartNumber", "null"},
                                                                       {"VPDSerialNumber", "sn"},
                                                                       {"FieldV0", "null"},
                                                                       {"VPDTags", "null"},
                                                                       {"VPDTagValues", "null"},
                                                                   });
}

TEST_F(PortData, APortWithoutVitalProductDataIsPublishedAllTheSame)
{
    fault("call = \"RM_GetVPD\", status = 2");
    EXPECT_THAT(plain(agent().m_NVRHBA_VitalProductData_map), SizeIs(0));
    EXPECT_EQ(agent().m_NVRHBA_ElementVPD_map.size(), 0u);
    EXPECT_THAT(words(),
                contains_in_order({"ERROR: RM_GetVPD call failed : 2", "FC port 10000000C9A00001 CreateVPD failed",
                                   "RM_GetSffData succesful", "PERF: updateAdapterMaps: cleanExit"}));
    EXPECT_THAT(plain(agent().m_NVRHBA_FCPort_map), SizeIs(1));
}

TEST_F(PortData, AWalkThatNeverEndsIsEnded)
{
    fault("call = \"RM_GetNextVpdEntry\", value = 1");
    EXPECT_THAT(plain(agent().m_NVRHBA_VitalProductData_map), SizeIs(1));
    EXPECT_LE(nvrsim_calls("RM_GetNextVpdEntry"), 2u * 256);
    expect_whole_port();
}

TEST_F(PortData, DamagedVitalProductDataHarmNothing)
{
    for (const char* damage : {"garbage", "ones", "zeros", "truncated", "unterminated"}) {
        for (const char* call : {"RM_GetVPD", "RM_GetNextVpdEntry"}) {
            SCOPED_TRACE(std::string(call) + " " + damage);
            port("");
            fault(std::string("call = \"") + call + "\", damage = \"" + damage + "\"");
            refresh();
            EXPECT_THAT(plain(agent().m_NVRHBA_VitalProductData_map), SizeIs(1));
            expect_whole_port();
        }
    }
}

TEST_F(PortData, AFlashImageIsASoftwareIdentity)
{
    port("[[adapter.port.flash]]\nname = \"Boot BIOS\"\nversion = \"2.12a3\"\n"
         "[[adapter.port.flash]]\nname = \"Loader\"\nversion = \"none\"\n");
    const Instances images = plain(agent().m_NVRHBA_FlashImageSoftwareIdentity_map);
    ASSERT_THAT(images, SizeIs(2));
    const std::string name = "FC HBA Flash Image Boot BIOS v 2.12a3 FC2162 10000000C9A00001";
    expect_rows(images[0].get(), {
                                     {"InstanceID", name},
                                     {"Name", name},
                                     {"ElementName", name},
                                     {"Description", "FC HBA Flash Image"},
                                     {"VersionString", "2.12a3"},
                                     {"MajorVersion", "2"},
                                     {"MinorVersion", "1"},
                                     {"RevisionNumber", "2"},
                                     {"BuildNumber", "3"},
                                     {"ReleaseType", "a"},
                                     {"TestReleaseVersion", ""},
                                     {"Manufacturer", "Norvane Corporation"},
                                     {"Classifications", "{10}"},
                                     {"ClassificationDescriptions", "{Firmware Kernel}"},
                                     {"IsEntity", "true"},
                                 });
    expect_rows(images[1].get(), {
                                     {"InstanceID", "FC HBA Flash Image Loader v none FC2162 10000000C9A00001"},
                                     {"VersionString", "none"},
                                     {"MajorVersion", "null"},
                                     {"ReleaseType", "null"},
                                 });
    const Instances links = plain(agent().m_NVRHBA_ElementFlashImageSoftwareIdentity_map);
    ASSERT_THAT(links, SizeIs(2));
    expect_rows(links[0].get(), {});
    EXPECT_EQ(end(links[0].get(), "Antecedent", "InstanceID"), name);
    EXPECT_EQ(end(links[0].get(), "Dependent", "DeviceID"), first_wwpn);
    EXPECT_THAT(
        words(),
        contains_in_order({"Generating NVRHBA_PortControllerConformsToProfile (Port Controller "
                           "FC2162:10000000C9A00001, FC HBA)",
                           "Generating NVRHBA_FlashImageSoftwareIdentity.",
                           "FlashContentsInstance - Parsing VersionString", "FlashContentsInstance - Parsing Success",
                           "FlashContentsInstance - Parsing Done", "FlashContentsInstance - Parsing VersionString",
                           "FlashContentsInstance - Parsing Done", "Success...", "Firmware- Parsing VersionString"}));
}

TEST_F(PortData, AnUnreadableFlashHasNoImages)
{
    fault("call = \"RM_DiagGetLoadListParams\", status = 2");
    EXPECT_THAT(plain(agent().m_NVRHBA_FlashImageSoftwareIdentity_map), SizeIs(0));
    EXPECT_THAT(words(), contains_in_order({"Failed to retrieve the flash contents. Exited with ErrorCode 2",
                                            "PERF: updateAdapterMaps: cleanExit"}));
}

TEST_F(PortData, ACountOfNoneOrOneHasNoImages)
{
    for (const char* count : {"0", "1"}) {
        port("");
        fault(std::string("call = \"RM_DiagGetLoadListParams\", value = ") + count);
        refresh();
        EXPECT_THAT(plain(agent().m_NVRHBA_FlashImageSoftwareIdentity_map), SizeIs(0));
        EXPECT_THAT(words(), contains_in_order({"Generating NVRHBA_FlashImageSoftwareIdentity.", "Success...",
                                                "PERF: updateAdapterMaps: cleanExit"}));
    }
}

TEST_F(PortData, AFlashHoldsSixtyFourImages)
{
    std::string images;
    for (int i = 0; i < 64; i++)
        images += "[[adapter.port.flash]]\nname = \"image-" + std::to_string(i) + "\"\n";
    port(images);
    EXPECT_THAT(plain(agent().m_NVRHBA_FlashImageSoftwareIdentity_map), SizeIs(64));
    EXPECT_EQ(agent().m_NVRHBA_ElementFlashImageSoftwareIdentity_map.size(), 64u);
    fault("call = \"RM_DiagGetLoadListParams\", value = 4294967295");
    refresh();
    EXPECT_THAT(plain(agent().m_NVRHBA_FlashImageSoftwareIdentity_map), SizeIs(64)) << "a count that lies is cut";
}

TEST_F(PortData, TwoImagesAlikeEndTheListButNotTheUpdate)
{
    port("[[adapter.port.flash]]\nname = \"A\"\n[[adapter.port.flash]]\nname = \"A\"\n"
         "[[adapter.port.flash]]\nname = \"B\"\n");
    EXPECT_THAT(plain(agent().m_NVRHBA_FlashImageSoftwareIdentity_map), SizeIs(1));
    EXPECT_EQ(agent().m_NVRHBA_ElementFlashImageSoftwareIdentity_map.size(), 1u);
    EXPECT_THAT(words(), contains_in_order({"Insert Failed : m_NVRHBA_FlashImageSoftwareIdentity_map ",
                                            "Firmware- Parsing VersionString", "PERF: updateAdapterMaps: cleanExit"}));
}

TEST_F(PortData, TextsWithoutTerminatorAreCutAtTheirField)
{
    port("[[adapter.port.flash]]\nname = \"A\"\nversion = \"2.01a4\"\n");
    fault("call = \"RM_DiagGetLoadListParams\", damage = \"unterminated\"");
    refresh();
    for (const Ref<Instance>& image : plain(agent().m_NVRHBA_FlashImageSoftwareIdentity_map))
        EXPECT_LE(value(image.get(), "VersionString").size(), 32u);
    expect_whole_port();
}

TEST_F(PortData, EachPortHasItsOwn)
{
    scenario("[[adapter]]\nports = 2\n[[adapter]]\n");
    EXPECT_THAT(plain(agent().m_NVRHBA_VitalProductData_map), SizeIs(3));
    EXPECT_EQ(agent().m_NVRHBA_ElementVPD_map.size(), 3u);
    EXPECT_EQ(agent().m_NVRHBA_Transceiver_map.size(), 3u);
    EXPECT_EQ(agent().m_NVRHBA_TransceiverComponent_map.size(), 3u);
    EXPECT_EQ(agent().m_NVRHBA_FlashImageSoftwareIdentity_map.size(), 9u);
}
