// What a refresh leaves behind: the same instances as the one before it, and to the byte the same memory.
//
// This program replaces operator new for all that it loads, and counts what the module holds: blocks that its code
// asked for, also through the standard library's.
#include <atomic>
#include <chrono>
#include <cstdlib>
#include <new>
#include <string>
#include <thread>
#include <unwind.h>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/module/support/Rig.h"
#include "tests/support/code_range.h"
#include "tests/support/process_state.h"
#include "tests/support/simulator.h"

namespace {

nvrtest::Code_Range module, library;
std::atomic<std::size_t> module_bytes{0}, module_blocks{0};

/// Walks out of the standard library: true if the module called it.
bool called_by_module()
{
    struct Walk {
        int frames = 0;
        bool is_module = false;
    } walk;
    _Unwind_Backtrace(
        [](_Unwind_Context* frame, void* data) {
            auto& [frames, is_module] = *static_cast<Walk*>(data);
            const std::uintptr_t place = _Unwind_GetIP(frame);
            is_module = module.holds(place);
            const bool goes_on = frames++ < 3 || library.holds(place); // this program's own frames come first
            return is_module || !goes_on || frames > 20 ? _URC_END_OF_STACK : _URC_NO_REASON;
        },
        &walk);
    return walk.is_module;
}

constexpr std::size_t head = 16; // keeps the alignment; its first word is the size of a block of the module's, or 0

void* allocate(std::size_t size, std::uintptr_t caller)
{
    auto* block = static_cast<char*>(std::malloc(size + head));
    if (!block) throw std::bad_alloc();
    const bool is_module = module.holds(caller) || (library.holds(caller) && module.is_found() && called_by_module());
    *reinterpret_cast<std::size_t*>(block) = is_module ? size + head : 0;
    if (is_module) {
        module_bytes += size + head;
        module_blocks++;
    }
    return block + head;
}

void give_back(void* place)
{
    if (!place) return;
    char* block = static_cast<char*>(place) - head;
    if (const std::size_t size = *reinterpret_cast<std::size_t*>(block)) {
        module_bytes -= size;
        module_blocks--;
    }
    std::free(block);
}

} // namespace

#define NVR_CALLER reinterpret_cast<std::uintptr_t>(__builtin_return_address(0))
void* operator new(std::size_t size)
{
    return allocate(size, NVR_CALLER);
}
void* operator new[](std::size_t size)
{
    return allocate(size, NVR_CALLER);
}
void operator delete(void* place) noexcept
{
    give_back(place);
}
void operator delete[](void* place) noexcept
{
    give_back(place);
}
void operator delete(void* place, std::size_t) noexcept
{
    give_back(place);
}
void operator delete[](void* place, std::size_t) noexcept
{
    give_back(place);
}

namespace {

using namespace nvrtest;

struct Held {
    std::size_t bytes, blocks;

    bool operator==(const Held& other) const { return bytes == other.bytes && blocks == other.blocks; }
    friend void PrintTo(const Held& held, std::ostream* os) { *os << held.bytes << " bytes in " << held.blocks; }
};

/// What is held once no more than `resting` threads run: that of the last refresh, which has told its end, is gone.
Held held_at_rest(std::size_t resting)
{
    EXPECT_TRUE(wait_for_threads(resting, std::chrono::seconds(20))) << number_of_threads() << " of " << resting;
    return {module_bytes, module_blocks};
}

std::string all_names(Rig& rig)
{
    std::string all;
    for (const std::string& class_name : rig.classes())
        for (const host::Path& path : rig.names(class_name).paths)
            all += path.to_text() + '\n';
    return all;
}

std::string large_host()
{
    std::string text(nvrsim_generate(8, 8, 16, nullptr, 0) + 1, '\0');
    text.resize(nvrsim_generate(8, 8, 16, text.data(), text.size()));
    return text;
}

class Memory : public testing::TestWithParam<bool> {};

TEST_P(Memory, ARefreshLeavesTheSameInstancesAndNotAByteMore)
{
    const std::size_t resting = number_of_threads();
    Rig rig({host::Manner::strict(), GetParam() ? large_host() : "typical", refreshing_settings});
    library.find("libstdc++.so");
    ASSERT_THAT(rig.names("NVRHBA_FCPort"), succeeded());
    ASSERT_TRUE(module.find("libnorvane_fc_provider.so"));
    // From here on all is counted; what an earlier refresh holds goes with the next one.
    rig.refresh();
    rig.refresh();
    const std::string names = all_names(rig);
    EXPECT_GT(names.size(), 50000u);
    rig.refresh();
    const Held before = held_at_rest(resting);
    EXPECT_GT(before.bytes, 100000u) << "nothing was counted";
    for (int round = 0; round < 3; round++) {
        rig.refresh();
        EXPECT_EQ(held_at_rest(resting), before) << "round " << round;
    }
    EXPECT_EQ(all_names(rig), names);
    rig.refresh();
    EXPECT_EQ(held_at_rest(resting), before) << "after the requests";
}

// All nine tests on each port, with overrides and without, jobs that go at once and logs that are cleared.
TEST(MemoryOfDiagnostics, ARebuildTakesAllThatRunsLeft)
{
    const std::size_t resting = number_of_threads();
    Rig rig({host::Manner::strict(), "typical", refreshing_settings});
    library.find("libstdc++.so");
    ASSERT_THAT(rig.names("NVRHBA_FCPort"), succeeded());
    ASSERT_TRUE(module.find("libnorvane_fc_provider.so"));
    const auto with_id = [](const char* class_name, const host::Value& id) {
        host::Instance instance;
        instance.path.name_space = "root/norvane";
        instance.path.class_name = class_name;
        instance.set("InstanceID", id);
        return instance;
    };
    const auto run_all = [&](bool deletes) {
        for (const host::Path& test : rig.names("NVRHBA_FCHBADiagnosticTest").paths) {
            host::Instance settings = with_id("NVRHBA_FCHBADiagnosticSettingData", *test.find("Name"));
            settings.set("LoopControlParameter", host::Value::array(CMPI_string, {host::Value::string("7")}));
            settings.set("TargetDevice", host::Value::string("50060E8005A10000"));
            host::Instance jobs = with_id("NVRHBA_JobSettingData", host::Value::string("NVR:FCHBA JobSettingData"));
            jobs.set("DeleteOnCompletion", host::Value::boolean(deletes));
            for (const host::Path& port : rig.names("NVRHBA_PortController").paths)
                ASSERT_THAT(rig.server().call(test, "RunDiagnosticService",
                                              {{"ManagedElement", host::Value::reference(port)},
                                               {"DiagnosticSettings", host::Value::instance(settings)},
                                               {"JobSettings", host::Value::instance(jobs)}}),
                            succeeded());
        }
    };
    const auto act = [&] {
        run_all(false);
        const std::size_t records = rig.enumerate("NVRHBA_DiagnosticCompletionRecord").instances.size();
        EXPECT_GT(records, 20u);
        run_all(true);
        EXPECT_EQ(rig.enumerate("NVRHBA_DiagnosticCompletionRecord").instances.size(), 2 * records);
        const std::vector<host::Path> logs = rig.names("NVRHBA_DiagnosticsLog").paths;
        for (std::size_t i = 0; i < logs.size(); i += 2)
            ASSERT_THAT(rig.server().call(logs[i], "ClearLog"), succeeded());
    };
    act();
    rig.refresh();
    const std::string names = all_names(rig);
    rig.refresh();
    const Held before = held_at_rest(resting);
    for (int round = 0; round < 3; round++) {
        act();
        EXPECT_GT(held_at_rest(resting).blocks, before.blocks + 1000) << "nothing was left to take";
        rig.refresh();
        EXPECT_EQ(held_at_rest(resting), before) << "round " << round;
    }
    EXPECT_EQ(all_names(rig), names);
}

INSTANTIATE_TEST_SUITE_P(Of, Memory, testing::Bool(),
                         [](const auto& info) { return info.param ? "AThousandPaths" : "TheTypicalHost"; });

} // namespace
