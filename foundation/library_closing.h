/// Closing libraries beside an exit of the process.
///
/// The C library's `exit` and `dlclose` walk one list of the functions to call at the end, and let go of its lock for
/// each of them: glibc's `exit` (2.36) then frees parts of the list that a `dlclose` of another thread is still in. So
/// an exit waits for libraries that are being closed, and from then on they are left to the process.
#pragma once

namespace cimple {

/// Closes what dlopen opened. Result that of dlclose; 0 where the process exits, which leaves it open.
int closeLibrary(void* library);

/// For more to be done than one dlclose. An exit waits for it to go out of scope, about 100 milliseconds at most: a
/// library may take as long as it likes.
class Library_Closing {
public:
    Library_Closing();
    ~Library_Closing();
    Library_Closing(const Library_Closing&) = delete;
    Library_Closing& operator=(const Library_Closing&) = delete;

    /// False once the process exits. To be asked before each step.
    bool allowed() const;
};

/// Has an exit of the process do its part. What is asked for last an exit does first: so this is for after libraries
/// were opened, and the exit waits before it calls anything of theirs.
void watchExit();

/// Takes that back, after they were closed, so that the next libraries find the watch behind them again. Both are for
/// the thread that opens and closes them.
void forgetExit();

} // namespace cimple
