// The module opened, loaded, asked, unloaded and closed a thousand times in one process, which is then as it was.
//
// Closing does not take it out of the process (docs/architecture.md): each opening finds the same module at the same
// place. NVR_LIVES=10000 in the environment makes them so many.
#include <chrono>
#include <cstdlib>
#include <dlfcn.h>
#include <fstream>
#include <string>
#include <thread>
#include <unistd.h>
#include <vector>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/module/support/Entries.h"
#include "tests/module/support/Rig.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/private_host.h"
#include "tests/support/process_state.h"
#include "tests/support/simulator.h"

using namespace nvrtest;
using testing::ElementsAre;
using testing::IsEmpty;

namespace {

constexpr char scan[] = "HBA_GetNumberOfAdapters";
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr unsigned usual_lives = 50, first_lives = 10;
#else
constexpr unsigned usual_lives = 1000;
constexpr unsigned first_lives = 300; // until the server that asks holds all that it will
#endif

unsigned number_of_lives()
{
    const char* asked = std::getenv("NVR_LIVES");
    return asked ? static_cast<unsigned>(std::atoi(asked)) : usual_lives;
}

/// What a process holds of its system, and what else takes memory there.
struct Holdings {
    std::vector<std::string> files = open_files();
    std::vector<std::string> shared_memory = names_in("/dev/shm");
    std::size_t mappings = 0; ///< that have a file
    std::size_t bytes = heap_bytes();
    std::size_t resident = resident_kilobytes();

    Holdings()
    {
        std::ifstream maps("/proc/self/maps");
        for (std::string line; std::getline(maps, line);)
            mappings += line.find('/') != std::string::npos;
    }
};

/// One life of the module, from its opening to its closing; the place of its code. `ends_in_refresh` grows where its
/// end begins before a refresh's.
void* live(Rig& rig, unsigned life, unsigned& ends_in_refresh)
{
    Entries entries;
    rig.server().on_request_thread([&](const CMPIBroker* broker, const CMPIContext* context) {
        const auto ask = [&](CMPIInstanceMI* mi, const char* class_name) {
            CMPIStatus status;
            CMPIObjectPath* path = broker->eft->newObjectPath(broker, "root/norvane", class_name, &status);
            mi->ft->enumerateInstanceNames(mi, context, nullptr, path);
            path->ft->release(path);
        };
        CMPIInstanceMI* disks = entries.instances("NVRHBA_StorageVolume", broker, context);
        CMPIInstanceMI* settings = entries.instances("NVRHBA_ProviderConfigSetting", broker, context);
        CMPIIndicationMI* alerts = entries.indications("NVRHBA_AlertIndication", broker, context);
        ASSERT_TRUE(disks && settings && alerts);
        const std::uint64_t scans = calls(scan);
        ask(disks, "NVRHBA_StorageVolume"); // waits for the refresh that it starts
        EXPECT_EQ(calls(scan), scans + 1);
        if (life % 3 == 0) {
            EXPECT_EQ(alerts->ft->enableIndications(alerts, context).rc, CMPI_RC_OK);
            EXPECT_EQ(nvrsim_callbacks(), 1u);
        }
        if (life % 2 == 0) { // the end comes while a refresh runs, most often
            advance_clock(std::chrono::minutes(31));
            ask(settings, "NVRHBA_ProviderConfigSetting");
            ends_in_refresh += rig.server().report().contexts_not_detached > 0;
        }
        EXPECT_EQ(alerts->ft->cleanup(alerts, context, 1).rc, CMPI_RC_OK);
        EXPECT_EQ(settings->ft->cleanup(settings, context, 1).rc, CMPI_RC_OK);
        EXPECT_EQ(disks->ft->cleanup(disks, context, 1).rc, CMPI_RC_OK);
    });
    // The refresh asked for profiles, so that the server has a provider of the module loaded too.
    while (rig.server().is_loaded(NVR_MODULE))
        rig.server().unload_idle();
    return dlsym(entries.handle(), "cimple_module");
}

} // namespace

TEST(Lives, AThousandLeaveTheProcessAsItWas)
{
    Rig rig({host::Manner::strict(), "small", refreshing_settings});
    remove(dmp_path); // and no line is written
    const std::size_t threads = number_of_threads_from_the_start() - nvrsim_threads();
    const Holdings first;
    void* place = nullptr;
    unsigned ends_in_refresh = 0;
    for (unsigned life = 0; life < first_lives; life++)
        place = live(rig, life, ends_in_refresh);
    rig.restart(); // a server of its own keeps what it logged of the module
    const Holdings warm;
    const unsigned lives = number_of_lives();
    for (unsigned life = 0; life < lives; life++) {
        ASSERT_EQ(live(rig, life, ends_in_refresh), place) << "life " << life;
        ASSERT_EQ(nvrsim_open_handles(), 0u) << "life " << life;
        ASSERT_EQ(nvrsim_callbacks(), 0u) << "life " << life;
    }
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
    EXPECT_EQ(left_beside_strings(rig.server().report()), 0u) << rig.server().report().to_text();
    EXPECT_EQ(rig.server().report().contexts_not_detached, 0u);
    rig.restart();
    const Holdings after;
    EXPECT_GE(ends_in_refresh, lives / 10);
    EXPECT_EQ(after.files, first.files);
    EXPECT_TRUE(wait_for_threads(threads + nvrsim_threads(), std::chrono::seconds(60))) << number_of_threads();
    // One semaphore stays: that the libraries were started.
    EXPECT_THAT(first.shared_memory, IsEmpty());
    EXPECT_THAT(after.shared_memory, ElementsAre("sem.NVR_RM_INIT_LIB_DONE_" + std::to_string(getpid())));
    EXPECT_EQ(after.mappings, warm.mappings);
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
#if !defined(NORVANE_COVERAGE) // whose runtime loses the name of its file with each library that is closed
    EXPECT_LT(after.bytes, warm.bytes + 16 * lives); // half of what the smallest block a life is
#endif
    EXPECT_LT(after.resident, warm.resident + 2 * lives);
#endif
    RecordProperty("ends in a refresh", std::to_string(ends_in_refresh));
    RecordProperty("bytes", std::to_string(static_cast<long>(after.bytes - warm.bytes)));
    RecordProperty("kilobytes resident", std::to_string(static_cast<long>(after.resident - warm.resident)));
}
