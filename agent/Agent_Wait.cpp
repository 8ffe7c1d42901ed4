#include "agent/Agent_Wait.h"

#include "foundation/CLogger.h"

namespace cimple {

Ready_Lock::Ready_Lock(Mutex& mutex, const std::atomic<bool>& ready, Cond& condition, const char* name) : m_lock(mutex)
{
    if (ready) return;
    if (name) NVR_LOG("PERF: Waiting for %s", name);
    condition.wait(mutex);
    if (name) NVR_LOG("PERF: Woken up from wait for %s", name);
}

Agent_Locks::Agent_Locks(ProviderAgent& agent, Words words)
    : m_adapterData(agent.m_AdapterDataReadyMutex, agent.m_bIsAdapterDataReady, agent.m_AdapterDataReadyCond,
                    words == Words::spoken ? "m_AdapterDataReadyMutex" : nullptr),
      m_adapterMaps(agent.m_AdapterMapsReadyMutex, agent.m_bIsAdapterMapsReady, agent.m_AdapterMapsReadyCond,
                    words == Words::spoken ? "m_AdapterMapsReadyMutex" : nullptr),
      m_data(agent.m_DataMutex)
{
}

Agent_Wait::Agent_Wait(ProviderAgent& agent) : m_gate(agent.BuildCimpleInfo()), m_locks(agent, Words::spoken) {}

} // namespace cimple
