// Runs in processes of their own: whatever becomes of one, it is told, and the next finds a host of its own.
#include <array>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <unistd.h>

#include <gmock/gmock.h>

#include "tests/faults/Runs.h"
#include "tests/support/private_host.h"

using namespace nvrtest;
using testing::AllOf;
using testing::HasSubstr;

namespace {

constexpr std::chrono::seconds long_enough{60};

Run_Result result_of(const std::function<void(Run_Watch&)>& work, std::chrono::milliseconds patience = long_enough)
{
    return do_run({"a run", patience, work});
}

void stand(Run_Watch& watch)
{
    watch.step("a place");
    for (;;)
        ::pause();
}

} // namespace

TEST(Runs, OneThatIsDoneTellsWhatItHasToTell)
{
    const std::string much(1 << 20, 'x');
    const Run_Result result = result_of([&](Run_Watch& watch) {
        watch.tell("some ");
        watch.step("something");
        watch.tell(much);
        std::puts("nobody hears this");
    });
    EXPECT_EQ(result.failure, "");
    EXPECT_EQ(result.told, "some " + much);
}

TEST(Runs, OneThatFailsTellsWhyWhereAndWhatItPrinted)
{
    EXPECT_EQ(result_of([](Run_Watch& watch) {
                  watch.complain("one");
                  watch.complain("two");
              }).failure,
              "one\ntwo\n");
    EXPECT_EQ(result_of([](Run_Watch&) { throw std::runtime_error("a reason"); }).failure, "it threw: a reason\n");
    EXPECT_EQ(result_of([](Run_Watch& watch) {
                  watch.step("a place");
                  std::fputs("last words\n", stderr);
                  ::_exit(3);
              }).failure,
              "the process ended with 3\nat: a place\nlast words\n");
    EXPECT_THAT(result_of([](Run_Watch& watch) {
                    watch.step("a place");
                    ::kill(::getpid(), SIGKILL);
                }).failure,
                AllOf(HasSubstr("Killed"), HasSubstr("at: a place")));
}

TEST(Runs, OneThatStandsIsEnded)
{
    EXPECT_EQ(result_of(stand, std::chrono::milliseconds(1)).failure, "it stands at: a place\n");
}

TEST(Runs, EachIsMadeOnceOnAHostOfItsOwn)
{
    std::array<int, 20> made{};
    write_file("/etc/mine", "before");
    std::vector<nvrtest::Run> runs;
    for (std::size_t i = 0; i < made.size(); i++)
        runs.push_back({std::to_string(i), long_enough, [](Run_Watch& watch) {
                            if (read_file("/etc/mine") != "before") watch.complain("another was in my /etc");
                            write_file("/etc/mine", "after");
                            for (const std::string& folder :
                                 {std::string("/var/log"), std::string("/dev/shm"), library_folder()}) {
                                if (exists(folder + "/mine")) watch.complain("another was in my " + folder);
                                write_file(folder + "/mine", "");
                            }
                        }});
    runs[7].work = [](Run_Watch&) { std::abort(); };
    runs[9] = {"9", std::chrono::milliseconds(1), stand};
    do_runs(runs, 3,
            [&](std::size_t index, const Run_Result& result) { made[index] += result.failure.empty() ? 1 : 100; });
    for (std::size_t i = 0; i < made.size(); i++)
        EXPECT_EQ(made[i], i == 7 || i == 9 ? 100 : 1) << i;
    EXPECT_EQ(read_file("/etc/mine"), "before");
}
