// All that clients do, on eight threads at once: nobody waits for ever, and nothing is different afterwards.
//
// NVR_ROUNDS=1000 in the environment makes the rounds so many.
#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <mutex>
#include <random>
#include <stdexcept>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>

#include "simulator/nvrsim.h"
#include "tests/faults/Session.h"
#include "tests/module/support/Entries.h"
#include "tests/module/support/Firmware.h"
#include "tests/module/support/Instance_Text.h"
#include "tests/module/support/Quiet_Output.h"
#include "tests/module/support/Service_Methods.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/Watch.h"
#include "tests/support/simulator.h"
#include "tests/support/trace.h"

using namespace nvrtest;
using host::Value;
using testing::IsEmpty;
using namespace std::chrono_literals;

namespace {

constexpr char name_space[] = "root/norvane";
constexpr char settings_class[] = "NVRHBA_ProviderConfigSetting";
constexpr unsigned number_of_clients = 8;
constexpr std::uint32_t link_up = 514;

// What a call may take while no library is slow; the sanitizers' builds are.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr auto patience = 50s;
constexpr unsigned usual_rounds = 1;
#else
constexpr auto patience = 10s;
constexpr unsigned usual_rounds = 3;
#endif

unsigned rounds()
{
    const char* asked = std::getenv("NVR_ROUNDS");
    return asked ? static_cast<unsigned>(std::atoi(asked)) : usual_rounds;
}

/// A watch that ends the process, with the call's name, where a call waits too long.
class Watchdog {
public:
    template <class Call>
    auto during(const char* what, Call call)
    {
        const Watch::Turn turn(m_watch, what);
        return call();
    }

private:
    Watch m_watch{patience, [](const std::string& what) {
                      std::fprintf(stderr, "A call waits for ever: %s\n", what.c_str());
                      std::abort();
                  }};
};

/// Runs `body` on as many threads as there are clients, and waits for them.
void on_all_clients(const std::function<void(unsigned)>& body)
{
    std::vector<std::thread> threads;
    for (unsigned client = 0; client < number_of_clients; client++)
        threads.emplace_back(body, client);
    for (std::thread& thread : threads)
        thread.join();
}

/// Clients of one host, who do one thing after the other as dice say.
class Clients {
public:
    Clients(Rig& rig, Watchdog& watchdog) : m_rig(rig), m_watchdog(watchdog), m_classes(rig.classes())
    {
        m_ports = rig.names("NVRHBA_FCPort").paths;
        m_controllers = rig.names("NVRHBA_PortController").paths;
        m_tests = rig.names("NVRHBA_FCHBADiagnosticTest").paths;
        m_logs = rig.names("NVRHBA_DiagnosticsLog").paths;
        m_settings = rig.names(settings_class).paths;
        m_record_logs = rig.names("NVRHBA_RecordLog").paths;
        m_helps = rig.names("NVRHBA_HelpService").paths;
        m_dumps = rig.names("NVRHBA_DumpData").paths;
        for (const Service_Method& method : service_methods())
            m_methods.push_back({rig.names(method.service).paths.at(0), method.name, method.others});
    }

    void act(unsigned seed)
    {
        Dice dice(seed);
        for (unsigned i = 0; i < 25; i++)
            (this->*actions[dice() % actions.size()])(dice);
    }

    void advance(std::chrono::seconds by)
    {
        advance_clock(by);
        m_ahead.fetch_add(by.count(), std::memory_order_relaxed);
    }
    /// Between two lives: a year of rounds would show in what is published.
    void turn_clock_back() { advance_clock(-std::chrono::seconds(m_ahead.exchange(0))); }

    void restore_settings()
    {
        for (std::size_t which = 0; which < m_settings.size(); which++)
            change_setting(which, which == 0 ? Session::time_out : 1);
        set_driver_log(2);
        call(driver_log(), "ClearLog", {});
    }

    std::uint64_t asked() const { return m_asked; }
    std::uint64_t answered() const { return m_answered; }
    std::uint64_t unloads() const { return m_unloads; }
    /// Instances within instances in the answers since the last call: the bridge leaves such a one to its call's end.
    std::uint64_t take_embedded() { return m_embedded.exchange(0); }
    /// What no turn of the others can make right.
    const std::vector<std::string>& wrong() const { return m_wrong; }

private:
    using Dice = std::minstd_rand;
    using Action = void (Clients::*)(Dice& dice);
    static const std::vector<Action> actions;
    struct Method {
        host::Path service;
        const char* name;
        Arguments others;
    };

    template <class T>
    static const T& one_of(const std::vector<T>& all, Dice& dice)
    {
        return all.at(dice() % all.size());
    }

    template <class Request>
    void ask(const char* what, Request request)
    {
        const host::Answer answer = m_watchdog.during(what, [&] { return request(m_rig.server()); });
        m_asked.fetch_add(1, std::memory_order_relaxed);
        m_answered.fetch_add(answer.ok(), std::memory_order_relaxed);
        for (const host::Instance& instance : answer.instances)
            for (const host::Named_Value& property : instance.properties)
                m_embedded.fetch_add(property.value.type() == CMPI_instance && !property.value.is_null(),
                                     std::memory_order_relaxed);
        // What the module may answer changes with the others' turns; that it does is what counts.
        if (answer.status.fault != host::Fault::nobody && answer.status.fault != host::Fault::provider)
            found_wrong(what, answer.status);
    }
    void found_wrong(const char* what, const host::Status& status)
    {
        const std::lock_guard<std::mutex> lock(m_mutex);
        m_wrong.push_back(std::string(what) + ": " + status.message);
    }
    void call(const host::Path& path, const char* name, const Arguments& arguments)
    {
        ask(name, [&](host::Host& server) { return server.call(path, name, arguments); });
    }

    void enumerate(Dice& dice)
    {
        const std::string& name = one_of(m_classes, dice);
        if (name == "NVRHBA_AlertIndication") return;
        ask("enumerate", [&](host::Host& server) {
            return dice() % 2 ? server.enumerate(name_space, name) : server.names(name_space, name);
        });
    }
    void traverse(Dice& dice)
    {
        const host::Path& from = one_of(dice() % 2 ? m_ports : m_controllers, dice);
        const char* const over = dice() % 2 ? "NVRHBA_FCPortConformsToProfile" : "NVRHBA_ControlledBy";
        ask("associators", [&](host::Host& server) { return server.associators(from, over); });
        ask("reference names", [&](host::Host& server) { return server.reference_names(from, over); });
    }
    void get_live_values(Dice& dice)
    {
        advance(11s); // so that they are read again
        ask("get a port", [&](host::Host& server) { return server.get(one_of(m_ports, dice)); });
        const char* const name = dice() % 2 ? "NVRHBA_FCPortStatistics" : "NVRHBA_DriverParams";
        ask("enumerate live values", [&](host::Host& server) { return server.enumerate(name_space, name); });
    }
    void refresh(Dice&)
    {
        advance(31min);
        ask("start a refresh", [](host::Host& server) { return server.enumerate(name_space, settings_class); });
    }
    void change_a_setting(Dice& dice)
    {
        const std::size_t which = dice() % m_settings.size(); // the time-out, and two switches
        change_setting(which, which == 0 ? 1 + dice() % 30 : dice() % 2);
    }
    void serve(Dice& dice)
    {
        const Method& method = one_of(m_methods, dice);
        Arguments arguments = method.others;
        arguments.push_back({"Target", Value::reference(one_of(m_ports, dice))});
        call(method.service, method.name, arguments);
    }
    void diagnose(Dice& dice)
    {
        const host::Path& test = one_of(m_tests, dice);
        host::Instance settings;
        settings.path.class_name = "NVRHBA_FCHBADiagnosticSettingData";
        settings.path.name_space = name_space;
        settings.set("InstanceID", *test.find("Name"));
        settings.set("LoopControlParameter", texts_value({"2"}));
        settings.set("TargetDevice", Value::string("50060E8005A10000"));
        call(test, "RunDiagnosticService",
             {{"ManagedElement", Value::reference(one_of(m_controllers, dice))},
              {"DiagnosticSettings", Value::instance(settings)}});
        if (dice() % 4 == 0) call(one_of(m_logs, dice), "ClearLog", {});
        const host::Path& help = one_of(m_helps, dice);
        call(help, "GetHelp",
             {{"RequestedDocument", *help.find("Name")},
              {"Format", Value::uint16(1)},
              {"RequestedDelivery", Value::uint16(1)}});
    }
    // The provider's own log stays on, at what it tells: the rig reads it.
    void steer_logs(Dice& dice)
    {
        switch (dice() % 4) {
        case 0:
            return call(driver_log(), "ClearLog", {});
        case 1:
            return call(provider_log(), "RequestStateChange", {{"RequestedState", Value::uint16(2)}});
        case 2:
            return call(provider_log(), "SetLogParams",
                        {{"LogLevel", Value::uint16(5)},
                         {"LogMode", Value::uint16(2)},
                         {"TracePath", Value::string(trace_path)}});
        default:
            set_driver_log(static_cast<std::uint16_t>(2 + dice() % 2));
            ask("the driver's lines",
                [](host::Host& server) { return server.enumerate(name_space, "NVRHBA_FCDriverLogEntry"); });
        }
    }
    void modify(Dice& dice)
    {
        if (dice() % 2)
            change(one_of(m_ports, dice), "LocationIndicator",
                   Value::uint16(static_cast<std::uint16_t>(2 + dice() % 2)));
        else
            change(one_of(m_dumps, dice), "RetentionCount", Value::uint32(5 + dice() % 5));
    }
    void listen(Dice&)
    {
        int id = 0;
        const host::Status subscribed = m_watchdog.during("subscribe", [&] {
            return m_rig.server().subscribe(
                name_space, "NVRHBA_AlertIndication", [](const host::Indication&) {}, id);
        });
        if (!subscribed.ok()) return found_wrong("subscribe", subscribed);
        for (unsigned i = 0; i < 3; i++)
            m_watchdog.during("an event", [] { return nvrsim_event("0", link_up, 0); });
        // It may be gone: this server unloads what is idle, whoever listens.
        m_watchdog.during("unsubscribe", [&] { return m_rig.server().unsubscribe(id); });
    }
    void unload(Dice&)
    {
        const host::Unload_Result result =
            m_watchdog.during("unload what is idle", [&] { return m_rig.server().unload_idle(); });
        m_unloads.fetch_add(static_cast<unsigned>(result.closed), std::memory_order_relaxed);
    }

    void change_setting(std::size_t which, std::uint32_t value)
    {
        change(m_settings.at(which), "current", Value::uint32(value));
    }
    void change(const host::Path& path, const std::string& property, const Value& value)
    {
        host::Instance instance;
        instance.path = path;
        for (const host::Named_Value& key : path.keys)
            instance.set(key.name, key.value);
        instance.set(property, value);
        ask("modify", [&](host::Host& server) { return server.modify(instance, std::vector<std::string>{property}); });
    }
    const host::Path& record_log(const std::string& part) const
    {
        for (const host::Path& path : m_record_logs)
            if (path.to_text().find(part) != std::string::npos) return path;
        throw std::runtime_error("there is no log " + part);
    }
    const host::Path& driver_log() const { return record_log("Driver"); }
    const host::Path& provider_log() const { return record_log("ProviderLog"); }
    void set_driver_log(std::uint16_t state)
    {
        call(driver_log(), "RequestStateChange", {{"RequestedState", Value::uint16(state)}});
    }

    Rig& m_rig;
    Watchdog& m_watchdog;
    std::vector<std::string> m_classes;
    std::vector<host::Path> m_ports, m_controllers, m_tests, m_logs, m_settings, m_record_logs, m_helps, m_dumps;
    std::vector<Method> m_methods;
    std::atomic<std::uint64_t> m_asked{0}, m_answered{0}, m_unloads{0}, m_embedded{0};
    std::atomic<std::int64_t> m_ahead{0}; // seconds
    std::mutex m_mutex;
    std::vector<std::string> m_wrong;
};

const std::vector<Clients::Action> Clients::actions = {
    &Clients::enumerate, &Clients::enumerate,        &Clients::traverse,   &Clients::get_live_values,
    &Clients::refresh,   &Clients::change_a_setting, &Clients::serve,      &Clients::diagnose,
    &Clients::listen,    &Clients::unload,           &Clients::steer_logs, &Clients::modify,
};

} // namespace

TEST(Threads, OfAllThatClientsDoWaitForNoneForEverAndChangeNothing)
{
    Session session;
    Rig& rig = session.rig();
    // By the context that the server lends a refresh: clients switch the log off.
    rig.tell_refreshes_by([&] { return rig.server().report().contexts_not_detached == 0; });
    const std::string before = session.published();
    Watchdog watchdog;
    Clients clients(rig, watchdog);
    for (unsigned round = 0; round < rounds(); round++) {
        {
            const Quiet_Output quiet; // the bridge prints some of what it is asked
            on_all_clients([&](unsigned client) { clients.act(1 + round * number_of_clients + client); });
        }
        EXPECT_THAT(clients.wrong(), IsEmpty()) << "round " << round;
        EXPECT_THAT(rig.server().report().violations, IsEmpty()) << "round " << round;
        // A life ends while a refresh runs.
        clients.advance(31min);
        ASSERT_THAT(rig.enumerate(settings_class), succeeded());
        watchdog.during("stop", [&] { rig.stop(); });
        EXPECT_LE(left_beside_strings(rig.server().report()), clients.take_embedded())
            << rig.server().report().to_text();
        EXPECT_EQ(rig.server().report().contexts_not_detached, 0u);
        // The tag library's closing call is looked for in another library than its opening one, and not found.
        EXPECT_EQ(nvrsim_open_handles(), calls("CPQFC_OpenAdapter"));
        EXPECT_EQ(nvrsim_callbacks(), 0u);
        clients.turn_clock_back();
        rig.restart();
    }
    clients.restore_settings();
    rig.settle(); // a refresh that still runs would take the next one's question for its own
    EXPECT_EQ(difference(before, session.published()), "");
    EXPECT_GE(2 * clients.answered(), clients.asked());
    RecordProperty("asked", std::to_string(clients.asked()));
    RecordProperty("answered", std::to_string(clients.answered()));
    RecordProperty("unloads", std::to_string(clients.unloads()));
}

// Last clean-ups and first factories, from eight sides at once: the agent comes and goes all the time.
TEST(Threads, ThatLoadAndUnloadMeet)
{
    Rig rig({host::Manner::strict(), "small", refreshing_settings});
    Entries entries;
    Watchdog watchdog;
    const std::vector<std::string> classes = {"NVRHBA_FCPort", "NVRHBA_Product", "NVRHBA_StorageVolume",
                                              settings_class};
    const unsigned lives = 25 * rounds();
    const auto live = [&](unsigned client, const CMPIBroker* broker, const CMPIContext* context) {
        for (unsigned life = 0; life < lives; life++) {
            const std::string& name = classes[(client + life) % classes.size()];
            CMPIInstanceMI* mi = watchdog.during("a factory", [&] { return entries.instances(name, broker, context); });
            ASSERT_TRUE(mi) << name;
            CMPIStatus status;
            CMPIObjectPath* path = broker->eft->newObjectPath(broker, name_space, name.c_str(), &status);
            for (unsigned i = 0; i < life % 3; i++)
                watchdog.during("names", [&] { return mi->ft->enumerateInstanceNames(mi, context, nullptr, path); });
            path->ft->release(path);
            const CMPIStatus cleaned = watchdog.during("a clean-up", [&] { return mi->ft->cleanup(mi, context, 1); });
            EXPECT_EQ(cleaned.rc, CMPI_RC_OK) << name;
            // What the refresh's questions made the server load, which holds the agent too.
            watchdog.during("unload what is idle", [&] { return rig.server().unload_idle(); });
        }
    };
    on_all_clients([&](unsigned client) {
        rig.server().on_request_thread(
            [&](const CMPIBroker* broker, const CMPIContext* context) { live(client, broker, context); });
    });
    EXPECT_THAT(rig.server().report().violations, IsEmpty());
    rig.stop();
    EXPECT_EQ(rig.server().report().contexts_not_detached, 0u);
    EXPECT_EQ(nvrsim_open_handles(), 0u);
    const std::size_t loads = rig.count_words("Norvane Provider v2.5.19-1 Loaded[" + std::to_string(getpid()) + "]");
    EXPECT_GT(loads, 1u);
    EXPECT_EQ(rig.count_words("Norvane Provider Unloaded"), loads);
    RecordProperty("lives", std::to_string(loads));
}
