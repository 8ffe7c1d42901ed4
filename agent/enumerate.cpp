#include "agent/enumerate.h"

#include <cstdint>

#include "agent/Agent_Wait.h"
#include "foundation/CLogger.h"
#include "runtime/Selection.h"
#include "runtime/guarded.h"

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

/// Takes, by their index, the elements of `source` that a selection wants, all without one; false where `take` gave up.
template <class Take>
bool takeWanted(const Instance_Map& source, Selection* selection, Take take)
{
    if (const Instance* key = selection ? selection->key() : nullptr) {
        const int found = source.find(key);
        if (found >= 0 && !take(static_cast<std::size_t>(found))) return false;
    } else {
        for (std::size_t i = 0; i < source.size(); i++)
            if ((!selection || selection->wants(source[i])) && !take(i)) return false;
    }
    if (selection) selection->asked_all();
    return true;
}

/// Clones what the handler's owner wants of `source` into `copies`; false if a clone was refused.
bool copyMap(const Instance_Map& source, Instance_Map& copies, const Enum_Handler& handler)
{
    Selection* selection = Selection::of(handler);
    return takeWanted(source, selection, [&](std::size_t i) { return copyOne(source, i, selection, copies); });
}

/// Asks for the memory of an element that is looked at soon. Its strings and arrays lie close behind it.
void prefetch(const Instance* instance, std::size_t size)
{
    constexpr std::size_t line = 64;
    const auto place = reinterpret_cast<std::uintptr_t>(instance); // what is behind it is no part of the object
    for (std::size_t i = 0; i < size; i += line)
        __builtin_prefetch(reinterpret_cast<const void*>(place + i));
}

/// Elements of a map that nobody writes to, each held by a count.
class Shared_Elements {
public:
    Shared_Elements() = default;
    Shared_Elements(const Shared_Elements&) = delete;
    Shared_Elements& operator=(const Shared_Elements&) = delete;
    ~Shared_Elements()
    {
        while (m_next < m_elements.size())
            unref(m_elements[m_next++]);
    }

    void take(const Instance_Map& source, Selection& selection)
    {
        takeWanted(source, &selection, [&](std::size_t i) {
            constexpr std::size_t ahead = 8;
            if (i + ahead < source.size()) prefetch(source[i + ahead], sizeof(Instance));
            m_elements.append(source[i]);
            ref(source[i]);
            return true;
        });
    }
    /// Each count becomes the handler's.
    void hand_over(const Enum_Handler& handler)
    {
        constexpr std::size_t ahead = 2, most = 2048;
        while (m_next < m_elements.size()) {
            if (m_next + ahead < m_elements.size()) prefetch(m_elements[m_next + ahead], most);
            handler.handle(m_elements[m_next++]);
        }
    }

private:
    Array<Instance*> m_elements;
    std::size_t m_next = 0;
};

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
        Shared_Elements shared; // an instance of this side is never written to once it is in its map
        {
            Auto_Mutex maps(agent.m_SANMapsReadyMutex);
            if (!agent.m_bIsSANMapsReady) agent.waitForSANMaps();
            Auto_Mutex data(agent.m_DataMutex);
            Selection* selection = Selection::of(handler);
            if (selection && selection->only_reads())
                shared.take(source, *selection);
            else if (!copyMap(source, copies, handler))
                return;
        }
        shared.hand_over(handler);
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
