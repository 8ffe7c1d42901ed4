// Who holds the agent: the process-wide pointer, the counts, and the last release.
#include <cerrno>

#include "agent/ProviderAgent.h"
#include "foundation/CLogger.h"
#include "runtime/Registration.h"

namespace cimple {

namespace {

Mutex lifetime_mutex(false);
ProviderAgent* the_agent = nullptr;
std::atomic<sint32> reference_count{0};
uint32 refused_count = 0; // loads that were answered 30 and will be unloaded all the same
uint32 releasing = 0;     // threads that wait in a last release

thread_local bool on_fetch_thread = false;

bool in_use()
{
    return reference_count > 0 || refused_count > 0;
}

} // namespace

ProviderAgent* ProviderAgent::lockedInstance()
{
    if (!the_agent) the_agent = new ProviderAgent(errno);
    return the_agent;
}

ProviderAgent* ProviderAgent::GetInstance()
{
    Auto_Mutex lock(lifetime_mutex);
    return lockedInstance();
}

int ProviderAgent::load()
{
    Auto_Mutex lock(lifetime_mutex);
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
    Auto_Mutex lock(lifetime_mutex);
    reference_count++;
}

// All loads of one agent are accepted or all are refused, since m_bLoaded only falls when nobody is left: so the count
// that is not empty is the one that the caller's load raised.
void ProviderAgent::releaseRef()
{
    NVR_LOG("ProviderAgent::releaseRef[%d]", reference_count.load());
    Auto_Mutex lock(lifetime_mutex);
    if (reference_count > 0)
        reference_count--;
    else if (refused_count > 0)
        refused_count--;
    if (in_use() || !the_agent || on_fetch_thread) return;

    // The fetch thread's up-call may come back to a provider of ours, whose load needs the lifetime mutex: wait without
    // it. `releasing` keeps the agent for us if another thread loads and releases meanwhile.
    releasing++;
    while (!in_use() && the_agent->hasFetchThread()) {
        lifetime_mutex.unlock();
        the_agent->joinFetchThread();
        lifetime_mutex.lock();
    }
    releasing--;
    if (in_use() || releasing > 0) return;
    delete the_agent;
    the_agent = nullptr;
}

void ProviderAgent::markFetchThread()
{
    on_fetch_thread = true;
}

} // namespace cimple
