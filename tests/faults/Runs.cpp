#include "tests/faults/Runs.h"

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fcntl.h>
#include <new>
#include <poll.h>
#include <stdexcept>
#include <sys/file.h>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/support/private_host_setup.h"

namespace nvrtest {

namespace {

constexpr char complaint = 'c', message = 't';
constexpr std::size_t longest_output = 6000;
// Up to a run's first step: a busy machine makes hosts slowly.
constexpr std::chrono::milliseconds longest_start = std::chrono::minutes(1);

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
    }
    ~One_Run()
    {
        ::close(m_channel);
        ::close(m_output);
    }
    One_Run(const One_Run&) = delete;
    One_Run& operator=(const One_Run&) = delete;

    Run_Result wait()
    {
        using Clock = std::chrono::steady_clock;
        std::string received, why;
        auto seen_at = Clock::now();
        unsigned seen = 0;
        for (bool is_open = true; is_open;) {
            pollfd channel = {m_channel, POLLIN, 0};
            if (::poll(&channel, 1, 100) > 0) {
                char bytes[65536];
                const ssize_t got = ::read(m_channel, bytes, sizeof bytes);
                is_open = got > 0;
                if (got > 0) received.append(bytes, static_cast<std::size_t>(got));
            }
            if (const unsigned steps = m_shared->steps; steps != seen) {
                seen = steps;
                seen_at = Clock::now();
            }
            if (Clock::now() - seen_at > (seen == 0 ? longest_start : m_run.patience)) {
                why = std::string("it stands at: ") + m_shared->newest + '\n';
                ::kill(m_process, SIGKILL);
                break;
            }
        }
        int status = 0;
        check(::waitpid(m_process, &status, 0) == m_process, "the end of a process");
        Run_Result result;
        const std::string complaints = take_apart(received, result.told);
        if (why.empty() && (why = how_it_ended(status)) != "") why += std::string("at: ") + m_shared->newest + '\n';
        result.failure = complaints + why;
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
};

Run_Result do_run(const Run& run, bool prints)
{
    return One_Run(run, prints).wait();
}

void do_runs(const std::vector<Run>& runs, unsigned at_once,
             const std::function<void(std::size_t index, const Run_Result&)>& done)
{
    Shared_Memory<std::atomic<std::size_t>> next;
    const int turn = ::memfd_create("turn", MFD_CLOEXEC);
    check(turn >= 0, "a file in memory");
    const std::string turn_path = "/proc/self/fd/" + std::to_string(turn);
    std::fflush(nullptr);
    std::vector<pid_t> workers;
    for (unsigned i = 0; i < at_once; i++) {
        const pid_t worker = ::fork();
        check(worker >= 0, "a process");
        workers.push_back(worker);
        if (worker != 0) continue;
        ::prctl(PR_SET_PDEATHSIG, SIGKILL);
        try {
            const int own_turn = ::open(turn_path.c_str(), O_RDWR | O_CLOEXEC);
            check(own_turn >= 0, "the turn");
            for (std::size_t index; (index = (*next.get())++) < runs.size();) {
                const Run_Result result = do_run(runs[index]);
                ::flock(own_turn, LOCK_EX);
                done(index, result);
                std::fflush(nullptr);
                ::flock(own_turn, LOCK_UN);
            }
        } catch (const std::exception& error) {
            std::fprintf(stderr, "the runs end here: %s\n", error.what());
            std::fflush(nullptr);
            ::_exit(1);
        }
        ::_exit(0);
    }
    ::close(turn);
    bool whole = true;
    for (const pid_t worker : workers) {
        int status = 0;
        whole = ::waitpid(worker, &status, 0) == worker && WIFEXITED(status) && WEXITSTATUS(status) == 0 && whole;
    }
    if (!whole) throw std::runtime_error("not all runs were made");
}

} // namespace nvrtest
