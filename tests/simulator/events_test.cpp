// Port events on the library's thread, and calls from many threads at once.
#include "Sim.h"

#include <atomic>
#include <thread>

namespace {

struct Heard {
    std::atomic<int> calls{0};
    std::atomic<uint32_t> type{0}, fabric{0};
    std::atomic<uint64_t> port{0};
    std::atomic<bool> onOtherThread{false};
    std::thread::id main = std::this_thread::get_id();
    HBA_CALLBACKHANDLE handle = nullptr;
    bool removesItself = false;
};

void hear(void* data, HBA_WWN port, HBA_UINT32 type, HBA_UINT32 fabric)
{
    auto& heard = *static_cast<Heard*>(data);
    heard.port = number(port);
    heard.type = type;
    heard.fabric = fabric;
    heard.onOtherThread = std::this_thread::get_id() != heard.main;
    nvrsim_HBA_GetNumberOfAdapters(); // a callback may call in
    if (heard.removesItself) nvrsim_HBA_RemoveCallback(heard.handle);
    ++heard.calls;
}

} // namespace

class Events : public Simulated {
protected:
    Heard heard;

    void listen(uint64_t port)
    {
        const HBA_HANDLE handle = open();
        ASSERT_EQ(0u, nvrsim_HBA_RegisterForAdapterPortEvents(hear, &heard, handle, wire(port), &heard.handle));
        nvrsim_HBA_CloseAdapter(handle);
    }
};

TEST_F(Events, LinkDownReachesTheCallbackOnAThreadOfTheLibrary)
{
    listen(port0);
    ASSERT_EQ(0, nvrsim_link("0", 0));
    nvrsim_drain_events();
    EXPECT_EQ(1, heard.calls);
    EXPECT_EQ(unsigned(HBA_EVENT_PORT_OFFLINE), heard.type);
    EXPECT_EQ(port0, heard.port);
    EXPECT_TRUE(heard.onOtherThread);
    HBA_PORTATTRIBUTES port;
    ASSERT_EQ(0u, nvrsim_HBA_GetAdapterPortAttributes(open(), 0, &port));
    EXPECT_EQ(unsigned(HBA_PORTSTATE_LINKDOWN), port.PortState);
    EXPECT_EQ(0u, port.PortSpeed);
    EXPECT_EQ(0u, port.NumberofDiscoveredPorts);
    HBA_FCPTARGETMAPPING mapping{};
    mapping.NumberOfEntries = 1;
    EXPECT_EQ(0u, nvrsim_HBA_GetFcpTargetMapping(open(), &mapping));
    EXPECT_EQ(0u, mapping.NumberOfEntries);
    ASSERT_EQ(0, nvrsim_link("10000000C9A00001", 1));
    nvrsim_drain_events();
    EXPECT_EQ(unsigned(HBA_EVENT_PORT_ONLINE), heard.type);
    ASSERT_EQ(0u, nvrsim_HBA_GetAdapterPortAttributes(open(), 0, &port));
    EXPECT_EQ(32u, port.PortSpeed);
    EXPECT_EQ(0u, nvrsim_HBA_RemoveCallback(heard.handle));
}

TEST_F(Events, AnyTypeWithItsIdentifierAndNoneAfterRemoval)
{
    listen(port0);
    EXPECT_EQ(1, nvrsim_event("0", 515, 0x010203));
    nvrsim_drain_events();
    EXPECT_EQ(515u, heard.type);
    EXPECT_EQ(0x010203u, heard.fabric);
    EXPECT_EQ(0u, nvrsim_HBA_RemoveCallback(heard.handle));
    EXPECT_EQ(0, nvrsim_event("0", 515, 0));
    EXPECT_EQ(-1, nvrsim_event("9", 515, 0));
    EXPECT_NE(0u, nvrsim_HBA_RemoveCallback(heard.handle)) << "already removed";
    EXPECT_EQ(1, heard.calls);
}

TEST_F(Events, CallbackMayRemoveItself)
{
    listen(port0);
    heard.removesItself = true;
    nvrsim_event("0", 513, 0);
    nvrsim_event("0", 513, 0);
    nvrsim_drain_events();
    EXPECT_EQ(1, heard.calls);
    EXPECT_EQ(0u, nvrsim_callbacks());
}

TEST_F(Events, PortOfAnotherAdapterIsRefused)
{
    load("[[adapter]]\ncount = 2\n");
    HBA_CALLBACKHANDLE handle;
    EXPECT_EQ(5u, nvrsim_HBA_RegisterForAdapterPortEvents(hear, &heard, open(0), wire(port1), &handle));
    EXPECT_EQ(4u, nvrsim_HBA_RegisterForAdapterPortEvents(nullptr, &heard, open(0), wire(port0), &handle));
}

TEST_F(Events, AfterRemovalTheDataIsNeverTouchedAgain)
{
    for (int round = 0; round < 200; ++round) {
        auto local = std::make_unique<Heard>();
        const HBA_HANDLE handle = open();
        ASSERT_EQ(0u, nvrsim_HBA_RegisterForAdapterPortEvents(hear, local.get(), handle, wire(port0), &local->handle));
        nvrsim_HBA_CloseAdapter(handle);
        nvrsim_event("0", 513, 0);
        if (round % 2) std::this_thread::yield();
        ASSERT_EQ(0u, nvrsim_HBA_RemoveCallback(local->handle));
        local.reset(); // a late call would use freed memory
    }
    nvrsim_drain_events();
}

TEST_F(Events, ManyThreadsCallWhileTheHostChanges)
{
    load("[[adapter]]\ncount = 4\n[[target]]\nluns = 8\n");
    std::atomic<bool> stop{false};
    std::atomic<unsigned> wrong{0}, done{0};
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t)
        threads.emplace_back([&, t] {
            while (!stop) {
                const HBA_HANDLE handle = open(static_cast<uint32_t>(t));
                HBA_PORTATTRIBUTES port;
                const uint32_t status = nvrsim_HBA_GetAdapterPortAttributes(handle, 0, &port);
                if (status == 0 && number(port.PortWWN) - port0 > 3) ++wrong;
                uint8_t response[255], sense[128];
                nvrsim_HBA_SendScsiInquiry(handle, wire(target0), fcp_lun(1), 0, 0, response, 255, sense, 128);
                nvrsim_HBA_CloseAdapter(handle);
                Block block(RM_HBA_BLOCK_SIZE);
                nvrsim_RM_GetHBAAttributes(wire(port0 + static_cast<unsigned>(t)), block.bytes.data(), &block.size);
                nvrsim_RM_DiagBeacon(wire(port0), RM_BEACON_ON);
                ++done;
            }
        });
    for (int round = 0; round < 100; ++round) {
        nvrsim_link("1", round % 2);
        nvrsim_set("2", "present", round % 2);
        nvrsim_fault("call = 'HBA_OpenAdapter', delay_ms = 1, times = 3");
        if (round % 10 == 0) nvrsim_reset();
        sim_text(nvrsim_state);
    }
    while (done < 50)
        std::this_thread::yield();
    stop = true;
    for (std::thread& thread : threads)
        thread.join();
    EXPECT_EQ(0u, wrong);
}
