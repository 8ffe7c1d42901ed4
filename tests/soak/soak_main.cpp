// A server's weeks in short: clients of all kinds at once, adapters that trouble them, and at every tenth of the run a
// look at what the process holds.
//
//     nvr_soak --seconds 20
//     nvr_soak --minutes 5 --manner pegasus
//     nvr_soak --hours 72
//     nvr_soak --minutes 10 --one-life
//
// The exit code is 0 if resident memory stayed level, threads and descriptors came back, every request was answered in
// time and the instances are in the end those of the start; else 1. Runs as root, or as a user who may make user
// namespaces: settings, logs and libraries are its own.
#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <filesystem>
#include <iostream>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <unistd.h>
#include <vector>

#include "simulator/nvrsim.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Rig.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/soak/Crossing.h"
#include "tests/soak/Load.h"
#include "tests/soak/Options.h"
#include "tests/soak/Process.h"
#include "tests/soak/Report.h"
#include "tests/soak/Season.h"
#include "tests/soak/Trend.h"
#include "tests/soak/Trouble.h"
#include "tests/support/private_host.h"
#include "tests/support/private_host_setup.h"
#include "tests/support/process_state.h"
#include "tests/support/simulator.h"

namespace {

using namespace soak;
using Clock = std::chrono::steady_clock;

/// Between two looks the resident memory may move by as much without a leak, kB over the second half of the run.
constexpr double tolerance = 512;
/// Once in each reading of the adapters, and nowhere else; and in each of the SAN's, some for a port.
constexpr char reading_call[] = "HBA_GetNumberOfAdapters";
constexpr char san_call[] = "HBA_GetFcpTargetMapping";
constexpr std::uintmax_t largest_trace = 16 * 1024 * 1024;

void bound_trace()
{
    std::error_code none;
    if (std::filesystem::file_size(nvrtest::trace_path, none) > largest_trace && !none)
        (void)truncate(nvrtest::trace_path, 0);
}

/// The server remembers what it did, up to 10,000 lines: that it still fills its memory must not show.
void fill_server_log(host::Host& server)
{
    const std::string line(100, '-');
    server.on_request_thread([&](const CMPIBroker* broker, const CMPIContext*) {
        for (int i = 0; i < 10000; i++)
            broker->eft->logMessage(broker, 0, "soak", line.c_str(), nullptr);
    });
}

/// Ten, or one a minute; for each half of one life.
std::size_t number_of_looks(const Options& options)
{
    const std::size_t least = options.has_one_life ? 20 : 10;
    if (options.requests != 0) return least;
    return std::max<std::size_t>(least, std::chrono::duration_cast<std::chrono::minutes>(options.length).count());
}

/// One run.
class Soak {
public:
    explicit Soak(const Options& options)
        : m_options(options), m_ticks(number_of_looks(options)), m_watch(options.patience, &Soak::tell_hang),
          m_rig({*options.manner}), m_load(m_rig, m_watch, m_counts, m_season),
          m_trouble(m_rig, m_watch, m_counts, m_season, warm_up())
    {
        m_rig.restart();
        fill_server_log(m_rig.server());
        m_before = Process::now();
        m_before.threads = nvrtest::number_of_threads_from_the_start();
    }

    /// True if all was well.
    bool run();

private:
    struct Look {
        double minutes;
        Process process;
    };
    /// Of the adapters, in one life.
    struct Readings {
        std::uint64_t before = 0; ///< the calls before the season
        std::uint64_t among_changes = 0, undisturbed = 0;
        std::uint64_t san_calls_before = 0, san_calls = 0; ///< undisturbed
        std::size_t missed = 0;                            ///< that a service was to start after changes
    };

    [[noreturn]] static void tell_hang(const std::string& what)
    {
        say("hangs: %s\n", what.c_str());
        std::_Exit(1);
    }
    std::vector<std::string> warm_up();
    void serve_client(std::uint64_t seed);
    void make_trouble(std::uint64_t seed);
    /// Waits until a tenth, or a minute, has passed.
    void wait_for_tick(std::size_t tick);
    const Season& season_after(std::size_t looks) const;
    /// While no other thread acts.
    void begin(const Season& season);
    void look();
    /// The settings are the defaults, and a service has the adapters read anew.
    void end_changes();
    void wait_for_refresh();
    std::string rested_names();
    void begin_new_life();
    void lose(); ///< what --leak says
    bool judge();
    /// By the looks from `first` to before `last`, the later ones of their kind.
    bool judge_memory(const char* which, std::size_t first, std::size_t last);

    double minutes() const { return std::chrono::duration<double, std::ratio<60>>(Clock::now() - m_start).count(); }

    const Options m_options;
    const std::size_t m_ticks; ///< looks at the process
    Season m_season = all_at_once;
    Counts m_counts;
    nvrtest::Watch m_watch;
    nvrtest::Rig m_rig;
    Load m_load;
    std::string m_names; ///< of all instances, at the start
    Trouble m_trouble;
    Crossing m_crossing;
    Process m_before;
    Clock::time_point m_start = Clock::now();
    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::atomic<std::uint64_t> m_next_tick{0}; ///< in requests
    std::atomic<bool> m_ends{false};
    std::vector<Look> m_looks;
    Readings m_readings;
    std::mutex m_lost_mutex;
    std::vector<std::unique_ptr<char[]>> m_lost; ///< in one life, until adapters are read anew
    std::size_t m_different = 0;
    std::uint64_t m_violations = 0, m_left = 0;
    std::string m_told_left;       ///< the first report with one of them
    std::string m_told_difference; ///< of the first look that saw other instances
    bool m_is_traced = true;
};

std::vector<std::string> Soak::warm_up()
{
    m_names = rested_names();
    return nvrtest::called_operations();
}

void Soak::serve_client(std::uint64_t seed)
{
    Random random(seed);
    while (!m_ends) {
        const Crossing::Pass pass(m_crossing);
        const std::uint64_t before = m_counts.requests;
        m_load.act(random);
        if (m_options.leak != 0) lose();
        if (before < m_next_tick && m_counts.requests >= m_next_tick) {
            const std::lock_guard<std::mutex> lock(m_mutex);
            m_changed.notify_all();
        }
    }
}

void Soak::lose()
{
    auto bytes = std::make_unique<char[]>(m_options.leak);
    std::memset(bytes.get(), 1, m_options.leak);
    if (!m_options.has_one_life) return static_cast<void>(bytes.release());
    const std::lock_guard<std::mutex> lock(m_lost_mutex);
    m_lost.push_back(std::move(bytes));
}

void Soak::make_trouble(std::uint64_t seed)
{
    Random random(seed);
    while (!m_ends) {
        {
            const Crossing::Pass pass(m_crossing);
            m_trouble.act(random);
            bound_trace();
        }
        std::unique_lock<std::mutex> lock(m_mutex);
        m_changed.wait_for(lock, std::chrono::milliseconds(5 + random.below(50)), [this] { return m_ends.load(); });
    }
}

void Soak::wait_for_tick(std::size_t tick)
{
    std::unique_lock<std::mutex> lock(m_mutex);
    if (m_options.requests != 0) {
        m_next_tick = m_options.requests * tick / m_ticks;
        m_changed.wait(lock, [this] { return m_counts.requests >= m_next_tick; });
    } else {
        m_changed.wait_until(lock, m_start + m_options.length * tick / m_ticks, [] { return false; });
    }
}

// A refresh runs on a thread that the server has lent a context; so does the worker of the alerts, which some servers
// never let go: it is there when this is called.
void Soak::wait_for_refresh()
{
    const nvrtest::Watch::Turn turn(m_watch, "the end of a refresh");
    const std::uint64_t resting = m_options.manner->disable == host::Manner::Disable::never;
    while (m_rig.server().report().contexts_not_detached > resting)
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
}

std::string Soak::rested_names()
{
    m_load.unsubscribe_all();
    m_load.meet_alert();
    m_load.restore_settings();
    m_load.restore_files();
    wait_for_refresh();
    nvrtest::advance_clock(std::chrono::minutes(31));
    m_load.all_names(); // starts the refresh
    wait_for_refresh();
    if (m_season.has_changes && !m_season.has_unloads) end_changes();
    return m_load.all_names();
}

void Soak::end_changes()
{
    m_season.reads_adapters = false;
    const std::uint64_t before = nvrtest::calls(reading_call);
    const bool is_read = m_load.restore_settings() && m_load.have_adapters_read();
    wait_for_refresh();
    m_readings.missed += !is_read || nvrtest::calls(reading_call) == before;
    m_lost.clear();
    m_lost.shrink_to_fit();
}

const Season& Soak::season_after(std::size_t looks) const
{
    if (!m_options.has_one_life) return all_at_once;
    if (looks >= m_ticks / 2) return undisturbed;
    return looks % 2 == 0 ? failing_changes : changes;
}

void Soak::begin(const Season& season)
{
    m_season = season;
    if (season.has_unloads) return;
    m_load.restore_settings();
    wait_for_refresh();
    m_readings.before = nvrtest::calls(reading_call);
    m_readings.san_calls_before = nvrtest::calls(san_call);
}

void Soak::begin_new_life()
{
    const nvrtest::Watch::Turn turn(m_watch, "the server's stop and start");
    m_rig.stop();
    const host::Report report = m_rig.server().report();
    m_violations += report.violation_count;
    m_left += report.clones_alive() + report.contexts_not_detached;
    if (m_violations + m_left != 0 && m_told_left.empty()) m_told_left = report.to_text();
    m_is_traced = !m_is_traced;
    nvrtest::write_file(nvrtest::dmp_path, std::string(m_is_traced ? "2,5,1\n" : "2,5,0\n") + nvrtest::trace_path);
    m_rig.restart();
    fill_server_log(m_rig.server());
    m_counts.unloads++;
}

void Soak::look()
{
    const Crossing::Hold hold(m_crossing);
    const std::uint64_t requests = m_counts.requests, errors = m_counts.errors; // of clients
    const std::uint64_t readings = nvrtest::calls(reading_call) - m_readings.before;
    (m_season.has_changes ? m_readings.among_changes : m_readings.undisturbed) += readings;
    if (!m_season.has_changes) m_readings.san_calls += nvrtest::calls(san_call) - m_readings.san_calls_before;
    const bool is_spoiled = m_trouble.end();
    // A refresh that failed may have left no settings, and where adapters are not to be read, none brings them back.
    if (m_season.has_unloads && (!m_load.restore_settings() || is_spoiled)) begin_new_life();
    if (const std::string names = rested_names(); names != m_names) {
        m_different++;
        if (m_told_difference.empty()) m_told_difference = nvrtest::difference(m_names, names);
    }
    const Process process = Process::now();
    m_looks.push_back({minutes(), process});
    m_counts.requests = requests;
    m_counts.errors = errors;
    say("%7.1f min  requests %9llu  errors %8llu  faults %8llu  alerts %7llu  lives %5llu  resident %7zu kB  heap %7zu "
        "kB  "
        "threads %3zu  descriptors %3zu%s%s\n",
        minutes(), static_cast<unsigned long long>(m_counts.requests), static_cast<unsigned long long>(m_counts.errors),
        static_cast<unsigned long long>(m_counts.faults), static_cast<unsigned long long>(m_counts.alerts),
        static_cast<unsigned long long>(m_counts.unloads + 1), process.resident, process.heap, process.threads,
        process.descriptors, *m_season.name ? "  " : "", m_season.name);
    if (!m_options.has_one_life && m_looks.size() % 3 == 0) begin_new_life();
    begin(season_after(m_looks.size()));
}

bool Soak::run()
{
    // Loaded without faults: what is missing then is missing for the whole life.
    if (m_options.has_one_life) m_load.all_names();
    begin(season_after(0));
    m_start = Clock::now();
    std::vector<std::thread> threads;
    for (std::size_t i = 0; i < m_options.clients; i++)
        threads.emplace_back([this, i] { serve_client(m_options.seed * 1000 + i + 1); });
    threads.emplace_back([this] { make_trouble(m_options.seed * 1000); });
    for (std::size_t tick = 1; tick <= m_ticks; tick++) {
        wait_for_tick(tick);
        look();
    }
    {
        const std::lock_guard<std::mutex> lock(m_mutex);
        m_ends = true;
        m_changed.notify_all();
    }
    for (std::thread& thread : threads)
        thread.join();
    m_trouble.end();
    m_load.unsubscribe_all();
    begin_new_life();
    return judge();
}

bool Soak::judge_memory(const char* which, std::size_t first, std::size_t last)
{
    std::vector<std::pair<double, double>> resident;
    for (std::size_t i = first; i < last; i++)
        resident.emplace_back(m_looks[i].minutes, static_cast<double>(m_looks[i].process.resident));
    const Trend trend = Trend::through(resident);
    if (is_sanitized) say("%s", "not judged under a sanitizer: ");
    return hold_against(
        is_sanitized || trend.is_level(tolerance),
        "%sresident memory moves by %.1f kB a minute (standard error %.1f), %.0f kB over the last %zu lines; level "
        "below two standard errors, or %.0f kB\n",
        which, trend.slope, trend.error, trend.change, resident.size(), tolerance);
}

bool Soak::judge()
{
    bool all_well = true;
    if (m_options.has_one_life) {
        all_well &= judge_memory("among changes, ", m_ticks / 4, m_ticks / 2);
        all_well &= judge_memory("undisturbed, ", m_ticks / 2 + m_ticks / 4, m_ticks);
        all_well &= hold_against(
            m_readings.among_changes != 0 && m_readings.missed == 0 && m_readings.undisturbed == 0,
            "adapters read %llu times among changes, not where a service asked at %zu looks, and %llu times "
            "undisturbed, with %llu calls for targets\n",
            static_cast<unsigned long long>(m_readings.among_changes), m_readings.missed,
            static_cast<unsigned long long>(m_readings.undisturbed),
            static_cast<unsigned long long>(m_readings.san_calls));
        all_well &=
            hold_against(m_counts.unloads == 1, "%llu unloads\n", static_cast<unsigned long long>(m_counts.unloads));
    } else {
        all_well &= judge_memory("", m_ticks / 2, m_ticks);
    }
    nvrtest::wait_for_threads(m_before.threads, std::chrono::seconds(20));
    const Process after = Process::now();
    all_well &= hold_against(after.threads <= m_before.threads, "%zu threads before, %zu after\n", m_before.threads,
                             after.threads);
    all_well &= hold_against(after.descriptors <= m_before.descriptors, "%zu descriptors before, %zu after\n",
                             m_before.descriptors, after.descriptors);
    all_well &= hold_against(m_different == 0, "other instances than at the start in %zu of %zu looks\n%s", m_different,
                             m_looks.size(), m_told_difference.c_str());
    all_well &= hold_against(nvrsim_open_handles() == 0, "%zu handles of adapters open\n", nvrsim_open_handles());
    all_well &= hold_against(
        m_violations == 0 && m_left == 0, "%llu rules of the server broken, %llu of its objects kept\n%s",
        static_cast<unsigned long long>(m_violations), static_cast<unsigned long long>(m_left), m_told_left.c_str());
    say("well: each of %llu requests was answered in time\n", static_cast<unsigned long long>(m_counts.requests));
    return all_well;
}

} // namespace

int main(int argc, char** argv)
{
    try {
        const Options options = Options::parsed(argc, argv);
        if (options.asks_for_help) return std::fputs(Options::usage(), stdout) < 0;
        // By its default settings the allocator keeps free blocks aside for each thread, more and more for a while.
        setenv("GLIBC_TUNABLES", "glibc.malloc.tcache_count=0:glibc.malloc.arena_max=1", 0);
        nvrtest::enter_private_host(argv);
        report_stream();
        // Simulated dumps and all else go where nobody else is.
        setenv("TMPDIR", Load::folder, 1);
        return Soak(options).run() ? 0 : 1;
    } catch (const std::exception& error) {
        std::cerr << error.what() << '\n';
        return 1;
    }
}
