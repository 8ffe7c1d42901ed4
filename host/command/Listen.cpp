// nvrcim listen: subscriptions, and alerts printed as they come.
#include "host/command/Listing.h"
#include "host/command/Logs.h"
#include "host/command/Table.h"
#include "host/command/Verbs.h"
#include "host/command/Views.h"

#include <nlohmann/json.hpp>

#include <csignal>
#include <mutex>
#include <pthread.h>

namespace host {
namespace {

constexpr char alert_class[] = "NVRHBA_AlertIndication";
constexpr int enough = SIGUSR1; ///< what the last alert sends

/// Signals that end the listening, kept from all threads that are made from now on, the module's too.
class Ending_Signals {
public:
    Ending_Signals()
    {
        sigemptyset(&m_set);
        for (const int signal : {SIGINT, SIGTERM, SIGHUP, enough})
            sigaddset(&m_set, signal);
        pthread_sigmask(SIG_BLOCK, &m_set, nullptr);
    }
    void wait() const
    {
        int signal = 0;
        sigwait(&m_set, &signal);
    }

private:
    sigset_t m_set;
};

/// "2026-11-21 20:15:03.784571" of a date-time; any other text as it is.
std::string time_text(const std::string& time)
{
    if (time.size() != 25 || time[14] != '.') return time;
    return time.substr(0, 4) + "-" + time.substr(4, 2) + "-" + time.substr(6, 2) + " " + time.substr(8, 2) + ":" +
           time.substr(10, 2) + ":" + time.substr(12, 9);
}

/// Prints or counts alerts. Called on the module's threads, one alert at a time.
class Printer {
public:
    Printer(const Options& options, std::ostream& out)
        : m_options(options), m_out(out), m_left(options.count), m_listener(pthread_self())
    {
        if (options.csv && !options.quiet)
            m_out << csv_line({"time", "namespace", "number", "description"}) << std::flush;
    }

    void take(const Indication& indication)
    {
        std::lock_guard lock(m_mutex);
        if (m_options.count != 0 && m_left == 0) return;
        m_seen++;
        if (!m_options.quiet) {
            print(indication);
            m_out.flush();
        }
        if (m_options.count != 0 && --m_left == 0) pthread_kill(m_listener, enough);
    }
    std::size_t seen()
    {
        std::lock_guard lock(m_mutex);
        return m_seen;
    }

private:
    void print(const Indication& indication)
    {
        const Instance& alert = indication.instance;
        if (m_options.json) {
            // One line each, for those who read line by line.
            const nlohmann::ordered_json json = {{"namespace", indication.name_space}, {"alert", to_json(alert)}};
            m_out << json.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace) << "\n";
            return;
        }
        if (m_options.csv) {
            m_out << csv_line({time_text(alert.get("EventTime").as_text()), indication.name_space,
                               alert.get("SequenceNumber").to_text(), alert.get("Description").as_text()});
            return;
        }
        m_out << printable(time_text(alert.get("EventTime").as_text()) + "  " + indication.name_space + "  " +
                           alert.get("SequenceNumber").to_text() + "  " + alert.get("Description").as_text())
              << "\n";
    }

    const Options& m_options;
    std::ostream& m_out;
    std::mutex m_mutex;
    std::size_t m_seen = 0, m_left;
    const pthread_t m_listener;
};

/// The server knows each class in the namespaces that it was registered for: adds those that are asked for.
void register_in(Host& server, const std::vector<std::string>& name_spaces)
{
    for (Registration registration : server.registrations()) {
        if (!same_name(registration.class_name, alert_class)) continue;
        std::vector<std::string> missing;
        for (const std::string& name_space : name_spaces) {
            bool known = false;
            for (const std::string& one : registration.name_spaces)
                known = known || same_name(one, name_space);
            if (!known) missing.push_back(name_space);
        }
        if (missing.empty()) continue;
        registration.name_spaces = missing;
        server.add(registration);
    }
}

/// What the provider answered to being enabled, which a manner may ask on a thread of its own; empty: no complaint.
std::string trouble_of_enabling(const Host& server)
{
    for (const std::string& line : server.log())
        if (line.find("enableIndications") != std::string::npos && line.find("CMPI_RC_ERR") != std::string::npos)
            return line;
    return "";
}

} // namespace

int listen(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    std::vector<std::string> name_spaces = {options.name_space};
    for (const std::string& name_space : options.also) {
        bool known = false;
        for (const std::string& one : name_spaces)
            known = known || same_name(one, name_space);
        if (!known) name_spaces.push_back(name_space);
    }
    const Ending_Signals signals;
    Printer printer(options, out);
    register_in(server, name_spaces);
    std::vector<int> subscriptions;
    Status status;
    std::string spaces;
    for (const std::string& name_space : name_spaces) {
        int id = 0;
        status = server.subscribe(
            name_space, alert_class, [&](const Indication& indication) { printer.take(indication); }, id);
        if (!status.ok()) break;
        subscriptions.push_back(id);
        spaces += (spaces.empty() ? "" : ", ") + name_space;
    }
    if (status.ok()) {
        server.settle();
        if (const std::string trouble = trouble_of_enabling(server); !trouble.empty())
            complaints << "nvrcim: not every port is watched: " << printable(trouble) << "\n";
        complaints << "nvrcim: listening in " << printable(spaces) << std::endl;
        signals.wait();
    }
    for (const int id : subscriptions)
        server.unsubscribe(id);
    if (!status.ok()) return tell_failure(status, options, out, complaints);
    if (options.quiet) {
        if (options.json)
            out << json_text({{"status", 0}, {"alerts", printer.seen()}});
        else if (options.csv)
            out << csv_record({{"alerts", Value::uint64(printer.seen())}});
        else
            out << printer.seen() << (printer.seen() == 1 ? " alert\n" : " alerts\n");
    }
    return 0;
}

} // namespace host
