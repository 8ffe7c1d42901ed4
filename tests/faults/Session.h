/// The life of the module as a script: whatever can be made to fail may fail at any place of it.
///
///     Session session;
///     for (const Session::Part& part : Session::parts())
///         session.run(part);
///
/// From the load to the unload, everything is asked for once that a client can ask for: all classes, all traversals,
/// each method, each diagnostic test, alerts, a refresh. No answer is needed for the script to go on: what is not there
/// is asked for by the name that it has on a sound host. Between two requests no refresh runs, so that two sessions
/// make the same library calls in the same order.
///
/// For programs with a private host that link support/Test_Clock.cpp. One at a time, on one thread.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "tests/faults/Settings_Files.h"
#include "tests/module/support/Rig.h"

namespace nvrtest {

struct Service_Method;

class Session {
public:
    struct Part {
        const char* name;
        void (Session::*run)();
    };
    /// In order; the first loads the module, the last one unloads it.
    static const std::vector<Part>& parts();
    /// Minutes, as the settings file has it at first and the script leaves it; not what the module has without a file.
    static constexpr unsigned time_out = 20;
    /// The words for a part, to find one by.
    static const Part& part(const std::string& name);

    /// A host with simulated hardware and a server. Nothing of the module is loaded before the first part.
    /// `before_request` hears what is about to be asked, on the thread that asks.
    explicit Session(std::function<void(const std::string&)> before_request = {});

    void run(const Part& part);

    /// What clients read after the next refresh of the host as it was at first: hardware as the scenario has it, no
    /// faults. Every class's instances as text, but for the entries of the module's log and their ties, which tell of
    /// the past. Throws std::runtime_error if a class does not answer.
    std::string published();
    /// One class of it, without the refresh.
    std::string published(const std::string& class_name);

    /// What clients do after any load: alerts, a service, a diagnostic test. Result: what did not succeed.
    std::vector<std::string> serve_clients();

    /// Requests that did not succeed so far, with their statuses; none on a sound host.
    const std::vector<std::string>& failures() const { return m_failures; }
    /// What the settings files are to hold after an unload, by what was answered so far.
    const Settings_Files& settings() const { return m_settings; }
    Rig& rig() { return m_rig; }

private:
    void load();
    void enumerate_all();
    void traverse_all();
    void traverse(const host::Path& source, const std::string& through);
    void call_services();
    void call_service(const Service_Method& method);
    void modify_instances();
    void set_time_out(unsigned minutes);
    void set_log_state(bool is_enabled);
    void run_diagnostics();
    void run_diagnostic(const std::string& name);
    void steer_logs();
    void receive_alerts();
    void refresh();
    void unload();

    host::Answer ask(const std::string& what, const std::function<host::Answer(host::Host&)>& request);
    bool modify(const host::Path& path, const std::string& property, const host::Value& value);
    /// The same for a method that returns 0 when it is done: whether it has.
    bool call(const host::Path& path, const std::string& method, const std::vector<host::Named_Value>& arguments);

    const std::function<void(const std::string&)> m_before_request;
    Rig m_rig;
    Settings_Files m_settings{time_out};
    std::vector<std::string> m_failures;
};

} // namespace nvrtest
