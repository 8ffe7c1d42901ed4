/// What this process holds of the machine, as the kernel and the allocator tell it. Any thread.
///
/// Threads are counted without a look at each one: the kernel keeps an entry for each that is looked at, and searches
/// for those whenever a thread ends, which takes a third of the time of programs that count often.
#pragma once

#include <chrono>
#include <cstddef>
#include <string>
#include <vector>

namespace nvrtest {

/// Threads that have not ended.
std::size_t number_of_threads();
/// The same once one has come and gone: a sanitizer starts one of its own with the first.
std::size_t number_of_threads_from_the_start();
/// Waits until there are no more than so many: one that was joined, or has told its end, is there a moment longer.
/// Result: they were so few in time.
bool wait_for_threads(std::size_t most, std::chrono::seconds up_to = std::chrono::hours(1));

/// Descriptors of files, sockets and pipes that are open, by their numbers.
std::vector<std::string> open_files();
/// What is in the folder with `part` in its name, in order; nothing where there is no such folder.
std::vector<std::string> names_in(const std::string& folder, const std::string& part = {});

/// Memory that is in use, kB.
std::size_t resident_kilobytes();
/// What the allocator has given out; 0 under a sanitizer, which has one of its own.
std::size_t heap_bytes();

} // namespace nvrtest
