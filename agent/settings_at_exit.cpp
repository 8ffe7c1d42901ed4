#include "agent/settings_at_exit.h"

#include <atomic>
#include <cstdlib>
#include <unistd.h>
#include <utility>

#include "foundation/CLogger.h"
#include "foundation/Management_Session.h"
#include "foundation/NvrConfigFile.h"
#include "runtime/Mutex.h"
#include "runtime/Undisturbed.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

// Held while the two files are written, and for moments.
Mutex mutex(false, "settings_at_exit", Lock_Place::innermost);
NvrConfigFile* living = nullptr;
std::atomic<pid_t> owner{0};
bool registered = false;

void save()
{
    const Undisturbed undisturbed; // a thread that was cancelled would leave its exit, and the lock with it
    if (owner != ::getpid() || !mutex.lock_soon()) return;
    if (living)
        guarded([] {
            Management_Session::forgetName();
            CLogger::instance()->saveSettingsAtExit();
            living->saveForGood();
        });
    mutex.unlock();
}

} // namespace

void saveAtExit(NvrConfigFile& config)
{
    const Auto_Mutex lock(mutex);
    living = &config;
    owner = ::getpid();
    if (!registered) registered = std::atexit(save) == 0;
}

void saveAtEnd()
{
    const Auto_Mutex lock(mutex);
    if (NvrConfigFile* config = std::exchange(living, nullptr)) {
        CLogger::instance()->saveSettingsAtEnd();
        config->saveForGood();
    }
}

} // namespace cimple
