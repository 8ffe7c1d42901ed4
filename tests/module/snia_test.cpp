// The module over the system's own Common HBA API library, with the simulated adapters behind it as a vendor's plug-in
// that the library's configuration lists.
#include <string>

#include <gmock/gmock.h>

#include "tests/module/support/Expected.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

using namespace nvrtest;

namespace {

void install_system_library()
{
    make_link(NVR_SYSTEM_HBAAPI, library_folder() + "/libHBAAPI.so");
    write_file("/etc/hba.conf",
               std::string("com.norvane.simulator ") + NVRSIM_BUILD + "/lib/libnvrsim_hba_vendor.so\n");
}

} // namespace

TEST(SystemHbaLibrary, ShowsThePortsOfThePluginThatItsConfigurationNames)
{
    Rig rig;
    install_system_library();
    const host::Answer ports = rig.enumerate("NVRHBA_FCPort");
    ASSERT_THAT(ports, succeeded());
    ASSERT_EQ(ports.instances.size(), 4u);
    // The library numbers adapter names by itself; all else is the same as without it.
    std::string expected = lines_of_class(expected_text("typical.txt"), "NVRHBA_FCPort");
    std::string found = to_lines("NVRHBA_FCPort", ports.instances);
    EXPECT_EQ(difference(expected, found), "");
}

TEST(SystemHbaLibrary, IsLoadedAnewByEveryAgent)
{
    Rig rig;
    install_system_library();
    for (int round = 0; round < 3; round++) {
        EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u) << round;
        rig.restart();
    }
}

TEST(SystemHbaLibrary, WithoutAPluginFindsNoAdapters)
{
    Rig rig;
    install_system_library();
    write_file("/etc/hba.conf", "# nothing installed\n");
    const host::Answer ports = rig.enumerate("NVRHBA_FCPort");
    EXPECT_THAT(ports, succeeded());
    EXPECT_TRUE(ports.instances.empty());
}
