/// What makes a shell complete the command: a script made from the command's own options, so that it never lags behind.
#pragma once

#include <string>

namespace CLI {
class App;
}

namespace host {

/// For bash: verbs and their verbs, options, files where files are meant, and class names, which the command itself is
/// asked for.
std::string bash_completion(const CLI::App& app);

} // namespace host
