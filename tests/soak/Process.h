/// What this process holds of the machine, as the kernel and the allocator tell it. Any thread.
#pragma once

#include <chrono>
#include <cstddef>
#include <map>
#include <string>

namespace soak {

struct Process {
    std::size_t resident = 0;    ///< memory, kB
    std::size_t heap = 0;        ///< of it what the allocator has given out, kB; 0 under a sanitizer's own allocator
    std::size_t threads = 0;     ///< that have not ended
    std::size_t descriptors = 0; ///< open files, sockets and pipes

    /// As it is now. Free memory goes back to the kernel first, so that resident memory is what is in use.
    static Process now();
};

/// How long threads of this process were ready to run while no processor was free for them. One thread asks.
class Starvation {
public:
    /// The longest such time of a thread since the last call.
    std::chrono::nanoseconds since_last();

private:
    std::map<std::string, std::chrono::nanoseconds> m_waited; ///< by thread, since its start
};

} // namespace soak
