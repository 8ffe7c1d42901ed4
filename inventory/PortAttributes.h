/// What a port reports about itself, read once when the object is built.
#pragma once

#include <string>

#include "runtime/Type.h"

namespace cimple {

class Adapter;

class PortAttributes {
public:
    PortAttributes() = default;
    virtual ~PortAttributes() noexcept(false) {}
    PortAttributes(const PortAttributes&) = delete;
    PortAttributes& operator=(const PortAttributes&) = delete;
};

/// World Wide Names stand as 16 upper-case digits; numbers are those of the Common HBA API.
class FCPortAttributes : public PortAttributes {
public:
    /// Opens `adapter` by name, reads the record of its port `index`, and then the port's management block, whose port
    /// state replaces the record's. Throws std::exception, logged, if one of them cannot be read.
    FCPortAttributes(const Adapter& adapter, uint32 index);

    std::string NodeWWN;
    std::string PortWWN;
    uint32 PortFcId = 0;
    uint32 PortType = 1;
    uint32 PortState = 1; ///< HBA_PORTSTATE, or 20, 21, 22 of the management library; 0 if it does not tell
    uint32 PortSupportedClassofService = 0;
    uint32 PortSupportedFc4Types[32] = {}; ///< one byte of the API's field in each
    uint32 PortActiveFc4Types[32] = {};
    std::string PortSymbolicName;
    std::string OSDeviceName;
    uint32 PortSupportedSpeed = 0;
    uint32 PortSpeed = 0;
    uint32 PortMaxFrameSize = 0;
    std::string FabricName;
    uint32 NumberofDiscoveredPorts = 0;
};

} // namespace cimple
