/// A write lock on a file, held against other processes for a scope.
///
/// The lock belongs to the process: threads of one process need a mutex beside it. Internal to the runtime.
#pragma once

#include <cerrno>
#include <fcntl.h>
#include <unistd.h>

namespace cimple {

class File_Lock {
public:
    /// Waits for the lock on the open file `file`. A failure is not told: a log line is worth more than its order.
    explicit File_Lock(int file) : m_file(file)
    {
        while (set(F_WRLCK, F_SETLKW) == -1 && errno == EINTR) {
        }
    }
    // Does not wait, so that a cancelled thread cannot be caught in a destructor.
    ~File_Lock() { set(F_UNLCK, F_SETLK); }
    File_Lock(const File_Lock&) = delete;
    File_Lock& operator=(const File_Lock&) = delete;

private:
    int set(short type, int command) const
    {
        struct flock range = {};
        range.l_type = type;
        range.l_whence = SEEK_SET;
        return fcntl(m_file, command, &range);
    }
    int m_file;
};

} // namespace cimple
