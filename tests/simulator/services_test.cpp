// Calls that change the host, and that what they change is seen by later calls.
#include "Sim.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

class Services : public Simulated {
protected:
    static std::string temporary_directory()
    {
        char name[] = "/tmp/nvrsim-test-XXXXXX";
        return mkdtemp(name) ? name : "";
    }

    struct Read {
        uint32_t status, word;
        uint64_t wwpn;
    };
    static Read read_names(uint64_t port, uint32_t type)
    {
        HBA_WWN wwpn{}, wwnn{};
        uint32_t word = 77;
        const uint32_t status = nvrsim_RM_ReadWWN(wire(port), type, &wwpn, &wwnn, &word);
        return {status, word, number(wwpn)};
    }
};

TEST_F(Services, ChangedNameWaitsForTheResetAndThenIsThePorts)
{
    const uint64_t fresh = 0x10000000C9B00001;
    uint32_t code = 0;
    ASSERT_EQ(0u, nvrsim_RM_ChangeWWN(wire(port0), wire(fresh), wire(0x20000000C9B00001), RM_WWN_NONVOLATILE, &code));
    EXPECT_EQ(unsigned(RM_ACTIVATION_NONVOLATILE_RESET), code);
    EXPECT_EQ(unsigned(RM_ACTIVATION_NONVOLATILE_RESET), read_names(port0, RM_WWN_CONFIGURED).word);
    EXPECT_EQ(fresh, read_names(port0, RM_WWN_CONFIGURED).wwpn);
    EXPECT_EQ(port0, read_names(port0, RM_WWN_CURRENT).wwpn);
    ASSERT_EQ(0u, nvrsim_RM_ResetHBA(wire(port0), 1));
    EXPECT_EQ(5u, read_names(port0, RM_WWN_CURRENT).status) << "the old name is gone";
    EXPECT_EQ(fresh, read_names(fresh, RM_WWN_CURRENT).wwpn);
    EXPECT_EQ(unsigned(RM_WWN_STATUS_CURRENT_NONVOLATILE), read_names(fresh, RM_WWN_CURRENT).word);
    EXPECT_EQ(port0, read_names(fresh, RM_WWN_FACTORY).wwpn);
    HBA_PORTATTRIBUTES port;
    ASSERT_EQ(0u, nvrsim_HBA_GetAdapterPortAttributes(open(), 0, &port));
    EXPECT_EQ(fresh, number(port.PortWWN));
    EXPECT_EQ("1", sim_value("0", "resets"));
}

TEST_F(Services, RestoreBringsBackFactoryNamesAndSaysWhenThereIsNothingToDo)
{
    uint32_t code = 0;
    ASSERT_EQ(0u, nvrsim_RM_RestoreWWN(wire(port0), 0, &code));
    EXPECT_EQ(unsigned(RM_ACTIVATION_ALREADY_ACTIVE), code);
    const uint64_t fresh = 0x10000000C9B00001;
    ASSERT_EQ(0u, nvrsim_RM_ChangeWWN(wire(port0), wire(fresh), wire(fresh), RM_WWN_VOLATILE, &code));
    EXPECT_EQ(unsigned(RM_ACTIVATION_VOLATILE_RESET), code);
    ASSERT_EQ(0u, nvrsim_RM_ResetHBA(wire(port0), 1));
    EXPECT_EQ(unsigned(RM_WWN_STATUS_CURRENT_VOLATILE), read_names(fresh, RM_WWN_CURRENT).word);
    EXPECT_EQ(unsigned(RM_WWN_STATUS_VOLATILE_ACTIVE), read_names(fresh, RM_WWN_VOLATILE).word);
    ASSERT_EQ(0u, nvrsim_RM_RestoreWWN(wire(fresh), 0, &code));
    EXPECT_EQ(unsigned(RM_ACTIVATION_NONVOLATILE_RESET), code);
    ASSERT_EQ(0u, nvrsim_RM_ResetHBA(wire(fresh), 1));
    EXPECT_EQ(port0, read_names(port0, RM_WWN_CURRENT).wwpn);
    EXPECT_EQ(unsigned(RM_WWN_STATUS_NONE), read_names(port0, RM_WWN_VOLATILE).word);
}

TEST_F(Services, NamesThatNeedARebootChangeOnlyThen)
{
    load("[[adapter]]\n[[adapter.port]]\nwwn_capability = 0x100C\n");
    uint32_t code = 0;
    ASSERT_EQ(0u, nvrsim_RM_ChangeWWN(wire(port0), wire(0x10000000C9B00001), wire(0x20000000C9B00001), 0, &code));
    EXPECT_EQ(unsigned(RM_ACTIVATION_VOLATILE_REBOOT), code);
    ASSERT_EQ(0u, nvrsim_RM_ResetHBA(wire(port0), 1));
    EXPECT_EQ("10000000C9A00001", sim_value("0", "wwpn"));
    nvrsim_reboot();
    EXPECT_EQ("10000000C9B00001", sim_value("0", "wwpn"));
}

TEST_F(Services, CapabilityDecidesWhatIsRefused)
{
    load("[[adapter]]\n[[adapter.port]]\nwwn_capability = 0x8000\n[[adapter]]\n[[adapter.port]]\nwwn_capability = 4\n");
    uint32_t code = 0, capability = 0;
    EXPECT_EQ(92u, nvrsim_RM_ChangeWWN(wire(port0), wire(port0), wire(port0), 0, &code));
    EXPECT_EQ(89u, nvrsim_RM_ChangeWWN(wire(port1), wire(port0), wire(port0), 0, &code));
    EXPECT_EQ(89u, read_names(port1, RM_WWN_VOLATILE).status);
    EXPECT_EQ(0u, nvrsim_RM_GetWWNCapability(wire(port1), &capability));
    EXPECT_EQ(4u, capability);
}

TEST_F(Services, ImpossibleNamesAreInvalid)
{
    for (uint64_t wrong : {0ull, ~0ull, 0x3000000000000001ull}) {
        const HBA_WWN wwn = wire(wrong);
        EXPECT_EQ(5u, nvrsim_RM_ValidateWwn(&wwn));
    }
    const HBA_WWN good = wire(port0);
    EXPECT_EQ(0u, nvrsim_RM_ValidateWwn(&good));
}

TEST_F(Services, BeaconIsKept)
{
    uint32_t state = 0;
    ASSERT_EQ(0u, nvrsim_RM_DiagBeaconState(wire(port0), &state));
    EXPECT_EQ(unsigned(RM_BEACON_OFF), state);
    ASSERT_EQ(0u, nvrsim_RM_DiagBeacon(wire(port0), RM_BEACON_ON));
    ASSERT_EQ(0u, nvrsim_RM_DiagBeaconState(wire(port0), &state));
    EXPECT_EQ(unsigned(RM_BEACON_ON), state);
    EXPECT_EQ("3", sim_value("0", "beacon"));
    EXPECT_EQ(4u, nvrsim_RM_DiagBeacon(wire(port0), 9));
}

TEST_F(Services, BeaconCanBeMissingInTwoWays)
{
    load("[[adapter]]\n[[adapter.port]]\nbeacon = 'unavailable'\n[[adapter]]\n[[adapter.port]]\nbeacon = "
         "'unsupported'\n");
    uint32_t state = 0;
    EXPECT_EQ(0u, nvrsim_RM_DiagBeaconState(wire(port0), &state));
    EXPECT_EQ(unsigned(RM_BEACON_NOT_AVAILABLE), state);
    EXPECT_EQ(2u, nvrsim_RM_DiagBeaconState(wire(port1), &state));
}

TEST_F(Services, TestsRunAndEndAsTheScenarioSays)
{
    load("[[adapter]]\n[[adapter.port]]\ndiagnostics = { polls = 2, running_state = 1, running_status = 0, state = 9, "
         "cycles = 5, loops_failed = 3, seconds = 7, loopback = 2, cancel_polls = 1 }\n");
    uint32_t id = 0;
    ASSERT_EQ(0u, nvrsim_RM_DiagLoopBackTestV3(wire(port0), 1, 10, 1, &id, 0, "1a2b"));
    EXPECT_EQ("loopback cycles=10 halt=1 pattern=1a2b", sim_value("0", "test"));
    RM_DIAGRESULT result = {};
    for (int poll = 0; poll < 2; ++poll) {
        EXPECT_EQ(0u, nvrsim_RM_DiagGetResults(wire(port0), id, &result));
        EXPECT_EQ(1u, result.state);
    }
    EXPECT_EQ(0u, nvrsim_RM_DiagGetResults(wire(port0), id, &result));
    EXPECT_EQ(9u, result.state);
    EXPECT_EQ(2u, result.resultCode);
    EXPECT_EQ(5u, result.cyclesCompleted);
    EXPECT_EQ(3u, result.loopsFailed);
    EXPECT_EQ(7u, result.executionTime);
    // A cancel takes its time.
    EXPECT_EQ(0u, nvrsim_RM_DiagCancelDiagnostic(wire(port0), id));
    EXPECT_EQ(0u, nvrsim_RM_DiagGetResults(wire(port0), id, &result));
    EXPECT_EQ(1u, result.state);
    EXPECT_EQ(0u, nvrsim_RM_DiagGetResults(wire(port0), id, &result));
    EXPECT_EQ(unsigned(RM_DIAG_CANCELLED), result.state);
    EXPECT_EQ(4u, nvrsim_RM_DiagGetResults(wire(port0), id + 1, &result));
}

TEST_F(Services, OldResultsMakeRoom)
{
    load("[[adapter]]\n");
    RM_DIAGRESULT result = {};
    uint32_t first = 0, id = 0;
    ASSERT_EQ(0u, nvrsim_RM_DiagRunPOST(wire(port0), &first));
    for (int i = 0; i < 64; ++i)
        ASSERT_EQ(0u, nvrsim_RM_DiagRunPOST(wire(port0), &id));
    EXPECT_EQ(4u, nvrsim_RM_DiagGetResults(wire(port0), first, &result));
    EXPECT_EQ(60u, nvrsim_RM_DiagGetResults(wire(port0), id, &result));
}

TEST_F(Services, ALoopbackPlugHidesFabricAndTargets)
{
    load("[[adapter]]\n[[target]]\n");
    RM_TARGETLIST list = {};
    list.count = 1;
    EXPECT_EQ(0u, nvrsim_RM_GetFcpTargetMapping(wire(port0), &list));
    EXPECT_EQ(1u, list.count);
    ASSERT_EQ(0, nvrsim_set("0", "loopback_plug", 1));
    EXPECT_EQ(0u, nvrsim_RM_GetFcpTargetMapping(wire(port0), &list));
    EXPECT_EQ(0u, list.count);
}

TEST_F(Services, DriverParametersAreListedAndSet)
{
    std::vector<RM_DRIVERPARAM> list(RM_DRIVERPARAM_FIRST_COUNT);
    uint32_t count = RM_DRIVERPARAM_FIRST_COUNT;
    ASSERT_EQ(0u, nvrsim_RM_GetDriverParams(wire(port0), list.data(), &count));
    ASSERT_EQ(12u, count);
    EXPECT_STREQ("lun-queue-depth", list[1].name);
    EXPECT_EQ(512u, list[1].highLimit);
    EXPECT_EQ(30u, list[1].currentValue);
    EXPECT_EQ(0u, nvrsim_RM_SetDriverParam(wire(port0), "lun-queue-depth=64", 0));
    EXPECT_EQ(4u, nvrsim_RM_SetDriverParam(wire(port0), "lun-queue-depth=5000", 0)) << "above its limit";
    EXPECT_EQ(4u, nvrsim_RM_SetDriverParam(wire(port0), "nobody=1", 0));
    EXPECT_EQ(4u, nvrsim_RM_SetDriverParam(wire(port0), "lun-queue-depth", 0));
    EXPECT_EQ(4u, nvrsim_RM_SetDriverParam(wire(port0), "lun-queue-depth=4x", 0));
    ASSERT_EQ(0u, nvrsim_RM_GetDriverParams(wire(port0), list.data(), &count));
    EXPECT_EQ(64u, list[1].currentValue);
    EXPECT_EQ(30u, list[1].defaultValue);
    EXPECT_EQ(0u, nvrsim_RM_SetDriverParam(wire(port0), "nodev-tmo=77", RM_PARAM_GLOBAL | RM_PARAM_PERMANENT));
    ASSERT_EQ(0u, nvrsim_RM_GetDriverParamsGlobal(wire(port0), list.data(), &count));
    EXPECT_EQ(77u, list[5].defaultValue);
    ASSERT_EQ(0u, nvrsim_RM_GetDriverParams(wire(port0), list.data(), &count));
    EXPECT_EQ(77u, list[5].currentValue);
}

TEST_F(Services, LongParameterListAsksForItsCount)
{
    load("[[adapter]]\n[[adapter.port]]\nparams = 60\n");
    std::vector<RM_DRIVERPARAM> list(60);
    uint32_t count = RM_DRIVERPARAM_FIRST_COUNT;
    EXPECT_EQ(7u, nvrsim_RM_GetDriverParams(wire(port0), list.data(), &count));
    EXPECT_EQ(60u, count);
    EXPECT_EQ(0u, nvrsim_RM_GetDriverParams(wire(port0), list.data(), &count));
    EXPECT_STREQ("param-59", list[59].name);
}

TEST_F(Services, BootCodeBlocksTheEnablingOfThePort)
{
    uint8_t activation = 0;
    ASSERT_EQ(0u, nvrsim_RM_SetBootBiosState(wire(port0), 1));
    Block block(2048);
    ASSERT_EQ(0u, nvrsim_RM_GetHBAAttributes(wire(port0), block.bytes.data(), &block.size));
    uint32_t enabled = 0;
    ASSERT_TRUE(block.read(RM_ATTR_BOOT_CODE_ENABLED, enabled));
    EXPECT_EQ(1u, enabled);
    EXPECT_EQ(221u, nvrsim_RM_SetPortEnabled(wire(port0), 0, &activation));
    ASSERT_EQ(0u, nvrsim_RM_SetBootBiosState(wire(port0), 0));
    EXPECT_EQ(0u, nvrsim_RM_SetPortEnabled(wire(port0), 0, &activation));
    EXPECT_EQ(RM_PORT_ACTIVATION_RESET, activation);
    Block port(2048);
    ASSERT_EQ(0u, nvrsim_RM_GetPortAttributes(wire(port0), port.bytes.data(), &port.size));
    uint32_t state = 0;
    ASSERT_TRUE(port.read(RM_ATTR_PORT_STATE, state));
    EXPECT_EQ(22u, state);
}

TEST_F(Services, FirmwareImageIsReallyChecked)
{
    const std::string directory = temporary_directory(), path = directory + "/image";
    ASSERT_EQ(0, nvrsim_make_firmware(path.c_str(), "2.09b1", 5000));
    EXPECT_EQ(0u, nvrsim_RM_ImportHBAFileA(path.c_str()));
    EXPECT_EQ(0u, nvrsim_RM_VerifyFirmwareA(wire(0), wire(port0), path.c_str()));
    EXPECT_EQ(0u, nvrsim_RM_DownloadFirmware(wire(port0), path.c_str(), 0));
    EXPECT_EQ("2.09b1", sim_value("0", "firmware"));
    HBA_ADAPTERATTRIBUTES attributes;
    ASSERT_EQ(0u, nvrsim_HBA_GetAdapterAttributes(open(), &attributes));
    EXPECT_STREQ("2.09b1", attributes.FirmwareVersion);

    const int file = ::open(path.c_str(), O_WRONLY);
    ASSERT_EQ(1, pwrite(file, "!", 1, 1000));
    EXPECT_NE(0u, nvrsim_RM_VerifyFirmwareA(wire(0), wire(port0), path.c_str())) << "one changed byte";
    ASSERT_EQ(0, ftruncate(file, 0));
    close(file);
    EXPECT_NE(0u, nvrsim_RM_VerifyFirmwareA(wire(0), wire(port0), path.c_str())) << "an empty file";
    EXPECT_NE(0u, nvrsim_RM_DownloadFirmware(wire(port0), path.c_str(), 0));
    unlink(path.c_str());
    ASSERT_EQ(0, mkfifo(path.c_str(), 0600));
    EXPECT_NE(0u, nvrsim_RM_ImportHBAFileA(path.c_str())) << "a FIFO must not block";
    unlink(path.c_str());
    EXPECT_NE(0u, nvrsim_RM_ImportHBAFileA(path.c_str()));
    rmdir(directory.c_str());
}

TEST_F(Services, ResettingAdapterIsBusyForAWhile)
{
    load("[[adapter]]\n[[adapter.port]]\nreset_ms = 3600000\n[[adapter]]\n[[adapter.port]]\nreset_ms = 30\n");
    uint32_t type = 0;
    ASSERT_EQ(0u, nvrsim_RM_ResetHBA(wire(port0), 1));
    EXPECT_EQ(64u, nvrsim_RM_GetDriverType(wire(port0), &type));
    ASSERT_EQ(0u, nvrsim_RM_ResetHBA(wire(port1), 1));
    usleep(40000);
    EXPECT_EQ(0u, nvrsim_RM_GetDriverType(wire(port1), &type));
}

TEST_F(Services, DumpsAreFilesAndTheOldestGoWithTheRetentionCount)
{
    const std::string directory = temporary_directory();
    load("[[adapter]]\n[[adapter.port]]\ndump_directory = '" + directory + "'\nretention = 5\n");
    for (int i = 0; i < 6; ++i)
        ASSERT_EQ(0u, nvrsim_RM_GenerateDump(wire(0), wire(port0)));
    char told[RM_DUMP_DIRECTORY_SIZE];
    ASSERT_EQ(0u, nvrsim_RM_GetDumpDirectoryA(wire(port0), told, sizeof told));
    EXPECT_EQ(directory, told);
    std::vector<char> buffer(RM_DUMPLIST_SIZE(5));
    auto* list = reinterpret_cast<RM_DUMPLIST*>(buffer.data());
    list->count = RM_DUMP_FIRST_COUNT;
    EXPECT_EQ(191u, nvrsim_RM_GetDumpFileNames(wire(port0), list));
    EXPECT_EQ(5u, list->count);
    list->count = 0; // as callers give their second list
    EXPECT_EQ(0u, nvrsim_RM_GetDumpFileNames(wire(port0), list));
    ASSERT_EQ(5u, list->count);
    EXPECT_STREQ("NVR_10000000C9A00001_dump_0002.dmp", list->entry[0].name) << "the first is gone";
    EXPECT_EQ(0, access((directory + "/" + list->entry[4].name).c_str(), R_OK));
    EXPECT_EQ(0u, nvrsim_RM_DeleteDumpFiles(wire(port0)));
    EXPECT_EQ(0, rmdir(directory.c_str())) << "nothing is left in it";
    uint32_t count = 0;
    EXPECT_EQ(4u, nvrsim_RM_SetDumpRetentionCount(wire(port0), 21));
    EXPECT_EQ(0u, nvrsim_RM_SetDumpRetentionCount(wire(port0), 20));
    EXPECT_EQ(0u, nvrsim_RM_GetDumpRetentionCount(wire(port0), &count));
    EXPECT_EQ(20u, count);
}

TEST_F(Services, DumpsInTheProcesssOwnDirectoryGoWithIt)
{
    const std::string temporary = temporary_directory();
    const pid_t child = fork();
    if (child == 0) {
        setenv("TMPDIR", temporary.c_str(), 1);
        char told[RM_DUMP_DIRECTORY_SIZE];
        const bool made = nvrsim_RM_GenerateDump(wire(0), wire(port0)) == 0 &&
                          nvrsim_RM_GetDumpDirectoryA(wire(port0), told, sizeof told) == 0 && access(told, R_OK) == 0 &&
                          nvrsim_reset() == 0 && nvrsim_RM_GenerateEfdDump(wire(port0), 0, 0) == 0;
        std::exit(made ? 0 : 1);
    }
    int status = -1;
    ASSERT_EQ(child, waitpid(child, &status, 0));
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
    EXPECT_EQ(0, rmdir(temporary.c_str())) << "nothing is left";
}

TEST_F(Services, DumpsFollowNoLinkThatStandsInThePlaceOfTheOwnDirectory)
{
    const std::string temporary = temporary_directory(), elsewhere = temporary_directory();
    const std::string link = temporary + "/nvrsim-dumps-" + std::to_string(getpid());
    ASSERT_EQ(0, symlink(elsewhere.c_str(), link.c_str()));
    setenv("TMPDIR", temporary.c_str(), 1);
    EXPECT_EQ(unsigned(RM_STATUS_DIRECTORY_NOT_OPENED), nvrsim_RM_GenerateDump(wire(0), wire(port0)));
    unsetenv("TMPDIR");
    EXPECT_EQ(0, rmdir(elsewhere.c_str())) << "nothing is written there";
    unlink(link.c_str());
    rmdir(temporary.c_str());
}

TEST_F(Services, TagTableIsReadBackAsWritten)
{
    char name[256];
    ASSERT_EQ(0u, nvrsim_HBA_GetAdapterName(0, name));
    EXPECT_EQ(1u, nvrsim_CPQFC_GetNumberOfAdapters());
    EXPECT_EQ(0u, nvrsim_CPQFC_OpenAdapter("nobody"));
    const uint32_t handle = nvrsim_CPQFC_OpenAdapter(name);
    ASSERT_NE(0u, handle);
    std::vector<char> buffer(CPQFC_QOSCONFIG_SIZE(2));
    auto* table = reinterpret_cast<CPQFC_QOSCONFIG*>(buffer.data());
    EXPECT_EQ(0u, nvrsim_CPQFC_QoSGetConfig(handle, table));
    EXPECT_EQ(0u, table->count) << "an empty table";
    table->count = 2;
    table->entry[0].source = wire(port0);
    table->entry[1].target = wire(target0);
    table->entry[1].tag = 44;
    ASSERT_EQ(0u, nvrsim_CPQFC_QoSSetConfig(handle, table));
    std::memset(buffer.data(), 0, buffer.size());
    EXPECT_EQ(7u, nvrsim_CPQFC_QoSGetConfig(handle, table));
    EXPECT_EQ(2u, table->count);
    EXPECT_EQ(0u, nvrsim_CPQFC_QoSGetConfig(handle, table));
    EXPECT_EQ(port0, number(table->entry[0].source));
    EXPECT_EQ(44, table->entry[1].tag);
    uint32_t flag = 9;
    EXPECT_EQ(0u, nvrsim_CPQFC_QoSSetGlobalFlag(handle, 1));
    EXPECT_EQ(0u, nvrsim_CPQFC_QoSGetGlobalFlag(handle, &flag));
    EXPECT_EQ(1u, flag);
    nvrsim_CPQFC_CloseAdapter(handle);
    EXPECT_NE(0u, nvrsim_CPQFC_QoSGetGlobalFlag(handle, &flag));
}

TEST_F(Services, TestsRunForSomePollsAndEndWithTheirResult)
{
    load("[[adapter]]\n[[adapter.port]]\ndiagnostics = { polls = 2, loopback = 2, seconds = 3 }\n[[target]]\n");
    uint32_t id = 0;
    RM_DIAGRESULT result{};
    ASSERT_EQ(0u, nvrsim_RM_DiagLoopBackTestV3(wire(port0), 1, 10, 0, &id, 0, "pattern"));
    EXPECT_EQ(60u, nvrsim_RM_DiagGetResults(wire(port0), id, &result));
    EXPECT_EQ(unsigned(RM_DIAG_RUNNING), result.state);
    EXPECT_EQ(60u, nvrsim_RM_DiagGetResults(wire(port0), id, &result));
    EXPECT_EQ(0u, nvrsim_RM_DiagGetResults(wire(port0), id, &result));
    EXPECT_EQ(unsigned(RM_DIAG_COMPLETED), result.state);
    EXPECT_EQ(2u, result.resultCode);
    EXPECT_EQ(10u, result.cyclesCompleted);
    EXPECT_EQ(3u, result.executionTime);
    ASSERT_EQ(0u, nvrsim_RM_DiagRunPOST(wire(port0), &id));
    EXPECT_EQ(0u, nvrsim_RM_DiagCancelDiagnostic(wire(port0), id));
    EXPECT_EQ(0u, nvrsim_RM_DiagGetResults(wire(port0), id, &result));
    EXPECT_EQ(unsigned(RM_DIAG_CANCELLED), result.state);
    ASSERT_EQ(0u, nvrsim_RM_DiagEchoTestV2(wire(port0), wire(target1), 1, 0, &id, 0, "x"));
    nvrsim_RM_DiagGetResults(wire(port0), id, &result);
    nvrsim_RM_DiagGetResults(wire(port0), id, &result);
    EXPECT_EQ(0u, nvrsim_RM_DiagGetResults(wire(port0), id, &result));
    EXPECT_EQ(10u, result.resultCode) << "nobody sees that target";
    EXPECT_EQ(0u, nvrsim_RM_DiagPciLoopBackTestV2(wire(port0), 1, 0, &id, 0, "x"));
}

TEST_F(Services, AdapterTakenOutVanishesFromEveryCall)
{
    load("[[adapter]]\ncount = 2\n");
    const HBA_HANDLE handle = open();
    ASSERT_EQ(0, nvrsim_set("0", "present", 0));
    HBA_ADAPTERATTRIBUTES attributes;
    EXPECT_EQ(unsigned(HBA_STATUS_ERROR_UNAVAILABLE), nvrsim_HBA_GetAdapterAttributes(handle, &attributes));
    EXPECT_EQ(1u, nvrsim_HBA_GetNumberOfAdapters());
    char name[256];
    ASSERT_EQ(0u, nvrsim_HBA_GetAdapterName(0, name));
    EXPECT_STREQ("Norvane-FC2162-1", name);
    uint32_t type;
    EXPECT_EQ(5u, nvrsim_RM_GetDriverType(wire(port0), &type));
    ASSERT_EQ(0, nvrsim_set("10000000C9A00001", "present", 1));
    EXPECT_EQ(2u, nvrsim_HBA_GetNumberOfAdapters());
    nvrsim_HBA_CloseAdapter(handle);
}

TEST_F(Services, ResetStartsTheScenarioAfresh)
{
    ASSERT_EQ(0u, nvrsim_RM_DiagBeacon(wire(port0), RM_BEACON_ON));
    fault("call = 'RM_GetVPD', status = 1");
    ASSERT_EQ(0, nvrsim_reset());
    EXPECT_EQ("2", sim_value("0", "beacon"));
    EXPECT_EQ("", sim_text(nvrsim_faults));
    EXPECT_EQ(0u, nvrsim_calls(nullptr));
}
