// The firmware service at its own interface: what no client of a server can bring about.
#include <filesystem>
#include <sys/stat.h>
#include <unistd.h>

#include "agent/instance_table.h"
#include "classes/CIM_ComputerSystem.h"
#include "classes/CIM_ManagedElement.h"
#include "classes/NVRHBA_FCPortStatistics.h"
#include "services/NVRHBA_SoftwareInstallationService_Provider.h"
#include "services/NVR_MethodWrapper.h"
#include "simulator/nvrsim.h"
#include "tests/agent/Simulated_Host.h"
#include "tests/support/Cases.h"
#include "tests/support/curl_libraries.h"
#include "tests/support/private_host.h"

using namespace cimple;
using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

const std::string folder = "/var/log/firmware";
const std::string local_image = "/var/log/an.image";
const std::string wrong_service = "Error - The SoftwareInstallationService instance selected is incorrect ";

class Firmware : public SimulatedHost {
protected:
    Firmware()
    {
        scenario("[[adapter]]\n");
        make_folder(folder);
        EXPECT_EQ(::chdir(folder.c_str()), 0);
        EXPECT_EQ(nvrsim_make_firmware(local_image.c_str(), "2.09b7", 100), 0);
        install_curl();
        EXPECT_EQ(load(), 0);
        refresh();
        port = known(first_wwpn);
        self = make<NVRHBA_SoftwareInstallationService>();
        copy(self.get(), services()[0]);
        words();
    }
    ~Firmware() override
    {
        settle();
        unload();
    }

    Instance_Map& services() { return agent().m_NVRHBA_SoftwareInstallationService_map; }

    static void copy(Instance* to, const Instance* from)
    {
        auto& service = static_cast<NVRHBA_SoftwareInstallationService&>(*to);
        const auto& published = static_cast<const NVRHBA_SoftwareInstallationService&>(*from);
        service.SystemCreationClassName = published.SystemCreationClassName;
        service.SystemName = published.SystemName;
        service.CreationClassName = published.CreationClassName;
        service.Name = published.Name;
    }
    static Ref<NVRHBA_FCPort> known(const char* device_id)
    {
        auto port = make<NVRHBA_FCPort>();
        set(port->DeviceID, device_id);
        return port;
    }
    /// A service that the agent has not published, while it publishes none.
    void name_service(const char* name)
    {
        services().clear();
        set(self->Name, name);
    }

    static const CIM_ManagedElement* element(const Instance* instance)
    {
        return static_cast<const CIM_ManagedElement*>(instance);
    }

    uint32 install(const std::string& uri, const Instance* target)
    {
        Property<String> text{};
        set(text, uri);
        CIM_ConcreteJob* job = nullptr;
        const Property<Array<uint16>> options{};
        const Property<Array<String>> values{};
        Property<uint32> result{};
        EXPECT_EQ(provider.InstallFromURI(self.get(), job, text, element(target), options, values, result),
                  INVOKE_METHOD_OK);
        EXPECT_EQ(job, nullptr);
        return result.value;
    }
    uint32 install(const Array<uint8>& bytes, const String& path, const Instance* target)
    {
        Property<Array<uint8>> image{};
        image.set(bytes);
        Property<Array<uint16>> options{};
        set(options, {32768});
        Property<Array<String>> values{};
        values.null = 0;
        values.value.append(path);
        CIM_ConcreteJob* job = nullptr;
        Property<uint32> result{};
        EXPECT_EQ(provider.InstallFromByteStream(self.get(), job, image, element(target), options, values, result),
                  INVOKE_METHOD_OK);
        return result.value;
    }
    uint32 reset(const NVRHBA_FCPort* target)
    {
        Property<uint32> result{};
        EXPECT_EQ(provider.ResetHBA(self.get(), target, result), INVOKE_METHOD_OK);
        return result.value;
    }
    uint32 enable(const NVRHBA_FCPort* target)
    {
        Property<boolean> enabled{};
        set(enabled, true);
        Property<uint32> result{};
        EXPECT_EQ(provider.SetPortEnabled(self.get(), target, enabled, result), INVOKE_METHOD_OK);
        return result.value;
    }

    static Array<uint8> bytes_of(const std::string& text)
    {
        Array<uint8> bytes;
        bytes.reserve(text.size());
        static_cast<Array_Base&>(bytes).append(text.data(), text.size());
        return bytes;
    }
    static bool is_empty(const std::string& path) { return std::filesystem::is_empty(path); }

    NVRHBA_SoftwareInstallationService_Provider provider;
    Ref<NVRHBA_SoftwareInstallationService> self;
    Ref<NVRHBA_FCPort> port;
};

} // namespace

TEST_F(Firmware, OfConvergedAdaptersResetsNothing)
{
    name_service("NVRVCNA_SoftwareInstallationService");
    EXPECT_EQ(reset(nullptr), 40002u) << "before the target is looked at";
    EXPECT_EQ(words().back(), "Reset HBA on CNA is not supported");
    EXPECT_EQ(reset(port.get()), 40002u);
    EXPECT_EQ(nvrsim_calls("RM_ResetHBA"), 0u);
    EXPECT_EQ(enable(port.get()), 0u);
}

TEST_F(Firmware, OnlyItsOwnServiceInstallsIt)
{
    for (const char* name : {"NVRVCNA_SoftwareInstallationService", "nvrhba_fcsoftwareinstallationservice", ""}) {
        name_service(name);
        EXPECT_EQ(install(local_image, port.get()), 4u) << name;
        EXPECT_EQ(words().back(), wrong_service);
        EXPECT_EQ(install(bytes_of("an image"), "a.copy", port.get()), 4u) << name;
        EXPECT_EQ(words().back(), wrong_service);
    }
    self->Name.null = 1;
    EXPECT_EQ(install(local_image, port.get()), 4u);
    EXPECT_EQ(install("file://" + local_image, port.get()), 4u) << "what was fetched does not stay";
    EXPECT_TRUE(is_empty(folder));
    EXPECT_TRUE(exists(local_image));
    EXPECT_EQ(nvrsim_calls("RM_ImportHBAFileA"), 0u);

    name_service("NVRHBA_FCSoftwareInstallationService");
    EXPECT_EQ(install(local_image, port.get()), 0u);
}

TEST_F(Firmware, IsServedUnderItsOwnClassAlone)
{
    const auto foreign = make<CIM_ComputerSystem>();
    set(foreign->Name, self->Name.value);
    const auto* disguised = reinterpret_cast<const NVRHBA_SoftwareInstallationService*>(foreign.get());
    Property<uint32> result{};
    for (const auto* instance : {disguised, static_cast<const NVRHBA_SoftwareInstallationService*>(nullptr)}) {
        provider.ResetHBA(instance, port.get(), result);
        EXPECT_EQ(result.value, 33068u);
        services().clear();
    }
}

TEST_F(Firmware, APortIsOneByItsClassNotByItsKey)
{
    const auto statistics = make<NVRHBA_FCPortStatistics>();
    set(statistics->InstanceID, first_wwpn);
    EXPECT_EQ(install(local_image, statistics.get()), 32968u);
    EXPECT_EQ(install(bytes_of("an image"), "a.copy", statistics.get()), 32968u);
    port->DeviceID.null = 1;
    EXPECT_EQ(install(local_image, port.get()), 32968u) << "a port without a key";
    EXPECT_EQ(reset(port.get()), 32968u);
    EXPECT_EQ(enable(port.get()), 32968u);
    EXPECT_TRUE(is_empty(folder));
}

TEST_F(Firmware, AKnownPortWhoseKeyIsNoNameIsRefusedLate)
{
    for (const char* id : {"short", "10000000C9A0000G"}) {
        const auto strange = known(id);
        auto published = known(id);
        ASSERT_GE(agent().m_NVRHBA_FCPort_map.insert(published.get()), 0);
        published.release();
        words();

        EXPECT_EQ(install(local_image, strange.get()), 4097u);
        EXPECT_EQ(words().back(), "NVRHBA_SoftwareInstallationService_Provider::str2HBAName failed");
        EXPECT_EQ(install("file://" + local_image, strange.get()), 4097u) << "what was fetched does not stay";
        EXPECT_EQ(install(bytes_of("an image"), "a.copy", strange.get()), 4097u);
        EXPECT_EQ(words().back(), "NVRHBA_SoftwareInstallationService_Provider::str2HBAName failed");
        EXPECT_EQ(reset(strange.get()), 32968u);
        EXPECT_EQ(words().back(), "NVRHBA_SoftwareInstallationService_Provider::str2HBAName failed");
        EXPECT_EQ(enable(strange.get()), 40001u);
        const auto said = words();
        ASSERT_GE(said.size(), 2u);
        EXPECT_EQ(said[said.size() - 2], "str2HBAName failed");
        EXPECT_EQ(said.back(),
                  std::string("NVRHBA_SoftwareInstallationService_Provider::SetPortEnabled failed for target ") + id);
    }
    EXPECT_TRUE(is_empty(folder));
    EXPECT_TRUE(exists(local_image));
}

TEST_F(Firmware, TakesImagesOf64Megabytes)
{
    // The thread sanitizer takes a hundred times as long over each byte.
    const uint32 whole = (64u << 20) / each_of_cases(1, 16), largest = whole - 64; // behind its header
    ASSERT_EQ(nvrsim_make_firmware(local_image.c_str(), "2.10", largest), 0);
    std::string image = read_file(local_image);
    ASSERT_EQ(image.size(), whole);
    EXPECT_EQ(install(bytes_of(image), "a.copy", port.get()), 0u);
    EXPECT_EQ(install(local_image, port.get()), 0u);
    EXPECT_EQ(install("file://" + local_image, port.get()), 0u);
    char version[64] = {};
    nvrsim_get("0", "firmware", version, sizeof version);
    EXPECT_STREQ(version, "2.10");
    image.back() ^= 1;
    EXPECT_EQ(install(bytes_of(image), "a.copy", port.get()), 40001u);
    EXPECT_TRUE(is_empty(folder));
}

TEST_F(Firmware, APathEndsAtAZeroByte)
{
    EXPECT_EQ(install(bytes_of(read_file(local_image)), String("a.copy\0/behind", 14), port.get()), 0u);
    EXPECT_EQ(install(local_image + std::string("\0behind", 7), port.get()), 0u);
    EXPECT_TRUE(is_empty(folder));
}

TEST_F(Firmware, AFileThatHasGoneIsALibrarysFailure)
{
    HBA_WWN name = {{0x10, 0, 0, 0, 0xC9, 0xA0, 0, 1}};
    const std::string longest(65536, 'x');
    ASSERT_EQ(::mkfifo("fifo", 0600), 0);
    const struct {
        std::string path, words;
    } rows[] = {{"nothing", "\nERROR: nvrcimDownloadFW: FW file not found"},
                {"", "\nERROR: nvrcimDownloadFW: FW file not found"},
                {longest, "\nERROR: nvrcimDownloadFW: Can't stat FW file"},
                {local_image + "/inside", "\nERROR: nvrcimDownloadFW: Can't stat FW file"},
                {"fifo", "\nERROR: nvrcimDownloadFW: Can't stat FW file"}};
    for (const auto& row : rows) {
        words();
        EXPECT_EQ(NVR_MethodWrapper::nvrcimDownloadFW(name, row.path.c_str()), 1u);
        EXPECT_THAT(words(),
                    ElementsAre("entering the nvrcimDownloadFW function", "Entering NVR_MethodWrapper::Validatewwpn()",
                                "RM_IsLocalHBA: status=0", "\n firmware file name \"" + row.path + "\"\n", row.words));
    }
    EXPECT_EQ(nvrsim_calls("RM_ImportHBAFileA"), 0u);
}
