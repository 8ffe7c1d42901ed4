// Calls that read the host: shapes, sizes and values.
#include "Sim.h"

#include <memory>

class Inventory : public Simulated {};

TEST_F(Inventory, AdapterIsNamedOpenedDescribedAndClosed)
{
    EXPECT_EQ(1u, nvrsim_HBA_GetNumberOfAdapters());
    char name[256];
    std::memset(name, 'x', sizeof name);
    ASSERT_EQ(0u, nvrsim_HBA_GetAdapterName(0, name));
    EXPECT_STREQ("Norvane-FC2162-0", name);
    EXPECT_EQ(unsigned(HBA_STATUS_ERROR_ILLEGAL_INDEX), nvrsim_HBA_GetAdapterName(1, name));
    const HBA_HANDLE handle = nvrsim_HBA_OpenAdapter(name);
    ASSERT_NE(0u, handle);
    EXPECT_LE(handle, 0xFFFFu);
    HBA_ADAPTERATTRIBUTES attributes;
    ASSERT_EQ(0u, nvrsim_HBA_GetAdapterAttributes(handle, &attributes));
    EXPECT_STREQ("Norvane Corporation", attributes.Manufacturer);
    EXPECT_STREQ("FC2162", attributes.Model);
    EXPECT_STREQ("2.01a4", attributes.FirmwareVersion);
    EXPECT_EQ(1u, attributes.NumberOfPorts);
    EXPECT_EQ(0x20000000C9A00001u, number(attributes.NodeWWN));
    EXPECT_EQ(1u, nvrsim_open_handles());
    nvrsim_HBA_CloseAdapter(handle);
    EXPECT_EQ(0u, nvrsim_open_handles());
    EXPECT_EQ(unsigned(HBA_STATUS_ERROR_INVALID_HANDLE), nvrsim_HBA_GetAdapterAttributes(handle, &attributes));
    char unknown[] = "nobody";
    EXPECT_EQ(0u, nvrsim_HBA_OpenAdapter(unknown));
}

TEST_F(Inventory, PortAttributesCarryEveryField)
{
    load("[[adapter]]\n[[adapter.port]]\nfc_id = 0x010203\ntype = 5\nstate = 2\nclass_of_service = 0x0C\n"
         "supported_fc4 = [8, 32, 88]\nsymbolic_name = 'sym'\nos_device_name = '/dev/host9'\nsupported_speed = 63\n"
         "speed = 16\nmax_frame_size = 2112\nfabric_name = '10:00:00:05:33:00:00:01'\ndiscovered_ports = 7\n");
    HBA_PORTATTRIBUTES port;
    ASSERT_EQ(0u, nvrsim_HBA_GetAdapterPortAttributes(open(), 0, &port));
    EXPECT_EQ(port0, number(port.PortWWN));
    EXPECT_EQ(0x20000000C9A00001u, number(port.NodeWWN));
    EXPECT_EQ(0x010203u, port.PortFcId);
    EXPECT_EQ(5u, port.PortType);
    EXPECT_EQ(2u, port.PortState);
    EXPECT_EQ(0x0Cu, port.PortSupportedClassofService);
    EXPECT_EQ(1, port.PortSupportedFc4Types.bits[2]);
    EXPECT_EQ(1, port.PortSupportedFc4Types.bits[7]);
    EXPECT_EQ(1, port.PortSupportedFc4Types.bits[8]);
    EXPECT_STREQ("sym", port.PortSymbolicName);
    EXPECT_STREQ("/dev/host9", port.OSDeviceName);
    EXPECT_EQ(63u, port.PortSupportedSpeed);
    EXPECT_EQ(16u, port.PortSpeed);
    EXPECT_EQ(2112u, port.PortMaxFrameSize);
    EXPECT_EQ(0x1000000533000001u, number(port.FabricName));
    EXPECT_EQ(7u, port.NumberofDiscoveredPorts);
    EXPECT_EQ(unsigned(HBA_STATUS_ERROR_ILLEGAL_INDEX), nvrsim_HBA_GetAdapterPortAttributes(open(), 1, &port));
}

TEST_F(Inventory, AttributeBlockHoldsNumbersTextsAndBytes)
{
    load(
        "[[adapter]]\n[[adapter.port]]\nattributes = { 551 = 0x55643C, 528 = 'Overlay', 531 = { hex = '010203040506' },"
        " 527 = false, 9999 = { u64 = 77 } }\n");
    Block block(RM_HBA_BLOCK_SIZE);
    ASSERT_EQ(0u, nvrsim_RM_GetHBAAttributes(wire(port0), block.bytes.data(), &block.size));
    EXPECT_LT(block.size, RM_PORT_BLOCK_SIZE) << "also fits the smaller buffer that some callers give";
    uint32_t temperature = 0;
    ASSERT_TRUE(block.read(RM_ATTR_BOARD_TEMPERATURE, temperature));
    EXPECT_EQ(0x55643Cu, temperature);
    EXPECT_EQ("Overlay", block.text(RM_ATTR_OPERATIONAL_FIRMWARE));
    EXPECT_EQ(std::string("\1\2\3\4\5\6"), block.text(RM_ATTR_IEEE_ADDRESS));
    EXPECT_EQ("(none)", block.text(RM_ATTR_MODEL_ID));
    uint64_t wide = 0;
    ASSERT_TRUE(block.read(9999, wide));
    EXPECT_EQ(77u, wide);
}

TEST_F(Inventory, EveryAttributeOfAnAdapterHasADefault)
{
    Block block(RM_HBA_BLOCK_SIZE);
    ASSERT_EQ(0u, nvrsim_RM_GetHBAAttributes(wire(port0), block.bytes.data(), &block.size));
    for (uint16_t attribute : {551, 526, 527, 544, 556, 531, 534, 546, 545, 528, 532, 553,
                               549, 587, 588, 589, 590, 565, 566, 563, 564, 560, 555})
        EXPECT_NE("(none)", block.text(attribute)) << attribute;
}

TEST_F(Inventory, TooSmallABlockGivesTheNeed)
{
    Block block(RM_HBA_BLOCK_SIZE);
    ASSERT_EQ(0u, nvrsim_RM_GetHBAAttributes(wire(port0), block.bytes.data(), &block.size));
    const uint32_t need = block.size;
    Block small(16);
    EXPECT_EQ(unsigned(RM_STATUS_MORE_DATA), nvrsim_RM_GetHBAAttributes(wire(port0), small.bytes.data(), &small.size));
    EXPECT_EQ(need, small.size);
}

TEST_F(Inventory, StatisticsFitTheirBlockAndAllOnesMeansNotCounted)
{
    load("[[adapter]]\n[[adapter.port]]\nstatistics = { 1030 = 5000000000, 1037 = -1, 1040 = false }\n");
    Block block(RM_STATISTICS_BLOCK_SIZE);
    ASSERT_EQ(0u, nvrsim_RM_GetPortStatistics(wire(port0), block.bytes.data(), &block.size));
    uint64_t value = 0;
    ASSERT_TRUE(block.read(RM_STAT_TX_FRAMES, value));
    EXPECT_EQ(5000000000u, value);
    ASSERT_TRUE(block.read(RM_STAT_NOS_COUNT, value));
    EXPECT_EQ(UINT64_MAX, value);
    EXPECT_FALSE(block.read(RM_STAT_LINK_FAILURES, value));
}

TEST_F(Inventory, DamagedBlockYieldsNoValue)
{
    Block block(RM_PORT_BLOCK_SIZE);
    ASSERT_EQ(0u, nvrsim_RM_GetPortAttributes(wire(port0), block.bytes.data(), &block.size));
    uint32_t state = 0;
    ASSERT_TRUE(block.read(RM_ATTR_PORT_STATE, state));
    EXPECT_EQ(2u, state);
    block.bytes[4] = 0x7F; // the length word, without its check
    EXPECT_FALSE(block.read(RM_ATTR_PORT_STATE, state));
}

TEST_F(Inventory, VpdWalkGivesEachEntryOnceAndEnds)
{
    load("[[adapter]]\n[[adapter.port]]\n"
         "vpd = { product = 'Card', entries = [['PN', 'P1'], ['V0', ''], ['V0', 'again'], ['YA', 'rw']] }\n");
    std::vector<char> block(RM_VPD_SIZE);
    uint32_t size = RM_VPD_SIZE;
    ASSERT_EQ(0u, nvrsim_RM_GetVPD(wire(port0), block.data(), &size));
    RM_VPDCURSOR cursor{};
    char value[RM_VPD_VALUE_SIZE];
    std::string walk;
    while (nvrsim_RM_GetNextVpdEntry(block.data(), &cursor, RM_VPD_CURSOR_SIZE, value, sizeof value) &&
           walk.size() < 200)
        walk += std::string(cursor.tag[0] == '\x82' ? "##" : cursor.tag) + "=" + value + ";";
    EXPECT_EQ("##=Card;PN=P1;V0=;V0=again;YA=rw;", walk);
}

TEST_F(Inventory, VpdThatNeverEndsIsBounded)
{
    std::string raw;
    for (int i = 0; i < 340; ++i)
        raw += "820000";
    load("[[adapter]]\n[[adapter.port]]\nvpd = { raw = '" + raw + "' }\n");
    std::vector<char> block(RM_VPD_SIZE);
    uint32_t size = RM_VPD_SIZE, entries = 0;
    ASSERT_EQ(0u, nvrsim_RM_GetVPD(wire(port0), block.data(), &size));
    RM_VPDCURSOR cursor{};
    char value[RM_VPD_VALUE_SIZE];
    while (nvrsim_RM_GetNextVpdEntry(block.data(), &cursor, RM_VPD_CURSOR_SIZE, value, sizeof value))
        ++entries;
    EXPECT_EQ(RM_VPD_MAX_ENTRIES, entries);
}

TEST_F(Inventory, TransceiverPagesAreBuiltOrReplayed)
{
    load("[[adapter]]\n[[adapter.port]]\ntransceiver = { vendor = 'ACME', wavelength = 1310, temperature = -1.5 }\n");
    std::vector<uint8_t> data(RM_SFF_SIZE);
    uint32_t size = RM_SFF_SIZE;
    ASSERT_EQ(0u, nvrsim_RM_GetSffData(wire(port0), data.data(), &size));
    EXPECT_EQ(RM_SFF_SIZE, size);
    EXPECT_EQ("ACME            ", std::string(data.begin() + 20, data.begin() + 36));
    EXPECT_EQ(1310, data[60] << 8 | data[61]);
    EXPECT_EQ(0xFE, data[256 + 96]);
    EXPECT_EQ(0x80, data[256 + 97]);

    const std::string page(512, 'a');
    load("[[adapter]]\n[[adapter.port]]\ntransceiver = { diagnostics = false, a0 = '" + page + "' }\n");
    size = RM_SFF_SIZE;
    ASSERT_EQ(0u, nvrsim_RM_GetSffData(wire(port0), data.data(), &size));
    EXPECT_EQ(256u, size);
    EXPECT_EQ(0xAA, data[255]);

    load("[[adapter]]\n[[adapter.port]]\ntransceiver = false\n");
    EXPECT_NE(0u, nvrsim_RM_GetSffData(wire(port0), data.data(), &size));
}

TEST_F(Inventory, PciHeaderIsLittleEndianInItsOrder)
{
    load("[[adapter]]\n[[adapter.port]]\npci = { vendor = 0x1234, device = 0xABCD, interrupt_line = 9 }\n");
    RM_PCIREGISTERS pci{};
    ASSERT_EQ(0u, nvrsim_RM_DiagReadPCIRegistersV2(wire(port0), &pci));
    EXPECT_EQ(0x34, pci.header[0]);
    EXPECT_EQ(0x12, pci.header[1]);
    EXPECT_EQ(0xCD, pci.header[2]);
    EXPECT_EQ(9, pci.header[60]);
}

TEST_F(Inventory, FlashContentsCountOneMoreThanImages)
{
    auto contents = std::make_unique<RM_FLASHCONTENTS>();
    ASSERT_EQ(0u, nvrsim_RM_DiagGetLoadListParams(wire(port0), contents.get()));
    EXPECT_EQ(4u, contents->count);
    EXPECT_STREQ("Firmware", contents->image[0].name);
    EXPECT_STREQ("2.01a4", contents->image[0].version);
    EXPECT_EQ(0xFFFFFFFFu, contents->image[3].type);
}

TEST_F(Inventory, MappingAsksForRoomAndThenGivesEveryPath)
{
    load("[[adapter]]\n[[target]]\nluns = 300\n");
    const HBA_HANDLE handle = open();
    std::vector<char> buffer(sizeof(HBA_FCPTARGETMAPPING) + 300 * sizeof(HBA_FCPSCSIENTRY));
    auto* mapping = reinterpret_cast<HBA_FCPTARGETMAPPING*>(buffer.data());
    mapping->NumberOfEntries = 256;
    EXPECT_EQ(unsigned(HBA_STATUS_ERROR_MORE_DATA), nvrsim_HBA_GetFcpTargetMapping(handle, mapping));
    EXPECT_EQ(300u, mapping->NumberOfEntries);
    EXPECT_EQ(0u, nvrsim_HBA_GetFcpTargetMapping(handle, mapping));
    const HBA_FCPSCSIENTRY& last = mapping->entry[299];
    EXPECT_EQ(299u, last.ScsiId.ScsiOSLun);
    EXPECT_EQ(target0, number(last.FcpId.PortWWN));
    uint8_t lun[8];
    std::memcpy(lun, &last.FcpId.FcpLun, sizeof lun);
    EXPECT_EQ(0x41, lun[0]) << "flat addressing, wire order";
    EXPECT_EQ(0x2B, lun[1]);
    EXPECT_STREQ("/dev/sda", mapping->entry[0].ScsiId.OSDeviceName);
    EXPECT_STREQ("/dev/sdz", mapping->entry[25].ScsiId.OSDeviceName);
    EXPECT_STREQ("/dev/sdaa", mapping->entry[26].ScsiId.OSDeviceName);
}

TEST_F(Inventory, HandleOfATwoPortAdapterMapsTheTargetsOfBothPorts)
{
    load("[[adapter]]\nports = 2\n[[target]]\nseen_by = [0]\n[[target]]\nseen_by = ['10000000C9A00002']\nluns = 2\n");
    std::vector<char> buffer(sizeof(HBA_FCPTARGETMAPPING) + 8 * sizeof(HBA_FCPSCSIENTRY));
    auto* mapping = reinterpret_cast<HBA_FCPTARGETMAPPING*>(buffer.data());
    mapping->NumberOfEntries = 8;
    ASSERT_EQ(0u, nvrsim_HBA_GetFcpTargetMapping(open(), mapping));
    ASSERT_EQ(3u, mapping->NumberOfEntries);
    EXPECT_EQ(target0, number(mapping->entry[0].FcpId.PortWWN));
    EXPECT_EQ(target1, number(mapping->entry[2].FcpId.PortWWN));
}

TEST_F(Inventory, ScsiCommandsGoToTheUnitByTargetAndLun)
{
    load("[[adapter]]\n[[target]]\n[[target.lun]]\nvendor = 'AAAA'\nproduct = 'BBBB'\nrevision = 'CC'\nserial = 'S77'\n"
         "identifier = '0102030405060708'\nidentifier_type = 2\nblocks = 0x1000000\nblock_size = 512\n");
    const HBA_HANDLE handle = open();
    uint8_t response[255] = {}, sense[128] = {};
    ASSERT_EQ(0u, nvrsim_HBA_SendScsiInquiry(handle, wire(target0), fcp_lun(0), 0, 0, response, 255, sense, 128));
    EXPECT_EQ("AAAA    BBBB            CC  ", std::string(response + 8, response + 36));
    ASSERT_EQ(0u, nvrsim_HBA_SendScsiInquiry(handle, wire(target0), fcp_lun(0), 1, 0x80, response, 255, sense, 128));
    EXPECT_EQ("S77", std::string(response + 4, response + 4 + response[3]));
    ASSERT_EQ(0u, nvrsim_HBA_SendScsiInquiry(handle, wire(target0), fcp_lun(0), 1, 0x83, response, 255, sense, 128));
    EXPECT_EQ(2, response[5]);
    EXPECT_EQ(8, response[7]);
    EXPECT_EQ(8, response[15]);
    ASSERT_EQ(0u, nvrsim_HBA_SendReadCapacity(handle, wire(target0), fcp_lun(0), response, 255, sense, 128));
    const uint8_t expected[] = {0x00, 0xFF, 0xFF, 0xFF, 0, 0, 2, 0};
    EXPECT_EQ(0, std::memcmp(expected, response, sizeof expected));

    EXPECT_EQ(9u, nvrsim_HBA_SendReadCapacity(handle, wire(target0), fcp_lun(5), response, 255, sense, 128));
    EXPECT_EQ(0x70, sense[0]);
    EXPECT_EQ(5u, nvrsim_HBA_SendReadCapacity(handle, wire(target1), fcp_lun(0), response, 255, sense, 128));
}

TEST_F(Inventory, ScsiAnswersCanBeRawAndLongerThanTheBuffer)
{
    std::string raw;
    for (int i = 0; i < 400; ++i)
        raw += "5A";
    load("[[adapter]]\n[[target]]\n[[target.lun]]\ninquiry = '" + raw +
         "'\npage83_status = 9\nsense = '700006'\ncapacity = '00FFFFFF00000200'\n");
    const HBA_HANDLE handle = open();
    uint8_t response[256] = {}, sense[128] = {};
    ASSERT_EQ(0u, nvrsim_HBA_SendScsiInquiry(handle, wire(target0), fcp_lun(0), 0, 0, response, 255, sense, 128));
    EXPECT_EQ(0x5A, response[254]);
    EXPECT_EQ(0, response[255]);
    EXPECT_EQ(9u, nvrsim_HBA_SendScsiInquiry(handle, wire(target0), fcp_lun(0), 1, 0x83, response, 255, sense, 128));
    EXPECT_EQ(6, sense[2]);
}

TEST_F(Inventory, LunListsAndLunsByTheManagementApi)
{
    std::vector<char> buffer(RM_LUNLIST_SIZE(3));
    auto* list = reinterpret_cast<RM_LUNLIST*>(buffer.data());
    list->count = 1;
    EXPECT_EQ(unsigned(RM_STATUS_MORE_DATA), nvrsim_RM_GetLunList(wire(port0), wire(target0), 0, list));
    EXPECT_EQ(3u, list->count);
    EXPECT_EQ(0u, nvrsim_RM_GetLunList(wire(port0), wire(target0), 0, list));
    EXPECT_EQ(2, list->entry[2].fcpLun[1]);
    uint8_t response[255] = {}, sense[255];
    EXPECT_EQ(0u, nvrsim_RM_ScsiInquiry(wire(port0), wire(target0), fcp_lun(2), response, 255, sense, 255));
    EXPECT_EQ("NORVANE ", std::string(response + 8, response + 16));
    EXPECT_EQ(0u, nvrsim_RM_ScsiReadCapacity(wire(port0), wire(target0), fcp_lun(2), response, 32, sense, 255));
    Block block(512);
    EXPECT_EQ(0u, nvrsim_RM_GetLunAttributes(wire(port0), wire(target0), fcp_lun(2), block.bytes.data(), &block.size));
    uint64_t blocks = 0;
    ASSERT_TRUE(block.read(RM_LUN_BLOCKS, blocks));
    EXPECT_EQ(0x03000000u, blocks);
    std::vector<char> targets(RM_TARGETLIST_SIZE(3));
    auto* mapping = reinterpret_cast<RM_TARGETLIST*>(targets.data());
    mapping->count = 3;
    EXPECT_EQ(0u, nvrsim_RM_GetFcpTargetMapping(wire(port0), mapping));
    EXPECT_EQ(target0, number(mapping->entry[2].FcpId.PortWWN));
}

TEST_F(Inventory, LocalPortsAreListedAndKnown)
{
    load("[[adapter]]\ncount = 2\n[[adapter]]\n[[adapter.port]]\nlocal = false\n");
    EXPECT_EQ(3u, nvrsim_RM_GetNumberOfLocalAdapters());
    auto info = std::make_unique<RM_LOCALHBAINFO>();
    const RM_LOCALINDEX second{0, 1}, beyond{0, 3};
    ASSERT_EQ(0u, nvrsim_RM_GetLocalHBAInfo(&second, info.get()));
    EXPECT_EQ(port1, number(info->wwpn));
    EXPECT_STREQ("Norvane-FC2162-1", info->adapterName);
    EXPECT_NE(0u, nvrsim_RM_GetLocalHBAInfo(&beyond, info.get()));
    uint32_t local = 7;
    EXPECT_EQ(0u, nvrsim_RM_IsLocalHBA(wire(port1), &local));
    EXPECT_EQ(1u, local);
    EXPECT_EQ(0u, nvrsim_RM_IsLocalHBA(wire(port0 + 2), &local));
    EXPECT_EQ(0u, local);
    EXPECT_EQ(0u, nvrsim_RM_IsLocalHBA(wire(0), &local));
    EXPECT_EQ(0u, local);
}

TEST_F(Inventory, VirtualPortsTargetsAndMachines)
{
    load("[[adapter]]\n[[adapter.port]]\n[[adapter.port.vport]]\nname = 'web'\n[[adapter.port.vport.vm]]\n"
         "identity = 'id1'\nname = 'machine'\nmemory = 512\n[[adapter.port.vport]]\n[[target]]\n");
    std::vector<char> buffer(RM_VPORTLIST_SIZE(2));
    auto* list = reinterpret_cast<RM_VPORTLIST*>(buffer.data());
    list->count = 1;
    EXPECT_EQ(unsigned(RM_STATUS_MORE_DATA), nvrsim_RM_VPList(wire(port0), list));
    EXPECT_EQ(2u, list->count);
    EXPECT_EQ(0u, nvrsim_RM_VPList(wire(port0), list));
    EXPECT_EQ(0x10010000C9A00001u, number(list->entry[0].wwpn));
    RM_VPORTATTRIBUTES attributes{};
    EXPECT_NE(0u, nvrsim_RM_VPGetAttributes(wire(port0), list->entry[0].wwpn, &attributes)) << "version not set";
    attributes.version = RM_VPORT_VERSION;
    EXPECT_EQ(0u, nvrsim_RM_VPGetAttributes(wire(port0), list->entry[0].wwpn, &attributes));
    EXPECT_STREQ("web", attributes.name);
    RM_TARGETLIST targets{};
    targets.count = 1;
    EXPECT_EQ(0u, nvrsim_RM_VPListTargets(wire(port0), list->entry[0].wwpn, &targets));
    EXPECT_EQ(1u, targets.count);
    RM_VMLIST machines{};
    machines.count = 1;
    EXPECT_EQ(0u, nvrsim_RM_GetVMFromVPort(list->entry[0].wwpn, &machines));
    RM_VMINFO info{};
    EXPECT_EQ(0u, nvrsim_RM_GetVMInfo(machines.entry, &info));
    EXPECT_STREQ("machine", info.machineName);
    EXPECT_EQ(512u, info.memorySize);
}

TEST_F(Inventory, StatusTextsAreEmptyForUnknownNumbers)
{
    char text[256] = "old";
    EXPECT_EQ(0u, nvrsim_RM_StatusString(RM_STATUS_MAILBOX_BUSY, text, sizeof text));
    EXPECT_STREQ("Mailbox busy", text);
    EXPECT_EQ(0u, nvrsim_RM_StatusString(12345, text, sizeof text));
    EXPECT_STREQ("", text);
    EXPECT_EQ(0u, nvrsim_RM_StatusString(RM_STATUS_MAILBOX_BUSY, text, 5));
    EXPECT_STREQ("Mail", text);
}

TEST_F(Inventory, UnknownPortIsRefusedByEveryCallAboutAPort)
{
    uint32_t word = 0;
    Block block(4096);
    EXPECT_EQ(5u, nvrsim_RM_GetHBAAttributes(wire(1), block.bytes.data(), &block.size));
    EXPECT_EQ(5u, nvrsim_RM_GetDriverType(wire(1), &word));
    EXPECT_EQ(5u, nvrsim_RM_DiagBeaconState(wire(1), &word));
    EXPECT_EQ(5u, nvrsim_RM_ResetHBA(wire(1), 1));
}

TEST_F(Inventory, NullPointersOfCallersAreSurvived)
{
    uint32_t size = 100;
    EXPECT_EQ(4u, nvrsim_RM_GetHBAAttributes(wire(port0), nullptr, &size));
    EXPECT_EQ(4u, nvrsim_RM_GetVPD(wire(port0), nullptr, nullptr));
    EXPECT_EQ(4u, nvrsim_RM_DiagReadPCIRegistersV2(wire(port0), nullptr));
    EXPECT_EQ(4u, nvrsim_RM_ValidateWwn(nullptr));
    EXPECT_EQ(nullptr, nvrsim_RM_GetAttributeValue(nullptr, 1, nullptr, nullptr));
    EXPECT_EQ(0u, nvrsim_RM_GetNextVpdEntry(nullptr, nullptr, 4, nullptr, 0));
    EXPECT_EQ(0u, nvrsim_HBA_OpenAdapter(nullptr));
    EXPECT_EQ(4u, nvrsim_HBA_GetAdapterName(0, nullptr));
    EXPECT_EQ(4u, nvrsim_HBA_GetFcpTargetMapping(open(), nullptr));
}
