/// Runs that may end their process or never end, told one by one: each has a process and a private host of its own, up
/// to so many at once, and a watch on its progress.
///
///     do_runs({{"a run", 10s, [](Run_Watch& watch) { ... watch.complain("the lock is held"); }}}, 2, tell);
///
/// For programs with a private host that have started no thread. What a run prints goes nowhere unless it fails.
#pragma once

#include <atomic>
#include <chrono>
#include <cstddef>
#include <functional>
#include <string>
#include <vector>

namespace nvrtest {

/// What a run says of itself. Any thread of it.
class Run_Watch {
public:
    /// What it is about to do: it has its patience for that anew.
    void step(const std::string& what);
    /// It has failed, and goes on.
    void complain(const std::string& why);
    /// A text for whoever started it.
    void tell(const std::string& text);

private:
    friend class One_Run;
    // In memory that both processes see.
    struct Shared {
        std::atomic<unsigned> steps{0};
        char newest[240] = {};
    };
    Run_Watch(Shared* shared, int channel) : m_shared(shared), m_channel(channel) {}
    void send(char kind, const std::string& text);

    Shared* const m_shared;
    const int m_channel;
};

struct Run {
    std::string name;
    /// How long a step may take; up to the first one it is a minute.
    std::chrono::milliseconds patience;
    std::function<void(Run_Watch&)> work;
};

struct Run_Result {
    std::string told; ///< by Run_Watch::tell
    /// Why it failed, a line for each reason, and the end of what it printed; empty: it did not.
    std::string failure;
};

/// Does the run in a process of its own. A run has failed if it complained, threw, ended its process with anything but
/// 0 (a sanitizer does so), or took longer for a step than its patience: then it is killed.
/// `prints`: what it prints goes to standard error.
Run_Result do_run(const Run& run, bool prints = false);

/// Does them all, up to `at_once` at a time; `done` is asked after each, in the order in which they end.
void do_runs(const std::vector<Run>& runs, unsigned at_once,
             const std::function<void(std::size_t index, const Run_Result&)>& done);

} // namespace nvrtest
