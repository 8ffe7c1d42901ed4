/// Sessions of the module in which an allocation of the module's is refused, and what was wrong with the module after
/// it.
///
///     watch_memory_of(NVR_MODULE, 8);                // in a private host, with no other thread
///     const Surveys surveys = hold_surveys(2, 10s);  // refuse none, and tell all places
///     const Run run = short_run(surveys, {surveys.at("").sites.front()}, 10s);
///
/// After the session the host is made sound; then another thread asks for every class after a refresh, which must
/// publish what the survey saw; the module is unloaded, loaded anew, asked and unloaded again. In the end it must hold
/// as many blocks, files, semaphores and threads as in the survey.
#pragma once

#include <chrono>
#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "tests/faults/Module_Memory.h"
#include "tests/faults/Runs.h"

namespace nvrtest {

/// A place that asked in a survey.
struct Surveyed_Site {
    Allocation_Site site; ///< as it was at the end of the session
    std::string part;     ///< of the session, in which it asked first
};

/// Blocks that are held, by the innermost frame that asked for them.
using Blocks = std::map<std::uintptr_t, std::int64_t>;

/// What the module does when nothing is refused.
struct Survey {
    std::vector<Surveyed_Site> sites; ///< in the order of their first ask
    std::string published;
    Blocks first, second; ///< after the unload of each load
};

/// By the part of the session that comes between the load and the unload; under "" that with all parts.
using Surveys = std::map<std::string, Survey>;

/// A step that takes longer than `patience` ends a run. Throws std::runtime_error if the module does not live through a
/// session without a refusal.
Surveys hold_surveys(unsigned at_once, std::chrono::milliseconds patience);

/// Which ask of which place is refused.
struct Refused_Ask {
    Surveyed_Site place;
    std::uint64_t time = 1; ///< from 1, in its session
    Refusal refusal = Refusal::once;
    bool is_in_whole = false; ///< in the session with all parts; else with the place's alone
};

/// Named PLACE:TIME. In its failure "@" and a hexadecimal number is an address in the module. The surveys must outlive
/// it.
Run short_run(const Surveys& surveys, const Refused_Ask& ask, std::chrono::milliseconds patience);

/// What such a run did.
struct Short_Outcome {
    std::uint64_t refused = 0; ///< asks; 0: the session did not come there
    bool is_idle = false;      ///< its load was refused, so that it published nothing
    std::string request;       ///< under way when it was refused
};
/// All zero of a run that did not come to its end.
Short_Outcome outcome_of(const Run_Result& result);

std::string hex(std::uint64_t number);

} // namespace nvrtest
