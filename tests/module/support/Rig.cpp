#include "tests/module/support/Rig.h"

#include <chrono>
#include <cstdlib>
#include <fstream>
#include <sched.h>
#include <stdexcept>
#include <thread>
#include <unistd.h>

#include "tests/module/support/Test_Clock.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

namespace nvrtest {

namespace {

constexpr char name_space[] = "root/norvane";
constexpr char refresh_start[] = "PERF: Creating DataFetch_Handler Thread.";
// Less than what ctest gives a test, so that it can tell why it failed.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr std::chrono::seconds patience{500};
#else
constexpr std::chrono::seconds patience{100};
#endif
constexpr char refresh_end[] = "PERF: DataFetch_Handler Thread END";

bool ends_with(const std::string& line, const std::string& end)
{
    return line.size() >= end.size() && line.compare(line.size() - end.size(), end.size(), end) == 0;
}

// The machine's own name stays what it is: the program has names of its own.
void name_host()
{
    static bool is_named = false;
    if (is_named) return;
    const std::string name = "storage1";
    if (::unshare(CLONE_NEWUTS) != 0 || ::sethostname(name.data(), name.size()) != 0)
        throw std::runtime_error("cannot give the host a name of its own");
    write_file("/etc/hosts",
               std::string("127.0.0.1 localhost\n") + rig_host_address + ' ' + rig_host_name + " storage1\n");
    write_file("/etc/nsswitch.conf", "hosts: files\n");
    write_file("/etc/host.conf", "multi on\n");
    is_named = true;
}

} // namespace

std::shared_ptr<const host::Schema> module_schema()
{
    static const std::shared_ptr<const host::Schema> schema = [] {
        std::string error;
        auto read = host::Schema::from_files({NVR_MOF_DIR}, error);
        if (!read) throw std::runtime_error(error);
        return read;
    }();
    return schema;
}

const std::vector<host::Registration>& module_registrations()
{
    static const std::vector<host::Registration> all = [] {
        host::Host server(module_schema());
        std::string error;
        if (server.add_module(NVR_MODULE, name_space, &error) == 0) throw std::runtime_error(error);
        return server.registrations();
    }();
    return all;
}

Rig::Rig(const Rig_Options& options) : m_options(options), m_trace_path(trace_path)
{
    name_host();
    remove(m_trace_path);
    write_file(dmp_path, "2,5,1\n" + m_trace_path);
    if (options.settings.empty())
        remove(conf_path);
    else
        write_file(conf_path, options.settings);
    if (options.variant.empty())
        compose_libraries(options.libraries);
    else
        compose_variant(options.variant);
    // Whether the machine has a transfer library must not show.
    write_file(library_folder() + "/libcurl.so", "No library of this name is installed.\n");
    clear_faults();
    load_scenario(options.scenario);
    start();
}

Rig::~Rig()
{
    stop();
}

void Rig::start()
{
    host::Host_Options options;
    options.manner = m_options.manner;
    m_server = std::make_unique<host::Host>(module_schema(), options);
    for (host::Registration registration : module_registrations()) {
        registration.module = m_options.module;
        m_server->add(registration);
    }
}

void Rig::stop()
{
    if (m_server) m_server->stop();
}

void Rig::restart()
{
    m_server.reset();
    start();
}

host::Answer Rig::enumerate(const std::string& class_name, host::Property_List properties)
{
    return m_server->enumerate(name_space, class_name, std::move(properties));
}

host::Answer Rig::names(const std::string& class_name)
{
    return m_server->names(name_space, class_name);
}

std::vector<std::string> Rig::classes()
{
    std::vector<std::string> names;
    for (const host::Registration& registration : m_server->registrations())
        names.push_back(registration.class_name);
    return names;
}

const Rig::Told& Rig::told() const
{
    std::ifstream trace(m_trace_path);
    trace.seekg(m_told.read);
    for (std::string line; std::getline(trace, line) && !trace.eof();) {
        m_told.read += static_cast<std::streamoff>(line.size()) + 1;
        m_told.starts += ends_with(line, refresh_start);
        m_told.ends += ends_with(line, refresh_end);
    }
    return m_told;
}

std::size_t Rig::refreshes() const
{
    return told().ends;
}

void Rig::wait_for_refreshes(std::size_t count)
{
    const auto deadline = std::chrono::steady_clock::now() + patience;
    while (m_none_runs ? !m_none_runs() : refreshes() < count) {
        if (std::chrono::steady_clock::now() > deadline) throw std::runtime_error("the refresh does not end");
        std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
}

void Rig::tell_refreshes_by(std::function<bool()> none_runs)
{
    m_none_runs = std::move(none_runs);
}

void Rig::settle()
{
    wait_for_refreshes(told().starts);
}

void Rig::refresh()
{
    // One that runs already would take the question for its own.
    const std::size_t before = told().starts;
    wait_for_refreshes(before);
    advance_clock(std::chrono::minutes(31));
    const host::Answer answer = enumerate("NVRHBA_ProviderConfigSetting");
    if (!answer.ok()) throw std::runtime_error("the question that starts a refresh failed: " + answer.status.message);
    wait_for_refreshes(before + 1);
}

std::vector<std::string> Rig::words() const
{
    std::vector<std::string> words = trace_file_words(m_trace_path);
    words.erase(words.begin(), words.begin() + static_cast<std::ptrdiff_t>(m_forgotten));
    return words;
}

std::streamoff Rig::log_size() const
{
    return std::ifstream(m_trace_path, std::ios::ate).tellg();
}

std::vector<Trace_Line> Rig::lines_from(std::streamoff size) const
{
    return trace_file_lines(m_trace_path, size);
}

void Rig::forget_words()
{
    m_forgotten = trace_file_words(m_trace_path).size();
}

std::size_t Rig::count_words(const std::string& word) const
{
    std::size_t count = 0;
    for (const std::string& one : words())
        count += one == word;
    return count;
}

std::uint64_t left_beside_strings(const host::Report& report)
{
    return report.left() - report.of(host::Object_Kind::string).left;
}

const host::Manner& manner_asked_for()
{
    const char* name = std::getenv("NORVANE_MANNER");
    const host::Manner* manner = name ? host::Manner::find(name) : &host::Manner::strict();
    if (!manner) throw std::runtime_error(std::string("no such manner: ") + name);
    return *manner;
}

std::vector<const host::Manner*> every_manner()
{
    return {&host::Manner::strict(), &host::Manner::sfcb(), &host::Manner::pegasus()};
}

std::vector<const host::Manner*> other_manners()
{
    return {&host::Manner::sfcb(), &host::Manner::pegasus()};
}

std::string manner_label(const host::Manner& manner)
{
    return manner.name;
}

} // namespace nvrtest
