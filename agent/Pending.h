/// A refresh that was asked for: a pending flag that no request can get lost in.
///
/// Asking raises a counter. Who serves the request notes the counter before it reads the state that the request is
/// about, and settles up to there afterwards; what was asked in between stays pending. Any thread, no lock.
#pragma once

#include <atomic>

#include "runtime/Type.h"

namespace cimple {

class Pending {
public:
    explicit Pending(bool pending) : m_asked(pending) {}

    /// Asks for it once more.
    void ask() { m_asked++; }
    explicit operator bool() const { return m_asked != m_settled; }

    uint32 asked() const { return m_asked; }
    /// All that was asked until the counter read `asked` is done.
    void settle(uint32 asked) { m_settled = asked; }

private:
    std::atomic<uint32> m_asked;
    std::atomic<uint32> m_settled{0};
};

} // namespace cimple
