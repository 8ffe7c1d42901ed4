#include "host/command/Options.h"

#include "host/Manner.h"
#include "host/command/Actions.h"
#include "host/command/Completion.h"
#include "host/command/Logs.h"

#include <CLI/CLI.hpp>

#include <algorithm>
#include <iostream>
#include <iterator>

namespace host {
namespace {

/// Verbs whose answers are no rows.
const std::string without_rows[] = {"graph", "serve"};

constexpr const char* description =
    "nvrcim asks the Fibre Channel provider module as a CIM server would: it loads the module, calls it through CMPI,\n"
    "and shows what came back. No server is needed; with --scenario no adapter either.";

constexpr const char* footer =
    "Object paths are the usual WBEM text: [namespace:]Class.Key=value,Key=\"text\"\n"
    "Without a namespace, root/norvane is meant. Inside quotes write \\\" and \\\\; a reference is a quoted path.\n"
    "\n"
    "Arguments are name=value, read by the type that the class declares: number=5, mode=0x1F, name=\"any text\",\n"
    "ports=[1,2], state=OK (a word of the class), target=NVRHBA_FCPort.DeviceID=\"...\", gone=NULL.\n"
    "\n"
    "Examples:\n"
    "  nvrcim --scenario typical.toml enum NVRHBA_FCPort\n"
    "  nvrcim enum NVRHBA_FCPort --properties DeviceID,Speed --json\n"
    "  nvrcim get 'NVRHBA_ProviderConfigSetting.InstanceID=\"Norvane HBA Provider:cachetimeout\"'\n"
    "  nvrcim set 'NVRHBA_ProviderConfigSetting.InstanceID=\"Norvane HBA Provider:cachetimeout\"' current=20\n"
    "  nvrcim associators 'NVRHBA_PhysicalPackage.Tag=\"...\",CreationClassName=\"NVRHBA_PhysicalPackage\"' --names\n"
    "  nvrcim --scenario typical.toml tree\n"
    "  nvrcim --scenario typical.toml paths --csv\n"
    "  nvrcim ports --json\n"
    "  nvrcim --manner pegasus --server-log - names NVRHBA_Product\n"
    "  nvrcim port beacon on --port 10:00:00:00:c9:a0:00:01\n"
    "  nvrcim wwn change 10000000C9A0F001 20000000C9A0F001 --type volatile --yes\n"
    "  nvrcim log trace /var/log/norvane.trace\n"
    "  nvrcim listen --json\n"
    "  nvrcim diag run internal-loopback 10000000C9A00001 --loops 20 --pattern 5a5a\n"
    "\n"
    "Exit status: 0 done; a CIM status code (1 failed, 2 access denied, 3 no such namespace, 4 bad parameter,\n"
    "5 no such class, 6 not found, 7 not supported, ...); 64 for a command that cannot be understood; of the actions "
    "on\n"
    "ports and logs also 65, the question was answered with no, and 66, the method returned another value than 0;\n"
    "of diag run 67, the test found a fault.\n"
    "Environment: NVRCIM_MODULE, NVRCIM_MOF, NVRCIM_SIMULATOR name the places that are otherwise found beside nvrcim.";

std::string manners()
{
    std::string names;
    for (const Manner* manner : Manner::all())
        names += (names.empty() ? "" : ", ") + std::string(manner->name);
    return names;
}

/// Adds an input of an action to its verb; what is given goes into the options.
void add_input(CLI::App& verb, const Input& input, Options& options)
{
    if (input.kind == Input::flag) {
        verb.add_flag_callback(
            input.label, [&options, label = input.label] { options.given[label] = ""; }, input.help);
        return;
    }
    std::string help = input.help;
    std::vector<std::string> words;
    for (const Choice& choice : input.choices)
        words.push_back(choice.word);
    CLI::Option* option = verb.add_option_function<std::string>(
        input.label, [&options, label = input.label](const std::string& text) { options.given[label] = text; }, help);
    if (!words.empty()) option->check(CLI::IsMember(words));
    if (input.label[0] != '-') option->required();
    if (!input.fallback.empty()) option->default_str(input.fallback);
}

void add_actions(CLI::App& app, Options& options)
{
    for (const auto& [group_name, group_help] : action_groups()) {
        CLI::App* group = app.add_subcommand(group_name, group_help);
        group->require_subcommand(1);
        for (const Action& action : actions()) {
            if (action.group != group_name) continue;
            CLI::App* verb = group->add_subcommand(action.verb, action.help);
            for (const Input& input : action.inputs)
                add_input(*verb, input, options);
            verb->add_option("--port", options.port,
                             "The port, by its World Wide Name; not needed if there is one only");
            if (!action.question.empty()) verb->add_flag("-y,--yes", options.yes, "Do not ask before it is done");
            verb->callback([&options, &action] { options.action = &action; });
        }
    }
}

void add_diagnostics(CLI::App& app, Options& options)
{
    CLI::App* group = app.add_subcommand("diag", "List and run the diagnostic tests, and show what they have found");
    group->require_subcommand(1);
    const auto add = [&](const char* name, const char* help) {
        CLI::App* verb = group->add_subcommand(name, help);
        verb->callback([&options, name] { options.method = name; });
        return verb;
    };
    add("list", "Show the tests, the ports that can run them, and their options");
    CLI::App* run = add("run", "Run a test on a port, to its end");
    run->add_option("test", options.object, "The test, as diag list shows it, or by its whole name")->required();
    run->add_option("port", options.port, "The port, by its World Wide Name; not needed if there is one only");
    const auto add_setting = [&](const char* label, const char* help) {
        return run->add_option_function<std::string>(
            label, [&options, label](const std::string& text) { options.given[label] = text; }, help);
    };
    add_setting("--loops", "How often, 1 to 4000")->check(CLI::Range(1, 4000));
    add_setting("--pattern", "The bytes to send, as hexadecimal digits");
    add_setting("--size", "How many of them, 1 to 8")->check(CLI::Range(1, 8));
    add_setting("--target", "Port name of the device that answers an echo or a ping");
    run->add_flag_callback(
        "--halt-on-error", [&options] { options.given["--halt-on-error"] = ""; }, "End with the first loop that fails");
    add("results", "Show the records of the runs since the module was loaded");
    add("clear", "Remove the records of all tests, or of one")
        ->add_option("test", options.object, "The test whose log is cleared");
}

} // namespace

int read_options(int count, char** arguments, Options& options)
{
    CLI::App app(description, "nvrcim");
    app.footer(footer);
    app.require_subcommand(1);
    app.fallthrough();
    app.get_formatter()->column_width(34);

    app.add_option("--scenario", options.scenario, "Run over the simulated host of this file (TOML)");
    app.add_option("--manner", options.manner, "Behave like this server: " + manners())
        ->check([](const std::string& name) { return Manner::find(name) ? "" : "the manners are " + manners(); })
        ->type_name("NAME")
        ->capture_default_str();
    app.add_option("-n,--namespace", options.name_space, "Namespace where an object names none")->capture_default_str();
    app.add_option("--server-log", options.server_log,
                   "Append to this file what the server did with the module (- for standard error)");
    app.add_option("--module", options.module, "The provider module to load");
    app.add_option("--mof", options.mof, "Folder with the class files");
    app.add_option("--user", options.user, "Name of the user that the requests come from");
    CLI::Option* json = app.add_flag("--json", options.json, "Print JSON");
    app.add_flag("--csv", options.csv, "Print comma-separated values")->excludes(json);

    CLI::App* classes = app.add_subcommand("classes", "List the classes that the module serves");
    classes->add_option("pattern", options.object, "Only classes with this in their name");
    classes->add_flag("--all", options.all, "All classes known, also those that nobody serves");

    CLI::App* enumerate = app.add_subcommand("enum", "Show the instances of a class and its subclasses");
    enumerate->add_option("class", options.object, "The class")->required();

    CLI::App* names = app.add_subcommand("names", "Show the object paths of a class's instances");
    names->add_option("class", options.object, "The class")->required();

    CLI::App* get = app.add_subcommand("get", "Show one instance, every property on a line");
    get->add_option("path", options.object, "Its object path")->required();

    CLI::App* associators =
        app.add_subcommand("associators", "Show the instances that associations tie to an instance");
    CLI::App* references = app.add_subcommand("references", "Show the associations that hold an instance");
    for (CLI::App* verb : {associators, references}) {
        verb->add_option("path", options.object, "Its object path")->required();
        verb->add_option("--class", options.association_class, "Only by associations of this class");
        verb->add_option("--role", options.role, "Only where it stands as this end of the association");
        verb->add_flag("--names", options.names_only, "Only the object paths");
    }
    associators->add_option("--result-class", options.result_class, "Only instances of this class");
    associators->add_option("--result-role", options.result_role, "Only what stands as this end of the association");

    for (CLI::App* verb : {enumerate, get, associators, references}) {
        verb->add_flag("--all", options.all,
                       verb == get ? "Also properties without a value" : "Every property, one on a line");
        verb->add_option("-p,--properties", options.properties, "Only these properties (a,b,c)")->delimiter(',');
    }

    CLI::App* set = app.add_subcommand("set", "Change properties of an instance");
    set->add_option("path", options.object, "Its object path")->required();
    set->add_option("property=value", options.arguments, "The properties, with their new values")->required();

    CLI::App* call = app.add_subcommand("call", "Invoke a method");
    call->add_option("path", options.object, "Object path of the instance, or the class of a static method")
        ->required();
    call->add_option("method", options.method, "The method")->required();
    call->add_option("name=value", options.arguments, "Its arguments");

    app.add_subcommand("tree", "Show the host with its adapters, ports, targets and logical units");

    app.add_subcommand("paths", "Show the whole route of each logical unit in one row");
    app.add_subcommand("ports", "Show each port with its speeds, firmware, driver and error counters");
    CLI::App* completion = app.add_subcommand("completion", "Print what makes bash complete this command");

    CLI::App* graph = app.add_subcommand("graph", "Draw the tree as a picture (needs Graphviz)");
    graph
        ->add_option("file", options.file, "Where to: a name that ends in .svg or .png, or in .dot for the plain graph")
        ->required();

    CLI::App* check =
        app.add_subcommand("check", "Verify that both ends of each association exist and find each other");
    check->add_flag("--all", options.all, "Tell of each association class, not only of faults");

    add_actions(app, options);
    add_log_verbs(app, options);
    add_diagnostics(app, options);

    CLI::App* serve = app.add_subcommand("serve", "Answer CIM-XML over HTTP, for trying and testing");
    serve->add_option("--port", options.tcp_port, "TCP port; 0 for any that is free")->capture_default_str();
    serve->add_option("--bind", options.bind, "Address to listen on; others than this host's own reach it then")
        ->capture_default_str();

    try {
        app.parse(count, arguments);
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() == 0) return app.exit(error);
        std::cerr << "nvrcim: wrong command: " << error.what() << "\nTry nvrcim --help.\n";
        return usage_error;
    }
    const CLI::App* verb = app.get_subcommands().front();
    options.verb = verb->get_name();
    if (verb == completion) {
        std::cout << bash_completion(app);
        return 0;
    }
    const bool has_rows = std::count(std::begin(without_rows), std::end(without_rows), options.verb) == 0;
    if (options.csv && !has_rows) {
        std::cerr << "nvrcim: wrong command: " << options.verb << " prints no rows that --csv could show\n";
        return usage_error;
    }
    return -1;
}

} // namespace host
