// The decision when to refresh, and the thread that does.
#include "agent/Agent_Wait.h"
#include "agent/Clock.h"
#include "agent/ProviderAgent.h"
#include "foundation/CLogger.h"
#include "inventory/NVR_Data.h"
#include "runtime/Forced_Unwind.h"
#include "runtime/Undisturbed.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

constexpr uint32 usec_per_minute = 60000000;

/// Under the flag's mutex.
void raise(std::atomic<bool>& ready, Cond& condition)
{
    ready = true;
    condition.broadcast();
}

/// Asks before it locks: who waits for the maps holds the mutex of the data, whose flag it has seen up.
void raise(std::atomic<bool>& ready, Mutex& mutex, Cond& condition)
{
    if (ready) return;
    Auto_Mutex lock(mutex);
    raise(ready, condition);
}

/// Counts a waiting thread, also one that is cancelled while it waits.
class Waiter {
public:
    explicit Waiter(std::atomic<uint32>& count) : m_count(count) { m_count++; }
    ~Waiter() { m_count--; }
    Waiter(const Waiter&) = delete;
    Waiter& operator=(const Waiter&) = delete;

private:
    std::atomic<uint32>& m_count;
};

} // namespace

int ProviderAgent::checkTimeOut()
{
    NVR_LOG("Checking if TimeOut...");
    const Datetime now = agent_now();
    char loaded_text[Datetime::text_size];
    char now_text[Datetime::text_size];
    m_loadedTime.ascii(loaded_text);
    now.ascii(now_text);
    NVR_LOG("loadedtime = %s; currenttime = %s; cache timeout = %d", loaded_text, now_text,
            static_cast<int>(m_cacheTimeout.load()));
    const uint64 elapsed = now.usec() - m_loadedTime.usec();
    const uint32 limit = m_cacheTimeout * usec_per_minute; // 32 bits: meant for 1 to 30 minutes
    const bool out = (elapsed >> 32) != 0 || static_cast<uint32>(elapsed) >= limit;
    if (out)
        NVR_LOG("PERF: TimeOut");
    else
        NVR_LOG("PERF: Refresh Not yet required");
    return out ? 1 : 0;
}

int ProviderAgent::BuildCimpleInfo()
{
    NVR_LOG("PERF: ---BuildCimpleInfo BEGIN---");
    if (!m_bLoaded) NVR_LOG("Norvane Provider dependent library load has failed..do nothing is the only option");
    bool started;
    {
        Auto_Mutex lock(m_DataFetchMutex);
        if (checkTimeOut() == 0 && !m_bAdapterRefreshPending && !m_bSANRefreshPending) {
            NVR_LOG("PERF: ---No timeout BuildCimpleInfo END---");
            return 0;
        }
        if (m_bDataFetchRunning) {
            NVR_LOG("PERF: ---DataFetch_Handler thread already running -BuildCimpleInfo END---");
            return 0;
        }
        started = startFetchThread();
    }
    if (!started) {
        raiseAdapterFlags();
        // The caller may hold m_DataMutex, which comes behind this one: who has it now and waits for the maps sees that
        // no thread runs, and raises the flag itself.
        if (m_SANMapsReadyMutex.try_lock() == 0) {
            raise(m_bIsSANMapsReady, m_SANMapsReadyCond);
            m_SANMapsReadyMutex.unlock();
        }
        return 0;
    }
    NVR_LOG("PERF: ---Created DataFetch_Handler thread -- BuildCimpleInfo END---");
    return 0;
}

/// Under m_DataFetchMutex, with no fetch thread running. The thread before is past its last look, so that its join is
/// short. Nobody cancels the caller between the flag and the thread that clears it.
bool ProviderAgent::startFetchThread()
{
    const Undisturbed undisturbed;
    m_bDataFetchRunning = true;
    bool created = false;
    guarded([&] { // the server's hook for new threads may throw
        if (!m_dataFetchThread.empty()) {
            NVR_LOG("PERF: Clearing the previous thread...with join");
            void* result;
            Thread::join(m_dataFetchThread, result);
            m_dataFetchThread.reset();
        }
        NVR_LOG("PERF: Creating DataFetch_Handler Thread.");
        created = Thread::create_joinable(m_dataFetchThread, &DataFetch_Handler, this) == 0;
    });
    if (created) return true;
    m_dataFetchThread.reset();
    m_bDataFetchRunning = false;
    return false;
}

/// For what no thread will raise: so that no caller waits for ever. The maps are as the last refresh left them.
void ProviderAgent::raiseAdapterFlags()
{
    raise(m_bIsAdapterDataReady, m_AdapterDataReadyMutex, m_AdapterDataReadyCond);
    raise(m_bIsAdapterMapsReady, m_AdapterMapsReadyMutex, m_AdapterMapsReadyCond);
}

bool ProviderAgent::hasFetchThread()
{
    Auto_Mutex lock(m_DataFetchMutex);
    return !m_dataFetchThread.empty();
}

void ProviderAgent::joinFetchThread()
{
    Thread thread;
    {
        Auto_Mutex lock(m_DataFetchMutex);
        if (m_dataFetchThread.empty()) return;
        if (m_bDataFetchRunning) NVR_LOG("PERF: Clearing the previous thread...with join");
        thread = m_dataFetchThread;
        m_dataFetchThread.reset();
    }
    void* result;
    Thread::join(thread, result);
}

void ProviderAgent::waitForSANMaps()
{
    const Waiter waiter(m_SANWaiters);
    bool served;
    {
        // The fetch thread's last look is under this mutex too: either it sees us, or we see that it is gone.
        Auto_Mutex lock(m_DataFetchMutex);
        served = m_bDataFetchRunning || startFetchThread();
    }
    if (served)
        m_SANMapsReadyCond.wait(m_SANMapsReadyMutex);
    else
        raise(m_bIsSANMapsReady, m_SANMapsReadyCond);
}

void* ProviderAgent::DataFetch_Handler(void* argument)
{
    NVR_LOG("PERF: DataFetch_Handler Thread BEGIN");
    auto* agent = static_cast<ProviderAgent*>(argument);
    if (agent) {
        markFetchThread();
        try {
            agent->fetchData();
        } catch (...) {
            agent->abandonFetch();
            if (is_forced_unwind()) throw;
        }
    } else
        NVR_LOG("Error in converting the pointer to ProviderAgent");
    NVR_LOG("PERF: DataFetch_Handler Thread END");
    return nullptr;
}

void ProviderAgent::fetchData()
{
    bool first = true; // this round also serves the time-out, later ones only what was asked meanwhile
    do {
        const bool adapters = (first && m_bRefreshAdapterData) || m_bAdapterRefreshPending;
        if (adapters) runAdapterPhase();
        const bool targets = (first || adapters) && m_bRefreshSANData;
        if (targets || m_bSANRefreshPending || SANMapsMissed()) runSANPhase();
        first = false;
    } while (!nothingLeftToFetch());
}

/// The thread ends inside a refresh, cancelled or for want of memory: the next call starts anew, and nobody waits.
void ProviderAgent::abandonFetch()
{
    // First the flags: once the thread counts as gone, a caller that holds their mutexes may join it.
    raiseAdapterFlags();
    raise(m_bIsSANMapsReady, m_SANMapsReadyMutex, m_SANMapsReadyCond);
    Auto_Mutex lock(m_DataFetchMutex);
    m_bDataFetchRunning = false;
}

bool ProviderAgent::SANMapsMissed() const
{
    return m_SANWaiters != 0 && !m_bIsSANMapsReady;
}

bool ProviderAgent::nothingLeftToFetch()
{
    Auto_Mutex lock(m_DataFetchMutex);
    if (m_bAdapterRefreshPending || m_bSANRefreshPending || SANMapsMissed()) return false;
    m_bDataFetchRunning = false;
    m_loadedTime = agent_now();
    return true;
}

void ProviderAgent::runAdapterPhase()
{
    NVR_LOG("PERF: Building Adapter Data...");
    uint32 asked = m_bAdapterRefreshPending.asked();
    {
        Auto_Mutex ready(m_AdapterDataReadyMutex);
        m_bIsAdapterDataReady = false;
        if (m_bLoaded)
            guarded([&] {
                Auto_Mutex data(m_DataMutex);
                asked = m_bAdapterRefreshPending.asked();
                m_pData->buildAdapterData();
            });
        m_bIsAdapterDataReady = true;
        m_AdapterDataReadyCond.broadcast();
    }
    {
        // Stale from here on, also if no SAN phase follows.
        Auto_Mutex ready(m_SANMapsReadyMutex);
        m_bIsSANMapsReady = false;
    }
    Auto_Mutex ready(m_AdapterMapsReadyMutex);
    m_bIsAdapterMapsReady = false;
    if (m_bLoaded)
        guarded([&] {
            Auto_Mutex data(m_DataMutex);
            NVR_LOG("PERF: Updating Adapter Maps...");
            updateAdapterMaps();
        });
    m_bIsAdapterMapsReady = true;
    m_bAdapterRefreshPending.settle(asked);
    m_AdapterMapsReadyCond.broadcast();
}

void ProviderAgent::runSANPhase()
{
    Ready_Lock adapterData(m_AdapterDataReadyMutex, m_bIsAdapterDataReady, m_AdapterDataReadyCond, nullptr);
    if (m_bLoaded)
        guarded([&] {
            Auto_Mutex data(m_DataMutex);
            NVR_LOG("PERF: Building SAN Data...");
            m_pData->buildSANData();
        });
    Ready_Lock adapterMaps(m_AdapterMapsReadyMutex, m_bIsAdapterMapsReady, m_AdapterMapsReadyCond, nullptr);
    Auto_Mutex ready(m_SANMapsReadyMutex);
    m_bIsSANMapsReady = false;
    // Whoever asks takes this mutex, so that what was asked until now is served by what follows.
    uint32 asked = m_bSANRefreshPending.asked();
    if (m_bLoaded)
        guarded([&] {
            Auto_Mutex data(m_DataMutex);
            asked = m_bSANRefreshPending.asked();
            NVR_LOG("PERF: Updating SAN Maps...");
            updateSANMaps();
        });
    m_bIsSANMapsReady = true;
    m_bSANRefreshPending.settle(asked);
    m_SANMapsReadyCond.broadcast();
}

} // namespace cimple
