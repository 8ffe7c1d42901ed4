#include "inventory/AdapterAttributes.h"

#include <exception>

#include "foundation/AttributeBlock.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "inventory/Adapter.h"
#include "inventory/AdapterHandle.h"

namespace cimple {

FCAdapterAttributes::FCAdapterAttributes(const Adapter& adapter)
{
    NVR_LOG("FCAdapterName:%s", adapter.name().c_str());
    readBlock(readRecords(adapter)); // the adapter is closed in between: the block goes by the port's name
}

// Gives the WWPN of port 0.
std::string FCAdapterAttributes::readRecords(const Adapter& adapter)
{
    const AdapterHandle handle(adapter.name());
    HBA_ADAPTERATTRIBUTES record;
    HBA_STATUS status =
        handle.readRecord(record, [&](HBA_ADAPTERATTRIBUTES* r) { return HBA_GetAdapterAttributes(handle, r); });
    if (status != HBA_STATUS_OK)
        NVR_LOG("Error hbaStatus=%d, skipping Adapter %s", static_cast<int>(status), adapter.name().c_str());
    else
        takeRecord(record);

    HBA_PORTATTRIBUTES port;
    status = handle.readPort(0, port);
    if (status != HBA_STATUS_OK) {
        NVR_LOG("(portIndex=%d) failed with hbaStatus %d", 0, static_cast<int>(status));
        throw std::exception();
    }
    const std::string wwpn = wwnText(port.PortWWN);
    NVR_LOG("Port 0's WWPN: %s", wwpn.c_str());
    return wwpn;
}

void FCAdapterAttributes::takeRecord(const HBA_ADAPTERATTRIBUTES& record)
{
    _Manufacturer = fieldText(record.Manufacturer);
    _SerialNumber = fieldText(record.SerialNumber);
    _Model = fieldText(record.Model);
    _ModelDescription = fieldText(record.ModelDescription);
    _NodeSymbolicName = fieldText(record.NodeSymbolicName);
    NVR_LOG("_NodeSymbolicName=%s", _NodeSymbolicName.c_str());
    _HardwareVersion = fieldText(record.HardwareVersion);
    _DriverVersion = fieldText(record.DriverVersion);
    _OptionROMVersion = fieldText(record.OptionROMVersion);
    _FirmwareVersion = fieldText(record.FirmwareVersion);
    _DriverName = fieldText(record.DriverName);
    _NodeWWN = wwnText(record.NodeWWN);
    _VendorSpecificID = record.VendorSpecificID;
    _NumberOfPorts = record.NumberOfPorts;
}

void FCAdapterAttributes::readBlock(const std::string& wwpn)
{
    HBA_WWN wwn;
    if (!string2HBAName(&wwn, wwpn.c_str())) {
        NVR_LOG("NVR_MethodWrapper::string2HBAName failed");
        throw std::exception();
    }
    AttributeBlock block(RM_HBA_BLOCK_SIZE);
    if (!block.valid()) {
        NVR_LOG("ERROR: GetHBAAttributes: Unable to allocate buffer");
        throw std::exception();
    }
    if (const uint32 status = block.fill(RM_GetHBAAttributes, wwn)) {
        NVR_LOG("ERROR: RM_GetHBAAttributes call failed (%d)", static_cast<int>(status));
        throw std::exception();
    }

    uint32 temperature = 0;
    block.number(RM_ATTR_BOARD_TEMPERATURE, "_BoardTemperature", temperature);
    _Temperature0 = temperature & 0xFF;
    _Temperature2 = temperature >> 16 & 0xFF;
    _Temperature1 = temperature >> 8 & 0xFF;

    block.number(RM_ATTR_DEVICE_ID, "_DeviceID", _DeviceID);
    block.number(RM_ATTR_MODEL_ID, "_ModelID", _ModelID);
    block.number(RM_ATTR_DIAG_VERSION, "_DiagVersion", _DiagVersion);
    readDriverType(wwn);
    block.number(RM_ATTR_FUNCTION_TYPE, "_FunctionType", _FunctionType);
    NVR_LOG("Adapter _FunctionType: [ %d ]", static_cast<int>(_FunctionType));

    block.address(RM_ATTR_IEEE_ADDRESS, "_IEEE_ADDRESS", _IEEE_ADDRESS);
    block.text(RM_ATTR_BOOT_BIOS_VERSION, "_BOOTBIOS_VERSION", _BOOTBIOS_VERSION);
    block.text(RM_ATTR_KERNEL_VERSION, "_KERNEL_VERSION", _KERNEL_VERSION);
    block.text(RM_ATTR_INITIAL_FIRMWARE, "INITIAL_FW_LOAD", _INITIAL_FW_LOAD);
    block.text(RM_ATTR_OPERATIONAL_FIRMWARE, "Operational Firmware", _OperationalFirmware);
    uint32 bootCode = 0;
    block.number(RM_ATTR_BOOT_CODE_ENABLED, "_BootCodeEnabled", bootCode);
    _BootCodeEnabled = bootCode != 0;
    block.number(RM_ATTR_PORT_NUMBER, "_PortNumber", _PortNumber);
    block.number(RM_ATTR_SLI_MODE, "_SLIMode", _SLIMode);

    block.text(RM_ATTR_UNIVERSAL_VERSION, "_FCUniversalVersion", _FCUniversalVersion);
    block.text(RM_ATTR_X86_BIOS_VERSION, "FC_X86_BIOSVersion", _FC_X86_BIOSVersion);
    block.text(RM_ATTR_EFI_VERSION, "_FC_EFIVersion", _FC_EFIVersion);
    block.text(RM_ATTR_FCODE_VERSION, "_FC_FCODEVersion", _FC_FCODEVersion);
    block.text(RM_ATTR_ULP_FIRMWARE_VERSION, "_ULPFirmwareVersion", _ULPFirmwareVersion);
    block.text(RM_ATTR_ULP_FIRMWARE_NAME, "_ULPFirmwareName", _ULPFirmwareName);
    block.text(RM_ATTR_SP_FIRMWARE_VERSION, "_SPFirmwareVersion", _SPFirmwareVersion);
    block.text(RM_ATTR_SP_FIRMWARE_NAME, "_SPFirmwareName", _SPFirmwareName);
    block.number(RM_ATTR_PCI_FUNCTION_NUMBER, "_PCIFunctionNumber", _PCIFunctionNumber);
    block.number(RM_ATTR_PCI_BUS_NUMBER, "_PCIBusNumber", _PCIBusNumber);
}

void FCAdapterAttributes::readDriverType(const HBA_WWN& wwn)
{
    uint32 type = 0;
    if (const uint32 status = RM_GetDriverType(wwn, &type)) {
        NVR_LOG("ERROR: RM_GetDriverType call failed (%d)", static_cast<int>(status));
        return;
    }
    _DriverType = type;
    NVR_LOG("_DriverType: [ %d ]", static_cast<int>(type));
}

} // namespace cimple
