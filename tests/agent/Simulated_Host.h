/// The agent over the simulated libraries: what the tests of this room stand on.
///
/// Each test has a process and an /etc of its own. The trace holds the log's words since the last agent began; the
/// agent's clock is the test's, and its sleeps move that clock and take no time.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "agent/Agent_Builders.h"
#include "agent/ProviderAgent.h"
#include "agent/enumerate.h"
#include "tests/support/log_capture.h"

namespace nvrtest {

using cimple::Instance;
using cimple::Ref;

/// What the refresh of this room's tests reaches on higher floors: nothing, until a test says so.
extern std::function<void(cimple::ProviderAgent&)> on_driver_log;

/// What these answer to it.
struct Higher_Floors {
    cimple::uint32 driver_log = 0, dumps = 0, virtual_ports = 0;
    std::function<cimple::uint32()> diagnostics; ///< null: 0
};
extern Higher_Floors higher_floors;

/// True: the next threads cannot be created.
extern bool no_more_threads;

/// True: the host does not tell its name.
extern bool no_host_name;

/// So many microseconds go by on the agent's clock, as the agent's sleeps let them.
void advance_clock(cimple::uint64 usec);
/// How long the agent has slept since the host began, in microseconds.
cimple::uint64 slept();
constexpr cimple::uint64 second = 1000000;
constexpr cimple::uint64 minute = 60 * second;

class SimulatedHost : public testing::Test {
protected:
    SimulatedHost();
    ~SimulatedHost() override;

    /// The simulator's folder of libraries becomes the loader's first; `only` names the faces that are there.
    static void install(const std::vector<std::string>& only = {"HBAAPI", "lrmapi", "rmapi", "tssdm"});
    /// Loads a scenario text.
    static void scenario(const std::string& toml);
    static void fault(const std::string& table);

    /// One provider's load and unload.
    int load();
    void unload();
    cimple::ProviderAgent& agent() { return *cimple::ProviderAgent::GetInstance(); }

    /// Enumerates as a provider of the map's class does, and waits for what it started.
    using Instances = std::vector<Ref<Instance>>;
    Instances plain(const cimple::Instance_Map& map);
    Instances san(const cimple::Instance_Map& map);
    /// Waits until no refresh runs.
    void settle();
    /// A whole refresh of the adapter side, as a change of the hardware asks for it.
    void refresh();

    /// The log's words so far, and forgets them.
    std::vector<std::string> words();

    /// Waits, as a thread beside the one that does, until the log has this word.
    void awaitWord(const std::string& word) const;

    /// The end of an agent takes all loggers off: puts the capture back, for the next one.
    void listenAgain();

    std::unique_ptr<Log_Capture> log;

private:
    long m_fetching = 0; // fetch threads that the forgotten words left running
};

/// Such a host with one provider loaded.
class LoadedHost : public SimulatedHost {
protected:
    LoadedHost() { EXPECT_EQ(load(), 0); }
    ~LoadedHost() override
    {
        settle();
        unload();
    }

    /// The only instance of a map of the adapter side, or of the SAN's; otherwise a failure and an empty one.
    Ref<Instance> only(const cimple::Instance_Map& map) { return only(plain(map), map); }
    Ref<Instance> onlySAN(const cimple::Instance_Map& map) { return only(san(map), map); }
    /// A host of one adapter with one port of these keys.
    static void port(const std::string& keys) { scenario("[[adapter]]\n[[adapter.port]]\n" + keys); }

private:
    static Ref<Instance> only(const Instances& all, const cimple::Instance_Map& map);
};

/// The value of a property as text: arrays as "{a,b}", null as "null".
std::string value(const Instance* instance, const char* property);
/// The same of a key of the end that a reference names.
std::string end(const Instance* association, const char* reference, const char* property);

bool collect(Instance* instance, int status, void* data);

constexpr const char* first_wwpn = "10000000C9A00001";

} // namespace nvrtest
