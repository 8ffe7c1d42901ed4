#include "host/command/Logs.h"

#include "host/command/Actions.h"
#include "host/command/Listing.h"
#include "host/command/Table.h"
#include "host/command/Verbs.h"
#include "host/command/Views.h"

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <filesystem>

namespace host {
namespace {

using Json = nlohmann::ordered_json;

constexpr char log_class[] = "NVRHBA_RecordLog";
constexpr std::uint64_t state_enabled = 2, state_disabled = 3;
constexpr unsigned only_level = 5;

/// What becomes of a record, by the mode's number less 1.
struct Mode {
    const char* word;
    const char* meaning;
};
constexpr Mode modes[] = {{"ring", "the record log"},
                          {"file", "the trace file"},
                          {"none", "neither the record log nor the trace file"},
                          {"both", "the record log and the trace file"}};

std::string mode_words(std::uint64_t mode)
{
    const std::string number = std::to_string(mode);
    if (mode < 1 || mode > std::size(modes)) return mode == 0 ? "0: records are taken by nobody" : number;
    return number + ": records are taken by " + modes[mode - 1].meaning;
}

/// The number behind a word or a number; 0 for neither.
unsigned mode_number(const std::string& text)
{
    for (unsigned i = 0; i < std::size(modes); i++)
        if (text == modes[i].word || text == std::to_string(i + 1)) return i + 1;
    return 0;
}

bool is_driver_log(const Instance& log)
{
    return log.get("InstanceID").as_text().find("FC Driver") != std::string::npos;
}

/// The two logs of the module, as far as they are there.
struct Both_Logs {
    Status status;
    std::optional<Instance> provider, driver;
};

Both_Logs find_logs(Host& server, const Options& options)
{
    Answer answer = server.enumerate(options.name_space, log_class);
    Both_Logs logs;
    logs.status = answer.status;
    for (Instance& log : answer.instances)
        (is_driver_log(log) ? logs.driver : logs.provider) = std::move(log);
    return logs;
}

Answer request_state(Host& server, const Instance& log, std::uint64_t state)
{
    return server.call(log.path, "RequestStateChange",
                       {{"RequestedState", Value::uint16(static_cast<CMPIUint16>(state))}});
}

class Log_Run {
public:
    Log_Run(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
        : m_server(server), m_options(options), m_out(out), m_complaints(complaints)
    {
    }

    int run()
    {
        const Both_Logs logs = find_logs(m_server, m_options);
        if (!logs.status.ok()) return tell_failure(logs.status, m_options, m_out, m_complaints);
        if (!logs.provider) return missing("the provider's record log is not there");
        m_log = *logs.provider;
        const std::string& action = m_options.log_action;
        if (action == "show") return show();
        if (action == "clear") return tell(m_server.call(m_log.path, "ClearLog"), "the log is empty");
        if (action == "enable") return tell(request_state(m_server, m_log, state_enabled), "logging is enabled");
        if (action == "disable") return tell(request_state(m_server, m_log, state_disabled), "logging is disabled");
        if (action == "level") return set(m_options.log_number, mode_or(3), path());
        if (action == "mode") return set(only_level, mode_number(m_options.log_word), path());
        // A trace file beside the record log, where that takes records.
        const bool with_ring = mode_or(2) == 1 || mode_or(2) == 4;
        return set(only_level, with_ring ? 4 : 2, path());
    }

    int driver()
    {
        Both_Logs logs = find_logs(m_server, m_options);
        if (!logs.status.ok()) return tell_failure(logs.status, m_options, m_out, m_complaints);
        if (!logs.driver) return missing("there is no driver's log: no Fibre Channel adapter is there");
        const Answer read = request_state(m_server, *logs.driver, state_enabled);
        if (const int status = refused(read)) return status;
        const Answer lines = m_server.enumerate(m_options.name_space, "NVRHBA_FCDriverLogEntry");
        // To have the driver's log read switches the module's own logging on.
        if (logs.provider && logs.provider->get("EnabledState").as_uint() == state_disabled)
            request_state(m_server, *logs.provider, state_disabled);
        if (!lines.ok()) return tell_failure(lines.status, m_options, m_out, m_complaints);
        if (m_options.json) {
            Json texts = Json::array();
            for (const Instance& line : lines.instances)
                texts.push_back(line.get("RecordData").as_text());
            m_out << json_text({{"status", 0}, {"lines", texts}});
            return 0;
        }
        if (m_options.csv) {
            Listing listing(std::vector<Listing::Field>{{"line", ""}});
            for (auto line = lines.instances.rbegin(); line != lines.instances.rend(); ++line)
                listing.add({line->get("RecordData").as_text()});
            m_out << listing.csv();
            return 0;
        }
        for (auto line = lines.instances.rbegin(); line != lines.instances.rend(); ++line)
            m_out << printable(line->get("RecordData").as_text()) << "\n";
        if (lines.instances.empty()) m_out << "the system's log has no line of the driver\n";
        return 0;
    }

private:
    int missing(const std::string& text)
    {
        return tell_failure({CMPI_RC_ERR_NOT_FOUND, text, Fault::provider}, m_options, m_out, m_complaints);
    }

    bool is_enabled() const { return m_log.get("EnabledState").as_uint() == state_enabled; }

    std::uint64_t mode_or(std::uint64_t fallback) const
    {
        const std::uint64_t mode = m_log.get("LogMode").as_uint();
        return mode == 0 ? fallback : mode;
    }
    /// The trace file that was given, whole, since the module may stand in another folder; else the one in use.
    std::string path() const
    {
        if (m_options.file.empty()) return m_log.get("TracePath").as_text();
        std::error_code ignored;
        return std::filesystem::absolute(m_options.file, ignored).string();
    }

    int set(std::uint64_t level, std::uint64_t mode, const std::string& path)
    {
        const Answer answer = m_server.call(m_log.path, "SetLogParams",
                                            {{"LogLevel", Value::uint16(static_cast<CMPIUint16>(level))},
                                             {"LogMode", Value::uint16(static_cast<CMPIUint16>(mode))},
                                             {"TracePath", Value::string(path)}});
        return tell(answer, "level " + std::to_string(level) + ", mode " + mode_words(mode) +
                                (mode == 2 || mode == 4 ? ", " + path : "") +
                                (is_enabled() ? "" : "; logging is disabled"));
    }

    /// 0, or the exit status of a call that did not do what was asked, told.
    int refused(const Answer& answer)
    {
        if (!answer.ok()) return tell_failure(answer.status, m_options, m_out, m_complaints);
        const std::uint64_t value = answer.value.as_uint();
        if (value == 0) return 0;
        m_complaints << "nvrcim: the log refuses it (" << value << ")"
                     << (value == 32968 ? ": the level is always 5, and the trace file must be one that can be written"
                                        : "")
                     << "\n";
        if (m_options.json) m_out << json_text({{"status", 0}, {"returnValue", value}});
        if (m_options.csv) m_out << csv_record({{"returnValue", answer.value}});
        return returned_another;
    }
    int tell(const Answer& answer, const std::string& done)
    {
        if (const int status = refused(answer)) return status;
        if (m_options.json)
            m_out << json_text({{"status", 0}, {"returnValue", 0}});
        else if (m_options.csv)
            m_out << csv_record({{"returnValue", answer.value}});
        else
            m_out << printable(done) << "\n";
        return 0;
    }

    int show()
    {
        const Answer entries = m_server.enumerate(m_options.name_space, "NVRHBA_LogEntry");
        if (!entries.ok()) return tell_failure(entries.status, m_options, m_out, m_complaints);
        if (m_options.json) {
            Json records = Json::array();
            for (const Instance& entry : entries.instances)
                records.push_back(to_json(entry));
            m_out << json_text({{"status", 0}, {"log", to_json(m_log)}, {"records", records}});
            return 0;
        }
        Listing listing({{"time", "TIME"}, {"level", "LEVEL"}, {"record", "RECORD"}});
        for (const Instance& entry : entries.instances)
            listing.add({entry.get("CreationTimeStamp").to_text(), entry.get("LogLevel").as_text(),
                         entry.get("RecordData").as_text()});
        if (m_options.csv) {
            m_out << listing.csv();
            return 0;
        }
        const std::string trace = m_log.get("TracePath").as_text();
        m_out << "log         " << printable(m_log.get("InstanceID").as_text()) << "\n"
              << "state       " << (is_enabled() ? "enabled" : "disabled") << "\n"
              << "level       " << m_log.get("LogLevel").as_uint() << "\n"
              << "mode        " << mode_words(m_log.get("LogMode").as_uint()) << "\n"
              << "trace file  " << (trace.empty() ? "none" : printable(trace)) << "\n"
              << "records     " << entries.instances.size() << " of " << m_log.get("MaxNumberOfRecords").as_uint()
              << "\n";
        if (!listing.empty()) m_out << "\n" << listing.table(page_width);
        return 0;
    }

    Host& m_server;
    const Options& m_options;
    std::ostream& m_out;
    std::ostream& m_complaints;
    Instance m_log;
};

void add_log(CLI::App& app, Options& options)
{
    CLI::App* log = app.add_subcommand("log", "Show and steer the module's own log");
    log->require_subcommand(1);
    const auto add = [&](const char* name, const char* help) {
        CLI::App* action = log->add_subcommand(name, help);
        action->callback([&options, name] { options.log_action = name; });
        return action;
    };
    add("show", "Its state, and its records");
    add("level", "Set the level; there is one only, 5")
        ->add_option("level", options.log_number, "The level")
        ->required()
        ->check(CLI::Range(0, 65535));
    CLI::App* mode = add("mode", "Choose who takes records");
    mode->add_option("mode", options.log_word, "ring, file, none or both, or its number from 1")
        ->required()
        ->check([](const std::string& text) {
            return mode_number(text) ? std::string() : "the modes are ring, file, none and both";
        });
    mode->add_option("--trace", options.file, "The trace file, for the modes that have one");
    add("trace", "Write a trace file")->add_option("file", options.file, "The file; records go to its end")->required();
    add("clear", "Empty the record log and the trace file");
    add("enable", "Take records again");
    add("disable", "Take none");
}

} // namespace

void add_log_verbs(CLI::App& app, Options& options)
{
    add_log(app, options);
    app.add_subcommand("driverlog", "Show what the system's log says of the driver");
    CLI::App* listen = app.add_subcommand("listen", "Show alerts as they come, until Ctrl-C");
    listen->add_option("--also", options.also, "More namespaces in which to subscribe (a,b,c)")->delimiter(',');
    listen->add_option("--count", options.count, "End after so many")->check(CLI::Range(1, 2000000000));
    listen->add_flag("--quiet", options.quiet, "Only count them");
}

int run_log(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    return Log_Run(server, options, out, complaints).run();
}

int show_driver_log(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    return Log_Run(server, options, out, complaints).driver();
}

} // namespace host
