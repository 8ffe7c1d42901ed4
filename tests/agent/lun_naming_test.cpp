// Classes and names of logical units, from what a device reports.

#include <cstring>

#include <gmock/gmock.h>

#include "agent/lun_naming.h"

using namespace cimple;

namespace {

DeviceIdentifier identifier(uint32 type, const std::string& bytes)
{
    DeviceIdentifier made;
    made.identifierType = type;
    made.identifierLength = static_cast<uint32>(bytes.size());
    std::memcpy(made.identifier, bytes.data(), bytes.size());
    return made;
}

std::string name(const DeviceIdentifier& from)
{
    return unit_name(from, identifier_text(from)).c_str();
}

std::string text(const String& made)
{
    return made.c_str();
}

const std::string sixteen("\x60\x0C\x9A\x0F\x01\x02\x03\x04\x05\x06\x07\x08\x09\x0A\x0B\x0C", 16);

} // namespace

TEST(LunNaming, ADeviceTypeLeadsToAClass)
{
    const struct {
        uint32 type;
        Unit_Class unit;
        const char* name;
    } rows[] = {
        {0, Unit_Class::StorageVolume, "Storage Volume: %d"},
        {1, Unit_Class::TapeDrive, "Tape Drive %d"},
        {2, Unit_Class::StorageExtent, "Printer %d"},
        {3, Unit_Class::StorageExtent, "Processor %d"},
        {4, Unit_Class::StorageExtent, "Write-once device %d"},
        {5, Unit_Class::StorageExtent, "CD/DVD %d"},
        {6, Unit_Class::StorageExtent, "Scanner %d"},
        {7, Unit_Class::StorageExtent, "Optical memory device %d"},
        {8, Unit_Class::StorageExtent, "Jukebox %d"},
        {9, Unit_Class::StorageExtent, "Communications device %d"},
        {10, Unit_Class::StorageExtent, "Unknown device %d"},
        {11, Unit_Class::StorageExtent, "Unknown device %d"},
        {12, Unit_Class::SCSIArbitraryLogicalUnit, "Storage array controller %d"},
        {13, Unit_Class::SCSIArbitraryLogicalUnit, "Enclosure services %d"},
        {14, Unit_Class::StorageVolume, "Storage Volume: %d"},
        {15, Unit_Class::StorageExtent, "Optical card reader/writer %d"},
        {16, Unit_Class::SCSIArbitraryLogicalUnit, "Bridge controller %d"},
        {17, Unit_Class::LogicalDisk, "Object-based storage device: %d"},
        {18, Unit_Class::StorageExtent, "Unknown device %d"},
        {31, Unit_Class::StorageExtent, "Unknown device %d"},
        {32, Unit_Class::StorageExtent, "Unknown device %d"},
        {0xFFFFFFFF, Unit_Class::StorageExtent, "Unknown device %d"},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(unit_class(row.type).unit, row.unit) << row.type;
        EXPECT_STREQ(unit_class(row.type).elementName, row.name) << row.type;
    }
}

TEST(LunNaming, AnIdentifierTypeLeadsToANameFormat)
{
    const struct {
        uint32 type;
        uint16 format, name_space;
        const char *other_format, *other_name_space;
    } rows[] = {
        {0, 6, 1, nullptr, "Vendor specific"},
        {1, 5, 4, nullptr, nullptr},
        {2, 10, 3, nullptr, nullptr},
        {3, 9, 2, nullptr, nullptr},
        {4, 1, 1, "Relative target port identifier", "Relative target port idientifier"},
        {5, 1, 1, "Target port group", "Target port group"},
        {6, 1, 1, "Logical port group", "Logical unit group"},
        {7, 1, 1, "MD5 logical unit identifier", "MD5 logical unit identifier"},
        {8, 1, 1, "SCSI name std::string", "SCSI name std::string"},
    };
    for (const auto& row : rows) {
        const Name_Format_Row* made = name_format(row.type);
        ASSERT_NE(made, nullptr) << row.type;
        EXPECT_EQ(made->nameFormat, row.format) << row.type;
        EXPECT_EQ(made->nameNamespace, row.name_space) << row.type;
        EXPECT_STREQ(made->otherNameFormat, row.other_format) << row.type;
        EXPECT_STREQ(made->otherNameNamespace, row.other_name_space) << row.type;
    }
    for (uint32 type : {9u, 15u, 0xFFFFFFFFu})
        EXPECT_EQ(name_format(type), nullptr) << type;
}

TEST(LunNaming, AnIdentifierIsPrintedByItsLength)
{
    EXPECT_EQ(text(identifier_text(identifier(1, sixteen))), "600C9A0F0102030405060708090A0B0C");
    EXPECT_EQ(text(identifier_text(identifier(1, sixteen.substr(0, 12)))), "600C9A0F0102030405060708");
    EXPECT_EQ(text(identifier_text(identifier(1, sixteen.substr(0, 8)))), "600C9A0F01020304");
    for (std::size_t length : {0, 1, 7, 9, 11, 13, 15})
        EXPECT_EQ(text(identifier_text(identifier(1, sixteen.substr(0, length)))), "") << length;
}

TEST(LunNaming, ANameIsTheIdentifierUnlessItIsAnNAA)
{
    for (uint32 type : {0, 1, 2, 4, 5, 6, 7, 8, 9, 15})
        EXPECT_EQ(name(identifier(type, sixteen)), "600C9A0F0102030405060708090A0B0C") << type;
}

TEST(LunNaming, AnNAALosesItsAuthority)
{
    EXPECT_EQ(name(identifier(3, sixteen)), "0C9A0F0102030405060708090A0B0C") << "from the second byte";
    for (char first : {'\x10', '\x2F', '\x50'})
        EXPECT_EQ(name(identifier(3, first + std::string("\x06\x0E\x80\x05\xA1\xFF\x00", 7))), "0E8005A1FF00")
            << "from the third byte";
    for (char first : {'\x00', '\x3F', '\x40', '\x70', '\xF0'})
        EXPECT_EQ(name(identifier(3, first + std::string("\x06\x0E\x80\x05\xA1\xFF\x0A", 7))).substr(2),
                  "060E8005A1FF0A")
            << "the whole identifier";
}

TEST(LunNaming, AnNAAOfAnyLengthKeepsInsideItsBytes)
{
    EXPECT_EQ(name(identifier(3, "")), "");
    EXPECT_EQ(name(identifier(3, "\x60")), "");
    EXPECT_EQ(name(identifier(3, "\x50")), "");
    EXPECT_EQ(name(identifier(3, "\x50\x01")), "");
    EXPECT_EQ(name(identifier(3, "\x50\x01\xAB")), "AB") << "also where the identifier itself is not printed";
    EXPECT_EQ(name(identifier(3, "\x60\xAB")), "AB");
    DeviceIdentifier liar = identifier(3, "\x60\xAB");
    liar.identifierLength = 255;
    EXPECT_EQ(name(liar), "AB" + std::string(2 * 253, '0')) << "what the device did not send is zero";
    liar.identifierLength = 0xFFFFFFFF;
    EXPECT_EQ(name(liar), "AB" + std::string(2 * 254, '0'));
}
