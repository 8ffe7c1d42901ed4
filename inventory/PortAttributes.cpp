#include "inventory/PortAttributes.h"

#include <exception>

#include "foundation/AttributeBlock.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "inventory/Adapter.h"
#include "inventory/AdapterHandle.h"

namespace cimple {

static HBA_PORTATTRIBUTES readRecord(const Adapter& adapter, uint32 index)
{
    HBA_PORTATTRIBUTES record;
    const HBA_STATUS status = AdapterHandle(adapter.name()).readPort(index, record);
    if (status == HBA_STATUS_OK) return record;
    NVR_LOG("(portIndex=%d) failed with hbaStatus %d", static_cast<int>(index), static_cast<int>(status));
    throw std::exception();
}

static uint32 readPortState(const std::string& wwpn)
{
    NVR_LOG("Port 0's WWPN: %s", wwpn.c_str()); // these words for every port
    HBA_WWN wwn;
    if (!string2HBAName(&wwn, wwpn.c_str())) {
        NVR_LOG("NVR_MethodWrapper::string2HBAName failed");
        throw std::exception();
    }
    AttributeBlock block(RM_PORT_BLOCK_SIZE);
    if (!block.valid()) {
        NVR_LOG("\nERROR: nvrcimGetPortAttributes: Unable to allocate buffer\n");
        throw std::exception();
    }
    if (const uint32 status = block.fill(RM_GetPortAttributes, wwn)) {
        NVR_LOG("RM_GetPortAttributes call failed (%d)\n", static_cast<int>(status));
        throw std::exception();
    }
    uint32 state = 0;
    block.number(RM_ATTR_PORT_STATE, "_PortState", state);
    NVR_LOG("Physical port state for FC Port: %d", static_cast<int>(state));
    return state;
}

FCPortAttributes::FCPortAttributes(const Adapter& adapter, uint32 index)
{
    const HBA_PORTATTRIBUTES record = readRecord(adapter, index);
    PortFcId = record.PortFcId;
    PortType = record.PortType;
    PortState = record.PortState;
    PortSupportedClassofService = record.PortSupportedClassofService;
    for (unsigned i = 0; i < 32; i++) {
        PortSupportedFc4Types[i] = record.PortSupportedFc4Types.bits[i];
        PortActiveFc4Types[i] = record.PortActiveFc4Types.bits[i];
    }
    PortSymbolicName = fieldText(record.PortSymbolicName);
    OSDeviceName = fieldText(record.OSDeviceName);
    PortSupportedSpeed = record.PortSupportedSpeed;
    PortSpeed = record.PortSpeed;
    PortMaxFrameSize = record.PortMaxFrameSize;
    PortWWN = wwnText(record.PortWWN);
    NodeWWN = wwnText(record.NodeWWN);
    FabricName = wwnText(record.FabricName);
    NumberofDiscoveredPorts = record.NumberofDiscoveredPorts;
    PortState = readPortState(PortWWN);
}

} // namespace cimple
