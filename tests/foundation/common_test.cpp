#include "foundation/NVR_Common.h"

#include <cstring>

#include <gmock/gmock.h>

#include "tests/support/log_capture.h"
#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::IsEmpty;
using testing::Not;

namespace {

const HBA_WWN wwn = {{0x10, 0x00, 0x00, 0x00, 0xC9, 0x12, 0x34, 0x5F}};

} // namespace

TEST(WwnText, HasItsThreeForms)
{
    char text[wwn_text_size];
    EXPECT_EQ(wwn2String(text, wwn), 0);
    EXPECT_STREQ(text, "10000000C912345F");
    EXPECT_EQ(wwn2String(nullptr, wwn), 0);
    EXPECT_EQ(wwnText(wwn), "10000000C912345F");
    EXPECT_EQ(wwnColonText(wwn), "10:00:00:00:C9:12:34:5F");
    EXPECT_EQ(wwnLowerText(wwn), "10:00:00:00:c9:12:34:5f");
}

TEST(WwnText, OfSixteenDigitsIsReadInEitherCase)
{
    for (const char* text : {"10000000C912345F", "10000000c912345f"}) {
        HBA_WWN read{};
        EXPECT_EQ(string2HBAName(&read, text), 1);
        EXPECT_THAT(read.wwn, ElementsAreArray(wwn.wwn));
    }
}

TEST(WwnText, OfAnyOtherShapeIsRefused)
{
    for (const char* text : {"10000000C912345", "10000000C912345F0", "10000000C912345G", "", "10:00:00:00:C9:12:34:5F",
                             " 0000000C912345F", "0x000000C912345F", "10000000C912345\xB2"}) {
        Log_Capture log;
        HBA_WWN read{};
        EXPECT_EQ(string2HBAName(&read, text), 0) << text;
        EXPECT_THAT(log.words(), ElementsAre("INVALID WWN")) << text;
    }
    HBA_WWN read;
    EXPECT_EQ(string2HBAName(&read, nullptr), 0);
    EXPECT_EQ(string2HBAName(nullptr, "10000000C912345F"), 0);
}

TEST(DeviceId, GetsColons)
{
    Log_Capture log;
    char name[hba_name_size];
    EXPECT_EQ(Id2HBAName(name, "10000000C9123456"), 0);
    EXPECT_STREQ(name, "10:00:00:00:C9:12:34:56");
    EXPECT_THAT(log.words(), ElementsAre("Entering NVR_MethodWrapper::Id2HBAName", "DeviceID is:: 10000000C9123456",
                                         "HBA Name is:: 10:00:00:00:C9:12:34:56"));
}

TEST(DeviceId, MayBeginWithAQuote)
{
    char name[hba_name_size];
    EXPECT_EQ(Id2HBAName(name, "\"10000000C9123456\""), 0);
    EXPECT_STREQ(name, "10:00:00:00:C9:12:34:56");
}

TEST(DeviceId, WithoutAnArgumentIsRefused)
{
    Log_Capture log;
    char name[hba_name_size];
    EXPECT_EQ(Id2HBAName(nullptr, "10000000C9123456"), 1);
    EXPECT_EQ(Id2HBAName(name, nullptr), 1);
    EXPECT_THAT(log.words(), ElementsAre("Null pointer argument in one of the arguments",
                                         "Null pointer argument in one of the arguments"));
}

TEST(DeviceId, ThatIsTooShortEndsInZeroBytesThatAreRefused)
{
    for (const char* id : {"", "\"", "1", "10000000C912345"}) {
        char name[hba_name_size];
        std::memset(name, 'x', sizeof name);
        EXPECT_EQ(Id2HBAName(name, id), 0);
        EXPECT_EQ(name[22], '\0');
        EXPECT_EQ(name[23], '\0');
        EXPECT_EQ(name[20], ':');
        HBA_WWN read;
        EXPECT_EQ(str2HBAName(&read, name), 1) << id;
    }
}

TEST(DeviceId, ThatIsTooLongIsCut)
{
    char name[hba_name_size];
    EXPECT_EQ(Id2HBAName(name, std::string(1000, 'A').c_str()), 0);
    EXPECT_STREQ(name, "AA:AA:AA:AA:AA:AA:AA:AA");
    EXPECT_EQ(Id2HBAName(name, "10:00:00:00:C9:12:34:56"), 0);
    HBA_WWN read;
    EXPECT_EQ(str2HBAName(&read, name), 1) << "a colon among the digits";
}

TEST(ColonText, IsReadInEitherCase)
{
    for (const char* text : {"10:00:00:00:C9:12:34:5F", "10:00:00:00:c9:12:34:5f"}) {
        Log_Capture log;
        HBA_WWN read{};
        EXPECT_EQ(str2HBAName(&read, text), 0);
        EXPECT_THAT(read.wwn, ElementsAreArray(wwn.wwn));
        EXPECT_THAT(log.words(),
                    ElementsAre("Entering NVR_MethodWrapper::str2HBAName", std::string("wwpn:( ") + text + " ) ",
                                "After tokenizing wwpn:( 10  0  0  0 c9 12 34 5f )"));
    }
}

TEST(ColonText, WithoutADestinationIsRefused)
{
    Log_Capture log;
    EXPECT_EQ(str2HBAName(nullptr, "10:00:00:00:C9:12:34:56"), 1);
    EXPECT_THAT(log.words(),
                ElementsAre("Entering NVR_MethodWrapper::str2HBAName", "Null pointer assignment in argument pHBAName"));
}

TEST(ColonText, OfAnyOtherShapeIsRefused)
{
    std::vector<std::string> texts = {"", "10:00:00:00:C9:12:34:5", "10:00:00:00:C9:12:34:567",
                                      "10-00-00-00-C9-12-34-56"};
    for (std::size_t place = 0; place < 23; place++) {
        std::string text = "10:00:00:00:C9:12:34:56";
        text[place] = place % 3 == 2 ? '0' : ':';
        texts.push_back(text);
        text[place] = 'G';
        texts.push_back(text);
    }
    for (const std::string& text : texts) {
        Log_Capture log;
        HBA_WWN read;
        EXPECT_EQ(str2HBAName(&read, text.c_str()), 1) << text;
        EXPECT_EQ(log.words().back(), "INVALID HBA Name") << text;
    }
    HBA_WWN read;
    EXPECT_EQ(str2HBAName(&read, nullptr), 1);
}

TEST(ColonText, WithBlanksPassesTheLookAndFailsTheSplit)
{
    for (const char* text : {"10 00 00 00 C9 12 34 56", "10:00:00:00:C9:12:34 56"}) {
        Log_Capture log;
        HBA_WWN read;
        EXPECT_EQ(str2HBAName(&read, text), 1);
        EXPECT_EQ(log.words().back(), "INVALID HBA Name");
    }
}

TEST(MacText, TakesTheShapeOfAName)
{
    char name[mac_name_text_size];
    EXPECT_EQ(mac2HBAName(name, "00-00-C9-12-34-56"), 0u);
    EXPECT_STREQ(name, "00:00:C9:12:34:56:00:00");
    const uint8 mac[6] = {0, 0xAB, 0xC9, 0x12, 0x34, 0x56};
    EXPECT_EQ(macText(mac, '-'), "00-ab-c9-12-34-56");
    EXPECT_EQ(macText(mac, ':'), "00:ab:c9:12:34:56");
}

TEST(MacText, OfAnyOtherShapeIsRefused)
{
    char name[mac_name_text_size] = "untouched";
    EXPECT_EQ(mac2HBAName(nullptr, "00-00-C9-12-34-56"), 32769u);
    for (const char* text : {static_cast<const char*>(nullptr), "", "00-00-C9-12-34-5", "00-00-C9-12-34-567",
                             "00:00-C9-12-34-56", "00-00-C9-12-34:56", "00-00-C9-12-34 56"})
        EXPECT_EQ(mac2HBAName(name, text), 32769u);
    EXPECT_STREQ(name, "untouched");
}

TEST(Descriptor, IsPrintedForItsThreeLengths)
{
    DeviceIdentifier descriptor;
    for (unsigned i = 0; i < 256; i++)
        descriptor.identifier[i] = static_cast<uint8>(0xA0 + i);
    char text[descriptor_text_size];
    Log_Capture log;
    descriptor.identifierLength = 8;
    printDescriptor(text, descriptor);
    EXPECT_STREQ(text, "A0A1A2A3A4A5A6A7");
    descriptor.identifierLength = 12;
    printDescriptor(text, descriptor);
    EXPECT_STREQ(text, "A0A1A2A3A4A5A6A7A8A9AAAB");
    descriptor.identifierLength = 16;
    printDescriptor(text, descriptor);
    EXPECT_STREQ(text, "A0A1A2A3A4A5A6A7A8A9AAABACADAEAF");
    EXPECT_THAT(log.words(), ElementsAre("Entered", "Entered", "Entered"));
}

TEST(Descriptor, OfAnotherLengthIsEmpty)
{
    for (uint32 length : {0u, 1u, 7u, 9u, 17u, 255u, 256u, 0xFFFFFFFFu}) {
        DeviceIdentifier descriptor;
        descriptor.identifierLength = length;
        char text[descriptor_text_size] = "x";
        Log_Capture log;
        printDescriptor(text, descriptor);
        EXPECT_STREQ(text, "");
        EXPECT_THAT(log.words(), ElementsAre("Entered", "INVALID Descriptor"));
    }
}

TEST(FirmwareVersion, IsTakenApart)
{
    Log_Capture log;
    NVR_Version version;
    EXPECT_EQ(parseVersion("2.01a4", version), 0u);
    EXPECT_EQ(version.major, 2);
    EXPECT_EQ(version.minor, 0);
    EXPECT_EQ(version.revision, 1);
    EXPECT_EQ(version.build, 4);
    EXPECT_EQ(version.releaseType, "a");
    EXPECT_EQ(version.testRelease, "");
    EXPECT_THAT(log.words(),
                ElementsAre("Input Version String: [2.01a4]", "Parsed the major, minor, revision & build numbers",
                            "Filled Major, Minor, Revision & Build Numbers", "Filled ReleaseType",
                            "parseVersion: Version parsing success"));
}

TEST(FirmwareVersion, MayHaveATail)
{
    for (const char* text : {"1.23X4r5", "1.23X4 r5", "1.23X4rx", "1.23X4, sli-3", "1.23X4R1234567"}) {
        NVR_Version version;
        EXPECT_EQ(parseVersion(text, version), 0u) << text;
        EXPECT_EQ(version.build, 4);
        EXPECT_EQ(version.releaseType, "X");
        EXPECT_EQ(version.testRelease, "") << "test releases are hardly ever recognised";
    }
}

TEST(FirmwareVersion, OfAnyOtherShapeIsRefused)
{
    for (const char* text : {"", "2.01a", "12.1a4", "2,01a4", "a.01a4", "2.a1a4", "2.0aa4", "2.0114", "2.01ab",
                             "2.01\xE4"
                             "4"}) {
        Log_Capture log;
        NVR_Version version;
        EXPECT_EQ(parseVersion(text, version), 32769u) << text;
        EXPECT_EQ(version.releaseType, "");
        EXPECT_EQ(log.words().back(), "parseVersion Error: Invalid Firmware String");
    }
    Log_Capture log;
    NVR_Version version;
    EXPECT_EQ(parseVersion(nullptr, version), 32769u);
    EXPECT_THAT(log.words(),
                ElementsAre("Input Version String: []", "parseVersion Error: Input FirmwareVersion is Null"));
}

namespace {

struct OperatingSystem : testing::Test {
    OperatingSystem() { cover_file("/proc/version", "Linux version 6.1.0-13 (build@host) #1 SMP\nsecond line\n"); }
    uint32 get() { return getOSInformation(name, distribution); }
    String name{"before"};
    String distribution{"before"};
    Log_Capture log;
};

} // namespace

TEST_F(OperatingSystem, IsTheFirstLineAndTheWholeIssue)
{
    write_file("/etc/issue", "Some Linux 12 \\n \\l\n\n");
    EXPECT_EQ(get(), 0u);
    EXPECT_EQ(name, "Linux version 6.1.0-13 (build@host) #1 SMP");
    EXPECT_EQ(distribution, "Some Linux 12 \\n \\l\n\n");
    EXPECT_THAT(log.words(), ElementsAre("Under _LINUX -- getting the os name and version",
                                         "Under _LINUX -- Getting the OS Distribution Name"));
}

TEST_F(OperatingSystem, WithoutAnIssueIsUnknownInThatPart)
{
    remove("/etc/issue");
    EXPECT_EQ(get(), 32769u);
    EXPECT_EQ(name, "Linux version 6.1.0-13 (build@host) #1 SMP");
    EXPECT_EQ(distribution, "Unknown");
    EXPECT_EQ(log.words().back(), "Unable to open the /etc/issue file to get OSDistribution Name");
}

TEST_F(OperatingSystem, WithoutAVersionIsUnknown)
{
    make_unopenable("/proc/version");
    EXPECT_EQ(get(), 32769u);
    EXPECT_EQ(name, "Unknown");
    EXPECT_EQ(distribution, "Unknown");
    EXPECT_THAT(log.words(), ElementsAre("Under _LINUX -- getting the os name and version",
                                         "ifstream error no " + std::to_string(ENXIO)));
}

TEST_F(OperatingSystem, HasANameOf255CharactersAtMost)
{
    cover_file("/proc/version", std::string(400, 'v') + "\n");
    write_file("/etc/issue", "x");
    EXPECT_EQ(get(), 0u);
    EXPECT_EQ(name, std::string(255, 'v').c_str());
}

TEST_F(OperatingSystem, MayHaveEmptyFiles)
{
    cover_file("/proc/version", "");
    write_file("/etc/issue", "");
    EXPECT_EQ(get(), 0u);
    EXPECT_EQ(name, "");
    EXPECT_EQ(distribution, "");
}

TEST_F(OperatingSystem, WithAnIssueOfAbsurdSizeIsUnknownInThatPart)
{
    write_file("/etc/issue", std::string(2 * 1024 * 1024, 'x'));
    EXPECT_EQ(get(), 32769u);
    EXPECT_EQ(distribution, "Unknown");
    EXPECT_EQ(log.words().back(), "Unable to allocate the memory to store OSDistributionName");
}

TEST(FieldPrint, GivesNameAndValue)
{
    Log_Capture log;
    printField("Name", -3);
    printField("Name", "value");
    printField("Name", static_cast<const char*>(nullptr));
    printField("Name");
    EXPECT_THAT(log.words(), ElementsAre("Name: -3", "Name: value", "Name: ", "Name: "));
}

TEST(FieldText, EndsAtTheFieldAtTheLatest)
{
    char field[4] = {'a', 'b', '\0', 'd'};
    EXPECT_EQ(fieldText(field), "ab");
    field[2] = 'c';
    EXPECT_EQ(fieldText(field), "abcd");
}
