/// What an adapter reports about itself, read once when the object is built.
#pragma once

#include <string>

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

class Adapter;

/// The transport-independent face. Its end, as that of every part of the tree, may throw: owners log it and go on.
class AdapterAttributes {
public:
    AdapterAttributes() = default;
    virtual ~AdapterAttributes() noexcept(false) {}
    AdapterAttributes(const AdapterAttributes&) = delete;
    AdapterAttributes& operator=(const AdapterAttributes&) = delete;
};

/// The fields have the names under which the Common HBA API or the log knows them.
class FCAdapterAttributes : public AdapterAttributes {
public:
    /// Opens `adapter` by name, reads its record and that of its port 0, and then the management block of that port.
    /// Throws std::exception, logged, if the adapter cannot be opened or port 0 or the block cannot be read. A record
    /// that cannot be read leaves its fields empty and the number of ports 0; a missing attribute leaves its field
    /// empty.
    explicit FCAdapterAttributes(const Adapter& adapter);

    std::string _Manufacturer;
    std::string _SerialNumber;
    std::string _Model;
    std::string _ModelDescription;
    std::string _NodeSymbolicName;
    std::string _HardwareVersion;
    std::string _DriverVersion;
    std::string _OptionROMVersion;
    std::string _FirmwareVersion;
    std::string _DriverName;
    std::string _NodeWWN; ///< 16 upper-case digits
    uint32 _VendorSpecificID = 0;
    uint32 _NumberOfPorts = 0; ///< as reported
    uint32 _Temperature0 = 0;  ///< bytes of the board's temperature: 0 current,
    uint32 _Temperature2 = 0;  ///< 2 warning limit,
    uint32 _Temperature1 = 0;  ///< 1 critical limit; degrees Celsius
    uint32 _DeviceID = 0;
    uint32 _ModelID = 0;
    uint32 _DriverType = 0;
    uint32 _DiagVersion = 0;
    uint32 _PortNumber = 0;
    uint32 _FunctionType = 0; ///< 1, 2, 3: a converged function
    uint32 _SLIMode = 0;
    uint32 _PCIFunctionNumber = 0;
    uint32 _PCIBusNumber = 0;
    std::string _IEEE_ADDRESS; ///< "%02x:%02x:%02x:%02x:%02x:%02x"
    std::string _BOOTBIOS_VERSION;
    std::string _KERNEL_VERSION;
    std::string _INITIAL_FW_LOAD;
    std::string _OperationalFirmware;
    std::string _FCUniversalVersion;
    std::string _FC_X86_BIOSVersion;
    std::string _FC_EFIVersion;
    std::string _FC_FCODEVersion;
    std::string _ULPFirmwareVersion;
    std::string _ULPFirmwareName;
    std::string _SPFirmwareVersion;
    std::string _SPFirmwareName;
    bool _BootCodeEnabled = false;

private:
    std::string readRecords(const Adapter& adapter);
    void takeRecord(const HBA_ADAPTERATTRIBUTES& record);
    void readBlock(const std::string& wwpn);
    void readDriverType(const HBA_WWN& wwn);
};

class AdapterStatistics {
public:
    AdapterStatistics() = default;
    virtual ~AdapterStatistics() noexcept(false) {}
    AdapterStatistics(const AdapterStatistics&) = delete;
    AdapterStatistics& operator=(const AdapterStatistics&) = delete;
};

/// Reads nothing: every adapter has one, and nothing is counted per adapter.
class FCAdapterStatistics : public AdapterStatistics {};

} // namespace cimple
