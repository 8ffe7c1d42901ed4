#include "host/command/Places.h"

#include <cerrno>
#include <climits>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <unistd.h>

namespace host {
namespace {

namespace fs = std::filesystem;
constexpr const char* module_file = "libnorvane_fc_provider.so";

std::string first_that_exists(const std::vector<fs::path>& candidates)
{
    std::error_code ignored;
    for (const fs::path& candidate : candidates)
        if (fs::exists(candidate, ignored)) {
            fs::path real = fs::canonical(candidate, ignored);
            return (ignored ? candidate : real).string();
        }
    return "";
}

std::string own_folder()
{
    std::error_code ignored;
    return fs::read_symlink("/proc/self/exe", ignored).parent_path().string();
}

void take(std::string& place, const char* variable)
{
    const char* value = std::getenv(variable);
    if (value && *value) place = value;
}

} // namespace

Places find_places(const std::string& folder)
{
    const fs::path here(folder);
    Places places;
    // A build tree has <build>/host/nvrcim, <build>/lib and <build>/simulator below the sources; an installation has
    // bin, lib and share side by side.
    std::vector<fs::path> modules = {here / "../lib" / module_file};
    std::vector<fs::path> simulators = {here / "../simulator/lib"};
    for (const char* lib : {"../lib", "../lib/x86_64-linux-gnu", "../lib64"}) {
        modules.push_back(here / lib / "cmpi" / module_file);
        simulators.push_back(here / lib / "norvane-fc-provider/simulator");
    }
    places.module = first_that_exists(modules);
    places.mof = first_that_exists({here / "../../../classes/mof", here / "../share/norvane-fc-provider/mof"});
    places.simulator = first_that_exists(simulators);
    return places;
}

Places find_places()
{
    Places places = find_places(own_folder());
    take(places.module, "NVRCIM_MODULE");
    take(places.mof, "NVRCIM_MOF");
    take(places.simulator, "NVRCIM_SIMULATOR");
    return places;
}

std::string enter_scenario(const std::string& scenario, const std::string& simulator, char** arguments)
{
    char path[PATH_MAX];
    if (!realpath(scenario.c_str(), path)) return "your scenario " + scenario + ": " + std::strerror(errno);
    if (access(path, R_OK) != 0) return "your scenario " + scenario + ": " + std::strerror(errno);
    if (fs::is_directory(path)) return "your scenario " + scenario + " is a folder";
    if (simulator.empty() || !fs::is_directory(simulator))
        return "the simulator is not there" + (simulator.empty() ? "" : ": " + simulator) +
               "; build it, or name its folder in NVRCIM_SIMULATOR";

    const char* entered = std::getenv("NVRCIM_ENTERED");
    if (entered && std::string(entered) == path) return "";
    const char* libraries = std::getenv("LD_LIBRARY_PATH");
    std::string search = simulator + (libraries && *libraries ? ":" + std::string(libraries) : "");
    setenv("LD_LIBRARY_PATH", search.c_str(), 1);
    setenv("NVRSIM_SCENARIO", path, 1);
    setenv("NVRCIM_ENTERED", path, 1);
    execv("/proc/self/exe", arguments);
    return std::string("nvrcim cannot start itself anew for the scenario: ") + std::strerror(errno);
}

} // namespace host
