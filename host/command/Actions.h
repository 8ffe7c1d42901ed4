/// What people do with adapters, as rows of one table: each action is a verb of the command, and behind it one method
/// of a service of the module, or one property of a port.
///
/// A row says what the user gives and which parameter takes it, what is asked before anything changes, and what the
/// numbers that come back mean. A new action is a new row of Actions.cpp; only what is no call of a method brings a
/// function of its own. Constant data after the first call; any thread.
#pragma once

#include "host/Host.h"

#include <cstdint>
#include <map>
#include <ostream>
#include <string>
#include <utility>
#include <vector>

namespace host {

struct Options;
struct Action;

/// A word that a user gives and the value that it stands for, as Arguments.h reads it.
struct Choice {
    std::string word, value;
};

/// Something that the user gives.
struct Input {
    enum Kind {
        text,   ///< any text
        name,   ///< a World Wide Name, with or without separators; the parameter gets its sixteen digits
        choice, ///< one of the choices; the parameter gets its value
        flag    ///< nothing behind it: the parameter gets the first choice's value, or without the flag the second's
    };
    Kind kind = text;
    std::string label;     ///< "wwpn" for a place on the command line, "--type" for an option
    std::string parameter; ///< of the method, or the property of the port
    std::string help;
    std::vector<Choice> choices = {};
    std::string fallback = {}; ///< what an option is where it is not given; empty: the parameter is left out
};

/// What a number means.
struct Meaning {
    std::uint64_t value;
    std::string words;
};
using Meanings = std::vector<Meaning>;

/// One run of an action, its port found and its question answered.
struct Action_Run {
    Host& server;
    const Options& options;
    const Action& action;
    const Path& port;
    std::ostream& out;
    std::ostream& complaints;
};

struct Action {
    std::string group, verb; ///< "port", "reset"
    std::string help;
    std::string service;           ///< the class of the service; empty: the inputs are properties of the port
    std::string service_name = {}; ///< its key Name, where the class has several instances
    std::string method = {};
    std::vector<Input> inputs = {};
    std::vector<Choice> fixed = {}; ///< parameters that the user does not give, and their values
    std::string question = {};      ///< asked before the port's name and "?"; empty: nothing is changed
    std::string doing = {};         ///< "resetting the adapter": shown while it lasts; empty: it does not last
    Meanings meanings = {};         ///< of return values, before those that all services share
    std::map<std::string, Meanings> out_meanings = {}; ///< of numbers that out parameters bring
    std::map<std::string, Meanings> out_bits = {};     ///< of the bits of such numbers, for those that are set
    int (*own)(const Action_Run& run) = nullptr;       ///< in place of the call: gives the exit status
};

const std::vector<Action>& actions();
/// What the groups are about, in the order in which help shows them: name and line.
const std::vector<std::pair<std::string, std::string>>& action_groups();

/// Runs the action of the options. The result is the exit status.
int run_action(Host& server, const Options& options, std::ostream& out, std::ostream& complaints);

/// Exit statuses of actions: the question was answered with no; the method returned another value than 0.
constexpr int declined = 65;
constexpr int returned_another = 66;

} // namespace host
