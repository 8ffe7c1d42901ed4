#include "foundation/open_file.h"

#include <cerrno>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace cimple {

namespace {

constexpr int always = O_NONBLOCK | O_NOCTTY | O_CLOEXEC;

void close_keeping_errno(int fd)
{
    const int error = errno;
    ::close(fd);
    errno = error;
}

/// Gives the descriptor a stream, or closes it.
File stream_of(int fd, const char* mode)
{
    File file(::fdopen(fd, mode));
    if (!file) close_keeping_errno(fd);
    return file;
}

bool is_regular(const struct stat& status)
{
    if (!S_ISREG(status.st_mode)) errno = EINVAL;
    return S_ISREG(status.st_mode);
}

// A link that leads nowhere must not make a file somewhere else, so what does not exist is made only where nothing is.
int open_for_writing(const char* path)
{
    const int fd = ::open(path, O_WRONLY | always);
    if (fd >= 0 || errno != ENOENT) return fd;
    return ::open(path, O_WRONLY | O_CREAT | O_EXCL | always, 0666);
}

} // namespace

File open_file(const char* path, const char* mode)
{
    int flags = O_RDONLY;
    if (mode[0] == 'w') flags = O_WRONLY | O_CREAT | O_TRUNC;
    if (mode[0] == 'a') flags = O_RDWR | O_CREAT | O_APPEND; // reading too: a FIFO then opens without another reader
    const int fd = ::open(path, flags | always, 0666);
    return fd < 0 ? nullptr : stream_of(fd, mode);
}

int fault_of_file(const char* path)
{
    struct stat status;
    return ::stat(path, &status) == 0 && is_regular(status) ? 0 : errno;
}

bool write_text(const char* path, std::string_view text)
{
    const int fd = ::open(path, O_WRONLY | O_CREAT | O_TRUNC | always, 0666);
    if (fd < 0) return false;
    while (!text.empty()) {
        const ssize_t written = ::write(fd, text.data(), text.size());
        if (written < 0 && errno == EINTR) continue;
        if (written <= 0) break;
        text.remove_prefix(static_cast<std::size_t>(written));
    }
    ::close(fd);
    return true;
}

File open_regular_file(const char* path, const char* mode)
{
    // Even to open a device can do something, so what is known to be none of ours is not opened at all.
    if (fault_of_file(path) == EINVAL) return nullptr;

    struct stat status;
    const bool writes = mode[0] == 'w';
    const int fd = writes ? open_for_writing(path) : ::open(path, O_RDONLY | always);
    if (fd < 0) return nullptr;
    // It may have been replaced meanwhile; and it is emptied only once it is known for what it is.
    const bool good = ::fstat(fd, &status) == 0 && is_regular(status) && (!writes || ::ftruncate(fd, 0) == 0);
    if (!good) {
        close_keeping_errno(fd);
        return nullptr;
    }
    return stream_of(fd, mode);
}

} // namespace cimple
