#include "foundation/open_file.h"

#include <algorithm>
#include <cerrno>
#include <fcntl.h>
#include <sys/stat.h>
#include <sys/uio.h>
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

/// Writes all of them, with the first call if the system lets it; false, with errno set, once something is refused.
template <std::size_t Count>
bool write_all(int fd, const std::string_view (&texts)[Count])
{
    iovec parts[Count];
    for (std::size_t i = 0; i < Count; i++)
        parts[i] = {const_cast<char*>(texts[i].data()), texts[i].size()};
    iovec* const end = parts + Count;
    std::size_t written = 0; // of what begins at `part`
    for (iovec* part = parts;;) {
        for (; part != end && written >= part->iov_len; part++)
            written -= part->iov_len;
        if (part == end) return true;
        *part = {static_cast<char*>(part->iov_base) + written, part->iov_len - written};
        ssize_t result;
        do
            result = ::writev(fd, part, static_cast<int>(end - part));
        while (result < 0 && errno == EINTR);
        if (result == 0) errno = EIO; // it would go on for ever
        if (result <= 0) return false;
        written = static_cast<std::size_t>(result);
    }
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

/// The descriptor of a regular file, emptied if it is to be written; or -1.
int open_regular(const char* path, bool writes)
{
    // Even to open a device can do something, so what is known to be none of ours is not opened at all.
    if (fault_of_file(path) == EINVAL) return -1;

    struct stat status;
    const int fd = writes ? open_for_writing(path) : ::open(path, O_RDONLY | always);
    if (fd < 0) return -1;
    // It may have been replaced meanwhile; and it is emptied only once it is known for what it is.
    if (::fstat(fd, &status) == 0 && is_regular(status) && (!writes || ::ftruncate(fd, 0) == 0)) return fd;
    close_keeping_errno(fd);
    return -1;
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

Line_Reader::Line_Reader(const char* path)
    : m_fd(::open(path, O_RDONLY | always)), m_failed(m_fd < 0 && errno != ENOENT)
{
}

Line_Reader::~Line_Reader()
{
    if (m_fd >= 0) ::close(m_fd);
}

/// The next byte, or EOF.
int Line_Reader::next()
{
    if (m_at == m_end) {
        ssize_t size;
        do
            size = ::read(m_fd, m_bytes, sizeof m_bytes);
        while (size < 0 && errno == EINTR);
        if (size < 0) m_failed = true;
        if (size <= 0) return EOF;
        m_at = 0;
        m_end = static_cast<std::size_t>(size);
    }
    return static_cast<unsigned char>(m_bytes[m_at++]);
}

bool Line_Reader::read(char* line, std::size_t size)
{
    std::size_t length = 0;
    while (length + 1 < size) {
        const int byte = next();
        if (byte == EOF) break;
        line[length++] = static_cast<char>(byte);
        if (byte == '\n') break;
    }
    line[length] = '\0';
    return length > 0;
}

int fault_of_file(const char* path)
{
    struct stat status;
    return ::stat(path, &status) == 0 && is_regular(status) ? 0 : errno;
}

bool write_text(const char* path, std::string_view text, std::string_view rest)
{
    const int fd = ::open(path, O_WRONLY | O_CREAT | always, 0666);
    if (fd < 0) return false;
    // What is left of a longer text goes once all is there, and not before: its room might be another's then. Until
    // then it is a line of its own.
    const bool written = write_all(fd, {text, rest, "\n"});
    if (written) static_cast<void>(::ftruncate(fd, static_cast<off_t>(text.size() + rest.size())));
    close_keeping_errno(fd);
    return written;
}

File open_regular_file(const char* path, const char* mode)
{
    const int fd = open_regular(path, mode[0] == 'w');
    return fd < 0 ? nullptr : stream_of(fd, mode);
}

bool write_regular_file(const char* path, std::string_view bytes)
{
    const int fd = open_regular(path, true);
    if (fd < 0) return false;
    const bool written = write_all(fd, {bytes});
    const bool emptied = !written && ::ftruncate(fd, 0) == 0;
    if (::close(fd) == 0 && written) return true;
    // A link is not ours to remove, unless a part would be read through it.
    struct stat status;
    const bool is_link = ::lstat(path, &status) == 0 && S_ISLNK(status.st_mode);
    if (!is_link || !emptied) ::unlink(path);
    return false;
}

} // namespace cimple
