/// What the command line asks for.
#pragma once

#include <chrono>
#include <cstddef>
#include <cstdint>

#include "host/Manner.h"

namespace soak {

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr bool is_sanitized = true;
#else
constexpr bool is_sanitized = false;
#endif

struct Options {
    std::chrono::seconds length{300};
    std::uint64_t requests = 0; ///< ends the run in the place of the length, if not 0
    std::size_t clients = 6;
    std::uint64_t seed = 1;
    const host::Manner* manner = &host::Manner::strict();
    bool has_one_life = false; ///< the module is not unloaded before the end
    /// No request may take longer; ten times as long where a sanitizer slows all down.
    std::chrono::seconds patience{is_sanitized ? 100 : 10};
    std::size_t leak = 0; ///< bytes that each request is made to lose
    bool asks_for_help = false;

    /// Throws std::invalid_argument with what to tell the user.
    static Options parsed(int argc, char** argv);
    static const char* usage();
};

} // namespace soak
