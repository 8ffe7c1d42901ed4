/// A logical unit behind a port, as the adapter's target mapping and four SCSI commands tell of it.
#pragma once

#include <string>

#include "foundation/NVR_Common.h"
#include "runtime/Type.h"

namespace cimple {

class Adapter;

class Target {
public:
    /// Takes the mapping's entry and asks the device itself. Throws std::exception, logged, if the adapter cannot be
    /// opened; a command that fails leaves its fields at "Unknown", 0 or empty.
    Target(const Adapter& adapter, const HBA_FCPSCSIENTRY& entry);
    virtual ~Target() noexcept(false) {}
    Target(const Target&) = delete;
    Target& operator=(const Target&) = delete;

    uint32 FcId = 0;
    std::string NodeName; ///< 16 upper-case digits
    std::string PortName; ///< 16 upper-case digits
    uint64 FcpLun = 0;    ///< its eight bytes in memory are the LUN in wire order
    std::string OSDeviceName;
    uint32 BusNumber = 0;
    uint32 TargetNumber = 0;
    uint32 OSLun = 0;
    uint64 BlockSize = 0;
    uint64 LastBlock = 0;
    uint32 DeviceType = 0; ///< peripheral device type of the standard inquiry
    std::string Vendor;
    std::string Product;
    std::string Revision;
    std::string SerialNumber;
    DeviceIdentifier Identifier;
};

} // namespace cimple
