#include "host/command/Serve.h"

#include "host/command/Verbs.h"
#include "host/serve/Http_Server.h"

#include <csignal>

namespace host {

int serve(Host& server, const Options& options, std::ostream& out, std::ostream& complaints)
{
    // Before the first thread, so that none of them takes the signal that ends the wait below.
    sigset_t signals;
    sigemptyset(&signals);
    sigaddset(&signals, SIGINT);
    sigaddset(&signals, SIGTERM);
    pthread_sigmask(SIG_BLOCK, &signals, nullptr);
    // A client or a listener that goes away is no reason to go.
    std::signal(SIGPIPE, SIG_IGN);
    try {
        Http_Options http;
        http.address = options.bind;
        http.port = options.tcp_port;
        const bool is_six = options.bind.find(':') != std::string::npos;
        const std::string name = is_six ? "[" + options.bind + "]" : options.bind;
        Cim_Server cim(server, name + ":" + std::to_string(options.tcp_port));
        const Http_Server listener(cim, http);
        out << "nvrcim serve is for trying and testing: it knows no encryption and no passwords. CIM-XML on http://"
            << name << ":" << listener.port() << "/cimom" << std::endl;
        int signal = 0;
        sigwait(&signals, &signal);
        return 0;
    } catch (const std::runtime_error& error) {
        return tell_wrong(error.what(), complaints);
    }
}

} // namespace host
