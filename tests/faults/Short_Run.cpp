#include "tests/faults/Short_Run.h"

#include <algorithm>
#include <cstring>
#include <ctime>
#include <exception>
#include <filesystem>
#include <iterator>
#include <optional>
#include <sstream>
#include <stdexcept>
#include <thread>
#include <type_traits>

#include "tests/faults/Session.h"
#include "tests/module/support/Instance_Text.h"

namespace nvrtest {

namespace {

/// What a run tells: things one behind the other, numbers as they lie in memory, for both sides are this program. The
/// same words write and read; where nothing is left to read, things stay as they are.
class Record {
public:
    template <class Thing>
    static std::string of(Thing thing)
    {
        Record record;
        record.pass(thing);
        return record.m_bytes;
    }
    template <class Thing>
    static Thing read(const std::string& bytes)
    {
        Record record;
        record.m_bytes = bytes;
        record.m_reads = true;
        Thing thing;
        record.pass(thing);
        return thing;
    }

private:
    void pass(Short_Outcome& outcome) { pass_all(outcome.refused, outcome.is_idle, outcome.request); }
    void pass(Survey& survey) { pass_all(survey.sites, survey.published, survey.first, survey.second); }
    void pass(Surveyed_Site& site) { pass_all(site.part, site.site.id, site.site.asked, site.site.stack); }
    void pass(Blocks& blocks)
    {
        std::vector<Blocks::key_type> frames;
        std::vector<Blocks::mapped_type> counts;
        for (const auto& [frame, count] : blocks) {
            frames.push_back(frame);
            counts.push_back(count);
        }
        pass_all(frames, counts);
        for (std::size_t i = 0; i < frames.size(); i++)
            blocks[frames[i]] = counts[i];
    }
    template <class Thing>
    void pass(Thing& thing)
    {
        if constexpr (std::is_arithmetic_v<Thing>) {
            pass_bytes(&thing, sizeof thing);
        } else {
            std::size_t size = thing.size();
            pass(size);
            thing.resize(size);
            for (auto& one : thing)
                pass(one);
        }
    }
    template <class... Things>
    void pass_all(Things&... things)
    {
        (pass(things), ...);
    }
    void pass_bytes(void* bytes, std::size_t size)
    {
        if (!m_reads)
            m_bytes.append(static_cast<const char*>(bytes), size);
        else if (m_bytes.size() - m_at >= size)
            m_at += m_bytes.copy(static_cast<char*>(bytes), size, m_at);
    }

    std::string m_bytes;
    bool m_reads = false;
    std::size_t m_at = 0;
};

std::size_t entries_of(const char* folder)
{
    const std::filesystem::directory_iterator entries(folder);
    return static_cast<std::size_t>(std::distance(begin(entries), end(entries)));
}

/// What is there of a process beside its blocks.
struct Left {
    std::size_t files = entries_of("/proc/self/fd");
    std::size_t semaphores = entries_of("/dev/shm");
};

Blocks blocks()
{
    Blocks held;
    for (const Allocation_Site& site : allocation_sites())
        if (site.held != 0) held[site.stack.front()] += site.held;
    return held;
}

/// What requests that failed may leave as it was, or not: the lines of the driver's log, which a client clears, and of
/// settings.
std::vector<std::string> uncertain_classes(const Settings_Files& settings)
{
    std::vector<std::string> classes = {"NVRHBA_FCDriverLogEntry", "NVRHBA_DriverRecordLogManagesRecord"};
    if (!settings.is_sure_of_time_out()) classes.push_back("NVRHBA_ProviderConfigSetting");
    if (!settings.is_sure_of_log_state()) classes.push_back("NVRHBA_RecordLog");
    return classes;
}

std::string without(const std::vector<std::string>& classes, const std::string& published)
{
    std::istringstream lines(published);
    std::string rest;
    for (std::string line; std::getline(lines, line);)
        if (std::find(classes.begin(), classes.end(), line.substr(0, line.find('['))) == classes.end())
            rest += line + '\n';
    return rest;
}

/// The whole course of a run: a session, a look, a reload.
class Course {
public:
    /// A survey. Of the session, only the load, this part and the unload; empty: all parts.
    Course(Run_Watch& watch, std::string part) : m_watch(watch), m_part(std::move(part)) {}
    Course(Run_Watch& watch, std::string part, const Survey& expected, const Refused_Ask& ask)
        : m_watch(watch), m_part(std::move(part)), m_expected(&expected), m_ask(&ask)
    {
    }

    void run()
    {
        ::tzset(); // the C library keeps what it reads here, and anyone may come first
        const Left before;
        begin_refusal();
        drive_session();
        end_refusal();
        // What is made once a process may be made by the second load only.
        if (!m_ask || m_part.empty() || m_survey.first != m_expected->first) {
            load_again();
            look_at_blocks();
        }
        look_at_the_rest(before);
        m_outcome.refused = refused();
        m_watch.tell(m_ask ? Record::of(m_outcome) : Record::of(m_survey));
    }

private:
    /// Before each request.
    std::function<void(const std::string&)> listener()
    {
        return [this](const std::string& what) {
            note_refusal();
            m_request = what;
            m_watch.step(what);
        };
    }
    /// Alerts have a thread as long as somebody is subscribed.
    int lasting_threads() const
    {
        return m_request == "subscribe" || m_request == "alerts" || m_request == "unsubscribe" ? 1 : 0;
    }
    void begin_refusal()
    {
        if (m_ask) refuse(m_ask->place.site, m_ask->time, m_ask->refusal);
    }
    void note_refusal()
    {
        if (m_outcome.request.empty() && refused()) m_outcome.request = m_request.empty() ? "no request" : m_request;
    }

    void drive_session()
    {
        std::optional<Settings_Files> settings;
        {
            Session session(listener());
            session.rig().tell_refreshes_by([this] { return threads_of_module() <= lasting_threads(); });
            for (const Session::Part& part : Session::parts()) {
                const bool is_last = &part == &Session::parts().back();
                const bool is_first = &part == &Session::parts().front();
                if (!m_part.empty() && m_part != part.name && !is_first && !is_last) continue;
                // What comes behind a refusal, the look asks for.
                if (refused() && !is_last) continue;
                if (is_last) look_before_the_end(session);
                try {
                    session.run(part);
                } catch (const std::exception& error) {
                    // What a client asks for may be missing; what must be there, the look asks for.
                    if (!refused()) m_watch.complain(std::string("in ") + part.name + ": " + error.what());
                }
                note_refusal();
                if (refused()) end_refusal();
                survey_sites(part.name);
            }
            look_at_report(session);
            settings = session.settings();
        }
        wait_for_threads();
        look_at_settings(*settings);
        m_survey.first = blocks();
    }

    void survey_sites(const char* part)
    {
        if (m_ask) return;
        const std::vector<Allocation_Site> sites = allocation_sites();
        for (; m_known < sites.size(); m_known++)
            m_survey.sites.push_back({sites[m_known], part});
    }

    /// A refusal that still lies ahead is one of the last part: it waits.
    void look_before_the_end(Session& session)
    {
        end_refusal();
        const std::vector<Allocation_Site> sites = allocation_sites();
        for (std::size_t i = 0; i < m_survey.sites.size(); i++)
            m_survey.sites[i].site = sites[i];
        look(session);
        m_known = allocation_sites().size(); // what only this asks for is not refused
        if (!refused()) begin_refusal();
    }

    void load_again()
    {
        m_is_reloaded = true;
        std::optional<Settings_Files> settings;
        {
            Session session(listener());
            session.rig().tell_refreshes_by([this] { return threads_of_module() <= lasting_threads(); });
            session.run(Session::parts().front());
            look(session);
            session.run(Session::parts().back());
            look_at_report(session);
            settings = session.settings();
        }
        wait_for_threads();
        look_at_settings(*settings);
        m_survey.second = blocks();
    }

    void wait_for_threads()
    {
        m_watch.step("the end of the module's threads");
        while (threads_of_module() > 0)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }

    /// From a thread of its own, which owns none of the locks that may be left.
    void look(Session& session)
    {
        std::thread([&] {
            try {
                const std::vector<std::string> uncertain = uncertain_classes(session.settings());
                const std::string published = without(uncertain, session.published());
                if (m_survey.published.empty()) m_survey.published = published;
                const std::string expected = without(uncertain, m_ask ? m_expected->published : m_survey.published);
                if (published == expected) return;
                const std::string difference = nvrtest::difference(expected, published);
                // An agent that could not be built stays so until the next load, and has nothing of the host.
                if (!m_is_reloaded && m_outcome.request == "the first request" &&
                    difference.find("\n+") == std::string::npos && lines_of_class(published, "NVRHBA_FCPort").empty())
                    m_outcome.is_idle = true;
                else
                    m_watch.complain("it publishes something else:\n" + difference.substr(0, 2000));
            } catch (const std::exception& error) {
                m_watch.complain(std::string("it does not publish: ") + error.what());
            }
        }).join();
    }

    void look_at_report(Session& session)
    {
        const host::Report report = session.rig().server().report();
        for (const std::string& violation : report.violations)
            m_watch.complain("it breaks a rule: " + violation);
        if (left_beside_strings(report) != 0 || report.clones_alive() != 0 || report.contexts_not_detached != 0)
            m_watch.complain("it leaves objects of the server's: " + report.to_text());
    }

    /// As an unload leaves them. Who writes them may have been refused memory: then they are as they were.
    void look_at_settings(const Settings_Files& settings)
    {
        const std::string wrong = settings.wrong(m_ask && !m_is_reloaded);
        if (!wrong.empty()) m_watch.complain(wrong);
    }

    void look_at_blocks()
    {
        if (!m_ask) return;
        Blocks more = m_survey.second;
        for (const auto& [frame, count] : m_expected->second)
            more[frame] -= count;
        std::string places;
        for (const auto& [frame, count] : more)
            if (count > 0) places += '\n' + std::to_string(count) + " of @" + hex(frame);
        if (!places.empty()) m_watch.complain("it leaves more blocks than without a refusal:" + places);
    }

    void look_at_the_rest(const Left& before)
    {
        const Left after;
        if (after.files != before.files)
            m_watch.complain("it leaves " + std::to_string(after.files) + " files open, of " +
                             std::to_string(before.files));
        // The sign that the library has been initialised once stays.
        if (after.semaphores > 1) m_watch.complain("it leaves " + std::to_string(after.semaphores) + " semaphores");
    }

    Run_Watch& m_watch;
    const std::string m_part;
    const Survey* const m_expected = nullptr; // null in a survey, as is the next
    const Refused_Ask* const m_ask = nullptr;
    Survey m_survey; // of this run
    Short_Outcome m_outcome;
    std::string m_request;
    bool m_is_reloaded = false;
    std::size_t m_known = 0; // sites, in their order
};

} // namespace

Surveys hold_surveys(unsigned at_once, std::chrono::milliseconds patience)
{
    std::vector<Run> runs;
    const auto add = [&](const std::string& part) {
        runs.push_back({part, patience, [part](Run_Watch& watch) { Course(watch, part).run(); }});
    };
    add("");
    for (const Session::Part& part : Session::parts())
        add(part.name);
    Surveys surveys;
    do_runs(runs, at_once, [&](std::size_t index, const Run_Result& result) {
        if (!result.failure.empty()) throw std::runtime_error("without a refusal: " + result.failure);
        surveys[runs[index].name] = Record::read<Survey>(result.told);
    });
    for (const auto& [part, survey] : surveys) {
        if (survey.sites.empty()) throw std::runtime_error("the module asks for no memory");
        if (survey.published != surveys[""].published)
            throw std::runtime_error("without a refusal it publishes something else after " + part);
    }
    return surveys;
}

Run short_run(const Surveys& surveys, const Refused_Ask& ask, std::chrono::milliseconds patience)
{
    return {hex(ask.place.site.id) + ':' + std::to_string(ask.time), patience, [&surveys, ask](Run_Watch& watch) {
                const std::string part = ask.is_in_whole ? "" : ask.place.part;
                Course(watch, part, surveys.at(part), ask).run();
            }};
}

Short_Outcome outcome_of(const Run_Result& result)
{
    return Record::read<Short_Outcome>(result.told);
}

std::string hex(std::uint64_t number)
{
    std::ostringstream text;
    text << std::hex << number;
    return text.str();
}

} // namespace nvrtest
