// Faults of each kind, and what they hit: function, port, n-th call, attribute.
#include "Sim.h"

#include <chrono>
#include <memory>
#include <thread>

class Faults : public Simulated {
protected:
    static uint32_t driver_type(uint64_t port)
    {
        uint32_t type = 0;
        return nvrsim_RM_GetDriverType(wire(port), &type);
    }
};

TEST_F(Faults, StatusOfOneFunctionLeavesTheOthersAlone)
{
    fault("call = 'RM_GetDriverType', status = 64");
    EXPECT_EQ(64u, driver_type(port0));
    uint32_t state = 0;
    EXPECT_EQ(0u, nvrsim_RM_DiagBeaconState(wire(port0), &state));
}

TEST_F(Faults, RefusedCallChangesNothing)
{
    fault("call = 'RM_DiagBeacon', status = 1");
    EXPECT_EQ(1u, nvrsim_RM_DiagBeacon(wire(port0), RM_BEACON_ON));
    EXPECT_EQ("2", sim_value("0", "beacon"));
}

TEST_F(Faults, HitFromTheSecondCallForTwoCalls)
{
    fault("call = 'RM_GetDriverType', status = 97, from = 2, times = 2");
    EXPECT_EQ(0u, driver_type(port0));
    EXPECT_EQ(97u, driver_type(port0));
    EXPECT_EQ(97u, driver_type(port0));
    EXPECT_EQ(0u, driver_type(port0));
    EXPECT_NE(std::string::npos, sim_text(nvrsim_faults).find("seen=4 hits=2"));
}

TEST_F(Faults, PortByNumberOrByName)
{
    load("[[adapter]]\ncount = 2\n");
    fault("call = 'RM_GetDriverType', port = 1, status = 63");
    fault("call = 'RM_GetDriverType', port = '10:00:00:00:C9:A0:00:01', status = 62");
    EXPECT_EQ(62u, driver_type(port0));
    EXPECT_EQ(63u, driver_type(port1));
}

TEST_F(Faults, PortOfACommonApiCallIsTheOneItNames)
{
    load("[[adapter]]\nports = 2\n");
    fault("call = 'HBA_GetAdapterPortAttributes', port = 1, status = 1");
    HBA_PORTATTRIBUTES port;
    EXPECT_EQ(0u, nvrsim_HBA_GetAdapterPortAttributes(open(), 0, &port));
    EXPECT_EQ(1u, nvrsim_HBA_GetAdapterPortAttributes(open(), 1, &port));
    fault("call = 'HBA_GetAdapterAttributes', port = 1, status = 8");
    HBA_ADAPTERATTRIBUTES attributes;
    EXPECT_EQ(8u, nvrsim_HBA_GetAdapterAttributes(open(), &attributes)) << "a whole adapter concerns all its ports";
}

TEST_F(Faults, FirstMatchingFaultWinsAndTheNextFollowsWhenItIsUsedUp)
{
    fault("call = 'RM_GetDriverType', status = 1, times = 1");
    fault("call = 'RM_*', status = 2");
    EXPECT_EQ(1u, driver_type(port0));
    EXPECT_EQ(2u, driver_type(port0));
    nvrsim_clear_faults();
    EXPECT_EQ(0u, driver_type(port0));
}

TEST_F(Faults, ScenariosCanHoldThem)
{
    load("[[adapter]]\n[[fault]]\ncall = 'RM_InitLib'\nstatus = -1\n");
    EXPECT_EQ(-1, nvrsim_RM_InitLib());
}

TEST_F(Faults, DelayHoldsUpThatCallOnly)
{
    fault("call = 'RM_GetDriverType', delay_ms = 500, times = 1");
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(0u, driver_type(port0));
    EXPECT_GE(std::chrono::steady_clock::now() - start, std::chrono::milliseconds(500));
    EXPECT_EQ(0u, driver_type(port0));
    EXPECT_NE(std::string::npos, sim_text(nvrsim_faults).find("seen=2 hits=1")) << "the second was not held up";
}

TEST_F(Faults, ADelayIsOverWhenTheFaultsAreCleared)
{
    fault("call = 'RM_GetDriverType', delay_ms = 3600000");
    std::thread caller([&] { EXPECT_EQ(0u, driver_type(port0)); });
    while (nvrsim_calls("RM_GetDriverType") == 0)
        std::this_thread::yield();
    nvrsim_clear_faults();
    caller.join();
    EXPECT_EQ(0u, driver_type(port0));
}

TEST_F(Faults, CallsThatAreUnderWayAtOnceAreCounted)
{
    EXPECT_EQ(0u, driver_type(port0));
    EXPECT_EQ(1u, nvrsim_most_at_once());
    EXPECT_EQ(0u, nvrsim_most_at_once());
    fault("call = 'RM_GetDriverType', delay_ms = 60000, times = 2");
    std::thread first([] { driver_type(port0); });
    std::thread second([] { driver_type(port0); });
    while (nvrsim_calls("RM_GetDriverType") < 3)
        std::this_thread::yield();
    nvrsim_clear_faults(); // which ends the delays
    first.join();
    second.join();
    EXPECT_EQ(2u, nvrsim_most_at_once());
    EXPECT_EQ(0u, nvrsim_most_at_once());
}

TEST_F(Faults, GarbageIsTheSameEachTimeAndStaysInTheBuffer)
{
    fault("call = 'RM_GetHBAAttributes', damage = 'garbage'");
    Block first(RM_HBA_BLOCK_SIZE), second(RM_HBA_BLOCK_SIZE);
    EXPECT_EQ(0u, nvrsim_RM_GetHBAAttributes(wire(port0), first.bytes.data(), &first.size));
    EXPECT_EQ(0u, nvrsim_RM_GetHBAAttributes(wire(port0), second.bytes.data(), &second.size));
    EXPECT_EQ(first.bytes, second.bytes);
    EXPECT_EQ("(none)", first.text(RM_ATTR_BOOT_BIOS_VERSION));
    for (size_t i = first.size; i < first.bytes.size(); ++i)
        ASSERT_EQ(0, first.bytes[i]);
}

TEST_F(Faults, TruncatedKeepsTheFirstBytes)
{
    fault("call = 'RM_GetVPD', damage = 'truncated', keep = 10");
    std::vector<char> block(RM_VPD_SIZE, '#');
    uint32_t size = RM_VPD_SIZE;
    EXPECT_EQ(0u, nvrsim_RM_GetVPD(wire(port0), block.data(), &size));
    EXPECT_EQ('\x82', block[4]);
    EXPECT_NE('#', block[9]);
    EXPECT_EQ('#', block[10]);
    EXPECT_GT(size, 10u) << "the size still claims all of it";
}

TEST_F(Faults, OnesAndZerosFillWhatIsWritten)
{
    RM_PCIREGISTERS pci{};
    fault("call = 'RM_DiagReadPCIRegistersV2', damage = 'ones', times = 1");
    fault("call = 'RM_DiagReadPCIRegistersV2', damage = 'zeros'");
    EXPECT_EQ(0u, nvrsim_RM_DiagReadPCIRegistersV2(wire(port0), &pci));
    EXPECT_EQ(0xFF, pci.header[0]);
    EXPECT_EQ(0xFF, pci.registers[255]);
    EXPECT_EQ(0u, nvrsim_RM_DiagReadPCIRegistersV2(wire(port0), &pci));
    EXPECT_EQ(0, pci.header[0]);
    EXPECT_EQ(0, pci.registers[255]);
}

TEST_F(Faults, WrongNumberStandsInCountsAndSizes)
{
    fault("call = 'RM_GetDriverParams', value = 4294967295");
    std::vector<RM_DRIVERPARAM> list(52);
    uint32_t count = 52;
    EXPECT_EQ(0u, nvrsim_RM_GetDriverParams(wire(port0), list.data(), &count));
    EXPECT_EQ(4294967295u, count);
    EXPECT_STREQ("log-verbose", list[0].name);
    fault("call = 'HBA_GetFcpTargetMapping', status = 7, value = 0");
    HBA_FCPTARGETMAPPING mapping{};
    mapping.NumberOfEntries = 1;
    EXPECT_EQ(7u, nvrsim_HBA_GetFcpTargetMapping(open(), &mapping));
    EXPECT_EQ(0u, mapping.NumberOfEntries);
    fault("call = 'HBA_GetNumberOfAdapters', value = 5000");
    EXPECT_EQ(5000u, nvrsim_HBA_GetNumberOfAdapters());
    fault("call = 'RM_RestoreWWN', value = 8");
    uint32_t code = 0;
    EXPECT_EQ(0u, nvrsim_RM_RestoreWWN(wire(port0), 0, &code));
    EXPECT_EQ(8u, code);
}

TEST_F(Faults, NullWritesNothingAndGivesNoHandleOrPointer)
{
    fault("call = 'HBA_OpenAdapter', damage = 'null', times = 1");
    EXPECT_EQ(0u, open());
    EXPECT_NE(0u, open());
    Block block(RM_HBA_BLOCK_SIZE);
    ASSERT_EQ(0u, nvrsim_RM_GetHBAAttributes(wire(port0), block.bytes.data(), &block.size));
    fault("call = 'RM_GetAttributeValue', number = 551, damage = 'null'");
    uint16_t length = 0;
    uint32_t status = 1;
    EXPECT_EQ(nullptr, nvrsim_RM_GetAttributeValue(block.bytes.data(), 551, &length, &status));
    EXPECT_EQ(0u, status) << "success without a value";
    EXPECT_NE(nullptr, nvrsim_RM_GetAttributeValue(block.bytes.data(), 526, &length, &status));
}

TEST_F(Faults, AttributePointerCanPointOutsideTheBlock)
{
    Block block(RM_HBA_BLOCK_SIZE);
    ASSERT_EQ(0u, nvrsim_RM_GetHBAAttributes(wire(port0), block.bytes.data(), &block.size));
    fault("call = 'RM_GetAttributeValue', damage = 'garbage', value = 60000");
    uint16_t length = 0;
    uint32_t status = 1;
    const void* place = nvrsim_RM_GetAttributeValue(block.bytes.data(), 551, &length, &status);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(block.bytes.data()) - 64, reinterpret_cast<uintptr_t>(place));
    EXPECT_EQ(60000, length);
    EXPECT_EQ(0u, status);
}

TEST_F(Faults, UnterminatedTextsFillTheirFieldsAndNoMore)
{
    fault("call = '*', damage = 'unterminated'");
    struct {
        char name[256];
        char guard = 'G';
    } buffer;
    ASSERT_EQ(0u, nvrsim_HBA_GetAdapterName(0, buffer.name));
    EXPECT_EQ(nullptr, std::memchr(buffer.name, 0, sizeof buffer.name));
    EXPECT_EQ('G', buffer.guard);
    auto contents = std::make_unique<RM_FLASHCONTENTS>();
    ASSERT_EQ(0u, nvrsim_RM_DiagGetLoadListParams(wire(port0), contents.get()));
    EXPECT_EQ(nullptr, std::memchr(contents->image[0].version, 0, sizeof contents->image[0].version));
    EXPECT_EQ(1u, contents->image[0].type) << "numbers stay";
    char text[10];
    ASSERT_EQ(0u, nvrsim_RM_StatusString(1, text, sizeof text));
    EXPECT_EQ(nullptr, std::memchr(text, 0, sizeof text));
}

TEST_F(Faults, DamageReachesNumbersThatAreAnswersButNoSizes)
{
    uint32_t type = 0;
    fault("call = 'RM_GetDriverType', damage = 'ones', times = 1");
    fault("call = 'RM_GetDriverType', damage = 'garbage', from = 2, times = 1");
    fault("call = 'RM_GetDriverType', damage = 'zeros', from = 3");
    EXPECT_EQ(0u, nvrsim_RM_GetDriverType(wire(port0), &type));
    EXPECT_EQ(0xFFFFFFFFu, type);
    EXPECT_EQ(0u, nvrsim_RM_GetDriverType(wire(port0), &type));
    EXPECT_GT(type, 100u);
    EXPECT_LT(type, 0xFFFFFFFFu);
    EXPECT_EQ(0u, nvrsim_RM_GetDriverType(wire(port0), &type));
    EXPECT_EQ(0u, type);
    fault("call = 'RM_GetHBAAttributes', damage = 'ones'");
    Block block(RM_HBA_BLOCK_SIZE);
    EXPECT_EQ(0u, nvrsim_RM_GetHBAAttributes(wire(port0), block.bytes.data(), &block.size));
    EXPECT_LT(block.size, uint32_t{RM_HBA_BLOCK_SIZE});
}

TEST_F(Faults, TellWhatTheyChanged)
{
    const auto call_all = [] {
        uint32_t type = 7777, state = 0;
        char name[256] = {};
        nvrsim_RM_DiagBeacon(wire(port0), RM_BEACON_OFF);
        nvrsim_RM_GetDriverType(wire(port0), &type);
        nvrsim_RM_DiagBeaconState(wire(port0), &state);
        nvrsim_HBA_GetAdapterName(0, name);
        nvrsim_HBA_GetNumberOfAdapters();
        nvrsim_HBA_CloseAdapter(open());
    };
    for (const auto& [call, what, expected] : std::vector<std::tuple<const char*, const char*, bool>>{
             {"RM_DiagBeacon", "status = 64", true},
             {"RM_DiagBeacon", "delay_ms = 1", true},
             {"RM_DiagBeacon", "absent = true", true},
             {"RM_DiagBeacon", "damage = 'ones'", false},
             {"RM_DiagBeacon", "damage = 'null'", false},
             {"RM_DiagBeacon", "damage = 'unterminated'", false},
             {"RM_DiagBeacon", "value = 300", false},
             {"RM_DiagBeacon", "value = 300, status = 7", true},
             {"RM_DiagBeacon", "value = 300, status = 0", false},
             {"RM_GetDriverType", "damage = 'garbage'", true},
             {"RM_GetDriverType", "damage = 'null'", true},
             {"RM_GetDriverType", "damage = 'unterminated'", false},
             {"RM_GetDriverType", "value = 300", true},
             {"RM_DiagBeaconState", "value = 2", false}, // which it is
             {"HBA_GetAdapterName", "damage = 'unterminated'", true},
             {"HBA_GetAdapterName", "damage = 'null'", true},
             {"HBA_GetAdapterName", "value = 0", false},
             {"HBA_GetNumberOfAdapters", "value = 0", true},
             {"HBA_GetNumberOfAdapters", "damage = 'null'", false},
             {"HBA_GetNumberOfAdapters", "vanish = true", false},
             {"HBA_OpenAdapter", "damage = 'null'", true},
             {"HBA_OpenAdapter", "damage = 'ones'", false},
         }) {
        const std::string text = std::string("call = '") + call + "', times = 1, " + what;
        load("[[adapter]]\n");
        fault(text.c_str());
        EXPECT_NO_THROW(call_all());
        const std::string line = sim_text(nvrsim_faults);
        EXPECT_NE(std::string::npos, line.find(expected ? " hits=1 changed=1\n" : " hits=1 changed=0\n")) << line;
        // What the log of the same calls without a fault tells of it: all but that a number is as it was.
        load("[[adapter]]\n");
        call_all();
        const bool is_the_same = std::string(call) == "RM_DiagBeaconState";
        EXPECT_EQ(nvrsim_would_change(text.c_str()), expected || is_the_same) << text;
    }
    load("[[adapter]]\n");
    EXPECT_EQ(0, nvrsim_would_change("call = 'RM_GetVPD', status = 1")) << "it was not called";
    fault("call = 'RM_GetDriverType', vanish = true");
    EXPECT_NE(0u, driver_type(port0));
    EXPECT_NE(0u, driver_type(port0));
    EXPECT_NE(std::string::npos, sim_text(nvrsim_faults).find("seen=2 hits=2 changed=1\n"));
    EXPECT_EQ(0, nvrsim_would_change("call = 'RM_GetDriverType', from = 2, vanish = true"));
    EXPECT_EQ(1, nvrsim_would_change("call = 'RM_GetDriverType', from = 2, status = 1"));
    EXPECT_EQ(-1, nvrsim_would_change("call = "));
}

TEST_F(Faults, AbsentFunctionAnswersAsIfItsSymbolWereMissing)
{
    fault("call = '*', absent = true");
    EXPECT_EQ(1, nvrsim_RM_InitLib());
    EXPECT_EQ(0u, nvrsim_HBA_GetNumberOfAdapters());
    EXPECT_EQ(0u, nvrsim_RM_GetNumberOfLocalAdapters());
    EXPECT_EQ(1u, nvrsim_CPQFC_LoadLibrary());
    char name[] = "x";
    EXPECT_EQ(1u, nvrsim_HBA_OpenAdapter(name));
    Block block(64);
    EXPECT_EQ("(none)", block.text(1));
    uint32_t size = 10;
    EXPECT_EQ(1u, nvrsim_RM_GetVPD(wire(port0), name, &size));
}

TEST_F(Faults, AFunctionCanThrow)
{
    fault("call = '*', throws = true, from = 2, times = 3");
    EXPECT_EQ(0u, driver_type(port0));
    EXPECT_ANY_THROW(driver_type(port0));
    EXPECT_ANY_THROW(nvrsim_HBA_GetNumberOfAdapters());
    Block block(64);
    EXPECT_ANY_THROW(block.text(1));
    EXPECT_EQ(0u, driver_type(port0)) << "nothing stays locked";
}

TEST_F(Faults, AnAdapterCanVanishBetweenTwoCalls)
{
    load("[[adapter]]\n[[adapter]]\n");
    fault("call = '*', port = 0, from = 2, vanish = true");
    EXPECT_EQ(0u, driver_type(port0));
    EXPECT_EQ(RM_STATUS_ILLEGAL_WWN, driver_type(port0)) << "it leaves before this call does anything";
    EXPECT_EQ("0", sim_value("0", "present"));
    EXPECT_EQ(1u, nvrsim_HBA_GetNumberOfAdapters());
    EXPECT_EQ(0u, driver_type(port0 + 1));
    nvrsim_clear_faults();
    EXPECT_EQ(0, nvrsim_set("0", "present", 1));
    EXPECT_EQ(0u, driver_type(port0));
}

TEST_F(Faults, WrongFaultsAreRefusedWithTheirReason)
{
    EXPECT_EQ(-1, nvrsim_fault("status = 7"));
    EXPECT_EQ("fault:1: a fault needs a \"call\"", sim_text(nvrsim_error));
    EXPECT_EQ(-1, nvrsim_fault("call = 'X', damage = 'fire'"));
    EXPECT_NE(std::string::npos, sim_text(nvrsim_error).find("must be one of"));
    EXPECT_EQ(-1, nvrsim_fault("call = 'X', colour = 1"));
    EXPECT_EQ("fault:1: unknown key \"colour\"", sim_text(nvrsim_error));
    EXPECT_EQ(-1, nvrsim_fault("call = "));
    EXPECT_EQ(-1, nvrsim_fault(nullptr));
}

TEST_F(Faults, CallsAreTimedWhenToldTo)
{
    const auto work = [] {
        for (int i = 0; i < 1000; ++i)
            (void)nvrsim_HBA_GetNumberOfAdapters();
    };
    work();
    EXPECT_EQ(0.0, nvrsim_call_seconds());
    nvrsim_time_calls(1);
    work();
    const double taken = nvrsim_call_seconds();
    EXPECT_GT(taken, 0.0);
    nvrsim_time_calls(0);
    EXPECT_EQ(0.0, nvrsim_call_seconds());
    work();
    EXPECT_EQ(0.0, nvrsim_call_seconds());
}

TEST_F(Faults, EveryOperationSurvivesEveryDamage)
{
    load("[[adapter]]\n[[adapter.port]]\n[[adapter.port.vport]]\n[[adapter.port.vport.vm]]\n[[target]]\nluns = 2\n");
    std::vector<uint64_t> memory(8192);
    void* buffer = memory.data();
    auto* word = reinterpret_cast<uint32_t*>(memory.data() + 8000);
    char* text = reinterpret_cast<char*>(buffer);
    for (const char* damage : {"none", "garbage", "truncated", "ones", "zeros", "null", "unterminated"}) {
        nvrsim_clear_faults();
        const HBA_HANDLE handle = open();
        const uint32_t tags = nvrsim_CPQFC_OpenAdapter("Norvane-FC2162-0");
        fault((std::string("call = '*', keep = 3, damage = '") + damage + "'").c_str());
        const auto count = [&](uint32_t capacity) {
            std::memcpy(buffer, &capacity, 4);
            return buffer;
        };
        const HBA_WWN wwn = wire(port0), target = wire(target0), vport = wire(0x10010000C9A00001);
        *word = 8192;
        nvrsim_RM_GetHBAAttributes(wwn, buffer, word);
        *word = 8192;
        nvrsim_RM_GetPortAttributes(wwn, buffer, word);
        *word = 8192;
        nvrsim_RM_GetPortStatistics(wwn, buffer, word);
        *word = 8192;
        nvrsim_RM_GetSffData(wwn, buffer, word);
        *word = 8192;
        nvrsim_RM_GetLunAttributes(wwn, target, fcp_lun(0), buffer, word);
        *word = 60;
        nvrsim_RM_GetDriverParamsGlobal(wwn, buffer, word);
        nvrsim_RM_GetLunList(wwn, target, 0, count(10));
        nvrsim_RM_GetFcpTargetMapping(wwn, count(10));
        nvrsim_RM_VPList(wwn, count(10));
        nvrsim_RM_VPListTargets(wwn, vport, count(10));
        nvrsim_RM_GetVMFromVPort(vport, count(10));
        nvrsim_RM_GetDumpFileNames(wwn, count(10));
        static_cast<RM_VPORTATTRIBUTES*>(buffer)->version = RM_VPORT_VERSION;
        nvrsim_RM_VPGetAttributes(wwn, vport, static_cast<RM_VPORTATTRIBUTES*>(buffer));
        nvrsim_RM_DiagGetLoadListParams(wwn, static_cast<RM_FLASHCONTENTS*>(buffer));
        nvrsim_RM_ScsiInquiry(wwn, target, fcp_lun(0), buffer, 255, word, 128);
        nvrsim_RM_ScsiReadCapacity(wwn, target, fcp_lun(0), buffer, 32, word, 128);
        nvrsim_RM_GetDumpDirectoryA(wwn, text, 256);
        nvrsim_HBA_GetFcpTargetMapping(handle, static_cast<HBA_FCPTARGETMAPPING*>(count(10)));
        nvrsim_HBA_GetAdapterAttributes(handle, static_cast<HBA_ADAPTERATTRIBUTES*>(buffer));
        nvrsim_HBA_GetAdapterPortAttributes(handle, 0, static_cast<HBA_PORTATTRIBUTES*>(buffer));
        nvrsim_HBA_SendScsiInquiry(handle, target, fcp_lun(0), 1, 0x83, buffer, 255, word, 128);
        nvrsim_CPQFC_QoSGetConfig(tags, static_cast<CPQFC_QOSCONFIG*>(count(10)));
        nvrsim_clear_faults();
        nvrsim_HBA_CloseAdapter(handle);
        nvrsim_CPQFC_CloseAdapter(tags);
    }
    EXPECT_EQ(0u, nvrsim_open_handles());
    EXPECT_EQ("10000000C9A00001", sim_value("0", "wwpn")) << "damage is done to callers, never to the host";
}
