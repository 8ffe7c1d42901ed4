/// What happens to the adapters while clients ask: links go down and up, events come, the libraries fail, lie, throw,
/// are slow or lose an adapter, the cache grows old, the server unloads what is idle.
///
/// One thread at a time. Nobody stops or restarts the host's server meanwhile.
#pragma once

#include <string>
#include <vector>

#include "tests/module/support/Rig.h"
#include "tests/soak/Counts.h"
#include "tests/soak/Random.h"
#include "tests/soak/Season.h"
#include "tests/support/Watch.h"

namespace soak {

class Trouble {
public:
    /// `calls`: the operations of the libraries that may fail. Nobody acts while the season changes.
    Trouble(nvrtest::Rig& rig, nvrtest::Watch& watch, Counts& counts, const Season& season,
            std::vector<std::string> calls);

    /// One thing that happens.
    void act(Random& random);
    /// The host as it was loaded, without faults. True if the module may have been loaded while there were some: it
    /// needs a new life to see the host as it is.
    bool end();

private:
    void add_fault(Random& random);
    void unload(bool with_faults);
    void clear_faults();

    nvrtest::Rig& m_rig;
    nvrtest::Watch& m_watch;
    Counts& m_counts;
    const Season& m_season;
    const std::vector<std::string> m_calls;
    bool m_is_spoiled = false;
};

} // namespace soak
