#include "agent/lun_naming.h"

#include <algorithm>
#include <iterator>

namespace cimple {

namespace {

// clang-format off
constexpr Unit_Class_Row unit_classes[] = {
    {0, Unit_Class::StorageVolume, "Storage Volume: %d"},
    {14, Unit_Class::StorageVolume, "Storage Volume: %d"}, // a disk with a reduced command set
    {1, Unit_Class::TapeDrive, "Tape Drive %d"},
    {12, Unit_Class::SCSIArbitraryLogicalUnit, "Storage array controller %d"},
    {13, Unit_Class::SCSIArbitraryLogicalUnit, "Enclosure services %d"},
    {16, Unit_Class::SCSIArbitraryLogicalUnit, "Bridge controller %d"},
    {17, Unit_Class::LogicalDisk, "Object-based storage device: %d"},
    {2, Unit_Class::StorageExtent, "Printer %d"},
    {3, Unit_Class::StorageExtent, "Processor %d"},
    {4, Unit_Class::StorageExtent, "Write-once device %d"},
    {5, Unit_Class::StorageExtent, "CD/DVD %d"},
    {6, Unit_Class::StorageExtent, "Scanner %d"},
    {7, Unit_Class::StorageExtent, "Optical memory device %d"},
    {8, Unit_Class::StorageExtent, "Jukebox %d"},
    {9, Unit_Class::StorageExtent, "Communications device %d"},
    {15, Unit_Class::StorageExtent, "Optical card reader/writer %d"},
    {~0u, Unit_Class::StorageExtent, "Unknown device %d"},
};

constexpr uint32 type_eui64 = 2;
constexpr uint32 type_naa = 3;

constexpr Name_Format_Row name_formats[] = {
    {0, 6, 1, nullptr, "Vendor specific"},
    {1, 5, 4, nullptr, nullptr},
    {type_eui64, 10, 3, nullptr, nullptr},
    {type_naa, 9, 2, nullptr, nullptr},
    {4, 1, 1, "Relative target port identifier", "Relative target port idientifier"},
    {5, 1, 1, "Target port group", "Target port group"},
    {6, 1, 1, "Logical port group", "Logical unit group"},
    {7, 1, 1, "MD5 logical unit identifier", "MD5 logical unit identifier"},
    {8, 1, 1, "SCSI name std::string", "SCSI name std::string"},
};
// clang-format on

/// The index of the first byte behind the authority of an NAA identifier, which its high four bits name; 0 for one
/// that is not taken apart.
unsigned naa_start(uint8 first)
{
    switch (first >> 4) {
    case 6:
        return 1;
    case 1:
    case 2:
    case 5:
        return 2;
    default:
        return 0;
    }
}

} // namespace

const Unit_Class_Row& unit_class(uint32 deviceType)
{
    const auto* end = std::end(unit_classes) - 1;
    return *std::find_if(std::begin(unit_classes), end,
                         [=](const Unit_Class_Row& row) { return row.deviceType == deviceType; });
}

const Name_Format_Row* name_format(uint32 identifierType)
{
    for (const Name_Format_Row& row : name_formats)
        if (row.identifierType == identifierType) return &row;
    return nullptr;
}

String identifier_text(const DeviceIdentifier& identifier)
{
    char text[descriptor_text_size];
    printDescriptor(text, identifier);
    return text;
}

String unit_name(const DeviceIdentifier& identifier, const String& text)
{
    if (identifier.identifierType == type_eui64) return identifier_text(identifier);
    if (identifier.identifierType != type_naa) return text;
    const unsigned start = naa_start(identifier.identifier[0]);
    if (start == 0) return text;
    constexpr char digits[] = "0123456789ABCDEF";
    const std::size_t end =
        std::min<std::size_t>(identifier.identifierLength, sizeof identifier.identifier); // as the device claims
    char name[2 * sizeof identifier.identifier];
    char* next = name;
    for (std::size_t i = start; i < end; i++) {
        *next++ = digits[identifier.identifier[i] >> 4];
        *next++ = digits[identifier.identifier[i] & 0xF];
    }
    return String(name, static_cast<std::size_t>(next - name));
}

} // namespace cimple
