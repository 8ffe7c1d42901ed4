// The five classes of logical units, each as a table; what they have in common stands in the helpers.
#include "agent/SAN_Update.h"
#include "agent/instance_table.h"
#include "classes/NVRHBA_LogicalDisk.h"
#include "classes/NVRHBA_SCSIArbitraryLogicalUnit.h"
#include "classes/NVRHBA_StorageExtent.h"
#include "classes/NVRHBA_StorageVolume.h"
#include "classes/NVRHBA_TapeDrive.h"
#include "foundation/CLogger.h"
#include "inventory/Target.h"

namespace cimple {

namespace {

/// A unit that told no capacity has none of these properties.
bool hasCapacity(const Target& target)
{
    return target.BlockSize != 0 && target.LastBlock != 0;
}

template <class T>
void setCapacity(T& unit, const Target& target, Text_Pool& texts)
{
    if (!hasCapacity(target)) return;
    set(unit.Capacity, target.BlockSize * target.LastBlock);
    set(unit.CapacityUnit, texts("Byte"));
}

template <class T>
void setBlocks(T& unit, const Target& target)
{
    if (!hasCapacity(target)) return;
    set(unit.BlockSize, target.BlockSize);
    set(unit.NumberOfBlocks, target.LastBlock);
}

template <class T>
Ref<Instance> plain(Ref<T>& unit)
{
    return Ref<Instance>(unit.release());
}

} // namespace

template <class T>
Ref<T> SAN_Update::makeUnit(const char* class_name, const Target_Scope& scope, const Unit_Class_Row& row)
{
    const Target& target = scope.target;
    auto unit = make<T>(m_nameSpace);
    set(unit->SystemCreationClassName, m_hostClass);
    set(unit->SystemName, m_hostName);
    set(unit->CreationClassName, m_texts(class_name));
    set(unit->Description, scope.inquiry);
    set(unit->DeviceID,
        text("%s_%s_%s_%s", scope.wwpn, target.PortName.c_str(), scope.identifier.c_str(), scope.lun.c_str()));
    set(unit->ElementName, text(row.elementName, static_cast<int>(target.OSLun)));
    set(unit->OtherIdentifyingInfo, {text_of(target.OSDeviceName), scope.shortInquiry});
    set(unit->IdentifyingDescriptions, {m_texts("OS Device Name"), m_texts("Standard SCSI inquiry data")});
    set(unit->OperationalStatus, {0});
    set(unit->DeviceType, target.DeviceType);
    return unit;
}

Ref<Instance> SAN_Update::makeStorageVolume(const Target_Scope& scope, const Unit_Class_Row& row)
{
    NVR_LOG("creating NVRHBA_StorageVolume");
    const Target& target = scope.target;
    auto volume = makeUnit<NVRHBA_StorageVolume>("NVRHBA_StorageVolume", scope, row);
    NVR_LOG("StorageVolumeInstance->DeviceID = %s", volume->DeviceID.value.c_str());
    setBlocks(*volume, target);
    setCapacity(*volume, target, m_texts);
    set(volume->Name, unit_name(target.Identifier, scope.identifier));
    if (const Name_Format_Row* format = name_format(target.Identifier.identifierType)) {
        set(volume->NameFormat, format->nameFormat);
        set(volume->NameNamespace, format->nameNamespace);
        if (format->otherNameFormat) set(volume->OtherNameFormat, format->otherNameFormat);
        if (format->otherNameNamespace) set(volume->OtherNameNamespace, format->otherNameNamespace);
    }
    return plain(volume);
}

Ref<Instance> SAN_Update::makeTapeDrive(const Target_Scope& scope, const Unit_Class_Row& row)
{
    const Target& target = scope.target;
    auto drive = makeUnit<NVRHBA_TapeDrive>("NVRHBA_TapeDrive", scope, row);
    setCapacity(*drive, target, m_texts);
    set(drive->Name, target.OSDeviceName);
    set(drive->OtherIdentifyingInfo,
        {text_of(target.OSDeviceName),
         text("%s %s %s", target.Vendor.c_str(), target.Product.c_str(), target.Revision.c_str())});
    set(drive->IdentifyingDescriptions, {"OS Device Name", "standard SCSI Inquery data"});
    return plain(drive);
}

Ref<Instance> SAN_Update::makeLogicalDisk(const Target_Scope& scope, const Unit_Class_Row& row)
{
    const Target& target = scope.target;
    auto disk = makeUnit<NVRHBA_LogicalDisk>("NVRHBA_LogicalDisk", scope, row);
    setCapacity(*disk, target, m_texts);
    setBlocks(*disk, target);
    set(disk->Name, unit_name(target.Identifier, scope.identifier));
    set(disk->DataOrganization, 1);
    set(disk->StatusInfo, 2);
    set(disk->AdditionalAvailability, {2});
    return plain(disk);
}

Ref<Instance> SAN_Update::makeSCSIArbitraryLogicalUnit(const Target_Scope& scope, const Unit_Class_Row& row)
{
    const Target& target = scope.target;
    auto unit = makeUnit<NVRHBA_SCSIArbitraryLogicalUnit>("NVRHBA_SCSIArbitraryLogicalUnit", scope, row);
    set(unit->OtherDeviceType, text("Peripheral devices type is 0x%02X", target.DeviceType));
    set(unit->Name, target.OSDeviceName);
    return plain(unit);
}

Ref<Instance> SAN_Update::makeStorageExtent(const Target_Scope& scope, const Unit_Class_Row& row)
{
    const Target& target = scope.target;
    auto extent = makeUnit<NVRHBA_StorageExtent>("NVRHBA_StorageExtent", scope, row);
    setBlocks(*extent, target);
    setCapacity(*extent, target, m_texts);
    set(extent->Name, unit_name(target.Identifier, scope.identifier));
    // In this order, though the values stand the other way round.
    set(extent->IdentifyingDescriptions, {"Standard SCSI inquiry data", "OS Device Name"});
    return plain(extent);
}

} // namespace cimple
