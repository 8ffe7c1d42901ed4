/// What a module made through the broker and did not give back, and which rules it broke.
///
/// Counts and violations are kept in every manner; a test of a module asserts on `report()`. Any thread.
#pragma once

#include <array>
#include <atomic>
#include <cstdint>
#include <mutex>
#include <string>
#include <vector>

namespace host {

/// The encapsulated types.
enum class Object_Kind {
    instance,
    path,
    args,
    string,
    array,
    datetime,
    enumeration,
    result,
    context,
    select_exp,
    error
};
constexpr std::size_t object_kinds = 11;
const char* kind_name(Object_Kind kind);

/// How an object came to be.
enum class Origin {
    made,   ///< by a call that creates (newInstance, an up-call, prepareAttachThread): the module should release it
    got,    ///< by a look at another object (getNameSpace, getProperty): the broker frees it with the call
    cloned, ///< by clone: lives until the module releases it, whatever call or thread ends
    lent    ///< by the broker for one call (path, context, result): not the module's to release
};

struct Tally {
    std::uint64_t made = 0;
    std::uint64_t got = 0;
    std::uint64_t cloned = 0;
    std::uint64_t released = 0; ///< by the module, whatever the origin
    std::uint64_t left = 0;     ///< made, and still there when the call or the attachment ended
    std::uint64_t clones_alive = 0;
};

struct Report {
    std::array<Tally, object_kinds> tallies;
    /// One line each, in order of appearance; at most 1,000 are kept.
    std::vector<std::string> violations;
    std::uint64_t violation_count = 0;
    /// Most objects that lived at once since the last reset, to within 16 for each shard of the count.
    std::uint64_t peak_objects = 0;
    /// Contexts of prepareAttachThread that were neither detached nor released.
    std::uint64_t contexts_not_detached = 0;

    const Tally& of(Object_Kind kind) const { return tallies[static_cast<std::size_t>(kind)]; }
    /// All made objects that were left, of any kind.
    std::uint64_t left() const;
    std::uint64_t clones_alive() const;
    /// For a test's message: what is not zero, and the violations.
    std::string to_text() const;
};

class Ledger {
public:
    void created(Object_Kind kind, Origin origin);
    void released(Object_Kind kind, Origin origin);
    void settled(Object_Kind kind, Origin origin); ///< freed by the broker at the end of a call
    void context_out(int by);                      ///< +1 prepared for a thread, -1 detached or released
    std::int64_t contexts_out() const { return m_contexts_out; }
    void violation(const std::string& text);

    Report report() const;
    /// Sets all back to zero but what is alive: clones and contexts.
    void reset();

private:
    struct Counters {
        std::atomic<std::uint64_t> made{0}, got{0}, cloned{0}, released{0}, left{0}, clones_alive{0};
    };
    // Threads count in places of their own: each object is counted twice, and requests run side by side.
    struct alignas(64) Shard {
        std::array<Counters, object_kinds> counters;
        std::atomic<std::int64_t> alive{0}; // more or less, and not yet in m_alive
    };
    static constexpr std::size_t number_of_shards = 16;

    Shard& own_shard();
    void change_alive(Shard& shard, std::int64_t by);
    std::int64_t alive() const;

    std::array<Shard, number_of_shards> m_shards;
    std::atomic<std::int64_t> m_alive{0}, m_peak{0}, m_contexts_out{0};
    mutable std::mutex m_mutex;
    std::vector<std::string> m_violations;
    std::uint64_t m_violation_count = 0;
};

} // namespace host
