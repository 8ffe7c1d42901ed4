/// What the module's code asks of the heap: counted by the place that asks, and refused there at will.
///
///     watch_memory_of(NVR_MODULE);
///     refuse(site, 1, Refusal::once);
///     ... the module is driven ...
///     if (refused()) ...
///
/// The program that links this defines malloc and its kin for all that it loads. Its own calls, the simulator's and the
/// loader's pass; what the C and the C++ library ask for in a call of the module's (operator new, strdup, fopen) counts
/// as the module's. A place is told by the call stack inside the module: the same stack has the same number in each
/// process. Blocks that the module would map for the pieces of a rebuild are never there. Any thread.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace nvrtest {

struct Allocation_Site {
    std::uint64_t id = 0;              ///< of the stack, never 0
    std::uint64_t asked = 0;           ///< blocks so far
    std::int64_t held = 0;             ///< of them, not given back
    std::vector<std::uintptr_t> stack; ///< return addresses from the module's start on, innermost first
};

/// Loads the module, and counts from then on, also what its start asks for. So many innermost frames tell places apart,
/// at most 16. Once a process. Throws std::runtime_error.
void watch_memory_of(const std::string& module, std::size_t frames);

/// All that have asked, in the order of their first time.
std::vector<Allocation_Site> allocation_sites();
/// Blocks that the module's code asked for and nobody gave back.
std::int64_t blocks_held();

enum class Refusal {
    once,   ///< this one ask
    lasting ///< and all that the module asks for behind it, until the end of the refusal
};
/// Refuses the n-th time (from 1, from now on) that this place, of which its number and its innermost frame are read,
/// asks. Other places are told by their innermost frame alone from now on. No thread of the module runs yet.
void refuse(const Allocation_Site& site, std::uint64_t nth, Refusal refusal);
void end_refusal();
/// Asks that were refused.
std::uint64_t refused();

/// Threads that the module's code started and that have not ended.
int threads_of_module();

} // namespace nvrtest
