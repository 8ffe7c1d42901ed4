// What a target becomes: its endpoint, its logical unit, and the associations between them, in order.
#include <cstring>

#include "agent/SAN_Update.h"
#include "agent/instance_table.h"
#include "classes/NVRHBA_SCSIProtocolEndpoint.h"
#include "foundation/CLogger.h"
#include "inventory/Target.h"
#include "runtime/Meta_Class.h"

namespace cimple {

namespace {

template <auto member>
Instance_Map& map_of(ProviderAgent& agent)
{
    return agent.*member;
}

/// Where the units of a class and their associations go, and their word in the log.
struct Unit_Maps_Row {
    Unit_Class unit;
    Instance_Map& (*units)(ProviderAgent& agent);
    Instance_Map& (*devices)(ProviderAgent& agent);
    Instance_Map& (*paths)(ProviderAgent& agent);
    const char* word;
};

#define MAP(Class) &map_of<&ProviderAgent::m_NVRHBA_##Class##_map>
// clang-format off
constexpr Unit_Maps_Row unit_maps[] = {
    {Unit_Class::StorageVolume, MAP(StorageVolume), MAP(StorageVolumeSystemDevice), MAP(SCSIInitiatorTargetStorageVolumePath), "Storage Volume"},
    {Unit_Class::TapeDrive, MAP(TapeDrive), MAP(TapeDriveSystemDevice), MAP(SCSIInitiatorTargetTapeDrivePath), "Tape Drive"},
    {Unit_Class::SCSIArbitraryLogicalUnit, MAP(SCSIArbitraryLogicalUnit), MAP(SCSIArbitraryLogicalUnitSystemDevice), MAP(SCSIInitiatorTargetArbitraryLogicalUnitPath), "SCSI Arbitrary Logical Unit"},
    {Unit_Class::LogicalDisk, MAP(LogicalDisk), MAP(LogicalDiskSystemDevice), MAP(SCSIInitiatorTargetLogicalDiskPath), "Logical Disk"},
    {Unit_Class::StorageExtent, MAP(StorageExtent), MAP(StorageExtentSystemDevice), MAP(SCSIInitiatorTargetStorageExtentPath), "Storage Extent"},
};
// clang-format on
#undef MAP

const Unit_Maps_Row& mapsOf(Unit_Class unit)
{
    const Unit_Maps_Row* row = unit_maps;
    while (row->unit != unit)
        row++;
    return *row;
}

/// The LUN in wire order, which is how its eight bytes lie in memory.
String lunText(uint64 lun)
{
    uint8 b[8];
    std::memcpy(b, &lun, sizeof b);
    return text("%02X%02X%02X%02X%02X%02X%02X%02X", b[0], b[1], b[2], b[3], b[4], b[5], b[6], b[7]);
}

} // namespace

// The ends are shared with their maps, not copied: nothing writes to an instance of this side once it is inserted, and
// a host with many paths would hold each endpoint and unit three times.
Instance* SAN_Update::tie(Instance_Map& map, std::initializer_list<End> ends)
{
    Ref<Instance> association;
    {
        const Blocks::Use use(&m_agent.m_SANLinkBlocks);
        association.reset(create(map.meta_class(), true));
    }
    association->__name_space = m_nameSpace;
    for (const End& end : ends) {
        const Meta_Feature* feature = find_feature(map.meta_class(), end.reference, META_FLAG_REFERENCE);
        ref(end.instance);
        reference_of(association.get(), as_reference(feature)) = end.instance;
    }
    return insert(map, std::move(association));
}

Ref<NVRHBA_SCSIProtocolEndpoint> SAN_Update::makeEndpoint(Target_Scope& scope)
{
    const Blocks::Use use(&m_agent.m_SANEndpointBlocks);
    const Target& target = scope.target;
    auto endpoint = make<NVRHBA_SCSIProtocolEndpoint>(m_nameSpace);
    // The units say it too, and come later: made here, it lies with what else the endpoint says.
    scope.inquiry = text("%.8s %.16s Revision %.4s Serial Number %.40s", target.Vendor.c_str(), target.Product.c_str(),
                         target.Revision.c_str(), target.SerialNumber.c_str());
    set(endpoint->TargetWWPN, m_texts(target.PortName));
    set(endpoint->TargetWWNN, m_texts(target.NodeName));
    set(endpoint->Description, scope.inquiry);
    set(endpoint->SystemCreationClassName, m_hostClass);
    set(endpoint->SystemName, m_hostName);
    set(endpoint->CreationClassName, m_texts("NVRHBA_SCSIProtocolEndpoint"));
    set(endpoint->ElementName, m_texts(target.Product));
    set(endpoint->Name, text("%s:%s:%s", scope.wwpn, target.PortName.c_str(), scope.lun.c_str()));
    set(endpoint->ProtocolType, 18);
    set(endpoint->ProtocolIFType, 56);
    set(endpoint->ConnectionType, 2);
    set(endpoint->Role, 3);
    set(endpoint->EnabledDefault, 5);
    set(endpoint->EnabledState, 0);
    set(endpoint->RequestedState, 0);
    set(endpoint->OperationalStatus, {0});
    set(endpoint->FCID, target.FcId);
    set(endpoint->SCSIBusNumber, target.BusNumber);
    set(endpoint->SCSITargetNumber, target.TargetNumber);
    set(endpoint->OtherIdentifyingInfo, {text_of(target.OSDeviceName)});
    set(endpoint->IdentifyingDescriptions, {m_texts("OS Device Name")});
    return endpoint;
}

Instance* SAN_Update::buildUnit(const Target_Scope& scope, const Unit_Class_Row& row)
{
    const auto make_it = [&]() -> Ref<Instance> {
        const Blocks::Use use(&m_agent.m_SANUnitBlocks);
        switch (row.unit) {
        case Unit_Class::StorageVolume:
            return makeStorageVolume(scope, row);
        case Unit_Class::TapeDrive:
            return makeTapeDrive(scope, row);
        case Unit_Class::SCSIArbitraryLogicalUnit:
            return makeSCSIArbitraryLogicalUnit(scope, row);
        case Unit_Class::LogicalDisk:
            return makeLogicalDisk(scope, row);
        case Unit_Class::StorageExtent:
            break;
        }
        return makeStorageExtent(scope, row);
    };
    return insert(mapsOf(row.unit).units(m_agent), make_it());
}

void SAN_Update::buildTarget(Target_Scope& scope, int index)
{
    const Target& target = scope.target;
    scope.lun = lunText(target.FcpLun);
    const String shortInquiry =
        text("%.8s %.16s Revision %.4s", target.Vendor.c_str(), target.Product.c_str(), target.Revision.c_str());
    scope.shortInquiry = m_texts({shortInquiry.c_str(), shortInquiry.size()});

    Instance* endpoint = insert(m_agent.m_NVRHBA_SCSIProtocolEndpoint_map, makeEndpoint(scope));
    NVR_LOG("Generating NVRHBA_LocalHostedAccessPoint (Local Hosted Access Point %s:%s:%s)", scope.wwpn,
            target.PortName.c_str(), scope.lun.c_str());
    tie(m_agent.m_NVRHBA_LocalHostedAccessPoint_map, {{"Antecedent", m_host}, {"Dependent", endpoint}});

    NVR_LOG("Target %d is of type %d.", index, static_cast<int>(target.DeviceType));
    scope.identifier = identifier_text(target.Identifier);
    const Unit_Class_Row& row = unit_class(target.DeviceType);
    const Unit_Maps_Row& maps = mapsOf(row.unit);
    Instance* unit = buildUnit(scope, row);

    Instance_Map& devices = maps.devices(m_agent);
    NVR_LOG("Generating %s (%s: %s)", devices.meta_class()->name, maps.word, string_property(unit, "DeviceID").c_str());
    tie(devices, {{"GroupComponent", m_host}, {"PartComponent", unit}});

    Instance_Map& paths = maps.paths(m_agent);
    NVR_LOG("creating %s - %s", paths.meta_class()->name, maps.word);
    tie(paths, {{"LogicalUnit", unit}, {"Target", endpoint}, {"Initiator", scope.initiator}});
}

} // namespace cimple
