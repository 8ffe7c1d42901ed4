/// How a logical unit is published: the class that its device type leads to, and the name that its device identifier
/// gives it.
///
/// Pure functions of what the device reported, with no bound on what that may be; only the printing of an identifier
/// logs.
#pragma once

#include "foundation/NVR_Common.h"
#include "runtime/String.h"

namespace cimple {

enum class Unit_Class { StorageVolume, TapeDrive, SCSIArbitraryLogicalUnit, LogicalDisk, StorageExtent };

struct Unit_Class_Row {
    uint32 deviceType; // of the standard inquiry
    Unit_Class unit;
    const char* elementName; // "%d" is the operating system's number of the unit
};

/// The row of a device type; a type without one has the last.
const Unit_Class_Row& unit_class(uint32 deviceType);

/// What a storage volume says of its name. A null text leaves its property null.
struct Name_Format_Row {
    uint32 identifierType;
    uint16 nameFormat;
    uint16 nameNamespace;
    const char* otherNameFormat;
    const char* otherNameNamespace;
};

/// The row of an identifier type, or null if it says nothing.
const Name_Format_Row* name_format(uint32 identifierType);

/// The identifier as digits, or "" (logged) for a length that is not printed.
String identifier_text(const DeviceIdentifier& identifier);

/// The name of a volume, disk or extent. `text` is its identifier_text, which some types have printed anew, and of
/// which an NAA identifier keeps the part behind its authority.
String unit_name(const DeviceIdentifier& identifier, const String& text);

} // namespace cimple
