// What the walk makes for each port, in order.
#include "agent/Adapter_Update.h"
#include "agent/beacon.h"
#include "agent/library_name.h"
#include "agent/port_data_instances.h"
#include "agent/port_tables.h"
#include "agent/vpd.h"
#include "classes/NVRHBA_ControlledBy.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_FCPortStatistics.h"
#include "classes/NVRHBA_PortController.h"
#include "classes/NVRHBA_SCSIProtocolController.h"
#include "classes/NVRHBA_SCSIProtocolInitiatorEndpoint.h"
#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "inventory/AdapterAttributes.h"
#include "inventory/Port.h"
#include "inventory/PortAttributes.h"

namespace cimple {

namespace {

struct Vpd_Name_Row {
    const char* tag;
    const char* name;
};

constexpr Vpd_Name_Row vpd_names[] = {
    {"CP", "EXT_CAPABILITY"},  {"EC", "EC_LEVEL"},      {"FG", "FABRIC_GEOGRAPHY"}, {"LC", "LOCATION"},
    {"MN", "MANUFACTURER_ID"}, {"PG", "PCI_GEOGRAPHY"}, {"PN", "PART_NUMBER"},      {"SN", "SERIAL_NUMBER"},
};

std::string vpdName(const std::string& tag)
{
    for (const Vpd_Name_Row& row : vpd_names)
        if (tag == row.tag) return row.name;
    return tag == vpd_product_name ? "PRODUCT_NAME" : tag;
}

/// Appends the port's vital product data to a list of descriptions and their values.
void appendVPD(const HBA_WWN& wwn, Array<String>& values, Array<String>& descriptions)
{
    std::vector<Vpd_Entry> entries;
    const uint32 status = readVPD(wwn, entries);
    if (status != 0) NVR_LOG("ERROR: RM_GetVPD call failed, Returned with error code : %d", static_cast<int>(status));
    for (const Vpd_Entry& entry : entries) {
        values.append(text_of(entry.second));
        descriptions.append(text("VPD:%s", vpdName(entry.first).c_str()));
    }
}

template <class T>
void setStatus(T& instance, const Status_Row& row)
{
    set(instance.OperationalStatus, {row.status});
    set(instance.StatusDescriptions, {row.text});
}

} // namespace

void Adapter_Update::buildPort(const Port_Scope& scope)
{
    const Instance* device = buildPCIDevice(scope);
    if (!device) return;
    buildVPD(scope, device);
    buildTransceiver(scope);
    Instance* port = buildFCPort(scope);
    const std::string name = scope.adapter._Model + ":" + scope.wwpn;
    const auto conforms = [&](Link link, const Instance* profile, const Instance* element, const char* what,
                              const char* words) {
        associate(m_agent, link, profile, element, text("%s %s, %s", what, name.c_str(), words).c_str());
    };
    conforms(Link::FCPortConformsToProfile, m_physicalPackage, port, "FC Port", "Physical Package");
    conforms(Link::FCPortConformsToProfile, m_hostDiscoveredResources, port, "FC Port", "Host Discovered Resource");
    conforms(Link::FCPortConformsToProfile, m_fcInitiatorPorts, port, "FC Port", "FC Initiator Port");
    conforms(Link::FCPortConformsToProfile, m_accessPoints, port, "FC Port", "Access Points");

    tie(Link::FCPortSystemDevice, m_host, port);
    tie(Link::MemberOfCollection, scope.group, port);
    const Instance* statistics = buildStatistics(scope);
    tie(Link::ElementStatisticalData, port, statistics);
    const Instance* protocol = buildSCSIProtocolController(scope);
    tie(Link::ProtocolControllerForPort, protocol, port);
    tie(Link::SCSIProtocolControllerSystemDevice, m_host, protocol);
    Instance* controller = buildPortController(scope);
    tie(Link::ProductElementComponent, scope.product, controller);
    // The same two ends for every port of the adapter.
    if (scope.isFirst) tie(Link::ProductPhysicalComponent, scope.product, scope.package);
    conforms(Link::PortControllerConformsToProfile, m_storageHBA, controller, "Port Controller", "Storage HBA");
    conforms(Link::PortControllerConformsToProfile, m_fcHBA, controller, "Port Controller", "FC HBA");

    createFlashImages(m_agent, scope.wwpn, scope.adapter, controller);

    auto* controlled = static_cast<NVRHBA_ControlledBy*>(tie(Link::ControlledBy, controller, port));
    set(controlled->AccessState, access_state(scope.attributes.PortState));
    tie(Link::Realizes, scope.package, controller);
    tie(Link::PortControllerSystemDevice, m_host, controller);
    buildInitiatorEndpoint(scope, port);
    buildFirmwareIdentities(scope, controller);
    if (m_accessPoint) tie(Link::SAPAvailableForElement, m_accessPoint, port);
    buildServiceLinks(port, name.c_str());
    NVR_LOG("Ending of Software Installation Service");
}

void Adapter_Update::buildVPD(const Port_Scope& scope, const Instance* device)
{
    Instance* vpd = nullptr;
    if (CreateVPD(m_agent, scope.wwpn, vpd) == 0)
        tie(Link::ElementVPD, device, vpd);
    else
        NVR_LOG("FC port %s CreateVPD failed", scope.wwpn);
}

void Adapter_Update::buildTransceiver(const Port_Scope& scope)
{
    if (const Instance* transceiver = createTransceiver(m_agent, scope.wwpn))
        tie(Link::TransceiverComponent, scope.package, transceiver);
    else
        NVR_LOG("Failed Creating NVRVCNA_Transceiver");
}

Instance* Adapter_Update::buildFCPort(const Port_Scope& scope)
{
    const FCAdapterAttributes& adapter = scope.adapter;
    const FCPortAttributes& from = scope.attributes;
    NVR_LOG("FC Port # %d", static_cast<int>(adapter._PortNumber));
    auto port = make<NVRHBA_FCPort>();
    set(port->PortNumber, adapter._PortNumber);
    set(port->Description, adapter._ModelDescription);
    setHost(*port);
    set(port->CreationClassName, "NVRHBA_FCPort");
    set(port->Name, scope.wwpn);
    set(port->DeviceID, scope.wwpn);
    Array<String> info;
    Array<String> descriptions;
    appendVPD(scope.wwn, info, descriptions);
    info.append(text_of(from.OSDeviceName));
    descriptions.append("OS Device Name");
    info.append(text_of(adapter._IEEE_ADDRESS));
    descriptions.append("NORVANE:IEEE_ADDRESS");
    set(port->OtherIdentifyingInfo, info);
    set(port->IdentifyingDescriptions, descriptions);
    set(port->PermanentAddress, scope.wwpn);
    set(port->NetworkAddresses, {scope.wwpn});
    uint16 beacon = BEACON_UNKNOWN;
    if (GetBeaconState(scope.wwpn, &beacon) == 0) set(port->LocationIndicator, beacon);
    set(port->ElementName, adapter._NodeSymbolicName);
    set(port->UsageRestriction, 4);
    set(port->FCID, from.PortFcId);
    set(port->NumberOfDiscoveredPorts, from.NumberofDiscoveredPorts);
    set(port->OperationalFirmware,
        text("%s:v%s", adapter._OperationalFirmware.c_str(), adapter._FirmwareVersion.c_str()));
    set(port->FabricName, from.FabricName);
    set(port->AdapterName, scope.adapterName);
    set(port->LinkTechnology, 4);
    set(port->SupportedMaximumTransmissionUnit, from.PortMaxFrameSize);
    set(port->ActiveMaximumTransmissionUnit, from.PortMaxFrameSize);
    const Port_Type_Row& type = port_type(from.PortType);
    set(port->PortType, type.to);
    if (type.text) {
        set(port->OtherPortType, type.text);
        set(port->OtherNetworkPortType, type.text);
    }
    NVR_LOG("***************Port Status: %d******************", static_cast<int>(from.PortState));
    setStatus(*port, port_status(from.PortState));
    set(port->SupportedCOS, classes_of_service(from.PortSupportedClassofService));
    set(port->ActiveCOS, classes_of_service(from.PortSupportedClassofService));
    set(port->SupportedFC4Types, fc4_types(from.PortSupportedFc4Types));
    set(port->ActiveFC4Types, fc4_types(from.PortActiveFc4Types));
    set(port->Speed, port_speed(from.PortSpeed));
    set(port->MaxSpeed, max_port_speed(from.PortSupportedSpeed));
    return insert(m_agent.m_NVRHBA_FCPort_map, port);
}

Instance* Adapter_Update::buildStatistics(const Port_Scope& scope)
{
    auto statistics = make<NVRHBA_FCPortStatistics>();
    nullify_properties(statistics.get(), true, true, 1);
    set(statistics->ElementName, scope.wwpn);
    set(statistics->Description, "Statistics for the FC port.");
    set(statistics->InstanceID, text("NVR FC HBA:HBA Statistics:%s", scope.wwpn));
    return insert(m_agent.m_NVRHBA_FCPortStatistics_map, statistics);
}

Instance* Adapter_Update::buildSCSIProtocolController(const Port_Scope& scope)
{
    auto controller = make<NVRHBA_SCSIProtocolController>();
    set(controller->Description, scope.adapter._ModelDescription);
    setHost(*controller);
    set(controller->CreationClassName, "NVRHBA_SCSIProtocolController");
    set(controller->Name, scope.wwpn);
    set(controller->DeviceID, scope.wwpn);
    set(controller->ElementName, scope.adapter._NodeSymbolicName);
    setStatus(*controller, controller_status(scope.attributes.PortState));
    set(controller->NameFormat, 2);
    set(controller->MaxUnitsControlled, scope.adapterPorts);
    return insert(m_agent.m_NVRHBA_SCSIProtocolController_map, controller);
}

Instance* Adapter_Update::buildPortController(const Port_Scope& scope)
{
    auto controller = make<NVRHBA_PortController>();
    set(controller->Description, scope.adapter._ModelDescription);
    set(controller->ElementName, scope.adapter._NodeSymbolicName);
    set(controller->Name, scope.adapter._NodeSymbolicName);
    setHost(*controller);
    set(controller->CreationClassName, "NVRHBA_PortController");
    set(controller->DeviceID, scope.wwpn);
    set(controller->ControllerType, 4);
    set(controller->ProtocolSupported, 10);
    set(controller->MaxNumberControlled, scope.adapterPorts);
    set(controller->ProtocolDescription, "SCSI Fibre Channel Protocol");
    set(controller->Availability, 3);
    set(controller->EnabledState, 5);
    set(controller->RequestedState, 5);
    set(controller->EnabledDefault, 2);
    setStatus(*controller, controller_status(scope.attributes.PortState));
    return insert(m_agent.m_NVRHBA_PortController_map, controller);
}

void Adapter_Update::buildInitiatorEndpoint(const Port_Scope& scope, Instance* port)
{
    auto made = make<NVRHBA_SCSIProtocolInitiatorEndpoint>();
    set(made->Description, scope.adapter._ModelDescription);
    setHost(*made);
    set(made->CreationClassName, "NVRHBA_SCSIProtocolInitiatorEndpoint");
    set(made->ElementName, scope.adapter._NodeSymbolicName);
    set(made->Name, scope.wwpn);
    set(made->ProtocolType, 18);
    set(made->ProtocolIFType, 56);
    set(made->ConnectionType, 2);
    set(made->Role, 2);
    set(made->EnabledDefault, 5);
    set(made->EnabledState, 0);
    set(made->RequestedState, 0);
    set(made->OperationalStatus, {0});
    const Instance* endpoint = insert(m_agent.m_NVRHBA_SCSIProtocolInitiatorEndpoint_map, made);
    tie(Link::DeviceSAPImplementation, port, endpoint);
    tie(Link::LocalHostedInitiatorAccessPoint, m_host, endpoint);
}

} // namespace cimple
