#include "host/Ledger.h"

#include <algorithm>

namespace host {
namespace {

constexpr std::size_t kept_violations = 1000;
constexpr std::int64_t most_uncounted = 16;

void add(std::atomic<std::uint64_t>& counter, std::uint64_t by = 1)
{
    counter.fetch_add(by, std::memory_order_relaxed);
}
constexpr const char* names[object_kinds] = {"CMPIInstance", "CMPIObjectPath", "CMPIArgs",        "CMPIString",
                                             "CMPIArray",    "CMPIDateTime",   "CMPIEnumeration", "CMPIResult",
                                             "CMPIContext",  "CMPISelectExp",  "CMPIError"};

} // namespace

const char* kind_name(Object_Kind kind)
{
    return names[static_cast<std::size_t>(kind)];
}

std::uint64_t Report::left() const
{
    std::uint64_t sum = 0;
    for (const Tally& tally : tallies)
        sum += tally.left;
    return sum;
}

std::uint64_t Report::clones_alive() const
{
    std::uint64_t sum = 0;
    for (const Tally& tally : tallies)
        sum += tally.clones_alive;
    return sum;
}

std::string Report::to_text() const
{
    std::string text;
    for (std::size_t i = 0; i < object_kinds; ++i) {
        const Tally& t = tallies[i];
        if (t.left == 0 && t.clones_alive == 0) continue;
        text += std::string(names[i]) + ": " + std::to_string(t.left) + " of " + std::to_string(t.made) +
                " left at the end of a call, " + std::to_string(t.clones_alive) + " clones alive\n";
    }
    if (contexts_not_detached) text += std::to_string(contexts_not_detached) + " contexts not detached\n";
    if (violation_count) text += std::to_string(violation_count) + " violations:\n";
    for (const std::string& violation : violations)
        text += "  " + violation + "\n";
    return text;
}

Ledger::Shard& Ledger::own_shard()
{
    static std::atomic<std::size_t> threads{0};
    thread_local const std::size_t own = threads++ % number_of_shards;
    return m_shards[own];
}

void Ledger::change_alive(Shard& shard, std::int64_t by)
{
    const std::int64_t uncounted = shard.alive.fetch_add(by, std::memory_order_relaxed) + by;
    if (-most_uncounted < uncounted && uncounted < most_uncounted) return;
    const std::int64_t counted = shard.alive.exchange(0);
    const std::int64_t alive = m_alive.fetch_add(counted) + counted;
    std::int64_t peak = m_peak.load();
    while (alive > peak && !m_peak.compare_exchange_weak(peak, alive)) {
    }
}

std::int64_t Ledger::alive() const
{
    std::int64_t alive = m_alive;
    for (const Shard& shard : m_shards)
        alive += shard.alive;
    return alive;
}

void Ledger::created(Object_Kind kind, Origin origin)
{
    Shard& shard = own_shard();
    Counters& counters = shard.counters[static_cast<std::size_t>(kind)];
    if (origin == Origin::made) add(counters.made);
    if (origin == Origin::got) add(counters.got);
    if (origin == Origin::cloned) add(counters.cloned), add(counters.clones_alive);
    change_alive(shard, 1);
}

void Ledger::released(Object_Kind kind, Origin origin)
{
    Shard& shard = own_shard();
    Counters& counters = shard.counters[static_cast<std::size_t>(kind)];
    add(counters.released);
    if (origin == Origin::cloned) counters.clones_alive.fetch_sub(1, std::memory_order_relaxed); // of all shards' sum
    change_alive(shard, -1);
}

void Ledger::settled(Object_Kind kind, Origin origin)
{
    Shard& shard = own_shard();
    if (origin == Origin::made) add(shard.counters[static_cast<std::size_t>(kind)].left);
    change_alive(shard, -1);
}

void Ledger::context_out(int by)
{
    m_contexts_out += by;
}

void Ledger::violation(const std::string& text)
{
    std::lock_guard lock(m_mutex);
    ++m_violation_count;
    if (m_violations.size() < kept_violations) m_violations.push_back(text);
}

Report Ledger::report() const
{
    Report report;
    for (const Shard& shard : m_shards) {
        for (std::size_t i = 0; i < object_kinds; ++i) {
            const Counters& from = shard.counters[i];
            Tally& to = report.tallies[i];
            to.made += from.made;
            to.got += from.got;
            to.cloned += from.cloned;
            to.released += from.released;
            to.left += from.left;
            to.clones_alive += from.clones_alive;
        }
    }
    report.peak_objects = static_cast<std::uint64_t>(std::max({m_peak.load(), alive(), std::int64_t{0}}));
    report.contexts_not_detached = static_cast<std::uint64_t>(m_contexts_out.load());
    std::lock_guard lock(m_mutex);
    report.violations = m_violations;
    report.violation_count = m_violation_count;
    return report;
}

void Ledger::reset()
{
    for (Shard& shard : m_shards)
        for (Counters& c : shard.counters)
            c.made = c.got = c.cloned = c.released = c.left = 0;
    m_peak = alive();
    std::lock_guard lock(m_mutex);
    m_violations.clear();
    m_violation_count = 0;
}

} // namespace host
