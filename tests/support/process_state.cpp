#include "tests/support/process_state.h"

#include <algorithm>
#include <cstring>
#include <dirent.h>
#include <fstream>
#include <malloc.h>
#include <stdexcept>
#include <sys/syscall.h>
#include <thread>
#include <unistd.h>

namespace nvrtest {

namespace {

// Between two looks at what ends soon.
constexpr std::chrono::milliseconds a_moment{1};

std::vector<std::string> entries_of(const char* folder, const std::string& part, bool with_its_own_descriptor)
{
    std::vector<std::string> names;
    DIR* entries = ::opendir(folder);
    if (!entries) return names;
    const std::string own = with_its_own_descriptor ? std::string() : std::to_string(::dirfd(entries));
    while (const dirent* entry = ::readdir(entries)) {
        const char* name = entry->d_name;
        if (std::strcmp(name, ".") == 0 || std::strcmp(name, "..") == 0 || name == own) continue;
        if (std::strstr(name, part.c_str())) names.emplace_back(name);
    }
    ::closedir(entries);
    std::sort(names.begin(), names.end());
    return names;
}

} // namespace

std::size_t number_of_threads()
{
    std::ifstream status("/proc/self/status");
    const std::string word = "Threads:";
    for (std::string line; std::getline(status, line);)
        if (line.compare(0, word.size(), word) == 0) return std::stoul(line.substr(word.size()));
    throw std::runtime_error("the kernel does not tell the number of threads");
}

std::size_t number_of_threads_from_the_start()
{
    pid_t first = 0;
    std::thread([&] { first = ::gettid(); }).join();
    while (::syscall(SYS_tgkill, ::getpid(), first, 0) == 0)
        std::this_thread::sleep_for(a_moment);
    return number_of_threads();
}

bool wait_for_threads(std::size_t most, std::chrono::seconds up_to)
{
    const auto deadline = std::chrono::steady_clock::now() + up_to;
    while (number_of_threads() > most) {
        if (std::chrono::steady_clock::now() > deadline) return false;
        std::this_thread::sleep_for(a_moment);
    }
    return true;
}

std::vector<std::string> open_files()
{
    return entries_of("/proc/self/fd", {}, false);
}

std::vector<std::string> names_in(const std::string& folder, const std::string& part)
{
    return entries_of(folder.c_str(), part, true);
}

std::size_t resident_kilobytes()
{
    std::ifstream pages("/proc/self/statm");
    std::size_t size = 0, resident = 0;
    pages >> size >> resident;
    return resident * static_cast<std::size_t>(::sysconf(_SC_PAGESIZE)) / 1024;
}

std::size_t heap_bytes()
{
    const struct mallinfo2 heap = ::mallinfo2();
    return heap.uordblks + heap.hblkhd;
}

} // namespace nvrtest
