/// What this process holds of the machine, as the kernel and the allocator tell it. Any thread.
#pragma once

#include <cstddef>

namespace soak {

struct Process {
    std::size_t resident = 0;    ///< memory, kB
    std::size_t heap = 0;        ///< of it what the allocator has given out, kB; 0 under a sanitizer's own allocator
    std::size_t threads = 0;     ///< that have not ended
    std::size_t descriptors = 0; ///< open files, sockets and pipes

    /// As it is now. Free memory goes back to the kernel first, so that resident memory is what is in use.
    static Process now();
};

} // namespace soak
