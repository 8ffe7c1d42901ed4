#include "simulator/Defaults.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <cstring>

namespace nvrsim {

namespace {

template <class... T>
std::string format(const char* pattern, T... values)
{
    char text[256];
    std::snprintf(text, sizeof text, pattern, values...);
    return text;
}

void put_text(Bytes& page, size_t offset, size_t width, const std::string& text)
{
    for (size_t i = 0; i < width; ++i)
        page[offset + i] = i < text.size() ? text[i] : ' ';
}

void put_big16(Bytes& page, size_t offset, double value)
{
    const auto word = static_cast<uint16_t>(static_cast<int32_t>(std::lround(std::clamp(value, -32768.0, 65535.0))));
    page[offset] = static_cast<char>(word >> 8);
    page[offset + 1] = static_cast<char>(word);
}

void put_little(Bytes& page, size_t offset, size_t width, uint32_t value)
{
    for (size_t i = 0; i < width; ++i)
        page[offset + i] = static_cast<char>(value >> (8 * i));
}

void put_checksum(Bytes& page, size_t from, size_t to)
{
    unsigned sum = 0;
    for (size_t i = from; i < to; ++i)
        sum += static_cast<uint8_t>(page[i]);
    page[to] = static_cast<char>(sum);
}

// Sections are at most 64 KiB by their length word; the block that carries them is far smaller.
void append_section(Bytes& vpd, uint8_t tag, const Bytes& content)
{
    if (content.empty()) return;
    vpd += static_cast<char>(tag);
    vpd += static_cast<char>(content.size());
    vpd += static_cast<char>(content.size() >> 8);
    vpd += content;
}

} // namespace

Adapter default_adapter(uint32_t number)
{
    Adapter adapter;
    adapter.name = format("Norvane-FC2162-%u", number);
    adapter.manufacturer = "Norvane Corporation";
    adapter.serialNumber = format("NV2162%05u", number + 1);
    adapter.model = "FC2162";
    adapter.modelDescription = "Norvane FC2162 16Gb Fibre Channel Host Bus Adapter";
    adapter.nodeSymbolicName = format("Norvane FC2162 FV2.01a4 DV8.3.7.18 HBA%u", number);
    adapter.hardwareVersion = "31004549";
    adapter.driverVersion = "8.3.7.18";
    adapter.optionRomVersion = "2.12a2";
    adapter.firmwareVersion = "2.01a4";
    adapter.driverName = "nvrfc";
    adapter.vendorSpecificId = 0x4E56F162;
    return adapter;
}

Port default_port(uint32_t ordinal, uint32_t index)
{
    Port port;
    port.ordinal = ordinal;
    port.index = index;
    port.factory = port.current = {firstPortName + ordinal, firstNodeName + ordinal};
    port.fcId = 0x010100 + (ordinal % 2) * 0x010000 + ordinal / 2 % 256;
    port.classOfService = 0x08;
    port.supportedFc4[2] = 0x01; // FCP, type 8
    port.supportedFc4[7] = 0x01; // common transport, type 32 is entry 7
    port.activeFc4[2] = 0x01;
    port.symbolicName = format("Norvane FC2162 port %u", ordinal);
    port.osDeviceName = format("/sys/class/fc_host/host%u", ordinal);
    port.supportedSpeed = 8 | 16 | 32; // 4, 8 and 16 Gbit/s as this API numbers them
    port.speed = port.linkUpSpeed = 32;
    port.maxFrameSize = 2048;
    port.fabricName = 0x1000000533A00001 + ordinal % 2 * 0x10000;
    port.driverType = 1;

    port.adapterAttributes = {
        {RM_ATTR_VPORT_MAPPING, encode32(1)},
        {RM_ATTR_DEVICE_ID, encode32(0xF162)},
        {RM_ATTR_MODEL_ID, encode32(0x2162)},
        {RM_ATTR_DIAG_VERSION, encode32(3)},
        {RM_ATTR_SLI_MODE, encode32(4)},
        {RM_ATTR_BOARD_TEMPERATURE, encode32(45 | 100u << 8 | 85u << 16)},
        {RM_ATTR_PORT_NUMBER, encode32(ordinal % 2)},
        {RM_ATTR_FUNCTION_TYPE, encode32(0)},
        {RM_ATTR_PCI_BUS_NUMBER, encode32(4 + ordinal / 2)},
        {RM_ATTR_PCI_FUNCTION_NUMBER, encode32(ordinal % 2)},
        {RM_ATTR_BOOT_BIOS_VERSION, Bytes("2.12a2")},
        {RM_ATTR_KERNEL_VERSION, Bytes("1.40a3")},
        {RM_ATTR_INITIAL_FIRMWARE, Bytes("1.20a8")},
        {RM_ATTR_UNIVERSAL_VERSION, Bytes("2.12A2")},
        {RM_ATTR_X86_BIOS_VERSION, Bytes("2.12a2")},
        {RM_ATTR_EFI_VERSION, Bytes("4.30a0")},
        {RM_ATTR_FCODE_VERSION, Bytes("3.10a1")},
        {RM_ATTR_SP_FIRMWARE_NAME, Bytes("SP")},
    };
    for (uint16_t number = RM_STAT_FIRST; number <= RM_STAT_LAST; ++number)
        port.statistics[number] = encode64(1000ull * (number - RM_STAT_FIRST) + ordinal);
    for (uint16_t error = RM_STAT_LIP_COUNT; error <= RM_STAT_CRC_ERRORS; ++error)
        port.statistics[error] = encode64(error - RM_STAT_LIP_COUNT);
    for (uint16_t unused : {1034, 1035, 1049, 1050, 1051, 1052, 1053, 1054, 1055, 1056})
        port.statistics.erase(unused);

    port.vpd = build_vpd("Norvane FC2162 16Gb 2-Port PCIe Fibre Channel Adapter",
                         {{"PN", "FC2162-M8"},
                          {"SN", format("NV2162%05u", ordinal / 2 + 1)},
                          {"EC", "A-5681"},
                          {"MN", "4E56"},
                          {"V0", "FC2162"},
                          {"V1", "Norvane FC2162 16Gb 2-Port PCIe Fibre Channel Adapter"},
                          {"V2", "FC2162-M8"},
                          {"V4", format("%u", ordinal % 2)},
                          {"YA", format("slot %u", ordinal / 2 + 1)}});
    Transceiver module;
    module.serial = format("NVO%07u", ordinal + 1);
    port.sffA0 = build_sff_a0(module);
    port.sffA2 = build_sff_a2(module);
    port.pci = build_pci({});
    port.params = default_params();
    port.flash = {
        {"Firmware", "2.01a4", 1, 0x80000}, {"Boot BIOS", "2.12a2", 2, 0x20000}, {"EFI Boot", "4.30a0", 3, 0x40000}};
    return port;
}

void complete_attributes(const Adapter& adapter, Port& port)
{
    const HBA_WWN name = to_wire(port.factory.wwpn);
    port.adapterAttributes.emplace(RM_ATTR_OPERATIONAL_FIRMWARE, Bytes("SLI-3 Overlay"));
    port.adapterAttributes.emplace(RM_ATTR_IEEE_ADDRESS, Bytes(reinterpret_cast<const char*>(name.wwn + 2), 6));
    port.adapterAttributes.emplace(RM_ATTR_ULP_FIRMWARE_NAME, Bytes("FC2D" + adapter.firmwareVersion));
    port.adapterAttributes.emplace(RM_ATTR_ULP_FIRMWARE_VERSION, adapter.firmwareVersion);
    port.adapterAttributes.emplace(RM_ATTR_SP_FIRMWARE_VERSION, adapter.firmwareVersion);
}

std::array<uint8_t, 8> wire_lun(uint32_t number)
{
    std::array<uint8_t, 8> lun{};
    lun[0] = static_cast<uint8_t>(number < 256 ? 0 : 0x40 | (number >> 8 & 0x3F));
    lun[1] = static_cast<uint8_t>(number);
    // What flat addressing cannot hold goes into the second level, so that every number has a LUN of its own.
    if (number >= 0x4000) {
        lun[2] = static_cast<uint8_t>(number >> 22 & 0xFF);
        lun[3] = static_cast<uint8_t>(number >> 14);
    }
    return lun;
}

uint64_t default_blocks(uint8_t deviceType, uint32_t number)
{
    switch (deviceType) {
    case 0:
    case 4:
    case 5:
    case 7:
    case 14:
    case 17:
        return 0x01000000ull * (number % 8 + 1);
    default:
        return 0;
    }
}

Lun default_lun(const Target& target, uint32_t number)
{
    Lun lun;
    lun.number = number;
    lun.fcpLun = wire_lun(number);
    lun.vendor = "NORVANE";
    lun.product = "VIRTUAL-DISK";
    lun.revision = "0401";
    lun.blocks = default_blocks(0, number);
    lun.serial = format("%08X%04X", static_cast<unsigned>(target.wwnn), number);
    // Registered extended NAA identifier. It follows from the node, so that two ports of an array show the same units.
    const HBA_WWN node = to_wire(target.wwnn);
    lun.identifier = Bytes("\x60\x0C\x9A\x0F", 4) + Bytes(reinterpret_cast<const char*>(node.wwn + 4), 4);
    for (int shift = 56; shift >= 0; shift -= 8)
        lun.identifier += static_cast<char>(static_cast<uint64_t>(number) >> shift);
    return lun;
}

std::vector<Driver_Param> default_params()
{
    return {
        {"log-verbose", "Verbose logging bit mask", 0, 0xFFFFFFFF, 0, 0, 1, 1},
        {"lun-queue-depth", "Max number of FCP commands that can be queued to a specific LUN", 1, 512, 30, 30, 1, 1},
        {"hba-queue-depth", "Max number of FCP commands that can be queued to an adapter", 32, 8192, 8192, 8192, 1, 0},
        {"link-speed", "Select link speed: 0 automatic, else Gbit/s", 0, 16, 0, 0, 1, 0},
        {"topology", "Select Fibre Channel topology", 0, 6, 0, 0, 1, 0},
        {"nodev-tmo", "Seconds driver will hold I/O waiting for a device to come back", 0, 255, 30, 30, 1, 1},
        {"devloss-tmo", "Seconds driver will hold I/O waiting for a device to come back", 0, 255, 30, 30, 1, 1},
        {"scan-down", "Start scanning for devices from highest ALPA to lowest", 0, 1, 1, 1, 1, 0},
        {"fcp-class", "Select Fibre Channel class of service for FCP sequences", 2, 3, 3, 3, 1, 0},
        {"use-adisc", "Use ADISC on rediscovery to authenticate FCP devices", 0, 1, 0, 0, 1, 1},
        {"ack0", "Enable ACK0 support", 0, 1, 0, 0, 1, 0},
        {"enable-npiv", "Enable NPIV functionality", 0, 1, 1, 1, 1, 0},
    };
}

Bytes build_vpd(const std::string& product, const std::vector<std::pair<std::string, std::string>>& fields)
{
    Bytes readOnly, writable;
    for (const auto& [tag, value] : fields) {
        Bytes& section = tag[0] == 'Y' ? writable : readOnly;
        section += tag;
        section += static_cast<char>(value.size());
        section += value;
    }
    Bytes vpd;
    append_section(vpd, 0x82, product);
    append_section(vpd, 0x90, readOnly);
    append_section(vpd, 0x91, writable);
    vpd += '\x78';
    return vpd;
}

Bytes build_sff_a0(const Transceiver& module)
{
    Bytes page(256, '\0');
    page[0] = static_cast<char>(module.identifier);
    page[1] = static_cast<char>(module.extIdentifier);
    page[2] = static_cast<char>(module.connector);
    page[6] = 0x20;
    page[7] = 0x40; // intermediate distance
    page[8] = 0x0C;
    page[9] = 0x40;
    page[10] = 0x54;
    page[11] = 1;
    page[12] = static_cast<char>(0x8C);
    put_text(page, 20, 16, module.vendor);
    page[37] = static_cast<char>(module.oui >> 16);
    page[38] = static_cast<char>(module.oui >> 8);
    page[39] = static_cast<char>(module.oui);
    put_text(page, 40, 16, module.partNumber);
    put_text(page, 56, 4, module.revision);
    put_big16(page, 60, module.wavelength);
    put_text(page, 68, 16, module.serial);
    put_text(page, 84, 8, module.dateCode);
    page[92] = module.diagnostics ? 0x68 : 0x00; // implemented, internally calibrated, average power
    page[94] = module.diagnostics ? 0x05 : 0x00;
    put_checksum(page, 0, 63);
    put_checksum(page, 64, 95);
    return page;
}

Bytes build_sff_a2(const Transceiver& module)
{
    Bytes page(256, '\0');
    for (size_t slope : {76, 80, 84, 88})
        page[slope] = 1; // 1.0 in fixed point: neutral constants
    const float one = 1.0f;
    uint32_t bits;
    std::memcpy(&bits, &one, sizeof bits);
    for (size_t i = 0; i < 4; ++i)
        page[68 + i] = static_cast<char>(bits >> (24 - 8 * i));
    put_checksum(page, 0, 95);
    put_big16(page, 96, module.temperature * 256);
    put_big16(page, 98, module.vcc * 10000);
    put_big16(page, 100, module.txBias * 500);
    put_big16(page, 102, module.txPower * 10000);
    put_big16(page, 104, module.rxPower * 10000);
    return page;
}

Bytes build_pci(const Pci_Header& header)
{
    Bytes space(sizeof(RM_PCIREGISTERS), '\0');
    put_little(space, 0, 2, header.vendor);
    put_little(space, 2, 2, header.device);
    put_little(space, 4, 2, header.command);
    put_little(space, 6, 2, header.status);
    put_little(space, 8, 1, header.revision);
    put_little(space, 9, 1, header.progIf);
    put_little(space, 10, 1, header.subClass);
    put_little(space, 11, 1, header.baseClass);
    put_little(space, 12, 1, header.cacheLineSize);
    put_little(space, 13, 1, header.latencyTimer);
    put_little(space, 14, 1, header.headerType);
    put_little(space, 15, 1, header.bist);
    for (size_t i = 0; i < header.bases.size(); ++i)
        put_little(space, 16 + 4 * i, 4, header.bases[i]);
    put_little(space, 40, 4, header.cis);
    put_little(space, 44, 2, header.subVendor);
    put_little(space, 46, 2, header.subsystem);
    put_little(space, 48, 4, header.rom);
    put_little(space, 52, 1, header.capabilities);
    put_little(space, 60, 1, header.interruptLine);
    put_little(space, 61, 1, header.interruptPin);
    put_little(space, 62, 1, header.minGrant);
    put_little(space, 63, 1, header.maxLatency);
    for (size_t i = sizeof(RM_PCIREGISTERS::header); i < space.size(); ++i)
        space[i] = static_cast<char>(i);
    return space;
}

std::string os_device_name(const Lun& lun, uint32_t path)
{
    if (!lun.osDeviceName.empty()) return lun.osDeviceName;
    if (lun.deviceType == 1) return format("/dev/st%u", path);
    if (lun.deviceType != 0 && lun.deviceType != 14) return format("/dev/sg%u", path);
    std::string letters;
    for (uint64_t rest = path + 1ull; rest; rest = (rest - 1) / 26)
        letters.insert(letters.begin(), static_cast<char>('a' + (rest - 1) % 26));
    return "/dev/sd" + letters;
}

} // namespace nvrsim
