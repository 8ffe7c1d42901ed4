/// The command's talk with a person at a terminal: a question before something changes, and a sign of life while
/// something lasts.
#pragma once

#include <condition_variable>
#include <istream>
#include <mutex>
#include <ostream>
#include <string>
#include <thread>

namespace host {

/// Asks, and reads one line. True for an answer that begins with "y"; everything else, and no answer, is no.
bool confirm(const std::string& question, std::istream& in, std::ostream& out);

/// While it lives, a line on standard error with what is being done and for how long; nothing if that is no terminal.
class Progress {
public:
    explicit Progress(const std::string& doing);
    ~Progress();
    Progress(const Progress&) = delete;
    Progress& operator=(const Progress&) = delete;

private:
    void show(const std::string& doing);

    std::mutex m_mutex;
    std::condition_variable m_condition;
    bool m_over = false;
    std::thread m_thread;
};

} // namespace host
