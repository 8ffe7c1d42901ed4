// The module's memory: refuses the module each allocation once.
//
// A survey drives the module through a session and tells each place, by its call stack in the module, that asks for
// memory. Then there is one session for each of them, in a process of its own, whose first ask there is refused.
#include <algorithm>
#include <cstdio>
#include <cstring>
#include <exception>
#include <map>
#include <random>
#include <set>
#include <stdexcept>
#include <string>
#include <vector>

#include <CLI/CLI.hpp>

#include "tests/faults/Short_Run.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host_setup.h"

using namespace nvrtest;

namespace {

struct Options {
    std::string only;       ///< "site" or "site:time"; empty: all
    std::size_t sample = 0; ///< so many of all; 0: all
    std::uint64_t seed = 1;
    bool any_time = false; ///< a time by chance instead of the first
    bool lasting = false;
    unsigned jobs = 2;
    unsigned depth = 8;
    unsigned patience = 10;
    bool lists = false;
};

/// Stacks as a person reads them, one frame a line.
class Symbols {
public:
    std::string text(const Allocation_Site& site)
    {
        know({site});
        std::string text;
        for (const std::uintptr_t frame : site.stack)
            text += m_names[frame];
        return text;
    }
    /// Asks for all at once, which takes as long as for one.
    void know(const std::vector<Allocation_Site>& sites)
    {
        std::set<std::uintptr_t> unknown;
        for (const Allocation_Site& site : sites)
            for (const std::uintptr_t frame : site.stack)
                if (m_names.find(frame) == m_names.end()) unknown.insert(frame);
        std::vector<std::uintptr_t> frames(unknown.begin(), unknown.end());
        constexpr std::size_t at_once = 5000; // for the length of a command
        for (std::size_t i = 0; i < frames.size(); i += at_once)
            ask({frames.begin() + static_cast<std::ptrdiff_t>(i),
                 frames.begin() + static_cast<std::ptrdiff_t>(std::min(frames.size(), i + at_once))});
    }

private:
    void ask(const std::vector<std::uintptr_t>& frames)
    {
        std::string command = "addr2line -aCpfse " NVR_MODULE;
        for (const std::uintptr_t frame : frames) {
            command += " 0x" + hex(frame - 1); // in the call, not behind it
            m_names[frame] = "    0x" + hex(frame) + '\n';
        }
        std::FILE* lines = ::popen((command + " 2>/dev/null").c_str(), "r");
        if (!lines) return;
        char line[4096];
        for (const std::uintptr_t frame : frames)
            if (std::fgets(line, sizeof line, lines)) {
                const char* name = std::strstr(line, ": "); // behind the address
                m_names[frame] = std::string("    ") + (name ? name + 2 : line);
            }
        ::pclose(lines);
    }

    std::map<std::uintptr_t, std::string> m_names;
};

std::vector<Refused_Ask> asks_to_refuse(const Options& options, std::vector<Surveyed_Site> sites)
{
    std::mt19937_64 chance(options.seed);
    std::uint64_t only = 0, only_time = 1;
    if (!options.only.empty()) {
        only = std::stoull(options.only, nullptr, 16);
        const std::size_t colon = options.only.find(':');
        if (colon != std::string::npos) only_time = std::stoull(options.only.substr(colon + 1));
        sites.erase(std::remove_if(sites.begin(), sites.end(), [&](const auto& site) { return site.site.id != only; }),
                    sites.end());
        if (sites.empty()) throw std::runtime_error("no such place asks for memory: " + options.only);
    }
    if (options.sample && options.sample < sites.size()) {
        // From all over the session.
        for (std::size_t i = 0; i < options.sample; i++)
            std::swap(sites[i], sites[i + chance() % (sites.size() - i)]);
        sites.resize(options.sample);
    }
    std::vector<Refused_Ask> asks;
    for (const Surveyed_Site& site : sites) {
        const std::uint64_t time = only ? only_time : options.any_time ? 1 + chance() % site.site.asked : 1;
        // Most places ask first in their part, whatever comes before it; later times count from the load on.
        asks.push_back({site, time, options.lasting ? Refusal::lasting : Refusal::once, time != 1});
    }
    return asks;
}

class Campaign {
public:
    explicit Campaign(const Options& options)
        : m_options(options), m_patience(options.patience), m_surveys(hold_surveys(options.jobs, m_patience))
    {
    }

    int run()
    {
        const std::vector<Surveyed_Site>& sites = m_surveys.at("").sites;
        const std::vector<Refused_Ask> asks = asks_to_refuse(m_options, sites);
        if (m_options.lists) return list(sites);
        refuse_all(refuse_all(asks));
        std::uint64_t asked = 0;
        for (const Surveyed_Site& site : sites)
            asked += site.site.asked;
        std::printf(
            "%zu places asked for memory %llu times; %zu runs, %llu asks refused in %zu of them (%zu of a load, "
            "which was refused then), %zu failed\n",
            sites.size(), static_cast<unsigned long long>(asked), asks.size(),
            static_cast<unsigned long long>(m_refused), m_reached, m_idle, m_failed);
        // A few places depend on how threads meet; more of them would mean that nothing is refused any more.
        const bool has_reached_most = m_reached * 20 >= asks.size() * 19;
        if (!has_reached_most) std::puts("FAILED  too few of the places were reached");
        return m_failed == 0 && has_reached_most ? 0 : 1;
    }

private:
    int list(const std::vector<Surveyed_Site>& sites)
    {
        std::vector<Allocation_Site> all;
        for (const Surveyed_Site& site : sites)
            all.push_back(site.site);
        m_symbols.know(all);
        for (const Surveyed_Site& site : sites)
            std::printf("%s asks %llu times, first in %s\n%s", hex(site.site.id).c_str(),
                        static_cast<unsigned long long>(site.site.asked), site.part.c_str(),
                        m_symbols.text(site.site).c_str());
        return 0;
    }

    /// Result: those that were not reached in their part, to be refused in the session with all.
    std::vector<Refused_Ask> refuse_all(const std::vector<Refused_Ask>& asks)
    {
        std::vector<Run> runs;
        for (const Refused_Ask& ask : asks)
            runs.push_back(short_run(m_surveys, ask, m_patience));
        std::vector<Refused_Ask> missed;
        do_runs(runs, m_options.jobs, [&](std::size_t index, const Run_Result& result) {
            const Short_Outcome outcome = outcome_of(result);
            if (outcome.refused == 0 && result.failure.empty() && !asks[index].is_in_whole) {
                missed.push_back(asks[index]);
                missed.back().is_in_whole = true;
                return;
            }
            m_refused += outcome.refused;
            m_reached += outcome.refused != 0;
            m_idle += outcome.is_idle;
            if (!result.failure.empty()) {
                m_failed++;
                std::printf("FAILED  nvr_short_memory --depth %u%s --only %s\n%s  asked in %s, refused in %s, by\n%s\n",
                            m_options.depth, m_options.lasting ? " --lasting" : "", runs[index].name.c_str(),
                            readable(result.failure).c_str(), asks[index].place.part.c_str(), outcome.request.c_str(),
                            m_symbols.text(asks[index].place.site).c_str());
            }
            if (++m_done % 100 == 0) std::printf("%zu done, %zu failed\n", m_done, m_failed);
        });
        return missed;
    }

    /// With names in place of addresses.
    std::string readable(std::string failure)
    {
        for (std::size_t at = 0; (at = failure.find('@', at)) != std::string::npos; at++) {
            const std::size_t end = std::min(failure.find_first_not_of("0123456789abcdef", at + 1), failure.size());
            if (end - at < 5) continue;
            Allocation_Site site;
            site.stack = {std::stoul(failure.substr(at + 1, end - at - 1), nullptr, 16)};
            std::string name = m_symbols.text(site).substr(4);
            name.pop_back();
            failure.replace(at, end - at, name);
        }
        return failure;
    }

    const Options& m_options;
    const std::chrono::seconds m_patience;
    const Surveys m_surveys;
    Symbols m_symbols;
    std::size_t m_done = 0, m_reached = 0, m_idle = 0, m_failed = 0;
    std::uint64_t m_refused = 0;
};

} // namespace

int main(int argc, char** argv)
{
    Options options;
    CLI::App app("Refuses the module each allocation once: a session in a process of its own for each place that asks "
                 "for memory, told by its call stack.",
                 "nvr_short_memory");
    app.add_option("--only", options.only, "The place of that number alone, or its n-th ask (place:n)");
    app.add_option("--sample", options.sample, "So many places, chosen by the seed (all)");
    app.add_option("--seed", options.seed, "Of what is left to chance")->capture_default_str();
    app.add_flag("--any-time", options.any_time, "Refuse an ask by chance instead of each place's first");
    app.add_flag("--lasting", options.lasting, "Refuse all that follows too, until the end of the session's part");
    app.add_option("-j,--jobs", options.jobs, "Sessions at once")->capture_default_str()->check(CLI::Range(1, 64));
    app.add_option("--depth", options.depth, "Frames of the module that tell places apart")
        ->capture_default_str()
        ->check(CLI::Range(1, 16));
    app.add_option("--patience", options.patience, "Seconds that a step of a session may take")->capture_default_str();
    app.add_flag("--list", options.lists, "Only tell the places");
    CLI11_PARSE(app, argc, argv);
    std::setvbuf(stdout, nullptr, _IOLBF, 0);
    try {
        enter_private_host(argv);
        module_registrations(); // read once for all runs
        watch_memory_of(NVR_MODULE, options.depth);
        return Campaign(options).run();
    } catch (const std::exception& error) {
        std::fprintf(stderr, "nvr_short_memory: %s\n", error.what());
        return 2;
    }
}
