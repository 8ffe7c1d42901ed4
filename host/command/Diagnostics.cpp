#include "host/command/Diagnostics.h"

#include "host/command/Actions.h"
#include "host/command/Dialogue.h"
#include "host/command/Keys.h"
#include "host/command/Listing.h"
#include "host/command/Meanings.h"
#include "host/command/Options.h"
#include "host/command/Table.h"
#include "host/command/Verbs.h"
#include "host/command/Views.h"

#include <nlohmann/json.hpp>

#include <algorithm>

namespace host {
namespace {

using Json = nlohmann::ordered_json;

constexpr char test_class[] = "NVRHBA_FCHBADiagnosticTest";
constexpr char setting_class[] = "NVRHBA_FCHBADiagnosticSettingData";
constexpr char port_class[] = "NVRHBA_PortController";
constexpr char log_class[] = "NVRHBA_DiagnosticsLog";
constexpr char record_class[] = "NVRHBA_DiagnosticCompletionRecord";
constexpr std::uint64_t passed = 2; // CompletionState

const Meanings meanings = {
    {0, "carried out"},
    {1, "there is no such test"},
    {5, "the test, its settings or its target are not possible"},
    {40001, "there is no loopback plug, or the target or the port is none, or the library refused"},
};

/// "external-loopback" for "NVR:FCHBA External Loopback Test".
std::string short_name(const std::string& name)
{
    const std::string front = "NVR:FCHBA ", back = " Test";
    if (name.size() <= front.size() + back.size() || name.compare(0, front.size(), front) != 0) return name;
    std::string middle = lower_case(name.substr(front.size(), name.size() - front.size() - back.size()));
    std::replace(middle.begin(), middle.end(), ' ', '-');
    return middle;
}

/// The first element of an array as text; empty for none.
std::string first_text(const Value& array)
{
    return array.elements().empty() ? "" : array.elements().front().to_text();
}

class Diagnostics {
public:
    Diagnostics(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
        : m_server(server), m_options(options), m_out(out), m_complaints(complaints)
    {
    }

    int verb()
    {
        if (m_options.method == "list") return list();
        if (m_options.method == "run") return run();
        if (m_options.method == "results") return results();
        return clear();
    }

private:
    int wrong(const std::string& text) { return tell_wrong(text, m_complaints); }
    int failed(const Status& status) { return tell_failure(status, m_options, m_out, m_complaints); }
    int not_there(const std::string& text) { return failed({CMPI_RC_ERR_NOT_FOUND, text, Fault::request}); }
    bool given(const char* option) const { return m_options.given.count(option) != 0; }

    int list();
    int run();
    int results();
    int clear();

    /// The instance of this class that belongs to the test which the user named, by this key. 0, or the exit status.
    int find_of_test(const char* class_name, const char* key, Path& found);
    int read_settings(const std::string& test, Value& settings);
    int refuse_settings(const std::string& test);
    int tell_run(const Answer& answer, const std::string& test, const std::string& port);

    Host& m_server;
    const Options& m_options;
    std::ostream& m_out;
    std::ostream& m_complaints;
};

int Diagnostics::list()
{
    const auto all = [this](const char* name) { return m_server.enumerate(m_options.name_space, name).instances; };
    const Answer tests = m_server.enumerate(m_options.name_space, test_class);
    if (!tests.ok()) return failed(tests.status);
    const std::vector<Instance> settings = all(setting_class), services = all("NVRHBA_HelpService");
    const std::vector<Instance> offers = all("NVRHBA_AvailableDiagnosticService");
    Listing listing({{"test", "TEST"},
                     {"loops", "LOOPS"},
                     {"ports", "PORTS"},
                     {"options", "OPTIONS"},
                     {"description", "WHAT IT DOES"}});
    Json json = Json::array();
    for (const Instance& test : tests.instances) {
        const std::string name = test.get("Name").as_text();
        std::string loops, options, help;
        for (const Instance& setting : settings) {
            if (setting.get("InstanceID").as_text() != name) continue;
            loops = first_text(setting.get("LoopControlParameter"));
            if (!setting.get("BufferSizes").is_null()) options = "loops pattern size halt";
            if (!setting.get("TargetDevice").is_null()) options += " target";
        }
        for (const Instance& service : services)
            if (service.get("Name").as_text() == name) help = first_text(service.get("DocumentDescriptions"));
        Json ports = Json::array();
        for (const Instance& offer : offers) {
            const Path* provided = offer.get("ServiceProvided").as_path();
            const Path* port = offer.get("UserOfService").as_path();
            if (provided && port && key_text(*provided, "Name") == name) ports.push_back(key_text(*port, "DeviceID"));
        }
        listing.add({short_name(name), loops, std::to_string(ports.size()), options, help});
        json.push_back({{"test", short_name(name)}, {"name", name}, {"description", help}, {"ports", ports}});
    }
    if (m_options.json)
        m_out << json_text({{"status", 0}, {"tests", json}});
    else if (m_options.csv)
        m_out << listing.csv();
    else if (listing.empty())
        m_out << "this host has no diagnostic tests\n";
    else
        m_out << listing.table(page_width);
    return 0;
}

int Diagnostics::find_of_test(const char* class_name, const char* key, Path& found)
{
    const Answer names = m_server.names(m_options.name_space, class_name);
    if (!names.ok()) return failed(names.status);
    std::string known;
    for (const Path& path : names.paths) {
        const std::string name = key_text(path, key);
        known += (known.empty() ? "" : ", ") + short_name(name);
        if (name != m_options.object && short_name(name) != lower_case(m_options.object)) continue;
        found = path;
        return 0;
    }
    if (known.empty()) return not_there("this host has no diagnostic tests");
    return not_there("there is no test " + m_options.object + "; there are " + known);
}

/// The settings that the user gave, as an instance within the request; null if there are none.
int Diagnostics::read_settings(const std::string& test, Value& settings)
{
    if (m_options.given.empty()) return 0;
    Instance instance;
    instance.path.name_space = m_options.name_space;
    instance.path.class_name = setting_class;
    instance.path.set("InstanceID", Value::string(test));
    instance.set("InstanceID", Value::string(test));
    for (const auto& [label, text] : m_options.given) {
        if (label == "--loops") {
            instance.set("LoopControl", Value::array(CMPI_uint16, {Value::uint16(3)}));
            instance.set("LoopControlParameter", Value::array(CMPI_string, {Value::string(text)}));
        } else if (label == "--size") {
            const auto size = static_cast<std::uint32_t>(std::stoul(text));
            instance.set("BufferSizes", Value::array(CMPI_uint32, {Value::uint32(size)}));
        } else if (label == "--pattern") {
            std::vector<Value> bytes;
            for (const char c : text) {
                if (!std::isxdigit(static_cast<unsigned char>(c)))
                    return wrong("--pattern takes hexadecimal digits, which " + text + " are not");
                bytes.push_back(Value::uint8(static_cast<std::uint8_t>(c)));
            }
            instance.set("BufferPattern", Value::array(CMPI_uint8, bytes));
        } else if (label == "--target") {
            const std::string digits = plain_name(text);
            const auto is_digit = [](unsigned char c) { return std::isxdigit(c) != 0; };
            if (digits.size() != 16 || !std::all_of(digits.begin(), digits.end(), is_digit))
                return wrong("--target is a World Wide Name of sixteen hexadecimal digits, which " + text + " is not");
            instance.set("TargetDevice", Value::string(digits));
        } else {
            instance.set("HaltOnError", Value::boolean(true));
        }
    }
    settings = Value::instance(instance);
    return 0;
}

/// A setting that the test does not have would be dropped without a word.
int Diagnostics::refuse_settings(const std::string& test)
{
    if (m_options.given.empty()) return 0;
    for (const Instance& setting : m_server.enumerate(m_options.name_space, setting_class).instances) {
        if (setting.get("InstanceID").as_text() != test) continue;
        for (const auto& [label, text] : m_options.given)
            if (setting.get(label == "--target" ? "TargetDevice" : "BufferSizes").is_null())
                return wrong("the " + short_name(test) + " test takes no " + label +
                             "; diag list shows the options of each");
    }
    return 0;
}

int Diagnostics::run()
{
    Path test, port;
    if (int status = find_of_test(test_class, "Name", test)) return status;
    if (int status = find_port(m_server, m_options, port_class, "name a port", port, m_out, m_complaints))
        return status;
    const std::string name = key_text(test, "Name");
    std::vector<Named_Value> arguments = {{"ManagedElement", Value::reference(port)}};
    Value settings;
    if (int status = read_settings(name, settings)) return status;
    if (int status = refuse_settings(name)) return status;
    if (!settings.is_null()) arguments.push_back({"DiagnosticSettings", settings});
    Answer answer;
    {
        const Progress progress("running the " + short_name(name) + " test");
        answer = m_server.call(test, "RunDiagnosticService", arguments);
    }
    if (!answer.ok()) return failed(answer.status);
    return tell_run(answer, name, key_text(port, "DeviceID"));
}

int Diagnostics::tell_run(const Answer& answer, const std::string& test, const std::string& port)
{
    const std::uint64_t value = answer.value.as_uint();
    std::string job;
    for (const Named_Value& out : answer.out)
        if (const Path* path = same_name(out.name, "Job") ? out.value.as_path() : nullptr)
            job = key_text(*path, "InstanceID");
    std::string outcome, result;
    const std::vector<Instance> records =
        job.empty() ? std::vector<Instance>() : m_server.enumerate(m_options.name_space, record_class).instances;
    for (const Instance& record : records) {
        if (record.get("InstanceID").as_text() != job) continue;
        outcome = record.get("CompletionState").as_uint() == passed ? "passed" : "failed";
        result = record.get("RecordData").as_text();
        if (!record.get("CompletedCycles").is_null())
            result += ", " + record.get("LoopsPassed").to_text() + " of " + record.get("CompletedCycles").to_text() +
                      " loops passed in " + record.get("TimeToExecute").to_text() + " s";
    }
    std::string words = return_words(meanings, value);
    if (value == 0 && outcome.empty()) words = "not run: the port is disabled, has no beacon, or told of no result";
    if (m_options.json) {
        m_out << json_text({{"status", 0},
                            {"test", test},
                            {"port", port},
                            {"returnValue", value},
                            {"meaning", words},
                            {"job", job},
                            {"outcome", outcome},
                            {"result", result}});
    } else if (m_options.csv) {
        m_out << csv_record({{"test", Value::string(short_name(test))},
                             {"port", Value::string(port)},
                             {"returnValue", Value::uint64(value)},
                             {"meaning", Value::string(words)},
                             {"outcome", Value::string(outcome)},
                             {"result", Value::string(result)},
                             {"job", Value::string(job)}});
    } else {
        m_out << "diag run " << short_name(test) << ", port " << port << ": " << (outcome.empty() ? "" : outcome + ", ")
              << words << " (" << value << ")\n";
        if (!result.empty()) m_out << "  result = " << printable(result) << "\n";
        if (!job.empty()) m_out << "  job = " << printable(job) << "\n";
    }
    if (value != 0) return returned_another;
    return outcome == "passed" ? 0 : test_failed;
}

int Diagnostics::results()
{
    const Answer records = m_server.enumerate(m_options.name_space, record_class);
    if (!records.ok()) return failed(records.status);
    Listing listing({{"test", "TEST"},
                     {"outcome", "OUTCOME"},
                     {"passed", "PASSED"},
                     {"failed", "FAILED"},
                     {"seconds", "SECONDS"},
                     {"adapter", "ADAPTER"},
                     {"result", "RESULT"}});
    Json json = Json::array();
    for (const Instance& record : records.instances) {
        const std::string test = record.get("ServiceName").as_text();
        const auto text = [&record](const char* name) {
            return record.get(name).is_null() ? std::string() : record.get(name).to_text();
        };
        const std::string outcome = record.get("CompletionState").as_uint() == passed ? "passed" : "failed";
        listing.add({short_name(test), outcome, text("LoopsPassed"), text("LoopsFailed"), text("TimeToExecute"),
                     text("ManagedElementName"), text("RecordData")});
        json.push_back(to_json(record));
    }
    if (m_options.json)
        m_out << json_text({{"status", 0}, {"records", json}});
    else if (m_options.csv)
        m_out << listing.csv();
    else if (listing.empty())
        m_out << "no records of diagnostic tests: the module keeps them as long as it is loaded\n";
    else
        m_out << listing.table(page_width);
    return 0;
}

int Diagnostics::clear()
{
    std::vector<Path> logs;
    if (m_options.object.empty()) {
        const Answer names = m_server.names(m_options.name_space, log_class);
        if (!names.ok()) return failed(names.status);
        logs = names.paths;
        if (logs.empty()) return not_there("this host has no diagnostic logs");
    } else {
        logs.emplace_back();
        if (int status = find_of_test(log_class, "InstanceID", logs.front())) return status;
    }
    int status = 0;
    Json json = Json::array();
    Listing listing({{"log", "LOG"}, {"returnValue", "RETURNS"}, {"meaning", "MEANING"}});
    for (const Path& log : logs) {
        const Answer answer = m_server.call(log, "ClearLog");
        if (!answer.ok()) return failed(answer.status);
        const std::string name = short_name(key_text(log, "InstanceID"));
        const std::string words = answer.value.as_uint() == 0 ? "cleared" : "not cleared";
        listing.add({name, {answer.value.to_text(), answer.value}, words});
        if (!m_options.json && !m_options.csv)
            m_out << "log " << name << ": " << words << " (" << answer.value.to_text() << ")\n";
        json.push_back({{"log", name}, {"returnValue", to_json(answer.value)}});
        if (answer.value.as_uint() != 0) status = returned_another;
    }
    if (m_options.json) m_out << json_text({{"status", 0}, {"logs", json}});
    if (m_options.csv) m_out << listing.csv();
    return status;
}

} // namespace

int run_diagnostics(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    return Diagnostics(server, options, out, complaints).verb();
}

} // namespace host
