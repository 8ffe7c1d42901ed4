// An update of the maps for which memory runs out: wherever that is, it ends as updates end, and the next one is whole.
#include <set>
#include <sys/mman.h>

#include "agent/Agent_Wait.h"
#include "tests/agent/Simulated_Host.h"
#include "tests/support/Cases.h"
#include "tests/support/short_memory.h"

using namespace cimple;
using namespace nvrtest;
using testing::IsSupersetOf;

// There is no room for blocks here, so that each piece of an instance is asked for by itself.
extern "C" void* __wrap_mmap(void*, std::size_t, int, int, int, off_t)
{
    return MAP_FAILED;
}

namespace {

class MemoryShortage : public SimulatedHost {
protected:
    // With little about the port, so that each piece of memory can be refused once.
    MemoryShortage()
    {
        scenario("[host]\nglobal_params = 0\n[[adapter]]\n[[adapter.port]]\nparams = 0\nvpd = false\n"
                 "transceiver = false\nflash = []\n[[target]]\nluns = 1\n");
        EXPECT_EQ(load(), 0);
        plain(agent().m_NVRHBA_FCPort_map);
        san(agent().m_NVRHBA_StorageVolume_map);
        words();
    }
    ~MemoryShortage() override { unload(); }

    /// The words of `update` with each of its allocations refused in turn.
    std::set<std::string> words_without_memory(uint32 (ProviderAgent::*update)())
    {
        ProviderAgent& held = agent();
        const Agent_Wait wait(held);
        std::set<std::string> all;
        uint32 status = 0;
        const long pieces = refuse_each_allocation([&] { status = (held.*update)(); },
                                                   [&](bool has_thrown) {
                                                       EXPECT_FALSE(has_thrown);
                                                       EXPECT_TRUE(status == 0 || status == 32769) << status;
                                                       for (const std::string& word : words())
                                                           all.insert(word);
                                                   },
                                                   static_cast<long>(each_of_cases(1, 5)));
        EXPECT_GT(pieces, 50);
        EXPECT_EQ(status, 0u) << "the last one had all that it wanted";
        return all;
    }
};

} // namespace

TEST_F(MemoryShortage, EndsAnUpdateOfTheAdaptersInOrder)
{
    EXPECT_THAT(
        words_without_memory(&ProviderAgent::updateAdapterMaps),
        IsSupersetOf({"Failed to create NVRHBA_PCIDevice", "Failed to create NVRHBA_PCIElementConformsToProfile",
                      "Failed to create NVRHBA_SystemDevice", "No FC card found",
                      "Could not create the instance of the Association class"}));
    EXPECT_EQ(agent().m_NVRHBA_FCPort_map.size(), 1u);
    EXPECT_EQ(agent().m_NVRHBA_SCSIProtocolInitiatorEndpoint_map.size(), 1u);
}

TEST_F(MemoryShortage, EndsAnUpdateOfTheSANInOrder)
{
    words_without_memory(&ProviderAgent::updateSANMaps);
    EXPECT_EQ(agent().m_NVRHBA_StorageVolume_map.size(), 1u);
    EXPECT_EQ(agent().m_NVRHBA_SCSIInitiatorTargetStorageVolumePath_map.size(), 1u);
}
