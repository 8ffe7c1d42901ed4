// Who holds the agent: the process-wide pointer, the counts, and the last release.
#include <cerrno>

#include "agent/ProviderAgent.h"
#include "foundation/CLogger.h"
#include "runtime/Registration.h"
#include "runtime/Undisturbed.h"

namespace cimple {

namespace {

Mutex lifetime_mutex(false, "lifetime_mutex", Lock_Place::lifetime);
ProviderAgent* the_agent = nullptr;
std::atomic<sint32> reference_count{0};
std::atomic<sint32> refused_count{0}; // loads that were answered 30 and will be unloaded all the same
uint32 releasing = 0;                 // threads that wait in a last release

thread_local bool on_fetch_thread = false;

/// Holds the lifetime mutex, but on the fetch thread: an up-call that comes back holds the agent's locks already, which
/// the agent's end takes under this mutex. No lock is needed there, since the agent outlives its fetch thread.
class Lifetime_Lock {
public:
    Lifetime_Lock()
    {
        if (!on_fetch_thread) lifetime_mutex.lock();
    }
    ~Lifetime_Lock()
    {
        if (!on_fetch_thread) lifetime_mutex.unlock();
    }
    Lifetime_Lock(const Lifetime_Lock&) = delete;
    Lifetime_Lock& operator=(const Lifetime_Lock&) = delete;
};

/// Counts down, but not below 0: false if it was there.
bool take_one(std::atomic<sint32>& count)
{
    sint32 before = count;
    while (before > 0)
        if (count.compare_exchange_weak(before, before - 1)) return true;
    return false;
}

bool in_use()
{
    return reference_count > 0 || refused_count > 0;
}

} // namespace

ProviderAgent* ProviderAgent::lockedInstance()
{
    if (the_agent) return the_agent;
    // Cut short, it would leave a settings file half read for the end to write, and an agent that is gone for an exit.
    const Undisturbed undisturbed;
    return the_agent = new ProviderAgent(errno);
}

ProviderAgent* ProviderAgent::GetInstance()
{
    const Lifetime_Lock lock;
    return lockedInstance();
}

int ProviderAgent::load()
{
    const Lifetime_Lock lock;
    if (!lockedInstance()->m_bLoaded) {
        refused_count++;
        return LOAD_FAILED;
    }
    NVR_LOG("ProviderAgent::addRef[%d]", reference_count.load());
    reference_count++;
    return LOAD_OK;
}

int ProviderAgent::unload()
{
    releaseRef();
    return UNLOAD_OK;
}

void ProviderAgent::addRef()
{
    NVR_LOG("ProviderAgent::addRef[%d]", reference_count.load());
    const Lifetime_Lock lock;
    reference_count++;
}

// All loads of one agent are accepted or all are refused, since m_bLoaded only falls when nobody is left: so the count
// that is not empty is the one that the caller's load raised.
void ProviderAgent::releaseRef()
{
    NVR_LOG("ProviderAgent::releaseRef[%d]", reference_count.load());
    const Lifetime_Lock lock;
    if (!take_one(reference_count)) take_one(refused_count);
    if (on_fetch_thread || in_use() || !the_agent) return;

    // The fetch thread's up-call may have a provider of ours loaded by another thread of the server, which needs the
    // lifetime mutex: wait without it. `releasing` keeps the agent for us if such a thread loads and releases
    // meanwhile.
    const Undisturbed undisturbed;
    releasing++;
    bool used;
    while (!(used = in_use()) && the_agent->hasFetchThread()) {
        lifetime_mutex.unlock();
        the_agent->joinFetchThread();
        lifetime_mutex.lock();
    }
    releasing--;
    if (used || releasing > 0) return;
    const Unreachable_Locks the_agents; // no call and no thread is left that could hold one
    delete the_agent;
    the_agent = nullptr;
}

void ProviderAgent::markFetchThread()
{
    on_fetch_thread = true;
}

} // namespace cimple
