/// The management session: its life is the time in which RM_ operations may be called.
///
/// One instance, owned by the agent. The constructor initialises the management library, guarded by a semaphore named
/// after the process, and throws std::exception if the library refuses; it waits while another thread's instance is
/// initialising. The destructor lets go of the semaphore; the library stays initialised until it is closed.
#pragma once

namespace cimple {

class Management_Session {
public:
    Management_Session();
    ~Management_Session();
    Management_Session(const Management_Session&) = delete;
    Management_Session& operator=(const Management_Session&) = delete;

    /// For a process that ends without the destructor: takes the semaphore's name away, which would stay behind. Takes
    /// no lock and calls no library.
    static void forgetName();
};

} // namespace cimple
