#include "agent/enumerate.h"

#include "agent/Agent_Wait.h"
#include "agent/guarded.h"
#include "foundation/CLogger.h"

namespace cimple {

namespace {

/// Clones `source` into `copies`; false if a clone was refused.
bool copyMap(const Instance_Map& source, Instance_Map& copies)
{
    for (std::size_t i = 0; i < source.size(); i++) {
        Ref<Instance> copy(clone(source[i]));
        if (copies.insert(copy.get()) < 0) {
            NVR_LOG("Insert failed for %u", static_cast<unsigned>(i));
            return false;
        }
        copy.release();
    }
    return true;
}

} // namespace

void enumeratePlain(ProviderAgent& agent, const Instance_Map& source, const Enum_Handler& handler)
{
    const bool done = guarded([&] {
        agent.BuildCimpleInfo();
        Instance_Map copies(source.meta_class());
        {
            Ready_Lock maps(agent.m_AdapterMapsReadyMutex, agent.m_bIsAdapterMapsReady, agent.m_AdapterMapsReadyCond,
                            nullptr);
            Auto_Mutex data(agent.m_DataMutex);
            if (!copyMap(source, copies)) return;
        }
        copies.hand_over(handler);
    });
    if (!done) NVR_LOG("Exception in CIM Provider Enumeration - do nothing");
}

void enumerateSAN(ProviderAgent& agent, const Instance_Map& source, const Enum_Handler& handler)
{
    const bool done = guarded([&] {
        {
            Auto_Mutex maps(agent.m_SANMapsReadyMutex);
            if (!agent.m_bIsSANMapsReady) agent.m_bSANRefreshPending.ask();
        }
        agent.BuildCimpleInfo();
        Instance_Map copies(source.meta_class());
        {
            Auto_Mutex maps(agent.m_SANMapsReadyMutex);
            if (!agent.m_bIsSANMapsReady) agent.waitForSANMaps();
            Auto_Mutex data(agent.m_DataMutex);
            if (!copyMap(source, copies)) return;
        }
        copies.hand_over(handler);
    });
    if (!done) NVR_LOG("Exception in SAN CIM Provider Enumeration - do nothing");
}

void enumerateActive(ProviderAgent& agent, const Instance_Map& source, const Enum_Handler& handler,
                     void (ProviderAgent::*refresh)(), Mutex& refresh_mutex)
{
    const bool done = guarded([&] {
        agent.BuildCimpleInfo();
        Instance_Map copies(source.meta_class());
        {
            Agent_Locks locks(agent, Words::silent);
            {
                Auto_Mutex mine(refresh_mutex);
                (agent.*refresh)();
            }
            if (!copyMap(source, copies)) return;
        }
        copies.hand_over(handler);
    });
    if (!done) NVR_LOG("Exception in Active CIM Provider Enumeration - do nothing");
}

} // namespace cimple
