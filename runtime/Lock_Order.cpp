#include "runtime/Lock_Order.h"

#ifdef NORVANE_LOCK_ORDER

#include <bitset>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace cimple {

namespace {

// --- What the calling thread holds, oldest first ---------------------------------------------------------------------

constexpr unsigned max_held = 32;

struct Held {
    const Ordered_Lock* locks[max_held];
    unsigned count;
    unsigned reachable_from; // what is below was held before an Unreachable_Locks
};
thread_local Held held;

// --- What was observed: which name was locked under which ------------------------------------------------------------

constexpr unsigned max_names = 512;
constexpr unsigned word_bits = 64;

std::atomic<const char*> names[max_names];
std::atomic<std::uint64_t> locked_under[max_names][max_names / word_bits]; // [outer], a bit for each inner

const char* name_at(unsigned node)
{
    return names[node].load(std::memory_order_relaxed);
}

bool was_locked_under(unsigned inner, unsigned outer, std::memory_order order)
{
    return locked_under[outer][inner / word_bits].load(order) >> inner % word_bits & 1;
}

[[noreturn]] void end_process()
{
    std::fputs("\n", stderr);
    std::abort();
}

unsigned node_of(const char* name)
{
    for (unsigned node = 0; node < max_names; node++) {
        const char* there = nullptr;
        if (names[node].compare_exchange_strong(there, name) || std::strcmp(there, name) == 0) return node;
    }
    std::fprintf(stderr, "Lock order: %s is one name too many", name);
    end_process();
}

/// Locks of which each was locked under the next.
struct Way {
    unsigned nodes[max_names];
    unsigned length = 0;
    std::bitset<max_names> tried;

    bool find(unsigned inner, unsigned outer)
    {
        tried.set(outer);
        bool found = was_locked_under(inner, outer, std::memory_order_seq_cst);
        if (found) nodes[length++] = inner;
        for (unsigned between = 0; !found && between < max_names && name_at(between); between++)
            found =
                was_locked_under(between, outer, std::memory_order_seq_cst) && !tried[between] && find(inner, between);
        if (found) nodes[length++] = outer;
        return found;
    }
};

/// Remembers that `inner` is locked under `outer`; ends the process if it ever was the other way round. Remembers
/// first: of two threads that come from both sides at once, one sees the other.
void observe(unsigned inner, unsigned outer)
{
    if (was_locked_under(inner, outer, std::memory_order_relaxed)) return;
    locked_under[outer][inner / word_bits].fetch_or(std::uint64_t{1} << inner % word_bits);
    Way back;
    if (!back.find(outer, inner)) return;
    std::fprintf(stderr, "Lock order: %s is locked under %s, but there was %s", name_at(inner), name_at(outer),
                 name_at(back.nodes[0]));
    for (unsigned i = 1; i < back.length; i++)
        std::fprintf(stderr, " under %s", name_at(back.nodes[i]));
    end_process();
}

bool may_follow(Lock_Place held_place, Lock_Place wanted)
{
    return wanted == Lock_Place::observed ? held_place < Lock_Place::alert_signal : held_place < wanted;
}

} // namespace

unsigned Ordered_Lock::node() const
{
    short known = m_node.load(std::memory_order_relaxed);
    if (known < 0) m_node.store(known = static_cast<short>(node_of(m_name)), std::memory_order_relaxed);
    return static_cast<unsigned>(known);
}

void Ordered_Lock::check() const
{
    for (unsigned i = 0; i < held.count; i++)
        if (held.locks[i] == this) {
            if (m_recursive) return; // nothing to wait for
            std::fprintf(stderr, "Lock order: %s is locked by a thread that holds it", m_name);
            end_process();
        }
    for (unsigned i = 0; i < held.count; i++) {
        const Ordered_Lock& outer = *held.locks[i];
        if (!may_follow(outer.m_place, m_place)) {
            std::fprintf(stderr, "Lock order: %s is locked under %s, whose place is not before it", m_name,
                         outer.m_name);
            end_process();
        }
        if (i >= held.reachable_from) observe(node(), outer.node());
    }
}

void Ordered_Lock::taken() const
{
    if (held.count == max_held) {
        std::fprintf(stderr, "Lock order: a thread that holds %u locks takes %s", max_held, m_name);
        end_process();
    }
    held.locks[held.count++] = this;
}

void Ordered_Lock::given() const
{
    unsigned i = held.count;
    while (i > 0 && held.locks[i - 1] != this)
        i--;
    if (i == 0) {
        std::fprintf(stderr, "Lock order: %s is unlocked by a thread that does not hold it", m_name);
        end_process();
    }
    for (; i < held.count; i++)
        held.locks[i - 1] = held.locks[i];
    held.count--;
}

Unreachable_Locks::Unreachable_Locks() : m_outer(held.reachable_from)
{
    held.reachable_from = held.count;
}

Unreachable_Locks::~Unreachable_Locks()
{
    held.reachable_from = m_outer;
}

} // namespace cimple

#endif
