// The optical module of a port.
#include "agent/ProviderAgent.h"
#include "agent/instance_table.h"
#include "agent/library_name.h"
#include "agent/port_data_instances.h"
#include "agent/sff8472.h"
#include "classes/NVRHBA_Transceiver.h"
#include "foundation/CLogger.h"
#include "foundation/management_binding.h"

namespace cimple {

namespace {

void setText(Property<String>& property, const std::string& value, const char* words)
{
    NVR_LOG(words, value.c_str());
    set(property, value);
}

void setByte(Property<uint8>& property, uint8 value, const char* words)
{
    NVR_LOG(words, value);
    set(property, value);
}

/// What the module cannot measure stays null.
void setReading(Property<real32>& property, const std::optional<real32>& value, const char* words)
{
    if (!value) return;
    NVR_LOG(words, static_cast<double>(*value));
    set(property, *value);
}

void setDate(Property<Datetime>& property, const std::string& dateCode)
{
    NVR_LOG("DateCode: %s", dateCode.c_str());
    const std::string date = sff_date(dateCode);
    Datetime made;
    if (made.set(date.c_str()) == 0) return;
    NVR_LOG("ManufactureDate: %s", date.c_str());
    set(property, made);
}

} // namespace

Instance* createTransceiver(ProviderAgent& agent, const char* wwpn)
{
    HBA_WWN wwn = {};
    if (!library_name(wwn, wwpn, "Id2HBAName failed", "str2HBAName failed")) return nullptr;
    RM_SFFDATA pages = {};
    uint32 size = sizeof pages;
    if (RM_GetSffData(wwn, &pages, &size) != RM_STATUS_OK) {
        NVR_LOG("Unable to obtain transceiver data for this host bus adapter.");
        return nullptr;
    }
    NVR_LOG("RM_GetSffData succesful");
    NVR_LOG("PhysicalComponentInstance for : %s", wwpn);
    const Sff_Module module = decode_sff(pages, size);
    const Sff_Diagnostics& now = module.diagnostics;

    auto made = make<NVRHBA_Transceiver>();
    set(made->CreationClassName, "NVRHBA_Transceiver");
    set(made->Description, "Norvane PhysicalComponent Data");
    set(made->OperationalStatus, {0});
    set(made->StatusDescriptions, {"unknown"});
    setText(made->Manufacturer, module.vendorName, "VendorName: %s");
    setText(made->OUI, text("%02X-%02X-%02x", module.oui[0], module.oui[1], module.oui[2]).c_str(), "VendorOUI: %s");
    setText(made->PartNumber, module.vendorPN, "VendorPN: %s");
    setText(made->Version, module.vendorRev, "VendorRev: %s");
    setText(made->SerialNumber, module.vendorSN, "VendorSN: %s#");
    set(made->Tag, text("%s:%s", wwpn, module.vendorSN.c_str()));
    setDate(made->ManufactureDate, module.dateCode);
    setReading(made->Temperature, now.temperature, "Temperature: %-6.2f C");
    set(made->TemperatureUnit, "Celsius");
    setReading(made->Vcc, now.vcc, "Vcc:  %-6.2f V");
    setReading(made->TxBiasCurrent, now.txBiasCurrent, "TxBiasCurrent: %-6.2f mA");
    setReading(made->TxPower, now.txPower, "TxPower: %-6.2f mW");
    setReading(made->RxPower, now.rxPower, "RxPower: %-6.2f mW");
    setByte(made->Identifier, module.identifier, "Identifier: %xh");
    setByte(made->ExtIdentifier, module.extIdentifier, "ExtIdentifier: %xh");
    setByte(made->Connector, module.connector, "Connector: %xh");
    NVR_LOG("Wavelength: %d nm", module.wavelength);
    set(made->WaveLength, module.wavelength);

    Instance* transceiver = insertOrLog(agent.m_NVRHBA_Transceiver_map, Ref<Instance>(made.release()),
                                        "Insert Failed : m_CIM_PhysicalComponent_map ");
    if (transceiver) NVR_LOG("Success...");
    return transceiver;
}

} // namespace cimple
