// Adapters and ports: what is read, and what each failing call costs.

#include <cstring>
#include <pthread.h>
#include <stdexcept>
#include <thread>

#include <gmock/gmock.h>

#include "foundation/management_binding.h"
#include "inventory/Adapter.h"
#include "inventory/AdapterAttributes.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"
#include "inventory/PortAttributes.h"
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
using testing::StartsWith;

namespace {

struct Discovery : testing::Test {
    // "nvr0:0,1 nvr1:0,1": the adapters kept, with the indices of their ports.
    std::string tree()
    {
        std::string text;
        std::size_t ports = 0;
        for (Adapter* adapter : data.getAdapters()) {
            text += (text.empty() ? "" : " ") + *adapter->getAdapterName() + ":";
            for (uint32 i = 0; i < adapter->getNumberOfPorts(); i++) {
                Port* port = adapter->getPort(i);
                text += (i ? "," : "") + std::to_string(port->portIndex());
                EXPECT_EQ(port->getAdapter(), adapter);
                EXPECT_EQ(data.getPorts().at(ports++), port);
            }
        }
        EXPECT_EQ(ports, data.getPorts().size());
        EXPECT_EQ(data.haveAdapters(), data.getAdapters().empty() ? 0 : 1);
        EXPECT_EQ(host.open_handles, 0);
        return text;
    }
    std::string build()
    {
        data.buildAdapterData();
        return tree();
    }
    FCAdapterAttributes& attributes(std::size_t adapter)
    {
        return dynamic_cast<FCAdapterAttributes&>(*data.getAdapters().at(adapter)->getAttributes());
    }
    FCPortAttributes& port_attributes(uint32 port)
    {
        return dynamic_cast<FCPortAttributes&>(*data.getAdapters().at(0)->getPort(port)->getAttributes());
    }

    Fake_Host host;
    NVR_Data data;
};

const std::string whole_tree = "nvr0:0,1 nvr1:0,1";

} // namespace

TEST_F(Discovery, StartsEmpty)
{
    EXPECT_EQ(tree(), "");
    EXPECT_EQ(data.getNumberOfAdapters(), 0);
}

TEST_F(Discovery, FindsAdaptersAndPorts)
{
    EXPECT_EQ(build(), whole_tree);
    EXPECT_EQ(data.getNumberOfAdapters(), 2);
    Adapter* adapter = data.getAdapters()[1];
    EXPECT_EQ(*adapter->getAdapterNumber(), 1u);
    EXPECT_EQ(*adapter->getFunctionType(), 0u);
    EXPECT_EQ(adapter->type(), 1u);
    EXPECT_NE(dynamic_cast<FCAdapter*>(adapter), nullptr);
    EXPECT_NE(dynamic_cast<FCAdapterStatistics*>(adapter->getStatistics()), nullptr);
    EXPECT_EQ(adapter->getPorts()->size(), 2u);
    auto* port = dynamic_cast<FCPort*>(adapter->getPort(1));
    ASSERT_NE(port, nullptr);
    EXPECT_EQ(port->portName(), "10000000C9A00101");
    EXPECT_EQ(port->nodeName(), "20000000C9A00101");
    EXPECT_EQ(port->statistics(), nullptr);
    EXPECT_EQ(port->getNumberOfTargets(), 0u);
}

TEST_F(Discovery, SaysInItsWordsWhatItDoes)
{
    host.adapters.resize(1);
    host.adapters[0].record.NumberOfPorts = 1;
    Log_Capture log;
    data.buildAdapterData();
    EXPECT_THAT(
        log.words(),
        ElementsAre(
            "buildAdapterData", "freeAllData: Entry", "freeAllData: cleanExit", "buildAdapterData - with hbaapi",
            "Number of Adapters detected = 1", "FC AdapterName : [nvr0]",
            "Adapter( adapterName[nvr0], adapterNumber[0], adapterType[1] )", "FCAdapterName:nvr0",
            "_NodeSymbolicName=node symbolic", "Port 0's WWPN: 10000000C9A00000", "_BoardTemperature: [ 5262125 ]",
            "_DeviceID: [ 61824 ]", "_ModelID: [ 5 ]", "_DiagVersion: [ 3 ]", "_DriverType: [ 17 ]",
            "_FunctionType: [ 0 ]", "Adapter _FunctionType: [ 0 ]", "_IEEE_ADDRESS : [ 00:90:fa:01:02:03 ]",
            "_BOOTBIOS_VERSION : [ bios 1 ]", "_KERNEL_VERSION : [ kernel 2 ]", "INITIAL_FW_LOAD : [ initial 3 ]",
            "Operational Firmware : [ operational 4 ]", "_BootCodeEnabled: [ 1 ]", "_PortNumber: [ 0 ]",
            "_SLIMode: [ 4 ]", "_FCUniversalVersion : [ universal 5 ]", "FC_X86_BIOSVersion : [ x86 6 ]",
            "_FC_EFIVersion : [ efi 7 ]", "_FC_FCODEVersion : [ fcode 8 ]", "_ULPFirmwareVersion : [ ulp 9 ]",
            "_ULPFirmwareName : [ ulp name ]", "_SPFirmwareVersion : [ sp 10 ]", "_SPFirmwareName : [ sp name ]",
            "_PCIFunctionNumber: [ 1 ]", "_PCIBusNumber: [ 59 ]", "FCPort: Entry", "Port 0's WWPN: 10000000C9A00000",
            "_PortState: [ 20 ]", "Physical port state for FC Port: 20", "Adapter Function type : 0"));
}

TEST_F(Discovery, ReadsTheAdaptersRecordAndBlock)
{
    build();
    const FCAdapterAttributes& a = attributes(1);
    EXPECT_EQ(a._Manufacturer, "Norvane");
    EXPECT_EQ(a._SerialNumber, "SN0001");
    EXPECT_EQ(a._Model, "NV-32");
    EXPECT_EQ(a._ModelDescription, "A description");
    EXPECT_EQ(a._NodeSymbolicName, "node symbolic");
    EXPECT_EQ(a._HardwareVersion, "hw");
    EXPECT_EQ(a._DriverVersion, "driver 1.2");
    EXPECT_EQ(a._OptionROMVersion, "rom");
    EXPECT_EQ(a._FirmwareVersion, "1.23a4");
    EXPECT_EQ(a._DriverName, "nvrfc");
    EXPECT_EQ(a._NodeWWN, "20000000C9A00100");
    EXPECT_EQ(a._VendorSpecificID, 0xF18010DFu);
    EXPECT_EQ(a._NumberOfPorts, 2u);
    EXPECT_EQ(a._Temperature0, 0x2Du);
    EXPECT_EQ(a._Temperature1, 0x4Bu);
    EXPECT_EQ(a._Temperature2, 0x50u);
    EXPECT_EQ(a._DeviceID, 0xF180u);
    EXPECT_EQ(a._ModelID, 5u);
    EXPECT_EQ(a._DriverType, 17u);
    EXPECT_EQ(a._DiagVersion, 3u);
    EXPECT_EQ(a._PortNumber, 0u);
    EXPECT_EQ(a._SLIMode, 4u);
    EXPECT_EQ(a._PCIFunctionNumber, 1u);
    EXPECT_EQ(a._PCIBusNumber, 0x3Cu);
    EXPECT_EQ(a._IEEE_ADDRESS, "00:90:fa:01:02:03");
    EXPECT_EQ(a._BOOTBIOS_VERSION, "bios 1");
    EXPECT_EQ(a._KERNEL_VERSION, "kernel 2");
    EXPECT_EQ(a._INITIAL_FW_LOAD, "initial 3");
    EXPECT_EQ(a._OperationalFirmware, "operational 4");
    EXPECT_EQ(a._FCUniversalVersion, "universal 5");
    EXPECT_EQ(a._FC_X86_BIOSVersion, "x86 6");
    EXPECT_EQ(a._FC_EFIVersion, "efi 7");
    EXPECT_EQ(a._FC_FCODEVersion, "fcode 8");
    EXPECT_EQ(a._ULPFirmwareVersion, "ulp 9");
    EXPECT_EQ(a._ULPFirmwareName, "ulp name");
    EXPECT_EQ(a._SPFirmwareVersion, "sp 10");
    EXPECT_EQ(a._SPFirmwareName, "sp name");
    EXPECT_TRUE(a._BootCodeEnabled);
}

TEST_F(Discovery, ReadsThePortsRecordAndState)
{
    build();
    const FCPortAttributes& p = port_attributes(1);
    EXPECT_EQ(p.PortWWN, "10000000C9A00001");
    EXPECT_EQ(p.NodeWWN, "20000000C9A00001");
    EXPECT_EQ(p.FabricName, "30000000C9A00001");
    EXPECT_EQ(p.PortFcId, 0x010201u);
    EXPECT_EQ(p.PortType, 5u);
    EXPECT_EQ(p.PortState, 20u) << "the management library's, not the record's";
    EXPECT_EQ(p.PortSupportedClassofService, 8u);
    EXPECT_EQ(p.PortSupportedFc4Types[2], 1u);
    EXPECT_EQ(p.PortSupportedFc4Types[0], 0u);
    EXPECT_EQ(p.PortActiveFc4Types[31], 0xFFu);
    EXPECT_EQ(p.PortSymbolicName, "symbolic");
    EXPECT_EQ(p.OSDeviceName, "/dev/port");
    EXPECT_EQ(p.PortSupportedSpeed, 0x70u);
    EXPECT_EQ(p.PortSpeed, 0x40u);
    EXPECT_EQ(p.PortMaxFrameSize, 2048u);
    EXPECT_EQ(p.NumberofDiscoveredPorts, 3u);
}

TEST_F(Discovery, OpensAnAdapterOnceForItselfAndOncePerPort)
{
    build();
    EXPECT_EQ(host.calls["HBA_OpenAdapter"], 6);
}

TEST_F(Discovery, WithoutAdaptersDropsTheEarlierInventory)
{
    build();
    host.adapters.clear();
    Log_Capture log;
    EXPECT_EQ(build(), "");
    EXPECT_EQ(data.getNumberOfAdapters(), 0);
    EXPECT_THAT(log.words(),
                contains_in_order({"Freeing adapter: nvr0", "Freeing adapter: nvr1", "freeAllData: cleanExit",
                                   "buildAdapterData - with hbaapi", "Number of Adapters detected = 0",
                                   "HBAAPI reports that there are NO HBAs in the system."}));
}

TEST_F(Discovery, WithoutLibrariesFindsNothing)
{
    unloadLibraries();
    EXPECT_EQ(build(), "");
}

TEST_F(Discovery, SkipsAnAdapterWithoutAName)
{
    host.faults["HBA_GetAdapterName"] = [](int, uint32 index) { return index == 0 ? 3u : 0u; };
    Log_Capture log;
    EXPECT_EQ(build(), "nvr1:0,1");
    EXPECT_EQ(data.getNumberOfAdapters(), 1);
    EXPECT_THAT(log.words(), Contains("Error hbaStatus=3, Skipping Adapter# 0"));
}

TEST_F(Discovery, SkipsConvergedCardsByName)
{
    for (const char* name : {"Norvane-O", "Norvane-N", "Norvane-O-1", "Norvane-Nvr0"}) {
        host.adapters[0].name = name;
        host.calls.clear();
        Log_Capture log;
        EXPECT_EQ(build(), "nvr1:0,1");
        EXPECT_EQ(data.getNumberOfAdapters(), 1);
        EXPECT_EQ(host.calls["HBA_OpenAdapter"], 3) << "none for the card";
        EXPECT_THAT(log.words(),
                    Contains("Found VCNA Card, AdapterName = " + std::string(name) + ". skipping this card"));
    }
    for (const char* name : {"norvane-O", "Norvane-X", "Norvane-", " Norvane-O"}) {
        host.adapters[0].name = name;
        EXPECT_EQ(build(), std::string(name) + ":0,1 nvr1:0,1");
    }
}

TEST_F(Discovery, DropsConvergedFunctionsOnceTheyAreKnown)
{
    for (uint32 type : {1u, 2u, 3u}) {
        host.adapters[0].ports[0].adapter_block[RM_ATTR_FUNCTION_TYPE] = number_value(type);
        Log_Capture log;
        EXPECT_EQ(build(), "nvr1:0,1");
        EXPECT_EQ(data.getNumberOfAdapters(), 1);
        EXPECT_THAT(log.words(), contains_in_order({"Adapter Function type : " + std::to_string(type),
                                                    "Found VCNA Card, AdapterName = nvr0. skipping this card",
                                                    "~FCAdapter", "Freeing Port: 10000000C9A00000", "~FCPort", "~Port",
                                                    "Freeing Port: 10000000C9A00001", "~Adapter"}));
    }
    for (uint32 type : {0u, 4u, 0xFFFFFFFFu}) {
        host.adapters[0].ports[0].adapter_block[RM_ATTR_FUNCTION_TYPE] = number_value(type);
        EXPECT_EQ(build(), whole_tree);
        EXPECT_EQ(*data.getAdapters()[0]->getFunctionType(), type);
    }
}

TEST_F(Discovery, SkipsAnAdapterThatCannotBeOpened)
{
    host.faults["HBA_OpenAdapter"] = [](int, uint32 index) { return index == 0 ? 1u : 0u; };
    Log_Capture log;
    EXPECT_EQ(build(), "nvr1:0,1");
    EXPECT_EQ(data.getNumberOfAdapters(), 1);
    EXPECT_THAT(log.words(), contains_in_order({"HBA_OpenAdapter failed, skipping Adapter nvr0", "~Adapter",
                                                "Catch ALL error during creating adapter..., Skipping Adapter# 0"}));
}

TEST_F(Discovery, RefreshesStaleAdapterDataOnce)
{
    host.faults["HBA_GetAdapterAttributes"] = [](int call, uint32) { return call == 1 ? 8u : 0u; };
    EXPECT_EQ(build(), whole_tree);
    EXPECT_EQ(host.calls["HBA_RefreshInformation"], 1);
    EXPECT_EQ(attributes(0)._Model, "NV-32");
}

TEST_F(Discovery, KeepsAnAdapterWithStaleDataWithoutItsPorts)
{
    host.faults["HBA_GetAdapterAttributes"] = [](int, uint32 index) { return index == 0 ? 8u : 0u; };
    Log_Capture log;
    EXPECT_EQ(build(), "nvr0: nvr1:0,1");
    EXPECT_EQ(data.getNumberOfAdapters(), 2);
    EXPECT_THAT(log.words(), Contains("Error hbaStatus=8, skipping Adapter nvr0"));
    EXPECT_EQ(attributes(0)._NumberOfPorts, 0u);
    EXPECT_EQ(attributes(0)._Manufacturer, "");
    EXPECT_EQ(attributes(0)._NodeWWN, "");
    EXPECT_EQ(attributes(0)._KERNEL_VERSION, "kernel 2") << "the block was read all the same";
}

TEST_F(Discovery, RefreshesStalePortDataOnce)
{
    host.faults["HBA_GetAdapterPortAttributes"] = [](int call, uint32) { return call % 2 ? 8u : 0u; };
    EXPECT_EQ(build(), whole_tree);
    EXPECT_EQ(host.calls["HBA_RefreshInformation"], 6);
}

TEST_F(Discovery, SkipsAnAdapterWhosePortZeroIsUnreadable)
{
    host.faults["HBA_GetAdapterPortAttributes"] = [](int call, uint32) { return call == 1 ? 2u : 0u; };
    Log_Capture log;
    EXPECT_EQ(build(), "nvr1:0,1");
    EXPECT_THAT(log.words(), contains_in_order({"(portIndex=0) failed with hbaStatus 2",
                                                "Catch ALL error during creating adapter..., Skipping Adapter# 0"}));
}

TEST_F(Discovery, LeavesOutAPortThatFailsAndKeepsTheOthersIndices)
{
    host.faults["HBA_GetAdapterPortAttributes"] = [](int, uint32 index) { return index == 1 ? 1u : 0u; };
    Log_Capture log;
    EXPECT_EQ(build(), "nvr0:0 nvr1:0");
    EXPECT_THAT(log.words(), contains_in_order({"(portIndex=1) failed with hbaStatus 1", "~Port",
                                                "Failed to fetch information for port: [1] on adapter: [nvr0]"}));
    host.faults.clear();
    host.faults["RM_GetPortAttributes"] = [](int, uint32 index) { return index == 0 ? 5u : 0u; };
    EXPECT_EQ(build(), "nvr0:1 nvr1:1");
    EXPECT_THAT(log.words(), contains_in_order({"RM_GetPortAttributes call failed (5)\n", "~Port",
                                                "Failed to fetch information for port: [0] on adapter: [nvr0]"}));
    EXPECT_EQ(data.getNumberOfAdapters(), 2);
}

TEST_F(Discovery, SkipsAnAdapterWithoutABlock)
{
    host.faults["RM_GetHBAAttributes"] = [](int call, uint32) { return call == 1 ? 64u : 0u; };
    Log_Capture log;
    EXPECT_EQ(build(), "nvr1:0,1");
    EXPECT_THAT(log.words(), contains_in_order({"ERROR: RM_GetHBAAttributes call failed (64)",
                                                "Catch ALL error during creating adapter..., Skipping Adapter# 0"}));
}

TEST_F(Discovery, LeavesMissingAttributesEmpty)
{
    for (Fake_Port& port : host.adapters[0].ports) {
        port.adapter_block.clear();
        port.port_block.clear();
    }
    host.fail("RM_GetDriverType", 2);
    Log_Capture log;
    EXPECT_EQ(build(), whole_tree);
    const FCAdapterAttributes& a = attributes(0);
    EXPECT_EQ(a._DeviceID + a._Temperature0 + a._Temperature1 + a._Temperature2 + a._DriverType + a._PCIBusNumber, 0u);
    EXPECT_EQ(a._IEEE_ADDRESS + a._KERNEL_VERSION + a._SPFirmwareName, "");
    EXPECT_FALSE(a._BootCodeEnabled);
    EXPECT_EQ(port_attributes(0).PortState, 0u);
    EXPECT_THAT(log.words(), contains_in_order({"ERROR: RM_GetHBAAttributeValue HA__BoardTemperature call failed (2)",
                                                "ERROR: RM_GetDriverType call failed (2)",
                                                "ERROR: RM_GetHBAAttributeValue HA__FunctionType call failed (2)",
                                                "Adapter _FunctionType: [ 0 ]",
                                                "ERROR: _IEEE_ADDRESS: RM_GetHBAAttributes call failed (2)",
                                                "ERROR: INITIAL_FW_LOAD: RM_GetHBAAttributes call failed (2)",
                                                "ERROR: RM_GetHBAAttributeValue HA__BootCodeEnabled call failed (2)",
                                                "ERROR: RM_GetHBAAttributeValue HA__PortState call failed (2)",
                                                "Physical port state for FC Port: 0"}));
}

TEST_F(Discovery, TakesBootCodeForAFlag)
{
    for (uint32 value : {0u, 1u, 2u, 0x80000000u}) {
        host.adapters[0].ports[0].adapter_block[RM_ATTR_BOOT_CODE_ENABLED] = number_value(value);
        build();
        EXPECT_EQ(attributes(0)._BootCodeEnabled, value != 0);
    }
}

TEST_F(Discovery, ReadsUnterminatedTextsToTheEndOfTheirFields)
{
    HBA_ADAPTERATTRIBUTES& record = host.adapters[0].record;
    std::memset(record.Manufacturer, 'm', sizeof record.Manufacturer);
    std::memset(record.DriverName, 'd', sizeof record.DriverName);
    HBA_PORTATTRIBUTES& port = host.adapters[0].ports[0].record;
    std::memset(port.PortSymbolicName, 's', sizeof port.PortSymbolicName);
    std::memset(port.OSDeviceName, 'o', sizeof port.OSDeviceName);
    host.adapters[0].name = std::string(300, 'n');
    EXPECT_EQ(build(), std::string(256, 'n') + ":0,1 nvr1:0,1");
    EXPECT_EQ(attributes(0)._Manufacturer, std::string(64, 'm'));
    EXPECT_EQ(attributes(0)._DriverName, std::string(256, 'd'));
    EXPECT_EQ(port_attributes(0).PortSymbolicName, std::string(256, 's'));
    EXPECT_EQ(port_attributes(0).OSDeviceName, std::string(256, 'o'));
}

TEST_F(Discovery, WalksAtMost4096OfTheAdaptersThatAreReported)
{
    for (uint32 count : {4096u, 0x7FFFFFFFu, 0x80000000u, 0xFFFFFFFFu}) {
        host.calls.clear();
        fake::operations().HBA_GetNumberOfAdapters = [=] { return count; };
        host.faults["HBA_GetAdapterName"] = [](int, uint32 index) { return index < 2 ? 0u : 1u; };
        Log_Capture log;
        EXPECT_EQ(build(), whole_tree);
        EXPECT_EQ(host.calls["HBA_GetAdapterName"], 4096);
        EXPECT_EQ(data.getNumberOfAdapters(), static_cast<sint32>(count - 4094));
        EXPECT_THAT(log.words(),
                    Contains("Number of Adapters detected = " + std::to_string(static_cast<sint32>(count))));
    }
}

TEST_F(Discovery, WalksAtMost4096OfThePortsThatAreReported)
{
    host.adapters[0].record.NumberOfPorts = 0xFFFFFFFF;
    EXPECT_EQ(build(), whole_tree);
    EXPECT_EQ(attributes(0)._NumberOfPorts, 0xFFFFFFFFu);
    EXPECT_EQ(host.calls["HBA_GetAdapterPortAttributes"], 1 + 4096 + 1 + 2);
}

TEST_F(Discovery, SurvivesAGarbageBlock)
{
    for (const char* operation : {"block", "value"}) {
        fake::operations().RM_GetHBAAttributes = [](HBA_WWN, void* block, uint32_t* size) {
            std::memset(block, 0xFF, *size);
            *size = 0xFFFFFFFF;
            return 0u;
        };
        fake::operations().RM_GetAttributeValue = [=](void* block, uint16_t number, uint16_t* length,
                                                      uint32_t* status) -> void* {
            *status = 0;
            *length = 0xFFFF;
            if (*operation == 'b') return static_cast<char*>(block) + number * 5 % 2900;
            return reinterpret_cast<void*>(std::uintptr_t{number} << 32);
        };
        EXPECT_EQ(build(), whole_tree);
        EXPECT_LE(attributes(0)._KERNEL_VERSION.size(), 255u);
    }
}

TEST_F(Discovery, GivesPortsByPositionOnly)
{
    build();
    Adapter* adapter = data.getAdapters()[0];
    EXPECT_NE(adapter->getPort(1), nullptr);
    for (uint32 index : {2u, 0xFFFFFFFFu}) {
        try {
            adapter->getPort(index);
            FAIL();
        } catch (const std::out_of_range& error) {
            EXPECT_STREQ(error.what(), "vector::_M_range_check");
        }
    }
}

TEST_F(Discovery, LetsACancelledThreadEnd)
{
    host.faults["HBA_GetAdapterAttributes"] = [](int, uint32 index) -> uint32 {
        if (index == 1) ::pthread_exit(nullptr);
        return 0;
    };
    bool ended = true;
    std::thread([&] {
        data.buildAdapterData();
        ended = false;
    }).join();
    EXPECT_TRUE(ended) << "no catch-all holds it up";
    EXPECT_EQ(host.open_handles, 0);
    host.faults.clear();
    EXPECT_EQ(build(), whole_tree);
}

TEST_F(Discovery, FreesInOrderAndSaysSo)
{
    host.adapters.resize(1);
    host.adapters[0].record.NumberOfPorts = 1;
    build();
    data.buildSANData();
    Log_Capture log;
    data.freeAllData();
    EXPECT_THAT(log.words(),
                ElementsAre("freeAllData: Entry", "Freeing adapter: nvr0", "~FCAdapter",
                            "Freeing Port: 10000000C9A00000", "~FCPort", "~Port", "Freeing Target: 50000000C9A00000",
                            "Freeing Target: 50000000C9A00001", "~Adapter", "freeAllData: cleanExit"));
    EXPECT_EQ(tree(), "");
    EXPECT_EQ(data.getNumberOfAdapters(), 0);
}

TEST_F(Discovery, KeepsTheCountWhenAnEmptyInventoryIsFreed)
{
    host.adapters[0].record.NumberOfPorts = 0;
    fake::operations().HBA_GetNumberOfAdapters = [] { return 5000u; };
    host.fail("HBA_GetAdapterName", 1);
    build();
    EXPECT_EQ(data.getNumberOfAdapters(), 5000 - 4096);
    data.freeAllData();
    EXPECT_EQ(data.getNumberOfAdapters(), 5000 - 4096);
}

TEST(Inventory, SaysWhenItComesAndGoes)
{
    Log_Capture log;
    {
        NVR_Data data;
    }
    EXPECT_THAT(log.words(), ElementsAre("Data Pointer Constructed.", "freeAllData: Entry", "freeAllData: cleanExit",
                                         "Data Pointer deleted."));
}

namespace {

// Each call of a discovery, failing with each status that libraries answer.
struct EveryFault : Discovery, testing::WithParamInterface<std::tuple<std::string, uint32>> {};

} // namespace

TEST_P(EveryFault, CostsNothingThatTheNextScanDoesNotBringBack)
{
    const auto [operation, status] = GetParam();
    EXPECT_EQ(build(), whole_tree);
    data.buildSANData();

    host.calls.clear();
    host.fail(operation, status);
    build();
    data.buildSANData();
    EXPECT_GT(host.calls[operation], 0) << "the call was made";
    EXPECT_LE(data.getAdapters().size(), 2u);
    EXPECT_EQ(data.getNumberOfAdapters(), static_cast<sint32>(data.getAdapters().size()));
    EXPECT_EQ(host.open_handles, 0);

    for (int nth = 1; nth <= 4; nth++) {
        host.calls.clear();
        host.faults[operation] = [nth, status = status](int call, uint32) { return call == nth ? status : 0u; };
        build();
        data.buildSANData();
        EXPECT_GE(data.getAdapters().size(), 1u) << "one call costs one adapter at most";
        EXPECT_EQ(host.open_handles, 0);
    }

    host.faults.clear();
    EXPECT_EQ(build(), whole_tree);
    data.buildSANData();
    for (Port* port : data.getPorts())
        EXPECT_EQ(port->getNumberOfTargets(), 2u);
}

INSTANTIATE_TEST_SUITE_P(
    EveryCallAndStatus, EveryFault,
    testing::Combine(testing::Values("HBA_GetAdapterName", "HBA_OpenAdapter", "HBA_GetAdapterAttributes",
                                     "HBA_GetAdapterPortAttributes", "RM_GetHBAAttributes", "RM_GetPortAttributes",
                                     "RM_GetDriverType", "RM_GetAttributeValue", "HBA_GetFcpTargetMapping",
                                     "HBA_SendScsiInquiry", "HBA_SendReadCapacity"),
                     testing::Values(1u, 2u, 3u, 4u, 5u, 6u, 7u, 8u, 9u, 10u, 64u, 150u, 191u, 0xFFFFFFFFu)));
