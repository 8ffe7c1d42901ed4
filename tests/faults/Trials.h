/// What can fail about the libraries, each once: every call of a session in every way, every symbol and library that
/// the module looks for.
///
/// A trial is a whole session with that failure, and then: each class answers, on threads of their own; a refresh of
/// the sound host publishes what it does in a session without a failure; nothing stays behind after the unload, no
/// thread, descriptor, handle or callback; a second load publishes the same again.
#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>
#include <map>
#include <string>
#include <vector>

#include "tests/faults/Runs.h"
#include "tests/support/simulator.h"

namespace nvrtest {

/// How long a request may take where no library is slow: longer than any does on a busy machine.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr std::chrono::seconds usual_patience{50};
#else
constexpr std::chrono::seconds usual_patience{10};
#endif

/// What a session without a failure does.
struct Sound_Session {
    struct Calls {
        std::uint64_t until_unload = 0, in_unload = 0;
        /// For each call, which kinds of failure can change something of it: bits in the order of failure_kinds().
        std::vector<std::uint32_t> changing;
    };
    std::map<std::string, Calls> calls; ///< by the name of the operation
    /// Handles of the libraries that are open.
    struct Handles {
        std::size_t until_unload = 0, after_unload = 0, after_second_unload = 0;
    } handles;
    std::string published;
    std::chrono::seconds patience = usual_patience; ///< that each trial has with a request

    std::uint64_t all_calls() const;
    /// Operations that the module binds and that no request without a failure calls, in alphabetical order.
    std::vector<std::string> not_called() const;
    /// Held in a process of its own. Throws std::runtime_error if it is not sound.
    static Sound_Session hold(std::chrono::seconds patience = usual_patience);
};

/// The ways in which a call fails.
struct Failure_Kind {
    Library_Failure failure;
    bool is_slow;
};
const std::vector<Failure_Kind>& failure_kinds();

/// A trial for each call of the session and each kind that can change something of it, named CALL#N:KIND: the Nth call
/// of that name fails. Those that wait come last. The session must outlive them.
std::vector<Run> library_call_trials(const Sound_Session& sound);
/// What such a run tells if the failure has changed nothing after all: the caller had the same number, zeros for zeros.
extern const char changed_nothing[];
/// How many of them, at the end, mostly sleep.
std::size_t sleeping_trials(const Sound_Session& sound);

/// A trial for each name that the module may look up, named LIBRARIES:LIBRARY-SYMBOL, where LIBRARIES are those that
/// are installed; and one for each set of libraries, named LIBRARIES. In each the libraries are made whole while the
/// module is loaded, and found by the next load.
std::vector<Run> missing_symbol_trials(const Sound_Session& sound);

} // namespace nvrtest
