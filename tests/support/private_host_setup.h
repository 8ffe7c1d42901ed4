/// How a test program gets its private host: for main() alone.
#pragma once

#include <string>

namespace nvrtest {

/// Makes the host and starts the program anew in it; in that second life, returns. Throws std::runtime_error if the
/// machine does not allow it.
void enter_private_host(char** argv);

/// For a process that was forked in a private host and is to have one for itself: /etc as it is there now, the other
/// folders empty, under the same names. Before the first thread of the process.
void separate_private_host();

/// Shows `source`, with what is mounted in it, at `path` also. Throws std::runtime_error.
void bind_over(const std::string& source, const std::string& path);

/// The folder that carries the host's own parts. Throws outside of one.
std::string private_root();

} // namespace nvrtest
