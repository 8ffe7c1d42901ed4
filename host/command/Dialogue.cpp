#include "host/command/Dialogue.h"

#include <chrono>
#include <cstdio>
#include <unistd.h>

namespace host {

bool confirm(const std::string& question, std::istream& in, std::ostream& out)
{
    out << question << " [y/N] " << std::flush;
    std::string answer;
    if (!std::getline(in, answer)) out << "\n";
    return !answer.empty() && (answer[0] == 'y' || answer[0] == 'Y');
}

Progress::Progress(const std::string& doing)
{
    if (doing.empty() || !::isatty(STDERR_FILENO)) return;
    m_thread = std::thread([this, doing] { show(doing); });
}

Progress::~Progress()
{
    if (!m_thread.joinable()) return;
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        m_over = true;
    }
    m_condition.notify_one();
    m_thread.join();
}

void Progress::show(const std::string& doing)
{
    constexpr char wheel[] = "|/-\\";
    constexpr auto turn = std::chrono::milliseconds(200);
    const auto start = std::chrono::steady_clock::now();
    std::unique_lock<std::mutex> lock(m_mutex);
    for (unsigned turns = 0; !m_condition.wait_for(lock, turn, [this] { return m_over; }); turns++) {
        const auto seconds =
            std::chrono::duration_cast<std::chrono::seconds>(std::chrono::steady_clock::now() - start).count();
        std::fprintf(stderr, "\r%c %s, %lld s", wheel[turns % 4], doing.c_str(), static_cast<long long>(seconds));
    }
    std::fprintf(stderr, "\r\033[K");
}

} // namespace host
