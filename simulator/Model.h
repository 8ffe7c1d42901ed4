// The simulated hardware: adapters, their ports, and the targets and logical units that the ports see. Plain values
// without locks; the one instance that calls work on lives in Simulator and is touched under its mutex.
#ifndef _simulator_Model_h
#define _simulator_Model_h

#include "foundation/management_api.h"

#include <array>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <unordered_map>
#include <utility>
#include <vector>

namespace nvrsim {

using Bytes = std::string; // raw bytes, may hold zeros

/// A World Wide Name as a number, byte 0 of the wire in the top byte.
using Wwn = uint64_t;

Wwn to_number(const HBA_WWN& wwn);
HBA_WWN to_wire(Wwn wwn);
/// Sixteen upper-case digits.
std::string to_text(Wwn wwn);
/// Reads sixteen hexadecimal digits; ':', '-', blanks between and "0x" before them are skipped. False for anything
/// else.
bool parse_wwn(const std::string& text, Wwn& wwn);

/// Encoded attribute values by number; an empty optional leaves the attribute out of the block.
using Attributes = std::map<uint16_t, std::optional<Bytes>>;

Bytes encode32(uint32_t value);
Bytes encode64(uint64_t value);

/// How a logical unit answers one SCSI command: with a status, and with these bytes instead of the built ones.
struct Scsi_Answer {
    uint32_t status = 0;
    std::optional<Bytes> bytes;
};

struct Scsi_Answers {
    Scsi_Answer inquiry, page80, page83, capacity;
    Bytes sense; // for a check condition; empty gives "illegal request"
};

struct Lun {
    std::array<uint8_t, 8> fcpLun{}; // wire order
    uint32_t number = 0;             // the operating system's
    uint8_t deviceType = 0;
    uint8_t identifierType = 3;
    uint8_t identifierCodeSet = 1;
    uint32_t blockSize = 512;
    uint64_t blocks = 0; // 0: the unit has no capacity
    std::string vendor, product, revision, serial, osDeviceName;
    Bytes identifier;
    std::unique_ptr<Scsi_Answers> answers; // null: all built
};

struct Target {
    std::string name;
    Wwn wwpn = 0, wwnn = 0;
    uint32_t fcId = 0;
    std::vector<Lun> luns;
    std::unordered_map<uint64_t, uint32_t> byFcpLun; // eight bytes as they lie in memory

    const Lun* find(uint64_t fcpLun) const;
};

struct Tag_Entry {
    Wwn source = 0, target = 0;
    uint8_t tag = 0;
};

struct Virtual_Machine {
    std::string identity, server, name, guestOs;
    uint32_t memory = 0;
};

struct Virtual_Port {
    Wwn wwpn = 0, wwnn = 0;
    uint32_t fcId = 0;
    uint32_t state = HBA_PORTSTATE_ONLINE;
    std::string name;
    std::vector<Virtual_Machine> machines;
};

struct Flash_Image {
    std::string name, version;
    uint32_t type = 0, size = 0;
};

struct Driver_Param {
    std::string name, help;
    uint32_t low = 0, high = 0, defaultValue = 0, current = 0;
    uint16_t exportFlag = 1, dynamic = 1;
};

struct Names {
    Wwn wwpn = 0, wwnn = 0;
};

/// What a change of names waits for.
struct Pending_Names {
    Names names;
    bool isVolatile = false;
    bool dropVolatile = false;
    uint32_t activation = 0;
};

struct Diagnostic_Test {
    uint32_t id = 0;
    uint32_t type = 0;
    uint32_t polls = 0; // answers "running" this often
    uint32_t result = 0;
    uint32_t cycles = 0;
    uint32_t cancelPolls = 0; // after a cancel
    bool cancelled = false;
};

/// What the tests of a port lead to; the polls and result codes of each kind.
struct Diagnostics {
    bool available = true;
    uint32_t polls = 1;
    uint32_t runningState = RM_DIAG_RUNNING; // while it is polled
    uint32_t runningStatus = RM_STATUS_NO_RESULT_YET;
    uint32_t state = RM_DIAG_COMPLETED; // behind the polls
    uint32_t seconds = 1;
    std::optional<uint32_t> cycles;      // default: as many as were asked for
    std::optional<uint32_t> loopsFailed; // default: 1 for a test that fails
    bool canCancel = true;
    uint32_t cancelPolls = 0;                // that a cancelled test still runs
    std::string lastStart;                   // the newest test and its arguments
    std::map<std::string, uint32_t> results; // by "post", "loopback", "external_loopback", "pci_loopback", "echo"
    std::map<uint32_t, Diagnostic_Test> tests;
    uint32_t nextId = 1;
};

struct Port {
    uint32_t ordinal = 0; // over all ports of the host, in scenario order
    uint32_t index = 0;   // in its adapter
    Names factory, current;
    std::optional<Names> nonVolatile, volatileNames;
    std::optional<Pending_Names> pending;
    uint32_t wwnCapability = RM_WWN_CAN_NONVOLATILE | RM_WWN_CAN_VOLATILE | RM_WWN_NEEDS_RESET;

    uint32_t fcId = 0, type = HBA_PORTTYPE_NPORT, state = HBA_PORTSTATE_ONLINE, classOfService = 0;
    std::array<uint8_t, 32> supportedFc4{}, activeFc4{};
    std::string symbolicName, osDeviceName;
    uint32_t supportedSpeed = 0, speed = 0, maxFrameSize = 0;
    Wwn fabricName = 0;
    std::optional<uint32_t> discoveredPorts; // default: the targets it sees
    bool local = true;
    bool enabled = true;
    bool enableNeedsReset = true;
    bool loopbackPlug = false;
    uint32_t linkUpSpeed = 0; // to come back to
    uint32_t bootCode = 0;
    uint32_t beacon = RM_BEACON_OFF;
    uint32_t beaconStatus = 0;
    uint32_t resetMilliseconds = 0;
    int64_t resettingUntil = 0; // monotonic milliseconds
    uint32_t resets = 0;
    bool firmwareNeedsReboot = false;

    Attributes adapterAttributes; // of RM_GetHBAAttributes
    Attributes portAttributes;    // of RM_GetPortAttributes
    Attributes statistics;
    uint32_t driverType = 0;

    std::optional<Bytes> vpd; // PCI data; nullopt: none
    std::optional<Bytes> sffA0, sffA2;
    Bytes pci; // header, then registers
    std::vector<Driver_Param> params;
    std::vector<Flash_Image> flash;
    std::vector<Virtual_Port> vports;
    std::vector<std::string> dumps;
    uint32_t dumpsMade = 0;
    uint32_t dumpNeed = 0; // count that the last "list too long" asked for
    uint32_t retention = 5;
    std::string dumpDirectory;
    Diagnostics diagnostics;

    std::vector<std::shared_ptr<const Target>> targets;
    std::vector<uint32_t> firstPath; // of each target, counted over the host: numbers the devices of the system
    std::unordered_map<Wwn, uint32_t> targetByWwpn;

    bool link_is_up() const { return enabled && state == HBA_PORTSTATE_ONLINE; }
    const Target* find_target(Wwn wwpn) const;
    size_t paths() const;
};

struct Adapter {
    std::string name;
    bool present = true;
    std::string manufacturer, serialNumber, model, modelDescription, nodeSymbolicName, hardwareVersion, driverVersion,
        optionRomVersion, firmwareVersion, driverName;
    Wwn nodeWwn = 0;
    uint32_t vendorSpecificId = 0;
    std::optional<uint32_t> numberOfPorts; // default: the ports it has
    std::vector<Port> ports;
    std::vector<Tag_Entry> tags;
    uint32_t tagFlag = 0;
};

struct Host {
    std::vector<Adapter> adapters;
    std::vector<Driver_Param> globalParams;
    std::string importedFirmware;

    Adapter* find(const std::string& adapterName);
    /// A present port by its current name.
    Port* find(Wwn wwpn, Adapter** owner = nullptr);
    Port* port(uint32_t ordinal, Adapter** owner = nullptr);
    /// To be called whenever adapters or names of ports have changed.
    void reindex();

private:
    std::unordered_map<std::string, uint32_t> m_adapterByName;
    std::unordered_map<Wwn, std::pair<uint32_t, uint32_t>> m_portByWwpn;
    std::vector<std::pair<uint32_t, uint32_t>> m_portByOrdinal;
};

} // namespace nvrsim

#endif // _simulator_Model_h
