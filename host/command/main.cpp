// nvrcim: asks the provider module as a CIM server would, and shows the answer.
#include "host/Host.h"
#include "host/command/Options.h"
#include "host/command/Places.h"
#include "host/command/Streams.h"
#include "host/command/Table.h"
#include "host/command/Verbs.h"

#include <iostream>

namespace {

int refuse(const std::string& text)
{
    std::cerr << "nvrcim: " << text << "\n";
    return host::usage_error;
}

int run(host::Options& options, char** arguments)
{
    host::Places places = host::find_places();
    if (!options.module.empty()) places.module = options.module;
    if (!options.mof.empty()) places.mof = options.mof;
    if (places.mof.empty()) return refuse("the class files are not there: name their folder with --mof");
    if (places.module.empty()) return refuse("the provider module is not there: name it with --module");
    if (!options.scenario.empty()) {
        std::string wrong = host::enter_scenario(options.scenario, places.simulator, arguments);
        if (!wrong.empty()) return refuse(wrong);
    }
    std::string error;
    std::shared_ptr<const host::Schema> schema = host::Schema::from_files({places.mof}, error);
    if (!schema) return refuse("the class files are wrong: " + error);

    host::Own_Output output(options.server_log == "-");
    host::Host_Options server_options;
    server_options.manner = *host::Manner::find(options.manner);
    server_options.principal = options.user;
    server_options.log_file = options.server_log;
    host::Host server(schema, server_options);
    if (server.add_module(places.module, options.name_space, &error) == 0)
        return refuse("the module is unfit: " + error);
    return host::run_verb(server, options, output.stream(), std::cerr);
}

} // namespace

int main(int count, char** arguments)
{
    host::Options options;
    int status = host::read_options(count, arguments, options);
    if (status >= 0) return status;
    return run(options, arguments);
}
