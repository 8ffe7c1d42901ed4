#include "tests/faults/Runs.h"

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <iterator>
#include <map>
#include <new>
#include <poll.h>
#include <stdexcept>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>
#include <utility>

#include "tests/support/private_host_setup.h"

namespace nvrtest {

namespace {

constexpr char complaint = 'c', message = 't';
constexpr std::size_t longest_output = 6000;
// Up to a run's first step: a busy machine makes hosts slowly.
constexpr std::chrono::milliseconds longest_start = std::chrono::minutes(1);
// Between two looks at how long a run stands, in milliseconds.
constexpr int longest_wait = 100;

void check(bool done, const char* what)
{
    if (!done) throw std::runtime_error(std::string(what) + ": " + std::strerror(errno));
}

// Memory of a forked process and its parent.
template <class Thing>
class Shared_Memory {
public:
    Shared_Memory()
    {
        void* memory = ::mmap(nullptr, sizeof(Thing), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
        check(memory != MAP_FAILED, "shared memory");
        m_thing = new (memory) Thing;
    }
    ~Shared_Memory() { ::munmap(m_thing, sizeof(Thing)); }
    Shared_Memory(const Shared_Memory&) = delete;
    Shared_Memory& operator=(const Shared_Memory&) = delete;
    Thing* operator->() { return m_thing; }
    Thing* get() { return m_thing; }

private:
    Thing* m_thing;
};

std::string end_of(int file)
{
    const off_t size = ::lseek(file, 0, SEEK_END);
    std::string text(std::min<std::size_t>(static_cast<std::size_t>(std::max<off_t>(size, 0)), longest_output), '\0');
    const ssize_t got = ::pread(file, text.data(), text.size(), size - static_cast<off_t>(text.size()));
    text.resize(static_cast<std::size_t>(std::max<ssize_t>(got, 0)));
    return text;
}

std::string how_it_ended(int status)
{
    if (WIFSIGNALED(status)) return std::string("the process was ended by ") + strsignal(WTERMSIG(status)) + '\n';
    if (WEXITSTATUS(status) != 0) return "the process ended with " + std::to_string(WEXITSTATUS(status)) + '\n';
    return {};
}

} // namespace

void Run_Watch::step(const std::string& what)
{
    // Torn at worst, when the parent reads it meanwhile.
    std::snprintf(m_shared->newest, sizeof m_shared->newest, "%s", what.c_str());
    m_shared->steps++;
}

void Run_Watch::complain(const std::string& why)
{
    send(complaint, why + '\n');
}

void Run_Watch::tell(const std::string& text)
{
    send(message, text);
}

// A kind, a length, the text.
void Run_Watch::send(char kind, const std::string& text)
{
    const std::uint64_t size = text.size();
    std::string record(1, kind);
    record.append(reinterpret_cast<const char*>(&size), sizeof size);
    record += text;
    for (std::size_t sent = 0; sent < record.size();) {
        const ssize_t put = ::write(m_channel, record.data() + sent, record.size() - sent);
        if (put < 0) std::abort();
        sent += static_cast<std::size_t>(put);
    }
}

// The parent's side of a run.
class One_Run {
    using Clock = std::chrono::steady_clock;

public:
    One_Run(const Run& run, bool prints) : m_run(run)
    {
        int ends[2];
        check(::pipe2(ends, O_CLOEXEC) == 0, "a pipe");
        m_channel = ends[0];
        m_output = ::memfd_create("output", MFD_CLOEXEC);
        check(m_output >= 0, "a file in memory");
        std::fflush(nullptr);
        m_process = ::fork();
        check(m_process >= 0, "a process");
        if (m_process == 0) {
            ::close(ends[0]);
            live(ends[1], prints);
        }
        ::close(ends[1]);
        ::fcntl(m_channel, F_SETFL, O_NONBLOCK);
    }
    ~One_Run()
    {
        if (m_process > 0) {
            ::kill(m_process, SIGKILL);
            ::waitpid(m_process, nullptr, 0);
        }
        ::close(m_channel);
        ::close(m_output);
    }
    One_Run(const One_Run&) = delete;
    One_Run& operator=(const One_Run&) = delete;

    /// What is to be read when it tells something, and when it ends.
    pollfd channel() const { return {m_channel, POLLIN, 0}; }
    /// Takes what it has told; ends it where it stands.
    bool has_ended()
    {
        char bytes[65536];
        ssize_t got;
        while ((got = ::read(m_channel, bytes, sizeof bytes)) > 0)
            m_received.append(bytes, static_cast<std::size_t>(got));
        if (got == 0) return true;
        const auto now = Clock::now();
        if (const unsigned steps = m_shared->steps; steps != m_seen) {
            m_seen = steps;
            m_seen_at = now;
        }
        if (now - m_seen_at <= (m_seen == 0 ? longest_start : m_run.patience)) return false;
        m_why = std::string("it stands at: ") + m_shared->newest + '\n';
        ::kill(m_process, SIGKILL);
        return true;
    }
    /// Once it has.
    Run_Result result()
    {
        int status = 0;
        check(::waitpid(std::exchange(m_process, -1), &status, 0) > 0, "the end of a process");
        if (m_why.empty() && (m_why = how_it_ended(status)) != "")
            m_why += std::string("at: ") + m_shared->newest + '\n';
        Run_Result result;
        result.failure = take_apart(m_received, result.told) + m_why;
        if (!result.failure.empty()) result.failure += end_of(m_output);
        return result;
    }

private:
    // The run's side.
    [[noreturn]] void live(int channel, bool prints)
    {
        ::prctl(PR_SET_PDEATHSIG, SIGKILL); // it must not outlive who watches it
        ::dup2(prints ? STDERR_FILENO : m_output, STDOUT_FILENO);
        if (!prints) ::dup2(m_output, STDERR_FILENO);
        Run_Watch watch(m_shared.get(), channel);
        try {
            separate_private_host();
            ::setenv("TMPDIR", "/var/log", 1); // what a killed run left there goes with its host
            m_run.work(watch);
        } catch (const std::exception& error) {
            watch.complain(std::string("it threw: ") + error.what());
        }
        watch.step("the exit of the process");
        std::exit(0); // with the sanitizers' last words
    }

    static std::string take_apart(const std::string& received, std::string& told)
    {
        std::string complaints;
        std::uint64_t size = 0;
        for (std::size_t at = 0; at + 1 + sizeof size <= received.size(); at += 1 + sizeof size + size) {
            std::memcpy(&size, received.data() + at + 1, sizeof size);
            (received[at] == complaint ? complaints : told) += received.substr(at + 1 + sizeof size, size);
        }
        return complaints;
    }

    const Run& m_run;
    Shared_Memory<Run_Watch::Shared> m_shared;
    int m_channel = -1, m_output = -1;
    pid_t m_process = -1;
    std::string m_received, m_why;
    unsigned m_seen = 0; // of its steps
    Clock::time_point m_seen_at = Clock::now();
};

Run_Result do_run(const Run& run, bool prints)
{
    One_Run one(run, prints);
    while (!one.has_ended()) {
        pollfd channel = one.channel();
        ::poll(&channel, 1, longest_wait);
    }
    return one.result();
}

void do_runs(const std::vector<Run>& runs, unsigned at_once,
             const std::function<void(std::size_t index, const Run_Result&)>& done)
{
    std::map<std::size_t, One_Run> under_way; // by index
    for (std::size_t next = 0; next < runs.size() || !under_way.empty();) {
        for (; next < runs.size() && under_way.size() < at_once; next++)
            under_way.try_emplace(next, runs[next], false);
        std::vector<pollfd> channels;
        for (const auto& [index, one] : under_way)
            channels.push_back(one.channel());
        ::poll(channels.data(), channels.size(), longest_wait);
        for (auto at = under_way.begin(); at != under_way.end();) {
            auto& [index, one] = *at;
            const bool has_ended = one.has_ended();
            if (has_ended) done(index, one.result());
            at = has_ended ? under_way.erase(at) : std::next(at);
        }
    }
}

} // namespace nvrtest
