#include "tests/faults/Short_Run.h"

#include <algorithm>
#include <csignal>
#include <cstdlib>
#include <cstring>
#include <exception>
#include <fcntl.h>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <map>
#include <poll.h>
#include <sstream>
#include <stdexcept>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

#include "tests/faults/Session.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/support/private_host.h"

namespace nvrtest {

namespace {

// Left by the survey for all runs.
constexpr char published_path[] = "/var/log/survey.published";
constexpr char blocks_path[] = "/var/log/survey.blocks.";     // by part and load
constexpr char settings_path[] = "/var/log/survey.settings."; // by part
constexpr char words_path[] = "/var/log/run.words";           // what a process writes on its standard error

// --- In the process of a run

/// The way to the process that waits; one line each: a word, a blank, a text.
class Teller {
public:
    explicit Teller(int file) : m_file(file) {}
    void tell(const std::string& word, const std::string& text)
    {
        std::string line = word + ' ' + text;
        std::replace(line.begin(), line.end(), '\n', '\t');
        line += '\n';
        if (::write(m_file, line.data(), line.size()) < 0) ::_exit(1);
    }

private:
    const int m_file;
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

/// Blocks by the innermost frame that asked for them.
using Blocks = std::map<std::uintptr_t, std::int64_t>;

Blocks blocks()
{
    Blocks held;
    for (const Allocation_Site& site : allocation_sites())
        if (site.held != 0) held[site.stack.front()] += site.held;
    return held;
}

std::string text_of(const Blocks& held)
{
    std::ostringstream text;
    for (const auto& [frame, count] : held)
        text << std::hex << frame << ' ' << std::dec << count << '\n';
    return text.str();
}

Blocks blocks_of(const std::string& text)
{
    std::istringstream lines(text);
    Blocks held;
    for (std::uintptr_t frame; lines >> std::hex >> frame;)
        lines >> std::dec >> held[frame];
    return held;
}

std::string hex(std::uint64_t number)
{
    std::ostringstream text;
    text << std::hex << number;
    return text.str();
}

/// Without the driver's log, which a clearing that failed leaves as it was.
std::string without_driver_log(const std::string& published)
{
    std::istringstream lines(published);
    std::string rest;
    for (std::string line; std::getline(lines, line);)
        if (line.rfind("NVRHBA_FCDriverLogEntry[", 0) != 0 &&
            line.rfind("NVRHBA_DriverRecordLogManagesRecord[", 0) != 0)
            rest += line + '\n';
    return rest;
}

/// The whole course of a process: a session, a look, a reload.
class Course {
public:
    /// Of the session, only the load, this part and the unload; empty: all parts. `refused`: null in a survey.
    Course(int file, std::string part, const Refused_Ask* refused)
        : m_teller(file), m_part(std::move(part)), m_refused(refused)
    {
    }

    void run()
    {
        const Left before;
        wait_for_refreshes_by([this] { return threads_of_module() <= lasting_threads(); });
        if (m_refused) refuse(m_refused->site, m_refused->time, m_refused->refusal);
        drive_session();
        end_refusal();
        // What is made once a process may be made by the second load only.
        if (!m_refused || m_part.empty() || !is_as_surveyed("first")) {
            load_again();
            tell_blocks();
        }
        tell_what_is_left(before);
        if (!m_refused) tell_sites();
        if (refused()) m_teller.tell("refused", std::to_string(refused()) + ' ' + m_place);
    }

private:
    /// Before each request: it is a sign of life, and tells where a refusal falls.
    std::function<void(const std::string&)> listener()
    {
        return [this](const std::string& what) {
            note_refusal();
            m_request = what;
            m_teller.tell("at", what);
        };
    }
    /// Alerts have a thread as long as somebody is subscribed.
    int lasting_threads() const
    {
        return m_request == "subscribe" || m_request == "alerts" || m_request == "unsubscribe" ? 1 : 0;
    }
    void note_refusal()
    {
        if (m_place.empty() && refused()) m_place = m_request.empty() ? "no request" : m_request;
    }
    void finding(const std::string& text) { m_teller.tell("finding", text); }

    void drive_session()
    {
        std::string conf, dmp;
        {
            Session session(listener());
            conf = read_file(conf_path);
            dmp = read_file(dmp_path);
            for (const Session::Part& part : Session::parts()) {
                const bool is_last = &part == &Session::parts().back();
                const bool is_first = &part == &Session::parts().front();
                if (!m_part.empty() && m_part != part.name && !is_first && !is_last) continue;
                // What comes behind a refusal, the look asks for.
                if (m_refused && refused() && !is_last) continue;
                if (is_last) look_before_the_end(session);
                try {
                    session.run(part);
                } catch (const std::exception& error) {
                    // What a client asks for may be missing; what must be there, the look asks for.
                    if (!refused()) finding("in " + std::string(part.name) + ": " + error.what());
                }
                note_refusal();
                if (m_refused && refused()) end_refusal();
                tell_new_sites(part.name);
            }
            tell_report(session.rig().server().report());
        }
        wait_for_threads();
        look_at_settings(conf, dmp);
        if (!m_refused) write_file(blocks_path + m_part + ".first", text_of(blocks()));
    }

    /// Both files, as the unload leaves them: written as in the survey, or not at all. A part that sets them may have
    /// failed.
    void look_at_settings(const std::string& conf, const std::string& dmp)
    {
        const bool may_differ = m_part == "modifications" || m_part == "logs" || m_part.empty();
        for (const auto& [path, before] : {std::pair(conf_path, conf), std::pair(dmp_path, dmp)}) {
            const std::string now = read_file(path);
            const std::string surveyed = settings_path + m_part + (path == conf_path ? ".conf" : ".dmp");
            if (!m_refused)
                write_file(surveyed, now);
            else if (!may_differ && now != before && now != read_file(surveyed))
                finding("loses settings: " + now);
        }
    }

    void count_asks()
    {
        for (const Allocation_Site& site : allocation_sites())
            m_asked[site.id] = site.asked;
    }

    /// A refusal that still lies ahead is one of the last part: it waits.
    void look_before_the_end(Session& session)
    {
        end_refusal();
        if (!m_refused) count_asks();
        look(session);
        if (!m_refused) m_told = allocation_sites().size(); // what only this asks for is not refused
        if (m_refused && !refused()) refuse(m_refused->site, m_refused->time, m_refused->refusal);
    }

    void load_again()
    {
        m_is_reloaded = true;
        {
            Session session(listener());
            session.run(Session::parts().front());
            look(session);
            session.run(Session::parts().back());
            tell_report(session.rig().server().report());
        }
        wait_for_threads();
        if (!m_refused) write_file(blocks_path + m_part + ".second", text_of(blocks()));
    }

    /// From a thread of its own, which owns none of the locks that may be left.
    void look(Session& session)
    {
        std::thread([&] {
            try {
                const std::string published = without_driver_log(session.published());
                if (!exists(published_path)) write_file(published_path, published); // the first survey's
                const std::string expected = read_file(published_path);
                if (published == expected) return;
                const std::string difference = nvrtest::difference(expected, published);
                // An agent that could not be built stays so until the next load, and has nothing of the host.
                if (!m_is_reloaded && m_place == "the first request" && difference.find("\n+") == std::string::npos &&
                    lines_of_class(published, "NVRHBA_FCPort").empty())
                    m_teller.tell("idle", "");
                else
                    finding("publishes something else:\n" + difference.substr(0, 2000));
            } catch (const std::exception& error) {
                finding(std::string("does not publish: ") + error.what());
            }
        }).join();
    }

    void tell_report(const host::Report& report)
    {
        for (const std::string& violation : report.violations)
            finding("breaks a rule: " + violation);
        if (left_beside_strings(report) != 0 || report.clones_alive() != 0 || report.contexts_not_detached != 0)
            finding("leaves objects of the server's: " + report.to_text());
    }

    void tell_new_sites(const char* part)
    {
        if (m_refused) return;
        const std::vector<Allocation_Site> sites = allocation_sites();
        for (; m_told < sites.size(); m_told++)
            m_parts[m_told] = part;
    }

    void wait_for_threads()
    {
        m_teller.tell("at", "the end of the module's threads");
        while (threads_of_module() > 0)
            std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }

    void tell_sites()
    {
        const std::vector<Allocation_Site> sites = allocation_sites();
        for (const auto& [number, part] : m_parts) {
            const Allocation_Site& site = sites[number];
            std::ostringstream line;
            line << part << '\t' << std::hex << site.id << ' ' << std::dec
                 << std::max<std::uint64_t>(m_asked[site.id], 1) << std::hex;
            for (const std::uintptr_t frame : site.stack)
                line << ' ' << frame;
            m_teller.tell("site", line.str());
        }
    }

    void tell_what_is_left(const Left& before)
    {
        const Left after;
        if (after.files != before.files)
            finding("leaves " + std::to_string(after.files) + " files open, of " + std::to_string(before.files));
        // The sign that the library has been initialised once stays.
        if (after.semaphores > 1) finding("leaves " + std::to_string(after.semaphores) + " semaphores");
    }

    std::string surveyed(const char* load) const { return read_file(blocks_path + m_part + '.' + load); }
    bool is_as_surveyed(const char* load) const { return text_of(blocks()) == surveyed(load); }

    void tell_blocks()
    {
        const Blocks expected = blocks_of(surveyed("second")), found = blocks();
        std::int64_t more = 0;
        std::string places;
        for (const auto& [frame, count] : found) {
            const auto known = expected.find(frame);
            const std::int64_t extra = count - (known == expected.end() ? 0 : known->second);
            more += extra;
            if (extra > 0) places += "\n" + std::to_string(extra) + " of @" + hex(frame);
        }
        for (const auto& [frame, count] : expected)
            if (found.find(frame) == found.end()) more -= count;
        if (more > 0) finding("leaves " + std::to_string(more) + " blocks more than without a refusal:" + places);
    }

    Teller m_teller;
    const std::string m_part;
    const Refused_Ask* const m_refused;
    std::string m_request, m_place;
    bool m_is_reloaded = false;
    std::size_t m_told = 0;                         // sites that are known, in their order
    std::map<std::size_t, const char*> m_parts;     // of the session, by the sites that they were the first to ask at
    std::map<std::uint64_t, std::uint64_t> m_asked; // how often, in the session without the look
};

// --- In the process that waits

/// The lines that another process tells, as they come.
class Listener {
public:
    Listener(int file, pid_t process, std::chrono::seconds patience)
        : m_file(file), m_process(process), m_patience(patience)
    {
    }

    Short_Run listen()
    {
        Short_Run run;
        std::string last = "the start";
        for (;;) {
            pollfd waits{m_file, POLLIN, 0};
            const int milliseconds = static_cast<int>(std::chrono::milliseconds(m_patience).count());
            const int ready = ::poll(&waits, 1, milliseconds);
            if (ready == 0) {
                ::kill(m_process, SIGKILL);
                ::waitpid(m_process, nullptr, 0);
                run.findings.push_back("tells nothing for " + std::to_string(m_patience.count()) + " s at " + last);
                return run;
            }
            char buffer[65536];
            const ssize_t size = ::read(m_file, buffer, sizeof buffer);
            if (size <= 0) break;
            m_rest.append(buffer, static_cast<std::size_t>(size));
            for (std::size_t end; (end = m_rest.find('\n')) != std::string::npos; m_rest.erase(0, end + 1))
                take(m_rest.substr(0, end), last, run);
        }
        int status = 0;
        ::waitpid(m_process, &status, 0);
        if (status != 0)
            run.findings.push_back((WIFSIGNALED(status) ? std::string("ends by ") + strsignal(WTERMSIG(status))
                                                        : "ends with " + std::to_string(WEXITSTATUS(status))) +
                                   " at " + last + '\t' + read_file(words_path));
        return run;
    }

private:
    static void take(const std::string& line, std::string& last, Short_Run& run)
    {
        const std::size_t blank = line.find(' ');
        const std::string word = line.substr(0, blank);
        const std::string text = line.substr(blank + 1);
        std::istringstream words(text);
        if (word == "at") last = text;
        if (word == "idle") run.is_idle = true;
        if (word == "finding") run.findings.push_back(text);
        if (word == "refused") {
            words >> run.refused;
            std::getline(words >> std::ws, run.place);
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

    const int m_file;
    const pid_t m_process;
    const std::chrono::seconds m_patience;
    std::string m_rest;
};

} // namespace

Short_Runs::Short_Runs(std::size_t frames, std::chrono::seconds patience) : m_patience(patience)
{
    module_registrations(); // read once for all runs
    watch_memory_of(NVR_MODULE, frames);
}

template <class Act>
Short_Run Short_Runs::in_process(Act act)
{
    for (const auto& left : std::filesystem::directory_iterator("/dev/shm"))
        std::filesystem::remove(left.path()); // of a process that was ended
    int ends[2];
    if (::pipe2(ends, O_CLOEXEC) != 0) throw std::runtime_error("no pipe");
    const pid_t process = ::fork();
    if (process < 0) throw std::runtime_error("no process");
    if (process == 0) {
        ::close(ends[0]);
        if (!std::freopen(words_path, "w", stderr)) ::_exit(1);
        act(ends[1]);
        std::_Exit(0);
    }
    ::close(ends[1]);
    Short_Run run = Listener(ends[0], process, m_patience).listen();
    ::close(ends[0]);
    return run;
}

Short_Run Short_Runs::survey()
{
    const auto survey_part = [this](const std::string& part) {
        Short_Run survey = in_process([&part](int file) { Course(file, part, nullptr).run(); });
        if (!survey.findings.empty())
            throw std::runtime_error("without a refusal the module " + survey.findings.front());
        if (survey.sites.empty()) throw std::runtime_error("the module asks for no memory");
        return survey;
    };
    Short_Run survey = survey_part("");
    for (const Session::Part& part : Session::parts())
        survey_part(part.name);
    return survey;
}

Short_Run Short_Runs::run(const Refused_Ask& refused)
{
    // Most places ask in their part, whatever comes before it.
    Short_Run run = in_process([&refused](int file) { Course(file, refused.part, &refused).run(); });
    if (run.refused != 0 || !run.findings.empty() || refused.part.empty()) return run;
    return in_process([&refused](int file) { Course(file, "", &refused).run(); });
}

} // namespace nvrtest
