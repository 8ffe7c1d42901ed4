/// What the server did with its modules, one line a thing: loads, factories, calls with their status and time,
/// clean-ups, up-calls, broken rules, and what modules themselves logged. Any thread.
#pragma once

#include <cstdio>
#include <deque>
#include <mutex>
#include <string>
#include <vector>

namespace host {

class Server_Log {
public:
    /// Lines go to `file` ("-": standard error; "": memory only). A file that cannot be opened is told on standard
    /// error once and then done without.
    explicit Server_Log(const std::string& file);
    ~Server_Log();
    Server_Log(const Server_Log&) = delete;
    Server_Log& operator=(const Server_Log&) = delete;

    /// printf-like; the time, thread and line end are added in the file.
    void line(const char* format, ...) __attribute__((format(printf, 2, 3)));
    /// The last 10,000 lines, without time and thread.
    std::vector<std::string> lines() const;

private:
    mutable std::mutex m_mutex;
    std::FILE* m_file = nullptr;
    std::deque<std::string> m_lines;
};

} // namespace host
