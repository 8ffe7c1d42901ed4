#include "host/Ledger.h"

namespace host {
namespace {

constexpr std::size_t kept_violations = 1000;
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

void Ledger::one_more()
{
    std::int64_t alive = ++m_alive, peak = m_peak.load();
    while (alive > peak && !m_peak.compare_exchange_weak(peak, alive)) {
    }
}

void Ledger::created(Object_Kind kind, Origin origin)
{
    Counters& counters = m_counters[static_cast<std::size_t>(kind)];
    if (origin == Origin::made) ++counters.made;
    if (origin == Origin::got) ++counters.got;
    if (origin == Origin::cloned) ++counters.cloned, ++counters.clones_alive;
    one_more();
}

void Ledger::released(Object_Kind kind, Origin origin)
{
    Counters& counters = m_counters[static_cast<std::size_t>(kind)];
    ++counters.released;
    if (origin == Origin::cloned) --counters.clones_alive;
    --m_alive;
}

void Ledger::settled(Object_Kind kind, Origin origin)
{
    Counters& counters = m_counters[static_cast<std::size_t>(kind)];
    if (origin == Origin::made) ++counters.left;
    --m_alive;
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
    for (std::size_t i = 0; i < object_kinds; ++i) {
        const Counters& from = m_counters[i];
        report.tallies[i] = {from.made, from.got, from.cloned, from.released, from.left, from.clones_alive};
    }
    report.peak_objects = static_cast<std::uint64_t>(m_peak.load());
    report.contexts_not_detached = static_cast<std::uint64_t>(m_contexts_out.load());
    std::lock_guard lock(m_mutex);
    report.violations = m_violations;
    report.violation_count = m_violation_count;
    return report;
}

void Ledger::reset()
{
    for (Counters& c : m_counters)
        c.made = c.got = c.cloned = c.released = c.left = 0;
    m_peak = m_alive.load();
    std::lock_guard lock(m_mutex);
    m_violations.clear();
    m_violation_count = 0;
}

} // namespace host
