// One action: its port and its service are found, the user is asked, and the answer is told in words.
#include "host/command/Actions.h"
#include "host/command/Arguments.h"
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
#include <iostream>

namespace host {
namespace {

using Json = nlohmann::ordered_json;

constexpr char fc_port_class[] = "NVRHBA_FCPort";

class Runner {
public:
    Runner(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
        : m_server(server), m_options(options), m_action(*options.action), m_out(out), m_complaints(complaints)
    {
    }

    int run()
    {
        if (int status = find_port()) return status;
        if (!m_action.own) {
            if (int status = find_target()) return status;
            if (int status = read_inputs()) return status;
        }
        if (!m_action.question.empty() && !m_options.yes &&
            !confirm(m_action.question + ' ' + port_name() + '?', std::cin, m_complaints)) {
            m_complaints << "nvrcim: nothing was changed\n";
            return declined;
        }
        if (m_action.own) return m_action.own({m_server, m_options, m_action, m_port, m_out, m_complaints});
        return m_action.service.empty() ? set_property() : call();
    }

private:
    int wrong(const std::string& text) { return tell_wrong(text, m_complaints); }
    int failed(const Status& status) { return tell_failure(status, m_options, m_out, m_complaints); }
    int not_there(const std::string& text) { return failed({CMPI_RC_ERR_NOT_FOUND, text, Fault::request}); }
    std::string port_name() const { return key_text(m_port, "DeviceID"); }

    int find_port()
    {
        return host::find_port(m_server, m_options, fc_port_class, "name a port with --port", m_port, m_out,
                               m_complaints);
    }
    int find_target();
    int read_inputs();
    int read_input(const Input& input);
    int add_argument(const std::string& name, const std::string& text, bool verbatim);
    int call();
    std::string out_text(const Named_Value& out) const;
    int set_property();
    void tell(const std::string& result) const
    {
        m_out << m_action.group << ' ' << m_action.verb << ", port " << port_name() << ": " << result << "\n";
    }

    Host& m_server;
    const Options& m_options;
    const Action& m_action;
    std::ostream& m_out;
    std::ostream& m_complaints;
    Path m_port, m_target;
    const Method_Record* m_method = nullptr;
    std::vector<Named_Value> m_arguments;
};

/// The service's instance, or the port itself. 0, or the exit status.
int Runner::find_target()
{
    const std::string& name = m_action.service.empty() ? fc_port_class : m_action.service;
    const Class_Record* record = m_server.schema().find(name);
    if (!record) return failed({CMPI_RC_ERR_INVALID_CLASS, "there is no class " + name, Fault::request});
    if (m_action.service.empty()) {
        m_target = m_port;
        return 0;
    }
    m_method = record->method(m_action.method);
    if (!m_method) return not_there(name + " has no method " + m_action.method);
    const Answer names = m_server.names(m_options.name_space, name);
    if (!names.ok()) return failed(names.status);
    for (const Path& path : names.paths) {
        if (!m_action.service_name.empty() && key_text(path, "Name") != m_action.service_name) continue;
        m_target = path;
        m_arguments.push_back({"Target", Value::reference(m_port)});
        return 0;
    }
    return not_there("this host has no " + name);
}

int Runner::read_inputs()
{
    for (const Choice& fixed : m_action.fixed)
        if (int status = add_argument(fixed.word, fixed.value, false)) return status;
    for (const Input& input : m_action.inputs)
        if (int status = read_input(input)) return status;
    return 0;
}

int Runner::read_input(const Input& input)
{
    const auto given = m_options.given.find(input.label);
    std::string text = given == m_options.given.end() ? input.fallback : given->second;
    if (input.kind == Input::flag) {
        const bool is_set = given != m_options.given.end();
        return add_argument(input.parameter, input.choices.at(is_set ? 0 : 1).value, false);
    }
    if (text.empty() && given == m_options.given.end()) return 0;
    if (input.kind == Input::name) {
        const std::string digits = plain_name(text);
        const auto is_digit = [](unsigned char c) { return std::isxdigit(c) != 0; };
        if (digits.size() != 16 || !std::all_of(digits.begin(), digits.end(), is_digit))
            return wrong(input.label + " is a World Wide Name of sixteen hexadecimal digits, which " + text +
                         " is not");
        text = digits;
    }
    for (const Choice& choice : input.choices)
        if (choice.word == text) return add_argument(input.parameter, choice.value, false);
    return add_argument(input.parameter, text, true);
}

/// `verbatim`: a text counts as it is, whatever is in it.
int Runner::add_argument(const std::string& name, const std::string& text, bool verbatim)
{
    const Class_Record* record = m_server.schema().find(m_target.class_name);
    const Element_Record* element = m_method ? m_method->find_parameter(name)
                                    : record ? record->property(name)
                                             : nullptr;
    if (!element) return not_there(m_target.class_name + " takes no " + name);
    if (verbatim && element->type == CMPI_string) {
        m_arguments.push_back({element->name, Value::string(text)});
        return 0;
    }
    const Argument_Parse argument = parse_argument(*element, text, m_server.schema(), m_options.name_space);
    if (!argument.ok) return wrong(argument.error);
    m_arguments.push_back(argument.argument);
    return 0;
}

int Runner::call()
{
    Answer answer;
    {
        const Progress progress(m_action.doing);
        answer = m_server.call(m_target, m_method->name, m_arguments);
    }
    if (!answer.ok()) return failed(answer.status);
    const std::uint64_t value = answer.value.as_uint();
    const std::string words = return_words(m_action.meanings, value);
    const int status = value == 0 ? 0 : returned_another;
    if (m_options.json) {
        Json out = Json::object();
        for (const Named_Value& each : answer.out)
            out[each.name] = to_json(each.value);
        m_out << json_text({{"status", 0},
                            {"port", port_name()},
                            {"returnValue", to_json(answer.value)},
                            {"meaning", words},
                            {"out", out}});
        return status;
    }
    if (m_options.csv) {
        std::vector<Named_Value> fields = {
            {"port", Value::string(port_name())}, {"returnValue", answer.value}, {"meaning", Value::string(words)}};
        fields.insert(fields.end(), answer.out.begin(), answer.out.end());
        m_out << csv_record(fields);
        return status;
    }
    tell(words + " (" + answer.value.to_text() + ")");
    for (const Named_Value& each : answer.out) {
        if (each.value.is_null()) continue;
        const std::string text = out_text(each);
        m_out << "  " << each.name << " = " << printable(text) << "\n";
    }
    return status;
}

/// An out parameter's value with what it means to this action.
std::string Runner::out_text(const Named_Value& out) const
{
    const auto meanings = m_action.out_meanings.find(out.name);
    const auto bits = m_action.out_bits.find(out.name);
    std::string words;
    if (meanings != m_action.out_meanings.end()) words = words_among(meanings->second, out.value.as_uint());
    if (bits != m_action.out_bits.end()) words = words_of_bits(bits->second, out.value.as_uint());
    if (words.empty()) return value_text_with_number(m_method->find_parameter(out.name), out.value);
    return out.value.to_text() + " (" + words + ")";
}

int Runner::set_property()
{
    Instance instance;
    instance.path = m_port;
    instance.properties = m_port.keys;
    std::vector<std::string> names;
    for (const Named_Value& argument : m_arguments) {
        instance.set(argument.name, argument.value);
        names.push_back(argument.name);
    }
    const Answer answer = m_server.modify(instance, names);
    if (!answer.ok()) return failed(answer.status);
    if (m_options.json)
        m_out << json_text({{"status", 0}, {"port", port_name()}});
    else if (m_options.csv)
        m_out << csv_record({{"port", Value::string(port_name())}});
    else
        tell("done");
    return 0;
}

} // namespace

int run_action(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    return Runner(server, options, out, complaints).run();
}

} // namespace host
