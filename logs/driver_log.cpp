#include "logs/driver_log.h"

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <sys/stat.h>
#include <unistd.h>
#include <utility>

#include "agent/ProviderAgent.h"
#include "foundation/CLogger.h"
#include "foundation/open_file.h"
#include "runtime/Undisturbed.h"

namespace cimple {

namespace {

constexpr const char* system_log_path = "/var/log/messages";
constexpr const char* driver_name = "tsfc";
constexpr std::size_t longest_line = 1048576;

/// The newest lines that hold a text, out of bytes that come in any portions.
class Newest_Lines {
public:
    Newest_Lines(const std::string& search, std::size_t room, std::vector<std::string>& lines)
        : m_search(search), m_room(room), m_lines(lines)
    {
    }

    void take(const char* bytes, std::size_t size)
    {
        const char* const end = bytes + size;
        while (const auto* line_end =
                   static_cast<const char*>(std::memchr(bytes, '\n', static_cast<std::size_t>(end - bytes)))) {
            finish(bytes, static_cast<std::size_t>(line_end - bytes));
            bytes = line_end + 1;
        }
        keep_part(bytes, static_cast<std::size_t>(end - bytes));
    }
    /// Behind the last byte: the lines in their order.
    void end()
    {
        finish(nullptr, 0);
        std::rotate(m_lines.begin(), m_lines.begin() + static_cast<std::ptrdiff_t>(m_oldest), m_lines.end());
    }

private:
    /// The line whose beginning may be in m_part ends with these bytes.
    void finish(const char* bytes, std::size_t size)
    {
        if (!m_part.empty()) {
            keep_part(bytes, size);
            judge(m_part.data(), m_part.size());
            m_part.clear();
        } else {
            judge(bytes, std::min(size, longest_line));
        }
    }
    void keep_part(const char* bytes, std::size_t size)
    {
        m_part.append(bytes, std::min(size, longest_line - m_part.size()));
    }
    void judge(const char* line, std::size_t size)
    {
        if (size == 0 || !::memmem(line, size, m_search.data(), m_search.size())) return;
        std::string kept(line, size);
        std::replace(kept.begin(), kept.end(), '\0', '?');
        if (m_lines.size() < m_room) {
            m_lines.push_back(std::move(kept));
            return;
        }
        m_lines[m_oldest].swap(kept);
        m_oldest = (m_oldest + 1) % m_room;
    }

    const std::string& m_search;
    const std::size_t m_room;
    std::vector<std::string>& m_lines; // a ring once it is full
    std::size_t m_oldest = 0;
    std::string m_part; // what has come of a line that is not at its end
};

/// A file that grows meanwhile is read as far as it reached at the start.
void read_lines(Newest_Lines& lines)
{
    Undisturbed undisturbed;
    const File file = open_regular_file(system_log_path, "rb");
    struct stat status;
    if (!file || ::fstat(::fileno(file.get()), &status) != 0) return;
    std::vector<char> buffer(65536);
    for (auto left = static_cast<std::size_t>(status.st_size); left > 0;) {
        const ssize_t count = ::read(::fileno(file.get()), buffer.data(), std::min(left, buffer.size()));
        if (count < 0 && errno == EINTR) continue;
        if (count <= 0) break;
        lines.take(buffer.data(), static_cast<std::size_t>(count));
        left -= static_cast<std::size_t>(count);
    }
}

} // namespace

void refreshDriverLog(ProviderAgent& agent)
{
    agent.m_driverLogStore.clear();
    std::vector<std::string> lines;
    readEvents(driver_name, lines, agent.m_driverLogStore);
    NVR_LOG("Logging of FC Driver Log Ends");
}

void readEvents(const std::string& search, std::vector<std::string>& lines, Driver_Log_Store& store)
{
    NVR_LOG("Reading Events for %s", search.c_str());
    // One more than the store takes: that one is still offered, and refused.
    Newest_Lines newest(search, store.capacity + 1, lines);
    read_lines(newest);
    newest.end();
    for (auto line = lines.rbegin(); line != lines.rend(); ++line)
        if (store.insert(std::move(*line)) != 0) break;
    NVR_LOG("Finished reading Events for %s", search.c_str());
}

} // namespace cimple
