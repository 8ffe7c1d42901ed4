// What the services say and answer when memory runs out, piece by piece.
#include <cstdlib>
#include <filesystem>
#include <set>
#include <unistd.h>

#include "classes/NVRHBA_DumpService.h"
#include "foundation/NVR_Common.h"
#include "services/NVRHBA_DumpService_Provider.h"
#include "services/NVR_Dump.h"
#include "services/NVR_MethodWrapper.h"
#include "services/NVR_PortVirtualization.h"
#include "simulator/nvrsim.h"
#include "tests/services/Service_Host.h"
#include "tests/support/curl_libraries.h"
#include "tests/support/private_host.h"
#include "tests/support/short_memory.h"

namespace {

// Zeroed blocks of this size, which hold the library's lists, are not to be had. Of the test's own thread alone.
thread_local std::size_t refused_size = 0;

} // namespace

extern "C" {
void* __real_calloc(std::size_t count, std::size_t size);

void* __wrap_calloc(std::size_t count, std::size_t size)
{
    return count * size == refused_size ? nullptr : __real_calloc(count, size);
}
}

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::IsSupersetOf;

namespace {

class MemoryShortage : public ServiceHost {
protected:
    MemoryShortage()
        : ServiceHost(R"(
[[adapter]]
[[adapter.port]]
dump_directory = "/var/log"
dumps = ["1", "2", "3", "4", "5"]
attributes = { 265 = 1 }
[[adapter.port.vport]]
wwpn = "2B010000C9A000FF"
[[adapter.port.vport.vm]]
identity = "vm-one"
[[adapter.port.vport.vm]]
identity = "vm-two"
[[adapter.port.vport]]
wwpn = "2B020000C9A000FF"
[[target]]
luns = 3
)")
    {
        EXPECT_EQ(string2HBAName(&vport.wwpn, "2B010000C9A000FF"), 1);
        words();
    }

    /// The result of `step` while lists of that size are short; its words go to `told`.
    template <class Step>
    auto without(std::size_t size, Step step)
    {
        words();
        refused_size = size;
        const auto result = step();
        refused_size = 0;
        told = words();
        return result;
    }
    RM_VPORTENTRY vport = {};
};

} // namespace

TEST_F(MemoryShortage, LeavesTheBootCodeUnread)
{
    uint32 state = 7;
    EXPECT_EQ(without(2048, [&] { return NVR_MethodWrapper::nvrcimGetBootBiosState(first_name, &state); }), 1u);
    EXPECT_EQ(told.back(), "ERROR: GetHBAAttributes: Unable to allocate buffer");
    EXPECT_EQ(state, 7u);
    EXPECT_EQ(NVR_MethodWrapper::nvrcimGetBootBiosState(first_name, &state), 0u);
}

TEST_F(MemoryShortage, LeavesVirtualPortsUnlisted)
{
    VPort_List list;
    // The room for one, and for both.
    for (const std::size_t size : {4 + 24, 4 + 2 * 24}) {
        EXPECT_EQ(without(size, [&] { return NVR_MethodWrapper::ListVPorts(first_name, &list); }), 1);
        EXPECT_EQ(told.back(), "FMCMD_ListVPorts: Unable to allocate buffer");
    }
    EXPECT_EQ(NVR_MethodWrapper::ListVPorts(first_name, &list), 0);
    EXPECT_EQ(list.count, 2u);
    const std::size_t targets = offsetof(RM_TARGETLIST, entry) + sizeof(HBA_FCPSCSIENTRY);
    EXPECT_EQ(without(targets, [&] { return NVR_MethodWrapper::ListVPortTargets(first_name, first_name); }), 1);
    EXPECT_EQ(told.back(), "FMCMD_VportTargets: Unable to allocate buffer");
}

TEST_F(MemoryShortage, LeavesVirtualMachinesUnlisted)
{
    std::vector<RM_VMINFO> machines;
    const auto list = [&] { return NVR_MethodWrapper::ListVMfromVPort(first_name, vport, &machines); };
    EXPECT_EQ(without(4 + 512, list), 1);
    EXPECT_EQ(told.back(), "FMCMD_ListVMS: Unable to allocate buffer.");
    EXPECT_EQ(without(4 + 2 * 512, list), 1);
    EXPECT_EQ(told.back(), "FMCMD_ListVMS: Unable to allocate buffer\n");
    EXPECT_TRUE(machines.empty());
    EXPECT_EQ(list(), 0);
    EXPECT_EQ(machines.size(), 2u);
}

TEST_F(MemoryShortage, LeavesDumpsUnlisted)
{
    NVRHBA_DumpService_Provider provider;
    NVRHBA_FCPort* target = port();
    const auto list = [&] {
        Property<Array<String>> names{};
        Property<uint32> result{};
        EXPECT_EQ(provider.GetDumpFileNames(agent().m_NVRHBA_DumpService_map[0], target, names, result),
                  INVOKE_METHOD_OK);
        return result.value;
    };
    // The first list is asked for without a word, the longer one comes to the library's own status.
    EXPECT_EQ(without(8 + 4 * 256, list), 32968u);
    EXPECT_EQ(nvrsim_calls("RM_GetDumpFileNames"), 0u);
    EXPECT_EQ(without(8 + 5 * 256, list), 40191u);
    EXPECT_EQ(told.back(), "NVRHBA_DumpService::nvrcimGetDumpFileNames failed");
    EXPECT_EQ(nvrsim_calls("RM_GetDumpFileNames"), 1u);
    EXPECT_EQ(list(), 0u);
}

TEST_F(MemoryShortage, EndsTheBuildOfTheDumpClassesWithTheWordsOfWhatIsMissing)
{
    ProviderAgent& the_agent = agent();
    std::set<std::string> last_words;
    uint32 status = 0;
    NVR_Dump::FC_ClearDumpClasses(the_agent);
    words();
    refuse_each_allocation([&] { status = NVR_Dump::FC_CreateDumpClasses(the_agent); },
                           [&](bool has_thrown) {
                               EXPECT_FALSE(has_thrown);
                               const std::string last = words().back();
                               // What the library could not do for want of memory leaves an empty value.
                               const bool is_refused = last.rfind("Insert Failed : ", 0) == 0;
                               EXPECT_TRUE(status == (is_refused ? 32769 : 40008) || status == 0) << last;
                               last_words.insert(last);
                               NVR_Dump::FC_ClearDumpClasses(the_agent);
                               words();
                           });
    EXPECT_EQ(status, 0u);
    EXPECT_EQ(the_agent.m_NVRHBA_ElementDumpData_map.size(), 1u);
    EXPECT_THAT(
        last_words,
        IsSupersetOf(
            {"Failed to create NVRHBA_DumpService", "Failed to create NVRHBA_HostedDumpService",
             "Failed to create NVRHBA_DumpServiceAffectsElement", "Failed to create NVRHBA_DumpData for fc port",
             "Failed to create NVRHBA_ElementDumpData for fc port", "Insert Failed : m_NVRHBA_DumpService_map",
             "Insert Failed : m_NVRHBA_HostedDumpService_map", "Insert Failed : m_NVRHBA_DumpServiceAffectsElement_map",
             "Insert Failed : m_NVRHBA_DumpData_map", "Insert Failed : m_NVRHBA_ElementDumpData_map"}));
}

TEST_F(MemoryShortage, EndsTheBuildOfTheVirtualPortsWithTheWordsOfWhatIsMissing)
{
    ProviderAgent& the_agent = agent();
    std::set<std::string> last_words;
    words();
    refuse_each_allocation([&] { NVR_PortVirtualization::CreatePortVirtualizationClasses(the_agent); },
                           [&](bool) { last_words.insert(words().back()); });
    EXPECT_EQ(the_agent.m_NVRHBA_ElementAllocatedFromPool_map.size(), 2u);
    EXPECT_THAT(
        last_words,
        IsSupersetOf({"Failed to create ResourcePool", "Failed to create HostedResourcePool",
                      "Failed to create VirtualFCPort", "Failed to create VPortHostedDependency",
                      "Failed to create ElementAllocatedFromPool", "Insert Failed : m_NVRHBA_ResourcePool_map",
                      "Insert Failed : m_NVRHBA_HostedResourcePool_map", "Insert Failed : m_NVRHBA_VirtualFCPort_map",
                      "Insert Failed : m_NVRHBA_VPortHostedDependency_map",
                      "Insert Failed : m_NVRHBA_ElementAllocatedFromPool_map"}));
}

// Whatever of it is refused, the file is closed and the library given back.
TEST_F(MemoryShortage, LeavesATransferWhereItIs)
{
    const std::string folder = "/var/log/here", uri = "file:///var/log/served/image";
    make_folder(folder);
    make_folder("/var/log/served");
    write_file("/var/log/served/image", "the image");
    ASSERT_EQ(::chdir(folder.c_str()), 0);
    install_curl();
    const String address = uri.c_str();
    std::set<std::string> last_words;
    bool fetched = false;
    words();
    refuse_each_allocation(
        [&] {
            uint32 slot = 0;
            fetched = false;
            NVR_MethodWrapper::downloadFileUsingCurl(address, slot, fetched);
        },
        [&](bool) {
            last_words.insert(words().back());
            for (const auto& descriptor : std::filesystem::directory_iterator("/proc/self/fd")) {
                std::error_code gone;
                const std::string open = std::filesystem::read_symlink(descriptor, gone);
                EXPECT_NE(open.rfind(folder, 0), 0u) << open;
            }
        });
    EXPECT_TRUE(fetched);
    EXPECT_EQ(read_file(folder + "/image"), "the image");
    // Without a place for the address the transfer ends in silence.
    EXPECT_THAT(last_words, Contains("initialized the curl library to download from internet"));
    EXPECT_EQ(::chdir("/"), 0);
}
