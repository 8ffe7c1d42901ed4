/// The three ways to enumerate a map: copy it under the agent's locks, let go of them, hand the copies out.
///
/// Where the handler's owner has told what it will look at (runtime/Selection.h), no more than that is copied; and of
/// the SAN side, whose instances are never written to once they are in their map, nothing for one that only reads: it
/// gets a count of each. The handler owns each instance it gets, and runs with no lock held. A copy that is refused
/// ends the enumeration with a line in the log and nothing handed out. Nothing is thrown: an exception ends the
/// enumeration with a line.
#pragma once

#include "agent/ProviderAgent.h"
#include "runtime/Immortal.h"

namespace cimple {

/// For the classes of the adapter side.
void enumeratePlain(ProviderAgent& agent, const Instance_Map& source, const Enum_Handler& handler);

/// For the classes that the SAN phase fills: asks for that phase if they are not ready, and waits for it.
void enumerateSAN(ProviderAgent& agent, const Instance_Map& source, const Enum_Handler& handler);

/// For classes with live values: `refresh` writes them into the source map first, under `refresh_mutex`.
void enumerateActive(ProviderAgent& agent, const Instance_Map& source, const Enum_Handler& handler,
                     void (ProviderAgent::*refresh)(), Mutex& refresh_mutex);

/// The same with a mutex of its own for each refresh.
template <void (ProviderAgent::*refresh)()>
void enumerateActive(ProviderAgent& agent, const Instance_Map& source, const Enum_Handler& handler)
{
    static Immortal<Mutex> refresh_mutex(true, "refresh_mutex", Lock_Place::live_values);
    enumerateActive(agent, source, handler, refresh, *refresh_mutex);
}

} // namespace cimple
