/// Where the module, the class files and the simulator are: in a build tree, in an installation, or where the user
/// says.
#pragma once

#include <string>
#include <vector>

namespace host {

struct Places {
    std::string module;    ///< the provider module; "" if it is nowhere
    std::string mof;       ///< folder of the class files; "" likewise
    std::string simulator; ///< folder of the simulated libraries; "" likewise
};

/// Looks relative to the folder of the running program, first in the build tree, then in an installation. The
/// environment variables NVRCIM_MODULE, NVRCIM_MOF and NVRCIM_SIMULATOR come before both.
Places find_places();
/// The same for a program in `folder`, without the environment; for tests.
Places find_places(const std::string& folder);

/// The environment of a simulated host: NVRSIM_SCENARIO, and the simulator's folder first in LD_LIBRARY_PATH. Since the
/// loader reads its path when a program starts, the program is started anew. Returns only if there is nothing to do
/// (it was started anew for this scenario) or with a text of what is wrong.
std::string enter_scenario(const std::string& scenario, const std::string& simulator, char** arguments);

} // namespace host
