#include "tests/module/support/Command_Line.h"

#include <cstdio>
#include <stdexcept>
#include <sys/wait.h>

namespace nvrtest {

Ended_Command nvrcim(const std::string& arguments, const std::string& scenario, const std::string& environment)
{
    const std::string file =
        scenario[0] == '/' ? scenario : std::string(NVRSIM_BUILD) + "/scenarios/" + scenario + ".toml";
    const std::string command = environment + " '" + NVR_NVRCIM + "' --module '" + NVR_MODULE + "' --scenario '" +
                                file + "' " + arguments + " 2>&1";
    FILE* child = popen(command.c_str(), "r");
    if (!child) throw std::runtime_error("cannot start a shell");
    Ended_Command run;
    char buffer[4096];
    while (const std::size_t size = std::fread(buffer, 1, sizeof buffer, child))
        run.output.append(buffer, size);
    const int status = pclose(child);
    if (WIFEXITED(status)) run.status = WEXITSTATUS(status);
    return run;
}

} // namespace nvrtest
