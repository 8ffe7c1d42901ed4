/// nvrcim as a person runs it: in a process of its own, over a scenario, with this module.
#pragma once

#include <string>

namespace nvrtest {

struct Ended_Command {
    std::string output; ///< both streams
    int status = -1;    ///< of the exit; -1 after a signal
};

/// `scenario` is the name of one that ships, or the path of a file.
/// By the shell: `arguments` may redirect, `environment` sets variables or feeds a pipe ("echo y |").
Ended_Command nvrcim(const std::string& arguments, const std::string& scenario = "small",
                     const std::string& environment = "");

} // namespace nvrtest
