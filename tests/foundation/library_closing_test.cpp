#include "foundation/library_closing.h"

#include <atomic>
#include <cstdlib>
#include <dlfcn.h>
#include <string>
#include <thread>
#include <unistd.h>

#include <gtest/gtest.h>

#include "foundation/management_binding.h"
#include "tests/foundation/fakes/fake_libraries.h"
#include "tests/support/private_host.h"

namespace {

using cimple::closeLibrary;
using cimple::Library_Closing;
using cimple::watchExit;

std::string library_file()
{
    return nvrtest::library_folder() + "/libHBAAPI.so";
}

bool is_mapped()
{
    void* library = ::dlopen(library_file().c_str(), RTLD_NOW | RTLD_NOLOAD);
    if (library) ::dlclose(library);
    return library != nullptr;
}

void* open_library()
{
    fake::install({"HBAAPI"});
    return ::dlopen(library_file().c_str(), RTLD_NOW);
}

void* library = nullptr;
std::atomic<bool> under_way{false};
std::atomic<bool> done{false};

} // namespace

TEST(LibraryClosing, IsDlcloseWhileTheProcessLives)
{
    library = open_library();
    ASSERT_NE(library, nullptr);
    ASSERT_TRUE(is_mapped());
    EXPECT_TRUE(Library_Closing().allowed());
    EXPECT_EQ(closeLibrary(library), 0);
    EXPECT_FALSE(is_mapped());
}

// What a child asks for first at its exit is done last.
TEST(LibraryClosing, IsWaitedForByAnExit)
{
    EXPECT_EXIT(
        {
            std::atexit([] { _exit(done ? 3 : 4); });
            watchExit();
            std::thread([] {
                const Library_Closing closing;
                under_way = true;
                while (closing.allowed())
                    std::this_thread::yield();
                done = true;
            }).detach();
            while (!under_way)
                std::this_thread::yield();
            std::exit(0);
        },
        testing::ExitedWithCode(3), "");
}

TEST(LibraryClosing, ThatNeverEndsHoldsNoExitUp)
{
    EXPECT_EXIT(
        {
            std::atexit([] { _exit(3); });
            watchExit();
            alarm(100);
            const Library_Closing closing;
            std::exit(0);
        },
        testing::ExitedWithCode(3), "");
}

TEST(LibraryClosing, LeavesToAnExitingProcessWhatIsOpen)
{
    EXPECT_EXIT(
        {
            library = open_library();
            std::atexit([] {
                const bool refused = !Library_Closing().allowed();
                const int result = closeLibrary(library);
                _exit(refused && result == 0 && is_mapped() ? 3 : 4);
            });
            watchExit();
            watchExit();
            std::exit(0);
        },
        testing::ExitedWithCode(3), "");
}

TEST(LibraryClosing, OfTheBoundLibrariesStopsAtAnExit)
{
    EXPECT_EXIT(
        {
            fake::install({"HBAAPI"});
            fake::calls().clear(); // it is made now, and so lives longer than what is asked for next
            std::atexit([] {
                fake::calls().clear();
                cimple::unloadLibraries();
                // The common library would close its vendors' ones.
                _exit(fake::calls().empty() && is_mapped() && cimple::HBA_GetNumberOfAdapters() == 0 ? 3 : 4);
            });
            cimple::loadLibraries();
            std::exit(0);
        },
        testing::ExitedWithCode(3), "");
}

TEST(LibraryClosing, EndsBeforeAnExitCallsAnythingOfALaterLoad)
{
    EXPECT_EXIT(
        {
            fake::install({"HBAAPI"});
            cimple::loadLibraries();
            cimple::unloadLibraries();
            std::atexit([] { _exit(Library_Closing().allowed() ? 4 : 3); });
            cimple::loadLibraries();
            std::exit(0);
        },
        testing::ExitedWithCode(3), "");
}

TEST(LibraryClosing, IsNotWatchedForOnceAllAreClosed)
{
    EXPECT_EXIT(
        {
            std::atexit([] { _exit(Library_Closing().allowed() ? 3 : 4); });
            fake::install({"HBAAPI"});
            cimple::loadLibraries();
            cimple::unloadLibraries();
            std::exit(0);
        },
        testing::ExitedWithCode(3), "");
}
