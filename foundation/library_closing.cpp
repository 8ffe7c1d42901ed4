#include "foundation/library_closing.h"

#include <atomic>
#include <ctime>
#include <cxxabi.h>
#include <dlfcn.h>

#include "runtime/Undisturbed.h"

namespace cimple {

namespace {

// Either a thread that closes sees the exit, or the exit sees the thread.
std::atomic<int> under_way{0};
std::atomic<bool> exiting{false};

// What atexit registers stays until the module leaves the process; what has an owner of its own does not.
bool watched = false;
thread_local bool forgetting = false;

void wait_for_closings(void*)
{
    if (forgetting) return;
    const Undisturbed undisturbed; // a thread that was cancelled would leave its exit
    exiting = true;
    constexpr timespec pause = {0, 1000000};
    for (int tries = 0; under_way != 0 && tries < 100; tries++)
        ::nanosleep(&pause, nullptr);
}

} // namespace

int closeLibrary(void* library)
{
    const Library_Closing closing;
    return closing.allowed() ? ::dlclose(library) : 0;
}

Library_Closing::Library_Closing()
{
    under_way++;
}

Library_Closing::~Library_Closing()
{
    under_way--;
}

bool Library_Closing::allowed() const
{
    return !exiting;
}

void watchExit()
{
    if (!watched) watched = abi::__cxa_atexit(wait_for_closings, nullptr, &watched) == 0;
}

void forgetExit()
{
    const Library_Closing closing; // the same list is walked
    if (!watched || !closing.allowed()) return;
    forgetting = true;
    abi::__cxa_finalize(&watched);
    forgetting = false;
    watched = false;
}

} // namespace cimple
