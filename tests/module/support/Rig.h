/// A host with the module in it, for one test: name and address, settings files, a trace file, simulated hardware, and
/// a CIM server of some manner that knows the module's classes. The module is reached as a server reaches it, by its
/// exported entries.
///
///     Rig rig;
///     EXPECT_EQ(rig.enumerate("NVRHBA_FCPort").instances.size(), 4u);
///
/// For programs with a private host. One at a time; its server may be asked from many threads.
#pragma once

#include <functional>
#include <ios>
#include <memory>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "host/Host.h"
#include "tests/support/trace.h"

namespace nvrtest {

constexpr char conf_path[] = "/etc/norvane_fc_provider.conf";
constexpr char dmp_path[] = "/etc/norvane_fc_provider.dmp";
/// The trace file that the second of them names.
constexpr char trace_path[] = "/var/log/norvane.trace";

/// The host's official name and address.
constexpr char rig_host_name[] = "storage1.norvane.test";
constexpr char rig_host_address[] = "192.0.2.17";

/// The manner of the tests that are the same in all: the one that NORVANE_MANNER names, `strict` without it.
const host::Manner& manner_asked_for();

struct Rig_Options {
    host::Manner manner = manner_asked_for();
    /// As load_scenario takes it.
    std::string scenario = "typical";
    /// Content of the settings file; empty: there is none.
    std::string settings = {};
    /// The simulated libraries that are installed.
    std::vector<std::string> libraries = {"HBAAPI", "lrmapi", "rmapi", "tssdm"};
    /// A variant of the simulator instead of them.
    std::string variant = {};
    /// The file that serves the module's classes.
    std::string module = NVR_MODULE;
};

/// Settings under which each time-out reads the adapters anew.
constexpr char refreshing_settings[] = "NVR_PROVIDER_REFRESH_ADAPTERDATA = TRUE\n";

class Rig {
public:
    explicit Rig(const Rig_Options& options = {});
    ~Rig();
    Rig(const Rig&) = delete;
    Rig& operator=(const Rig&) = delete;

    host::Host& server() { return *m_server; }
    /// In the namespace of the module.
    host::Answer enumerate(const std::string& class_name, host::Property_List properties = {});
    host::Answer names(const std::string& class_name);
    /// All classes that the module serves, in the order of the server's registrations.
    std::vector<std::string> classes();

    /// Lets the cache grow old, asks, and waits until the refresh that this starts has ended.
    void refresh();
    /// Waits until so many refreshes have ended since the start of the trace.
    void wait_for_refreshes(std::size_t count);
    /// Waits until every refresh that has started has ended.
    void settle();
    /// From now on this tells whether no refresh runs, and not the words of the log, which are lost where a refresh
    /// cannot start or a client switches the log off: each of these waits until it says so.
    void tell_refreshes_by(std::function<bool()> none_runs);
    /// How many have ended.
    std::size_t refreshes() const;

    /// The words of the module's log so far, or since the last forget_words().
    std::vector<std::string> words() const;
    void forget_words();
    /// Bytes of the log so far, and its words behind so many with the threads that logged them.
    std::streamoff log_size() const;
    std::vector<Trace_Line> lines_from(std::streamoff size) const;
    /// How many of them are this one.
    std::size_t count_words(const std::string& word) const;

    /// Stops the server, as at its end, and starts another one: the module is loaded anew at the first request.
    void restart();
    void stop();

private:
    void start();

    const Rig_Options m_options;
    std::string m_trace_path;
    std::size_t m_forgotten = 0;
    /// What the trace has told of refreshes, read as far as `read`.
    struct Told {
        std::streamoff read = 0;
        std::size_t starts = 0, ends = 0;
    };
    const Told& told() const;
    mutable Told m_told;
    std::function<bool()> m_none_runs;
    std::unique_ptr<host::Host> m_server;
};

/// The schema of the module's classes, read once.
std::shared_ptr<const host::Schema> module_schema();

/// Its registrations, which the module's file tells, read once.
const std::vector<host::Registration>& module_registrations();

/// Objects that the module made and did not give back, but for strings: those in arrays live until their call returns.
std::uint64_t left_beside_strings(const host::Report& report);

/// Matches an answer of status OK; the description tells the status.
MATCHER(succeeded, "")
{
    *result_listener << "status " << host::status_name(arg.status.code) << ' ' << arg.status.message;
    return arg.ok();
}

/// Matches an answer of that CMPI status.
MATCHER_P(failed_with, code, "")
{
    *result_listener << "status " << host::status_name(arg.status.code) << ' ' << arg.status.message;
    return arg.status.code == code;
}

/// The manners of real servers and the strictest one, for parameterised tests.
class Every_Manner : public testing::TestWithParam<const host::Manner*> {};
std::vector<const host::Manner*> every_manner();
/// All but the strict one.
std::vector<const host::Manner*> other_manners();
#define NVR_IN_MANNERS(prefix, manners, suite)                                                                         \
    INSTANTIATE_TEST_SUITE_P(prefix, suite, testing::ValuesIn(manners),                                                \
                             [](const auto& info) { return nvrtest::manner_label(*info.param); })
/// For tests whose threads meet.
#define NVR_THREADS_IN_EVERY_MANNER(suite) NVR_IN_MANNERS(In, nvrtest::every_manner(), suite)
/// For tests that ask one thing after the other: the sanitizers, under which they take up to ten times as long, see
/// them in the strict manner alone, and in the others (`Also/`) under the test presets that go through all.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#define NVR_IN_EVERY_MANNER(suite)                                                                                     \
    NVR_IN_MANNERS(In, std::vector{&host::Manner::strict()}, suite);                                                   \
    NVR_IN_MANNERS(Also, nvrtest::other_manners(), suite)
#else
#define NVR_IN_EVERY_MANNER(suite) NVR_IN_MANNERS(In, nvrtest::every_manner(), suite)
#endif
std::string manner_label(const host::Manner& manner);

} // namespace nvrtest
