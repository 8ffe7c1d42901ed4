// nvr_short_memory: refuses the module each allocation once.
//
// A survey drives the module through a session and tells each place, by its call stack in the module, that asks for
// memory. Then there is one session for each of them, in a process of its own, whose first ask there is refused.
#include <algorithm>
#include <atomic>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <fcntl.h>
#include <iostream>
#include <map>
#include <memory>
#include <mutex>
#include <random>
#include <set>
#include <sstream>
#include <stdexcept>
#include <string>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>
#include <vector>

#include <CLI/CLI.hpp>

#include "tests/faults/Short_Run.h"
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
    bool works = false; ///< a worker
};

std::string hex(std::uint64_t number)
{
    std::ostringstream text;
    text << std::hex << number;
    return text.str();
}

// --- The worker: it has the private host, and makes one run for each line on its standard input.

int work(const Options& options)
{
    std::FILE* answers = ::fdopen(::dup(STDOUT_FILENO), "w");
    const auto tell = [&](const Short_Run& run) {
        for (const Surveyed_Site& site : run.sites) {
            std::fprintf(answers, "site %s\t%s %llu", site.part.c_str(), hex(site.site.id).c_str(),
                         static_cast<unsigned long long>(site.site.asked));
            for (const std::uintptr_t frame : site.site.stack)
                std::fprintf(answers, " %s", hex(frame).c_str());
            std::fputc('\n', answers);
        }
        for (const std::string& finding : run.findings)
            std::fprintf(answers, "finding %s\n", finding.c_str());
        std::fprintf(answers, "end %llu %d %s\n", static_cast<unsigned long long>(run.refused), run.is_idle,
                     run.place.c_str());
        std::fflush(answers);
    };
    Short_Runs runs(options.depth, std::chrono::seconds(options.patience));
    tell(runs.survey());
    for (std::string line; std::getline(std::cin, line);) {
        Refused_Ask refused;
        bool lasting = false;
        std::uintptr_t frame = 0;
        std::istringstream(line) >> std::hex >> refused.site.id >> frame >> std::dec >> refused.time >> lasting >>
            refused.part;
        refused.site.stack = {frame};
        refused.refusal = lasting ? Refusal::lasting : Refusal::once;
        tell(runs.run(refused));
    }
    return 0;
}

/// A worker as the other side sees it.
class Worker {
public:
    explicit Worker(const Options& options)
    {
        int orders[2], answers[2];
        if (::pipe2(orders, O_CLOEXEC) != 0 || ::pipe2(answers, O_CLOEXEC) != 0) throw std::runtime_error("no pipe");
        m_process = ::fork();
        if (m_process < 0) throw std::runtime_error("no process");
        if (m_process == 0) {
            ::dup2(orders[0], STDIN_FILENO);
            ::dup2(answers[1], STDOUT_FILENO);
            const std::string patience = std::to_string(options.patience);
            const std::string depth = std::to_string(options.depth);
            ::execl("/proc/self/exe", "nvr_short_memory", "--work", "--patience", patience.c_str(), "--depth",
                    depth.c_str(), nullptr);
            ::_exit(1);
        }
        ::close(orders[0]);
        ::close(answers[1]);
        m_orders = ::fdopen(orders[1], "w");
        m_answers = ::fdopen(answers[0], "r");
    }
    Worker(const Worker&) = delete;
    Worker& operator=(const Worker&) = delete;
    ~Worker()
    {
        std::fclose(m_orders);
        std::fclose(m_answers);
        ::waitpid(m_process, nullptr, 0);
    }

    Short_Run survey() { return read(); }
    Short_Run run(const Refused_Ask& refused)
    {
        std::fprintf(m_orders, "%s %s %llu %d %s\n", hex(refused.site.id).c_str(),
                     hex(refused.site.stack.front()).c_str(), static_cast<unsigned long long>(refused.time),
                     refused.refusal == Refusal::lasting, refused.part.c_str());
        std::fflush(m_orders);
        return read();
    }

private:
    Short_Run read()
    {
        Short_Run run;
        char* line = nullptr;
        std::size_t size = 0;
        for (;;) {
            if (::getline(&line, &size, m_answers) < 0) throw std::runtime_error("a worker ended");
            std::istringstream words(line);
            std::string word;
            words >> word;
            words.get();
            if (word == "end") {
                words >> run.refused >> run.is_idle;
                std::getline(words >> std::ws, run.place);
                break;
            }
            if (word == "finding") {
                std::string text;
                std::getline(words, text);
                run.findings.push_back(text);
            }
            if (word == "site") {
                Surveyed_Site site;
                std::getline(words, site.part, '\t');
                words >> std::hex >> site.site.id >> std::dec >> site.site.asked >> std::hex;
                for (std::uintptr_t frame; words >> frame;)
                    site.site.stack.push_back(frame);
                run.sites.push_back(site);
            }
        }
        std::free(line);
        return run;
    }

    pid_t m_process;
    std::FILE* m_orders;
    std::FILE* m_answers;
};

// --- The other side

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
        for (const std::uintptr_t frame : frames)
            command += " 0x" + hex(frame - 1); // in the call, not behind it
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

std::vector<std::pair<Surveyed_Site, Refused_Ask>> asks_to_refuse(const Options& options,
                                                                  std::vector<Surveyed_Site> sites)
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
    std::vector<std::pair<Surveyed_Site, Refused_Ask>> asks;
    for (const Surveyed_Site& site : sites) {
        const std::uint64_t time = only ? only_time : options.any_time ? 1 + chance() % site.site.asked : 1;
        asks.push_back(
            {site, {site.site, time == 1 ? site.part : "", time, options.lasting ? Refusal::lasting : Refusal::once}});
    }
    return asks;
}

class Campaign {
public:
    explicit Campaign(const Options& options) : m_options(options) {}

    int run()
    {
        std::vector<std::unique_ptr<Worker>> workers;
        for (unsigned i = 0; i < m_options.jobs; i++)
            workers.push_back(std::make_unique<Worker>(m_options));
        const Short_Run survey = workers[0]->survey();
        for (unsigned i = 1; i < m_options.jobs; i++)
            workers[i]->survey();
        m_asks = asks_to_refuse(m_options, survey.sites);
        if (m_options.lists) return list(survey.sites);

        std::vector<std::thread> threads;
        for (const auto& worker : workers)
            threads.emplace_back([this, &worker] { serve(*worker); });
        for (std::thread& thread : threads)
            thread.join();
        std::uint64_t asked = 0;
        for (const Surveyed_Site& site : survey.sites)
            asked += site.site.asked;
        std::printf(
            "%zu places asked for memory %llu times; %zu runs, %llu asks refused in %zu of them (%zu of a load, "
            "which was refused then), %zu with findings\n",
            survey.sites.size(), static_cast<unsigned long long>(asked), m_asks.size(),
            static_cast<unsigned long long>(m_refused), m_reached, m_idle, m_found);
        return m_found == 0 ? 0 : 1;
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

    void serve(Worker& worker)
    {
        for (std::size_t i; (i = m_next++) < m_asks.size();)
            tell(m_asks[i].first, m_asks[i].second, worker.run(m_asks[i].second));
    }

    void tell(const Surveyed_Site& site, const Refused_Ask& ask, const Short_Run& run)
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_done++;
        m_refused += run.refused;
        m_reached += run.refused != 0;
        m_idle += run.is_idle;
        m_found += !run.findings.empty();
        if (!run.findings.empty()) {
            std::printf("\n%s, refused in %s (%s):\n", hex(ask.site.id).c_str(), site.part.c_str(), run.place.c_str());
            for (const std::string& finding : run.findings)
                std::printf("  the module %s\n", readable(finding).c_str());
            std::printf("%s  again: nvr_short_memory --only %s:%llu%s\n", m_symbols.text(site.site).c_str(),
                        hex(ask.site.id).c_str(), static_cast<unsigned long long>(ask.time),
                        m_options.lasting ? " --lasting" : "");
            std::fflush(stdout);
        }
        if (::isatty(STDERR_FILENO) || m_done % 100 == 0)
            std::fprintf(stderr, "%zu of %zu, %zu with findings%s", m_done, m_asks.size(), m_found,
                         ::isatty(STDERR_FILENO) ? "\r" : "\n");
    }

    /// With names in place of addresses, and its lines as lines.
    std::string readable(std::string finding)
    {
        for (std::size_t at = 0; (at = finding.find('@', at)) != std::string::npos; at++) {
            const std::size_t end = std::min(finding.find_first_not_of("0123456789abcdef", at + 1), finding.size());
            if (end - at < 5) continue;
            Allocation_Site site;
            site.stack = {std::stoul(finding.substr(at + 1, end - at - 1), nullptr, 16)};
            std::string name = m_symbols.text(site).substr(4);
            name.pop_back();
            finding.replace(at, end - at, name);
        }
        for (std::size_t at = 0; (at = finding.find('\t', at)) != std::string::npos;)
            finding.replace(at, 1, "\n    ");
        return finding;
    }

    const Options& m_options;
    std::vector<std::pair<Surveyed_Site, Refused_Ask>> m_asks;
    std::atomic<std::size_t> m_next{0};
    std::mutex m_mutex;
    Symbols m_symbols;
    std::size_t m_done = 0, m_reached = 0, m_idle = 0, m_found = 0;
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
    app.add_option("--patience", options.patience, "Seconds without a sign of life that end a session")
        ->capture_default_str();
    app.add_flag("--list", options.lists, "Only tell the places");
    app.add_flag("--work", options.works)->group("");
    CLI11_PARSE(app, argc, argv);
    try {
        if (!options.works) return Campaign(options).run();
        ::setenv("TMPDIR", "/var/log", 1);
        enter_private_host(argv);
        return work(options);
    } catch (const std::exception& error) {
        std::fprintf(stderr, "nvr_short_memory: %s\n", error.what());
        return 1;
    }
}
