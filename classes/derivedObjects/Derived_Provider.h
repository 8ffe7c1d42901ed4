/// The provider of a class that does nothing but hand out what the agent has in its map of that class.
///
/// The generator names the family's members: `Family::Class`, `Family::name` ("<Class>_Provider") and `Family::file`
/// for the log, `Family::is_san` (the SAN phase fills the map) and `Family::map(agent)`. A provider has no state; what
/// it does is told once, below the template.
#pragma once

#include "agent/Read_Only_Provider.h"

namespace cimple {

/// What the functions behind the template know of a member.
struct Derived_Words {
    const char* name;
    const char* file;
};

/// Logs "<Class>_Provider::unload()" and gives the agent back. Result 0.
int unloadDerived(const Derived_Words& words);

/// Enumerates `source`, by its side's protocol, and then logs "<Class>_Provider::enum_instances()", whatever happened.
void enumerateDerived(const Derived_Words& words, ProviderAgent& agent, const Instance_Map& source, bool is_san,
                      const Enum_Handler& handler);

template <class Family>
class Derived_Provider : public Read_Only_Association_Provider<typename Family::Class> {
public:
    Unload_Status unload() { return static_cast<Unload_Status>(unloadDerived(words)); }

    Enum_Instances_Status enum_instances(const typename Family::Class*, const Enum_Handler& handler)
    {
        ProviderAgent& agent = *ProviderAgent::GetInstance();
        enumerateDerived(words, agent, Family::map(agent), Family::is_san, handler);
        return ENUM_INSTANCES_OK;
    }

private:
    static constexpr Derived_Words words{Family::name, Family::file};
};

} // namespace cimple
