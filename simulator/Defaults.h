// What the hardware of a scenario looks like where the scenario says nothing: plausible values, different for each
// port, the same in every run. Pure functions.
#ifndef _simulator_Defaults_h
#define _simulator_Defaults_h

#include "simulator/Model.h"

namespace nvrsim {

constexpr Wwn firstPortName = 0x10000000C9A00001;
constexpr Wwn firstNodeName = 0x20000000C9A00001;
constexpr Wwn firstTargetPort = 0x50060E8005A10000;
constexpr Wwn firstTargetNode = 0x50060E8005A1FF00;

/// Identity of the adapter with this number, without ports.
Adapter default_adapter(uint32_t number);

/// Everything of a port but its targets and what depends on the adapter's texts.
Port default_port(uint32_t ordinal, uint32_t index);

/// Attributes that repeat the adapter's texts; only those that the port does not have yet.
void complete_attributes(const Adapter& adapter, Port& port);

/// A logical unit with this number behind a target; capacity, serial number and identifier follow from both.
Lun default_lun(const Target& target, uint32_t number);
/// Capacity in blocks for a device type; 0 for types that have none.
uint64_t default_blocks(uint8_t deviceType, uint32_t number);
/// The bytes of an FCP LUN for a number: peripheral addressing below 256, flat space addressing from there.
std::array<uint8_t, 8> wire_lun(uint32_t number);

std::vector<Driver_Param> default_params();

/// PCI vital product data from the identifier text and fields in order; writable ones (V, Y) go to the second section.
Bytes build_vpd(const std::string& product, const std::vector<std::pair<std::string, std::string>>& fields);

/// What a module page A0 and A2 is built from; texts are cut and padded to their fields.
struct Transceiver {
    std::string vendor = "NORVANE OPTICS", partNumber = "NVO-16G-SW", revision = "A1", serial = "NVO0000001",
                dateCode = "210415";
    uint32_t oui = 0x00C9A0, wavelength = 850;
    uint8_t identifier = 3, extIdentifier = 4, connector = 7;
    double temperature = 41.5, vcc = 3.3, txBias = 6.25, txPower = 0.55, rxPower = 0.5; // Celsius, V, mA, mW, mW
    bool diagnostics = true;
};
Bytes build_sff_a0(const Transceiver& module);
Bytes build_sff_a2(const Transceiver& module);

/// The fields of a PCI configuration header that scenarios name.
struct Pci_Header {
    uint32_t vendor = 0x4E56, device = 0xF162, command = 0x0147, status = 0x0010, revision = 3, progIf = 0,
             subClass = 4, baseClass = 0x0C, cacheLineSize = 16, latencyTimer = 0, headerType = 0x80, bist = 0, cis = 0,
             subVendor = 0x4E56, subsystem = 0xF162, rom = 0xFE000000, capabilities = 0x58, interruptLine = 11,
             interruptPin = 1, minGrant = 0, maxLatency = 0;
    std::array<uint32_t, 6> bases{{0xFD000004, 0, 0xFC000004, 0, 0, 0}};
};
Bytes build_pci(const Pci_Header& header);

/// Device name of the operating system for a path: disks, tapes and all others are numbered over the host.
std::string os_device_name(const Lun& lun, uint32_t path);

} // namespace nvrsim

#endif // _simulator_Defaults_h
