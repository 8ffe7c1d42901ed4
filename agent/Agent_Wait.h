/// The lock protocol of all that reads or changes the maps, as objects that no path can forget to end.
///
/// Each flag is tested once and waited for once: after the wake-up it is not looked at again.
#pragma once

#include <atomic>

#include "agent/ProviderAgent.h"

namespace cimple {

/// Holds one ready mutex, its flag having been seen up or waited for. `name` (of the mutex, null: no words) is what the
/// log calls it.
class Ready_Lock {
public:
    Ready_Lock(Mutex& mutex, const std::atomic<bool>& ready, Cond& condition, const char* name);

private:
    Auto_Mutex m_lock;
};

enum class Words { spoken, silent };

/// Holds m_AdapterDataReadyMutex, m_AdapterMapsReadyMutex and m_DataMutex, taken in this order.
class Agent_Locks {
public:
    Agent_Locks(ProviderAgent& agent, Words words);

private:
    Ready_Lock m_adapterData;
    Ready_Lock m_adapterMaps;
    Auto_Mutex m_data;
};

/// What every operation on the maps outside an enumeration opens with: the refresh gate, then the three locks with
/// their words in the log.
class Agent_Wait {
public:
    explicit Agent_Wait(ProviderAgent& agent);

private:
    const int m_gate;
    Agent_Locks m_locks;
};

} // namespace cimple
