/// Makes chosen calls of the C library fail, for programs that are linked with --wrap of these calls.
///
/// While a System_Fault lives, calls of its kind from the runtime's code fail on all threads. One at a time.
#pragma once

namespace cimple {

class System_Fault {
public:
    enum Call { none, create_thread, create_key, set_value, lock, try_lock, clock };

    /// `error` is what the call returns (or -1 for the clock).
    System_Fault(Call call, int error);
    ~System_Fault();
    System_Fault(const System_Fault&) = delete;
    System_Fault& operator=(const System_Fault&) = delete;
};

} // namespace cimple
