#include "host/ServerLog.h"

#include <cerrno>
#include <cstdarg>
#include <cstring>
#include <ctime>
#include <sys/syscall.h>
#include <unistd.h>

namespace host {
namespace {
constexpr std::size_t kept_lines = 10000;
}

Server_Log::Server_Log(const std::string& file)
{
    if (file == "-") m_file = stderr;
    if (file.empty() || m_file) return;
    m_file = std::fopen(file.c_str(), "ae");
    if (!m_file) std::fprintf(stderr, "server log %s: %s\n", file.c_str(), std::strerror(errno));
}

Server_Log::~Server_Log()
{
    if (m_file && m_file != stderr) std::fclose(m_file);
}

void Server_Log::line(const char* format, ...)
{
    std::va_list arguments;
    va_start(arguments, format);
    std::va_list again;
    va_copy(again, arguments);
    int size = std::vsnprintf(nullptr, 0, format, arguments);
    va_end(arguments);
    std::string text(size > 0 ? static_cast<std::size_t>(size) : 0, '\0');
    if (size > 0) std::vsnprintf(text.data(), text.size() + 1, format, again);
    va_end(again);
    for (char& c : text)
        if (c == '\n' || c == '\r') c = ' ';

    std::lock_guard lock(m_mutex);
    if (m_file) {
        timespec now{};
        clock_gettime(CLOCK_REALTIME, &now);
        std::tm parts{};
        localtime_r(&now.tv_sec, &parts);
        char time[32];
        std::strftime(time, sizeof time, "%Y-%m-%dT%H:%M:%S", &parts);
        std::fprintf(m_file, "%s.%06ld %ld %s\n", time, now.tv_nsec / 1000, syscall(SYS_gettid), text.c_str());
        std::fflush(m_file);
    }
    m_lines.push_back(std::move(text));
    if (m_lines.size() > kept_lines) m_lines.pop_front();
}

std::vector<std::string> Server_Log::lines() const
{
    std::lock_guard lock(m_mutex);
    return {m_lines.begin(), m_lines.end()};
}

} // namespace host
