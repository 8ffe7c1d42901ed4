#include "host/command/Streams.h"

#include <cerrno>
#include <fcntl.h>
#include <unistd.h>

namespace host {

Own_Output::Own_Output(bool shown) : m_stream(this)
{
    setp(m_buffer, m_buffer + sizeof m_buffer);
    m_descriptor = fcntl(STDOUT_FILENO, F_DUPFD_CLOEXEC, 3);
    const int other = shown ? dup(STDERR_FILENO) : open("/dev/null", O_WRONLY | O_CLOEXEC);
    if (other < 0) return;
    dup2(other, STDOUT_FILENO);
    close(other);
}

Own_Output::~Own_Output()
{
    sync();
    if (m_descriptor >= 0) close(m_descriptor);
}

Own_Output::int_type Own_Output::overflow(int_type character)
{
    if (sync() != 0) return traits_type::eof();
    if (!traits_type::eq_int_type(character, traits_type::eof())) sputc(traits_type::to_char_type(character));
    return traits_type::not_eof(character);
}

int Own_Output::sync()
{
    const char* from = pbase();
    const char* const end = pptr();
    setp(m_buffer, m_buffer + sizeof m_buffer);
    while (from < end) {
        const ssize_t written = write(m_descriptor, from, static_cast<std::size_t>(end - from));
        if (written < 0 && errno == EINTR) continue;
        if (written <= 0) return -1;
        from += written;
    }
    return 0;
}

} // namespace host
