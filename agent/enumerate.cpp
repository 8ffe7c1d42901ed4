#include "agent/enumerate.h"

#include "agent/Agent_Wait.h"
#include "agent/guarded.h"
#include "foundation/CLogger.h"
#include "runtime/Selection.h"

namespace cimple {

namespace {

Instance* cloneFor(const Selection* selection, const Instance* element)
{
    if (!selection || selection->values() == Selection::Values::all) return clone(element);
    return selection->values() == Selection::Values::keys ? clone_keys(element) : clone_with_keys_of_ends(element);
}

/// Clones the element at `index` of `source` into `copies`; false if the clone was refused.
bool copyOne(const Instance_Map& source, std::size_t index, const Selection* selection, Instance_Map& copies)
{
    Ref<Instance> copy(cloneFor(selection, source[index]));
    if (copies.insert(copy.get()) < 0) {
        NVR_LOG("Insert failed for %u", static_cast<unsigned>(index));
        return false;
    }
    copy.release();
    return true;
}

/// Clones what the handler's owner wants of `source` into `copies`; false if a clone was refused.
bool copyMap(const Instance_Map& source, Instance_Map& copies, const Enum_Handler& handler)
{
    Selection* selection = Selection::of(handler);
    if (const Instance* key = selection ? selection->key() : nullptr) {
        const int found = source.find(key);
        if (found >= 0) copyOne(source, static_cast<std::size_t>(found), selection, copies);
    } else {
        for (std::size_t i = 0; i < source.size(); i++) {
            if (selection && !selection->wants(source[i])) continue;
            if (!copyOne(source, i, selection, copies)) return false;
        }
    }
    if (selection) selection->asked_all();
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
            if (!copyMap(source, copies, handler)) return;
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
            if (!copyMap(source, copies, handler)) return;
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
            if (!copyMap(source, copies, handler)) return;
        }
        copies.hand_over(handler);
    });
    if (!done) NVR_LOG("Exception in Active CIM Provider Enumeration - do nothing");
}

} // namespace cimple
