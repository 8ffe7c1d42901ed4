// Everything that the libraries can do wrong, once: see README.md.
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <exception>
#include <iostream>
#include <random>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "tests/faults/Trials.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host_setup.h"

namespace {

using namespace nvrtest;

struct Wanted {
    bool is_all = false, is_list = false, is_absent = false, is_first = false;
    std::size_t sample = 0, skip = 0;
    std::uint64_t seed = 1;
    std::string only;
    unsigned at_once = 2;
    unsigned patience = usual_patience.count(); // seconds
};

// Of a call that fails: the way in which it does.
std::string kind_of(const Run& run)
{
    return run.name.find('#') == std::string::npos ? std::string() : run.name.substr(run.name.rfind(':'));
}

// In an order by the seed, one of each kind first, those behind the skipped ones. The same on every machine, unlike
// std::shuffle.
std::vector<Run> sample_of(std::vector<Run> runs, const Wanted& wanted)
{
    std::mt19937_64 chance(wanted.seed);
    for (std::size_t i = 0; i < runs.size(); i++)
        std::swap(runs[i], runs[i + chance() % (runs.size() - i)]);
    std::set<std::string> kinds;
    std::stable_partition(runs.begin(), runs.end(), [&](const Run& run) { return kinds.insert(kind_of(run)).second; });
    const std::size_t from = std::min(wanted.skip, runs.size()), to = std::min(from + wanted.sample, runs.size());
    return {runs.begin() + static_cast<std::ptrdiff_t>(from), runs.begin() + static_cast<std::ptrdiff_t>(to)};
}

// Result: how many failed.
std::size_t make(const std::vector<Run>& runs, unsigned at_once, const std::string& what)
{
    std::size_t done = 0, failed = 0, same = 0;
    const auto start = std::chrono::steady_clock::now();
    do_runs(runs, at_once, [&](std::size_t index, const Run_Result& result) {
        done++;
        same += result.told == changed_nothing;
        if (!result.failure.empty()) {
            failed++;
            std::printf("FAILED  nvr_faults --only '%s'\n%s\n", runs[index].name.c_str(), result.failure.c_str());
        }
        if (done % 100 == 0) std::printf("%zu of %zu, %zu failed\n", done, runs.size(), failed);
    });
    const auto seconds = std::chrono::duration_cast<std::chrono::seconds>(std::chrono::steady_clock::now() - start);
    std::printf("%s: %zu runs, %zu of which changed what the module met; %zu failed, in %lld s\n", what.c_str(), done,
                done - same, failed, static_cast<long long>(seconds.count()));
    return failed;
}

int run_only(const std::vector<Run>& runs, const std::string& name)
{
    for (const Run& run : runs) {
        if (run.name != name) continue;
        const Run_Result result = do_run(run, true);
        std::printf("%s\n%s", result.failure.empty() ? "outlived" : "FAILED", result.failure.c_str());
        return result.failure.empty() ? 0 : 1;
    }
    throw std::runtime_error("there is no run " + name + ": see --list");
}

int run(const Wanted& wanted)
{
    module_registrations(); // read once for all runs, as is the schema
    const Sound_Session sound = Sound_Session::hold(std::chrono::seconds(wanted.patience));
    const std::vector<Run> calls = library_call_trials(sound), missing = missing_symbol_trials(sound);
    std::printf("%llu library calls of %zu operations in a session, %zu kinds of failure: %zu runs, without those that "
                "can change nothing of a call; %zu runs without a symbol or a library\n",
                static_cast<unsigned long long>(sound.all_calls()), sound.calls.size(), failure_kinds().size(),
                calls.size(), missing.size());
    std::printf("not called in a session:");
    for (const std::string& name : sound.not_called())
        std::printf(" %s", name.c_str());
    std::printf("\n");
    std::vector<Run> all = wanted.is_absent ? std::vector<Run>() : calls;
    all.insert(all.end(), missing.begin(), missing.end());
    if (wanted.is_first)
        all.erase(std::remove_if(all.begin(), all.end(),
                                 [](const Run& run) { return run.name.find("#1:") == std::string::npos; }),
                  all.end());
    if (wanted.is_list)
        for (const Run& run : all)
            std::printf("%s\n", run.name.c_str());
    if (!wanted.only.empty()) return run_only(all, wanted.only);
    if (wanted.sample > 0) {
        const std::vector<Run> sample = sample_of(all, wanted);
        if (sample.empty()) throw std::runtime_error("there are no more than " + std::to_string(all.size()) + " runs");
        return make(sample, wanted.at_once, "a sample by the seed " + std::to_string(wanted.seed)) > 0;
    }
    if (wanted.is_first) return make(all, wanted.at_once, "the first call of each operation") > 0;
    if (!wanted.is_all && !wanted.is_absent) return 0;
    std::size_t failed = make(missing, wanted.at_once, "without a symbol or a library");
    if (wanted.is_all) {
        const auto slow = calls.end() - static_cast<std::ptrdiff_t>(sleeping_trials(sound));
        failed += make({calls.begin(), slow}, wanted.at_once, "a call that fails");
        failed += make({slow, calls.end()}, 4 * wanted.at_once, "a call that takes two seconds");
    }
    return failed > 0;
}

} // namespace

int main(int argc, char** argv)
{
    CLI::App app("Holds a session of the module once for each library call in it and each way in which that can fail, "
                 "and for each symbol and library that can be missing.");
    Wanted wanted;
    CLI::Option* all = app.add_flag("--all", wanted.is_all, "All of them");
    app.add_flag("--absent", wanted.is_absent, "Of what is missing alone")->excludes(all);
    app.add_flag("--first", wanted.is_first, "Of the first call of each operation alone")->excludes(all);
    CLI::Option* sample = app.add_option("--sample", wanted.sample, "So many of them")->excludes(all);
    app.add_option("--seed", wanted.seed, "Which, with --sample")->needs(sample)->capture_default_str();
    app.add_option("--skip", wanted.skip, "Behind so many others of that seed")->needs(sample);
    app.add_option("--only", wanted.only, "This one, with what it prints");
    app.add_flag("--list", wanted.is_list, "Print their names");
    app.add_option("--at-once", wanted.at_once, "Up to so many at a time")
        ->check(CLI::Range(1, 64))
        ->capture_default_str();
    app.add_option("--patience", wanted.patience, "Seconds that a request may take")
        ->check(CLI::Range(1, 3600))
        ->capture_default_str();
    CLI11_PARSE(app, argc, argv);
    std::setvbuf(stdout, nullptr, _IOLBF, 0);
    try {
        nvrtest::enter_private_host(argv);
        return run(wanted);
    } catch (const std::exception& error) {
        std::cerr << "nvr_faults: " << error.what() << '\n';
        return 2;
    }
}
