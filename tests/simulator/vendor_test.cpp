// The plug-in behind the system's own libHBAAPI, which reads /etc/hba.conf: the test lays a configuration of its own
// over that file, in a mount namespace that only this process sees.
#include "Sim.h"

#include <dlfcn.h>
#include <fcntl.h>
#include <sched.h>
#include <sys/mount.h>
#include <unistd.h>

#include <string>

namespace {

bool write_file(const char* path, const std::string& text)
{
    const int file = ::open(path, O_WRONLY | O_CLOEXEC);
    if (file < 0) return false;
    const bool written = ::write(file, text.data(), text.size()) == static_cast<ssize_t>(text.size());
    return ::close(file) == 0 && written;
}

/// A mount namespace of our own: as root at once, else inside a user namespace.
bool private_mounts()
{
    if (unshare(CLONE_NEWNS) != 0) {
        const std::string user = std::to_string(getuid()), group = std::to_string(getgid());
        if (unshare(CLONE_NEWUSER | CLONE_NEWNS) != 0) return false;
        write_file("/proc/self/setgroups", "deny");
        if (!write_file("/proc/self/uid_map", "0 " + user + " 1") ||
            !write_file("/proc/self/gid_map", "0 " + group + " 1"))
            return false;
    }
    return mount(nullptr, "/", nullptr, MS_REC | MS_PRIVATE, nullptr) == 0;
}

int lastEvent = 0;
void remember(void*, HBA_WWN, HBA_UINT32 type, HBA_UINT32)
{
    lastEvent = static_cast<int>(type);
}

} // namespace

TEST(VendorPlugin, SystemLibraryListsAndReadsTheSimulatedAdapters)
{
    ASSERT_TRUE(private_mounts()) << "run as root, or allow user namespaces: " << strerror(errno);
    ASSERT_EQ(0, mount(NVRSIM_HBA_CONF, "/etc/hba.conf", nullptr, MS_BIND, nullptr)) << strerror(errno);
    void* library = dlopen("libHBAAPI.so.2", RTLD_NOW);
    ASSERT_NE(nullptr, library) << dlerror();
#define GET(name) auto* const name = reinterpret_cast<name##_t*>(dlsym(library, #name))
    GET(HBA_LoadLibrary);
    GET(HBA_GetNumberOfAdapters);
    GET(HBA_GetAdapterName);
    GET(HBA_OpenAdapter);
    GET(HBA_GetAdapterAttributes);
    GET(HBA_GetAdapterPortAttributes);
    GET(HBA_GetFcpTargetMapping);
    GET(HBA_SendScsiInquiry);
    GET(HBA_SendReadCapacity);
    GET(HBA_RegisterForAdapterPortEvents);
    GET(HBA_RemoveCallback);
    GET(HBA_CloseAdapter);
    GET(HBA_FreeLibrary);
#undef GET
    ASSERT_EQ(0, nvrsim_load(NVRSIM_SCENARIOS "/typical.toml")) << sim_text(nvrsim_error);
    EXPECT_EQ(0u, HBA_GetNumberOfAdapters()) << "nothing before the library is loaded";
    ASSERT_EQ(0u, HBA_LoadLibrary());
    ASSERT_EQ(4u, HBA_GetNumberOfAdapters());
    char name[256];
    ASSERT_EQ(0u, HBA_GetAdapterName(2, name));
    EXPECT_STREQ("Norvane-FC2162-2", name);
    const HBA_HANDLE handle = HBA_OpenAdapter(name);
    ASSERT_NE(0u, handle);
    HBA_ADAPTERATTRIBUTES attributes{};
    EXPECT_EQ(0u, HBA_GetAdapterAttributes(handle, &attributes));
    EXPECT_STREQ("NV216200002", attributes.SerialNumber);
    HBA_PORTATTRIBUTES port{};
    EXPECT_EQ(0u, HBA_GetAdapterPortAttributes(handle, 0, &port));
    EXPECT_EQ(0x10000000C9A00003u, number(port.PortWWN));
    std::vector<char> buffer(sizeof(HBA_FCPTARGETMAPPING) + 16 * sizeof(HBA_FCPSCSIENTRY));
    auto* mapping = reinterpret_cast<HBA_FCPTARGETMAPPING*>(buffer.data());
    mapping->NumberOfEntries = 16;
    EXPECT_EQ(0u, HBA_GetFcpTargetMapping(handle, mapping));
    EXPECT_EQ(16u, mapping->NumberOfEntries);
    uint8_t response[255] = {}, sense[128] = {};
    const HBA_FCPID& first = mapping->entry[0].FcpId;
    EXPECT_EQ(0u, HBA_SendScsiInquiry(handle, first.PortWWN, first.FcpLun, 0, 0, response, 255, sense, 128));
    EXPECT_EQ("NORVANE ", std::string(response + 8, response + 16));
    EXPECT_EQ(0u, HBA_SendReadCapacity(handle, first.PortWWN, first.FcpLun, response, 255, sense, 128));
    HBA_CALLBACKHANDLE callback = nullptr;
    ASSERT_EQ(0u, HBA_RegisterForAdapterPortEvents(remember, nullptr, handle, port.PortWWN, &callback));
    ASSERT_EQ(0, nvrsim_link("2", 0));
    nvrsim_drain_events();
    EXPECT_EQ(513, lastEvent);
    EXPECT_EQ(0u, HBA_RemoveCallback(callback));
    HBA_CloseAdapter(handle);
    EXPECT_EQ(0u, nvrsim_open_handles());
    EXPECT_EQ(0u, HBA_FreeLibrary());
    dlclose(library);
}
