/// One session of the module in a process of its own, in which an allocation of the module's is refused; and what was
/// wrong with the module after it.
///
///     Short_Runs runs;                                  // in a private host, with no other thread
///     const Short_Run survey = runs.survey();           // refuses none, and tells all places
///     const Short_Run ended = runs.run({site, 1, Refusal::once});
///     if (!ended.findings.empty()) ...
///
/// After the session the host is made sound; then another thread asks for every class after a refresh, which must
/// publish what the survey saw; the module is unloaded, loaded anew, asked and unloaded again. In the end it must hold
/// as many blocks, files, semaphores and threads as in the survey.
#pragma once

#include <chrono>
#include <cstdint>
#include <string>
#include <vector>

#include "tests/faults/Module_Memory.h"

namespace nvrtest {

/// Which ask of which place is refused.
struct Refused_Ask {
    Allocation_Site site; ///< its number and its innermost frame
    std::string part;     ///< of the session: with the load and the unload the whole of it; empty: all parts
    std::uint64_t time = 1;
    Refusal refusal = Refusal::once;
};

/// A place that asked in the survey.
struct Surveyed_Site {
    Allocation_Site site;
    std::string part; ///< of the session, in which it asked first
};

struct Short_Run {
    std::vector<std::string> findings; ///< "@" and a hexadecimal number is an address in the module
    std::uint64_t refused = 0;         ///< 0: the session did not come there
    bool is_idle = false;              ///< its load was refused, so that it published nothing
    std::string place;                 ///< the request under way when it was refused
    std::vector<Surveyed_Site> sites;  ///< of a survey
};

class Short_Runs {
public:
    /// `frames` tell places apart. A process that tells nothing new for so long is ended and reported. Throws
    /// std::runtime_error if the module cannot be loaded.
    Short_Runs(std::size_t frames, std::chrono::seconds patience);

    /// Must come first, once. Throws std::runtime_error if the module does not live through a session without refusal.
    Short_Run survey();
    Short_Run run(const Refused_Ask& refused);

private:
    template <class Act>
    Short_Run in_process(Act act);

    const std::chrono::seconds m_patience;
};

} // namespace nvrtest
