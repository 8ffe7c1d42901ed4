#include "foundation/open_file.h"

#include <cerrno>
#include <fcntl.h>
#include <unistd.h>

namespace cimple {

File open_file(const char* path, const char* mode)
{
    int flags = O_RDONLY;
    if (mode[0] == 'w') flags = O_WRONLY | O_CREAT | O_TRUNC;
    if (mode[0] == 'a') flags = O_RDWR | O_CREAT | O_APPEND; // reading too: a FIFO then opens without another reader
    const int fd = ::open(path, flags | O_NONBLOCK | O_NOCTTY | O_CLOEXEC, 0666);
    if (fd < 0) return nullptr;
    File file(::fdopen(fd, mode));
    if (!file) {
        const int error = errno;
        ::close(fd);
        errno = error;
    }
    return file;
}

} // namespace cimple
