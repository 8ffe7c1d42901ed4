/// What the user asked of nvrcim, read from its command line.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <vector>

namespace host {

struct Action;

struct Options {
    std::string verb;                    ///< classes, enum, names, get, set, call, associators, ...
    std::string object;                  ///< a class or an object path; of `classes` a pattern
    std::string method;                  ///< of `call`
    std::vector<std::string> arguments;  ///< name=value, of `set` and `call`
    std::vector<std::string> properties; ///< of `enum` and `get`: only these
    std::string association_class, result_class, role, result_role; ///< of a traversal; empty: any
    bool names_only = false;                                        ///< of a traversal: object paths only
    std::string file;                                               ///< where `graph` draws to; of `log` the trace file
    std::string log_action, log_word;                               ///< of `log`: what to do, and the mode
    unsigned log_number = 0;                                        ///< of `log level`
    std::vector<std::string> also;                                  ///< of `listen`: more namespaces
    unsigned count = 0;                                             ///< of `listen`: how many alerts; 0: any number
    bool quiet = false;                                             ///< of `listen`: count them only
    std::string bind = "127.0.0.1";                                 ///< of `serve`: the address to listen on
    std::uint16_t tcp_port = 5988;                                  ///< of `serve`; 0 for any free one
    bool all = false;
    bool json = false;
    bool csv = false;

    const Action* action = nullptr;           ///< one of Actions.h instead of a verb
    std::map<std::string, std::string> given; ///< its inputs by their labels, as far as they were given
    std::string port;                         ///< the port that it is meant for; empty: the only one
    bool yes = false;                         ///< the user is not asked

    std::string manner = "strict";
    std::string name_space = "root/norvane";
    std::string module, mof, scenario, server_log, user;
};

/// Reads the arguments. Result: -1 to go on, else the exit status (help was shown: 0, a usage error was told: 64).
int read_options(int count, char** arguments, Options& options);

/// Exit status for a command that cannot be understood.
constexpr int usage_error = 64;

} // namespace host
