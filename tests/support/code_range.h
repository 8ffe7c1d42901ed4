/// Where the code of a shared object lies in this process, to tell who calls.
///
///     Code_Range module;
///     module.find("libnorvane_fc_provider.so");
///     if (module.holds(reinterpret_cast<std::uintptr_t>(__builtin_return_address(0)))) ...
///
/// For what stands in for malloc and its kin: nothing here allocates, and a static one can be asked before main(). Any
/// thread.
#pragma once

#include <atomic>
#include <cstdint>
#include <string_view>

namespace nvrtest {

class Code_Range {
public:
    /// The loaded object whose path has this in it. Result: whether there is one.
    bool find(std::string_view name);
    bool is_found() const { return m_end != 0; }

    bool holds(std::uintptr_t place) const { return place < m_end && place >= m_first; } // the end is known last
    /// `place` counted from the object's start: the same in each process.
    std::uintptr_t offset(std::uintptr_t place) const { return place - m_base; }

private:
    std::atomic<std::uintptr_t> m_base{0}, m_first{0}, m_end{0};
};

} // namespace nvrtest
