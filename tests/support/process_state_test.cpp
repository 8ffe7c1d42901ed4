#include "tests/support/process_state.h"

#include <cstdlib>
#include <fcntl.h>
#include <future>
#include <string>
#include <thread>
#include <unistd.h>

#include <gmock/gmock.h>

using namespace nvrtest;
using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Not;

TEST(ProcessState, CountsThreadsThatHaveNotEnded)
{
    const std::size_t before = number_of_threads_from_the_start();
    std::promise<void> end;
    std::thread thread([&] { end.get_future().wait(); });
    EXPECT_EQ(number_of_threads(), before + 1);
    EXPECT_FALSE(wait_for_threads(before, std::chrono::seconds(0)));
    end.set_value();
    thread.join();
    EXPECT_TRUE(wait_for_threads(before));
    EXPECT_EQ(number_of_threads(), before);
}

TEST(ProcessState, NamesOpenFilesWithoutTheOneThatItReads)
{
    const std::vector<std::string> before = open_files();
    const int file = ::open("/dev/null", O_RDONLY | O_CLOEXEC);
    EXPECT_THAT(before, Not(Contains(std::to_string(file))));
    EXPECT_THAT(open_files(), Contains(std::to_string(file)));
    ::close(file);
    EXPECT_EQ(open_files(), before);
}

TEST(ProcessState, NamesWhatIsInAFolderInOrder)
{
    char folder[] = "/tmp/process_state_XXXXXX";
    ASSERT_TRUE(::mkdtemp(folder));
    for (const char* name : {"/sem.b_7", "/other", "/sem.a_7"})
        ::close(::open((std::string(folder) + name).c_str(), O_CREAT | O_WRONLY | O_CLOEXEC, 0600));
    EXPECT_THAT(names_in(folder), ElementsAre("other", "sem.a_7", "sem.b_7"));
    EXPECT_THAT(names_in(folder, "_7"), ElementsAre("sem.a_7", "sem.b_7"));
    for (const std::string& name : names_in(folder))
        ::unlink((std::string(folder) + '/' + name).c_str());
    EXPECT_THAT(names_in(folder), IsEmpty());
    ::rmdir(folder);
    EXPECT_THAT(names_in(folder), IsEmpty());
}

TEST(ProcessState, TellsMemoryInUse)
{
    EXPECT_GT(resident_kilobytes(), 100u);
#if !defined(__SANITIZE_ADDRESS__) && !defined(__SANITIZE_THREAD__)
    const std::size_t before = heap_bytes();
    void* block = std::malloc(1 << 20);
    *static_cast<volatile char*>(block) = 1;
    EXPECT_GE(heap_bytes(), before + (1 << 20));
    std::free(block);
#endif
}
