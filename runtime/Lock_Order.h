/// The order in which threads take the module's locks, and in debug builds the check of it.
///
/// Each lock has a name and a place. A thread that holds one of a place takes only locks of later places. Locks of no
/// place (`observed`) have none of their own, since the server decides whom an up-call reaches: there all threads must
/// agree, and which lock was taken under which is remembered by name for the life of the process. What breaks either
/// rule, or locks a plain mutex twice, ends a debug process with the names on standard error, whether or not it would
/// have waited that time. Other builds have nothing of it, not even the names.
///
/// The check itself takes no lock, and orders threads only where one lock is first seen under another: so it hides
/// hardly a race from the thread sanitizer.
#pragma once

#ifdef NORVANE_LOCK_ORDER
#include <atomic>
#endif

namespace cimple {

/// First to last. docs/architecture.md tells what each lock guards.
enum class Lock_Place : unsigned char {
    observed,
    alert_changes,
    alerts,
    lifetime,
    adapter_data_ready,
    adapter_maps_ready,
    san_maps_ready,
    data,
    live_values,
    // From here on a thread takes no lock but those of later places, so that it may hold any other when it comes here.
    alert_signal,
    innermost, // one at a time
    log,
};

/// What a mutex is in the order.
class Ordered_Lock {
public:
#ifdef NORVANE_LOCK_ORDER
    /// `name` lives as long as the process; locks of one name are one in the order.
    constexpr Ordered_Lock(const char* name, Lock_Place place, bool recursive) noexcept
        : m_name(name), m_place(place), m_recursive(recursive)
    {
    }

    /// The calling thread is about to wait for it. Ends the process if it must not.
    void check() const;
    /// It has it.
    void taken() const;
    /// It is about to let go of it.
    void given() const;

private:
    unsigned node() const;

    const char* m_name;
    Lock_Place m_place;
    bool m_recursive;
    mutable std::atomic<short> m_node{-1}; // of its name in what was observed; -1: not asked yet
#else
    constexpr Ordered_Lock(const char*, Lock_Place, bool) noexcept {}
    void check() const {}
    void taken() const {}
    void given() const {}
#endif
};

/// For a scope in which the thread takes locks that no other thread can reach any more: what it held before is not
/// remembered as held under them. Places count all the same.
class Unreachable_Locks {
public:
#ifdef NORVANE_LOCK_ORDER
    Unreachable_Locks();
    ~Unreachable_Locks();

private:
    const unsigned m_outer;

public:
#else
    Unreachable_Locks() {}
    ~Unreachable_Locks() {}
#endif
    Unreachable_Locks(const Unreachable_Locks&) = delete;
    Unreachable_Locks& operator=(const Unreachable_Locks&) = delete;
};

} // namespace cimple
