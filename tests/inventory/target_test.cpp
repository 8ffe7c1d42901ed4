// Targets: the mapping with its retries, and the four SCSI commands.

#include <cstdlib>
#include <cstring>
#include <exception>
#include <memory>

#include <gmock/gmock.h>

#include "inventory/Adapter.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"
#include "inventory/Target.h"
#include "tests/foundation/fakes/fake_libraries.h"
#include "tests/inventory/fake_host.h"
#include "tests/support/log_capture.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;

namespace {

struct Targets : testing::Test {
    Targets()
    {
        host.adapters.resize(1);
        host.adapters[0].record.NumberOfPorts = 1;
        data.buildAdapterData();
        port = dynamic_cast<FCPort*>(data.getPorts().at(0));
    }
    std::size_t scan()
    {
        data.buildSANData();
        EXPECT_EQ(host.open_handles, 0);
        return port->getNumberOfTargets();
    }
    // Scans a mapping of one entry.
    Target& scan_one()
    {
        host.adapters[0].mapping = {make_entry(0)};
        EXPECT_EQ(scan(), 1u);
        return *port->getTarget(0);
    }

    Fake_Host host;
    NVR_Data data;
    FCPort* port = nullptr;
};

} // namespace

TEST_F(Targets, AreReadFromMappingAndDevice)
{
    host.adapters[0].mapping = {make_entry(1)};
    Log_Capture log;
    ASSERT_EQ(scan(), 1u);
    const Target& target = *port->getTarget(0);
    EXPECT_EQ(target.FcId, 0x020301u);
    EXPECT_EQ(target.NodeName, "40000000C9A00001");
    EXPECT_EQ(target.PortName, "50000000C9A00001");
    EXPECT_EQ(target.FcpLun, 0x0100u);
    EXPECT_EQ(target.OSDeviceName, "/dev/sdb");
    EXPECT_EQ(target.BusNumber, 1u);
    EXPECT_EQ(target.TargetNumber, 2u);
    EXPECT_EQ(target.OSLun, 1u);
    EXPECT_EQ(target.BlockSize, 512u);
    EXPECT_EQ(target.LastBlock, 16777215u);
    EXPECT_EQ(target.DeviceType, 0u) << "the low five bits";
    EXPECT_EQ(target.Vendor, "Vendor01");
    EXPECT_EQ(target.Product, "Product name 016");
    EXPECT_EQ(target.Revision, "R001");
    EXPECT_EQ(target.SerialNumber, "SERIAL0001");
    EXPECT_EQ(target.Identifier.deviceType, 0);
    EXPECT_EQ(target.Identifier.pageCode, 0x83);
    EXPECT_EQ(target.Identifier.pageLength, 12u);
    EXPECT_EQ(target.Identifier.identifierType, 3u);
    EXPECT_EQ(target.Identifier.identifierLength, 8u);
    char text[descriptor_text_size];
    printDescriptor(text, target.Identifier);
    EXPECT_STREQ(text, "6006016011223344");
    EXPECT_THAT(log.words(),
                ElementsAre("buildSANData", "Target Scan from adapter: nvr0", "FCAdapter::rescanTargets",
                            "FCPort::rescanTargets", "To retry the HBA_GetFcpTargetMapping command", "All Ok ...break ",
                            "Successful target info fetched", "Creating Target...", "NodeWWN: 40000000C9A00001",
                            "PortWWN: 50000000C9A00001", "SCSI Inquiry with 0, 0", "DeviceType......0",
                            "SCSI Inquiry with 1, 0x80", "SCSI Inquiry with 1, 0x83", "Send Read Capacity",
                            "End Creating Target...", "Entered"));
}

TEST_F(Targets, AreReplacedByEachScan)
{
    EXPECT_EQ(scan(), 2u);
    host.adapters[0].mapping.pop_back();
    Log_Capture log;
    EXPECT_EQ(scan(), 1u);
    EXPECT_THAT(log.words(), contains_in_order({"FCPort::rescanTargets", "Freeing Target: 50000000C9A00000",
                                                "Freeing Target: 50000000C9A00001", "Creating Target..."}));
}

TEST_F(Targets, OfEachPortAreTheWholeMapping)
{
    host.adapters[0].record.NumberOfPorts = 2;
    data.buildAdapterData();
    data.buildSANData();
    ASSERT_EQ(data.getPorts().size(), 2u);
    for (Port* each : data.getPorts())
        EXPECT_EQ(each->getTargets()->size(), 2u);
}

TEST_F(Targets, OpenTheAdapterOnceMoreThanTheyAre)
{
    host.calls.clear();
    EXPECT_EQ(scan(), 2u);
    EXPECT_EQ(host.calls["HBA_OpenAdapter"], 3);
}

TEST_F(Targets, MayBeNone)
{
    host.adapters[0].mapping.clear();
    Log_Capture log;
    EXPECT_EQ(scan(), 0u);
    EXPECT_THAT(log.words(), contains_in_order({"Successful target info fetched",
                                                "HBA_GetFcpTargetMapping_t() found no target mappings"}));
}

TEST_F(Targets, OfALongMappingAreFetchedWithALargerBuffer)
{
    host.adapters[0].mapping.clear();
    for (int i = 0; i < 300; i++)
        host.adapters[0].mapping.push_back(make_entry(static_cast<uint8>(i)));
    Log_Capture log;
    EXPECT_EQ(scan(), 300u);
    EXPECT_THAT(log.words(),
                contains_in_order({"To retry the HBA_GetFcpTargetMapping command", "Increasing the buffer to = 300",
                                   "To retry the HBA_GetFcpTargetMapping command", "Deleting the allocated memory",
                                   "All Ok ...break ", "Successful target info fetched"}));
    EXPECT_EQ(host.calls["HBA_GetFcpTargetMapping"], 2);
}

TEST_F(Targets, OfAStaleMappingAreNoneAfterThreeAttempts)
{
    host.fail("HBA_GetFcpTargetMapping", HBA_STATUS_ERROR_STALE_DATA);
    Log_Capture log;
    EXPECT_EQ(scan(), 0u);
    EXPECT_EQ(host.calls["HBA_GetFcpTargetMapping"], 3);
    EXPECT_EQ(host.calls["HBA_RefreshInformation"], 3);
    EXPECT_THAT(log.words(),
                ElementsAre("buildSANData", "Target Scan from adapter: nvr0", "FCAdapter::rescanTargets",
                            "FCPort::rescanTargets", "To retry the HBA_GetFcpTargetMapping command",
                            "Refresh and retry ... ", "To retry the HBA_GetFcpTargetMapping command",
                            "Deleting the allocated memory", "Refresh and retry ... ",
                            "To retry the HBA_GetFcpTargetMapping command", "Deleting the allocated memory",
                            "Refresh and retry ... ", "Successful target info fetched"));
}

TEST_F(Targets, OfAStaleMappingComeOnTheThirdAttempt)
{
    host.faults["HBA_GetFcpTargetMapping"] = [](int call, uint32) { return call < 3 ? 8u : 0u; };
    EXPECT_EQ(scan(), 2u);
}

TEST_F(Targets, OfARefusedMappingAreNone)
{
    host.fail("HBA_GetFcpTargetMapping", HBA_STATUS_ERROR_NOT_SUPPORTED);
    Log_Capture log;
    EXPECT_EQ(scan(), 0u);
    EXPECT_EQ(host.calls["HBA_GetFcpTargetMapping"], 1);
    EXPECT_EQ(log.words().back(), "Error hbaStatus=2");
}

TEST_F(Targets, BelieveNoCountOfTheMapping)
{
    for (uint32 count : {257u, 300u, 0x7FFFFFFFu, 0xFFFFFFFFu}) {
        fake::operations().HBA_GetFcpTargetMapping = [=](HBA_HANDLE, HBA_FCPTARGETMAPPING* mapping) {
            EXPECT_EQ(mapping->NumberOfEntries, 256u);
            mapping->NumberOfEntries = count;
            return HBA_STATUS(HBA_STATUS_OK);
        };
        EXPECT_EQ(scan(), 256u) << "the entries behind what the library wrote are zero, and read as such";
        EXPECT_EQ(port->getTarget(255)->PortName, "0000000000000000");
    }
}

TEST_F(Targets, BelieveNoNeedOfTheMapping)
{
    for (uint32 count : {0u, 1u, 65537u, 1048576u, 0x7FFFFFFFu, 0xFFFFFFFFu}) {
        int calls = 0;
        fake::operations().HBA_GetFcpTargetMapping = [&](HBA_HANDLE, HBA_FCPTARGETMAPPING* mapping) {
            calls++;
            mapping->NumberOfEntries = count;
            return HBA_STATUS(HBA_STATUS_ERROR_MORE_DATA);
        };
        Log_Capture log;
        EXPECT_EQ(scan(), 0u);
        if (count > 1) {
            EXPECT_EQ(calls, 1);
            EXPECT_THAT(log.words(),
                        contains_in_order({"To retry the HBA_GetFcpTargetMapping command",
                                           "Deleting the allocated memory", "Could not allocate memory..break "}));
        } else {
            EXPECT_EQ(calls, 3);
        }
    }
}

TEST_F(Targets, MappingIsGivenBackWithItsStatus)
{
    HBA_FCPTARGETMAPPING* mapping = nullptr;
    EXPECT_EQ(FCPort::getTargetMapping(100, &mapping), 0u);
    ASSERT_NE(mapping, nullptr);
    EXPECT_EQ(mapping->NumberOfEntries, 2u);
    std::free(mapping);
    host.fail("HBA_GetFcpTargetMapping", HBA_STATUS_ERROR_STALE_DATA);
    EXPECT_EQ(FCPort::getTargetMapping(100, &mapping), 8u);
    EXPECT_NE(mapping, nullptr);
    std::free(mapping);
    host.fail("HBA_GetFcpTargetMapping", HBA_STATUS_ERROR);
    EXPECT_EQ(FCPort::getTargetMapping(100, &mapping), 1u);
    EXPECT_EQ(mapping, nullptr);
}

TEST_F(Targets, GoWhenTheAdapterCannotBeOpened)
{
    EXPECT_EQ(scan(), 2u);
    host.fail("HBA_OpenAdapter", 1);
    Log_Capture log;
    EXPECT_EQ(scan(), 0u);
    EXPECT_THAT(log.words(), contains_in_order({"HBA_OpenAdapter failed, skipping Adapter nvr0",
                                                "Issue with Target Rescan - moving to the next Port"}));
}

TEST_F(Targets, ThatCannotBeOpenedAreLeftOut)
{
    host.calls.clear();
    host.faults["HBA_OpenAdapter"] = [](int call, uint32) { return call == 2 ? 1u : 0u; };
    Log_Capture log;
    EXPECT_EQ(scan(), 1u);
    EXPECT_EQ(port->getTarget(0)->PortName, "50000000C9A00001");
    EXPECT_THAT(log.words(), contains_in_order({"HBA_OpenAdapter failed, skipping Adapter nvr0",
                                                "target creation failed - moving to the next target",
                                                "Creating Target...", "End Creating Target..."}));
}

TEST_F(Targets, AreGivenByPositionOnly)
{
    EXPECT_EQ(scan(), 2u);
    EXPECT_NE(port->getTarget(1), nullptr);
    for (uint32 index : {2u, 0xFFFFFFFFu}) {
        try {
            port->getTarget(index);
            FAIL();
        } catch (const std::exception& error) {
            EXPECT_TRUE(typeid(error) == typeid(std::exception)) << "a plain one";
        }
    }
}

TEST_F(Targets, ThatAnswerOnTheThirdCallHaveAnswered)
{
    host.inquiry.statuses = {9, 9, 0};
    host.capacity.statuses = {9, 0};
    Target& target = scan_one();
    EXPECT_EQ(target.Vendor, "Vendor01");
    EXPECT_EQ(target.BlockSize, 512u);
    EXPECT_EQ(host.inquiry.calls, 3);
    EXPECT_EQ(host.capacity.calls, 2);
    EXPECT_EQ(host.serial_page.calls, 1);
}

TEST_F(Targets, ThatCheckThreeTimesHaveFailed)
{
    for (Fake_Answer* answer : {&host.inquiry, &host.serial_page, &host.identifier_page, &host.capacity})
        answer->statuses = {9};
    host.identifier_page.sense = std::string("\x70\x00\x05\xFF", 4);
    Log_Capture log;
    Target& target = scan_one();
    EXPECT_EQ(target.Vendor, "Unknown");
    EXPECT_EQ(target.Product, "Unknown");
    EXPECT_EQ(target.Revision, "Unknown");
    EXPECT_EQ(target.SerialNumber, "Unknown");
    EXPECT_EQ(target.DeviceType, 0u);
    EXPECT_EQ(target.Identifier.identifierLength, 0u);
    EXPECT_EQ(target.Identifier.pageCode, 0);
    EXPECT_EQ(target.BlockSize, 0u);
    EXPECT_EQ(target.LastBlock, 0u);
    for (const Fake_Answer* answer : {&host.inquiry, &host.serial_page, &host.identifier_page, &host.capacity})
        EXPECT_EQ(answer->calls, 3);
    EXPECT_THAT(
        log.words(),
        contains_in_order({"SCSI Inquiry with 0, 0", "HBA_SendScsiInquiry_t(0x80) returns 9.",
                           "SCSI Inquiry with 1, 0x80", "HBA_SendScsiInquiry_t(0x80) returns 9.",
                           "SCSI Inquiry with 1, 0x83", "HBA_SendScsiInquiry_t(0x80) returns 9.",
                           "Sense Data: 70 00 05 ff 00 00 00 00 00 00 00 00 00 00 00 00 00 00 00 00 00 00 00 00 ",
                           "Send Read Capacity", "HBA_SendScsiInquiry_t(0x80) returns 9.", "End Creating Target..."}));
}

TEST_F(Targets, ThatRefuseAreAskedOnce)
{
    for (Fake_Answer* answer : {&host.inquiry, &host.serial_page, &host.identifier_page, &host.capacity})
        answer->statuses = {2};
    Log_Capture log;
    EXPECT_EQ(scan_one().PortName, "50000000C9A00000");
    for (const Fake_Answer* answer : {&host.inquiry, &host.serial_page, &host.identifier_page, &host.capacity})
        EXPECT_EQ(answer->calls, 1);
    EXPECT_THAT(log.words(), Not(Contains(testing::StartsWith("Sense Data"))));
}

TEST_F(Targets, ThatRefuseTheInquiryStillShowTheirSize)
{
    host.inquiry.statuses = {1};
    Target& target = scan_one();
    EXPECT_EQ(target.Vendor, "Unknown");
    EXPECT_EQ(target.LastBlock, 16777215u);
    EXPECT_EQ(target.BlockSize, 512u);
}

TEST_F(Targets, ShowSizesAboveTwoGiga)
{
    host.capacity.response = std::string("\xFF\xFF\xFF\xFE\x80\x00\x00\x00", 8);
    Target& target = scan_one();
    EXPECT_EQ(target.LastBlock, 0xFFFFFFFEu);
    EXPECT_EQ(target.BlockSize, 0x80000000u);
}

TEST_F(Targets, KeepWhatAnEarlierAttemptLeftInTheResponse)
{
    int calls = 0;
    fake::operations().HBA_SendReadCapacity = [&](HBA_HANDLE, HBA_WWN, HBA_UINT64, void* response, HBA_UINT32, void*,
                                                  HBA_UINT32) -> HBA_STATUS {
        auto* bytes = static_cast<uint8*>(response);
        if (calls++ == 0) {
            bytes[3] = 7;
            return 9;
        }
        bytes[7] = 1;
        return 0;
    };
    EXPECT_EQ(scan_one().LastBlock, 7u);
}

TEST_F(Targets, AreAddressedByTheMappingsNameAndUnit)
{
    host.adapters[0].mapping = {make_entry(3)};
    int calls = 0;
    fake::operations().HBA_SendScsiInquiry = [&](HBA_HANDLE handle, HBA_WWN wwn, HBA_UINT64 lun, HBA_UINT8, HBA_UINT32,
                                                 void*, HBA_UINT32, void*, HBA_UINT32) -> HBA_STATUS {
        calls++;
        EXPECT_EQ(handle, 100u);
        EXPECT_EQ(wwn.wwn[7], 3);
        EXPECT_EQ(lun, 0x0300);
        return 0;
    };
    EXPECT_EQ(scan(), 1u);
    EXPECT_EQ(calls, 3);
    EXPECT_EQ(port->getTarget(0)->Vendor, "");
}

TEST_F(Targets, HaveTextsBoundedByTheResponse)
{
    host.inquiry.response = std::string(255, 'i');
    host.serial_page.response = std::string(255, 's');
    host.identifier_page.response = std::string(255, '\xFF');
    host.adapters[0].mapping = {make_entry(0)};
    std::memset(host.adapters[0].mapping[0].ScsiId.OSDeviceName, 'o', 256);
    ASSERT_EQ(scan(), 1u);
    const Target& target = *port->getTarget(0);
    EXPECT_EQ(target.Vendor, std::string(8, 'i'));
    EXPECT_EQ(target.Product, std::string(16, 'i'));
    EXPECT_EQ(target.Revision, std::string(4, 'i'));
    EXPECT_EQ(target.SerialNumber, std::string(251, 's'));
    EXPECT_EQ(target.OSDeviceName, std::string(256, 'o'));
    EXPECT_EQ(target.Identifier.identifierLength, 255u);
    EXPECT_EQ(target.Identifier.identifier[246], 0xFF);
    EXPECT_EQ(target.Identifier.identifier[247], 0) << "the response ends there";
    EXPECT_EQ(target.Identifier.deviceType, 31);
}

TEST_F(Targets, KeepBlanksOfTheirTexts)
{
    host.inquiry.response = std::string("\0\0\0\0\0\0\0\0ACME    DISK            1.0 ", 36);
    Target& target = scan_one();
    EXPECT_EQ(target.Vendor, "ACME    ");
    EXPECT_EQ(target.Product, "DISK            ");
    EXPECT_EQ(target.Revision, "1.0 ");
}
