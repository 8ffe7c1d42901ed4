#include "tests/soak/Process.h"

#include <dirent.h>
#include <fstream>
#include <malloc.h>
#include <unistd.h>

namespace soak {

namespace {

std::size_t entries_of(const char* folder)
{
    DIR* entries = opendir(folder);
    if (!entries) return 0;
    std::size_t count = 0;
    while (const dirent* entry = readdir(entries))
        count += entry->d_name[0] != '.';
    closedir(entries);
    return count;
}

} // namespace

Process Process::now()
{
    Process process;
    malloc_trim(0);
    std::ifstream pages("/proc/self/statm");
    std::size_t size = 0, resident = 0;
    pages >> size >> resident;
    process.resident = resident * static_cast<std::size_t>(sysconf(_SC_PAGESIZE)) / 1024;
    const struct mallinfo2 heap = mallinfo2();
    process.heap = (heap.uordblks + heap.hblkhd) / 1024;
    process.threads = entries_of("/proc/self/task");
    process.descriptors = entries_of("/proc/self/fd") - 1; // the folder itself was open
    return process;
}

} // namespace soak
