#include "simulator/Call.h"

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <ctime>

namespace nvrsim {

namespace {

constexpr size_t longestLog = 20000;

uint64_t processor_nanoseconds()
{
    timespec now{};
    clock_gettime(CLOCK_THREAD_CPUTIME_ID, &now);
    return static_cast<uint64_t>(now.tv_sec) * 1000000000 + static_cast<uint64_t>(now.tv_nsec);
}

} // namespace

Call::Under_Way::Under_Way(Simulator& simulator, Call_Id id)
    : m_simulator(std::strncmp(to_text(id), "RM_", 3) == 0 ? &simulator : nullptr)
{
    if (m_simulator) m_simulator->mostAtOnce = std::max(m_simulator->mostAtOnce, ++m_simulator->underWay);
}

Call::Under_Way::~Under_Way()
{
    if (m_simulator) --m_simulator->underWay;
}

Call::Call(Call_Id id, const Subject& subject)
    : m_simulator(Simulator::instance()), m_lock(m_simulator.mutex), m_id(id), m_underWay(m_simulator, id)
{
    if (m_simulator.timesCalls) m_start = processor_nanoseconds();
    resolve(subject);
    ++m_simulator.counters[static_cast<size_t>(id)];
    const char* name = to_text(id);
    m_clearings = m_simulator.faultClearings;
    for (size_t i = 0; i < m_simulator.faults.size(); ++i) {
        Fault& fault = m_simulator.faults[i];
        if (!matches(fault, name, subject)) continue;
        ++fault.seen;
        if (m_hit || fault.seen < fault.from || fault.seen - fault.from >= fault.times) continue;
        ++fault.hits;
        m_fault = fault;
        m_hit = i + 1;
    }
    note_change(m_fault.throws || m_fault.absent || m_fault.delay || is_refused());
    if (m_fault.delay) {
        const auto is_over = [&] { return m_simulator.faultClearings != m_clearings; };
        m_simulator.faultsCleared.wait_for(m_lock, std::chrono::milliseconds(m_fault.delay), is_over);
        resolve(subject); // the host may be another one now
    }
    if (m_port) m_wwpn = m_port->current.wwpn;
    if (m_adapter && m_adapter->present) note_gift(adapter_gift);
    if (m_fault.vanish && m_adapter) {
        note_change(m_adapter->present);
        m_adapter->present = false;
        m_simulator.host.reindex();
        resolve(subject);
    }
}

Call::~Call()
{
    if (m_hit && m_hasChanged && m_clearings == m_simulator.faultClearings) ++m_simulator.faults[m_hit - 1].changed;
    try {
        m_simulator.log.push_back({m_id, m_wwpn, m_result, m_gifts});
        if (m_simulator.log.size() > longestLog) m_simulator.log.pop_front();
    } catch (const std::exception&) {
        // A log without this line is all that is lost.
    }
    if (m_start != 0) m_simulator.callNanoseconds += processor_nanoseconds() - m_start;
}

void Call::resolve(const Subject& subject)
{
    m_adapter = nullptr;
    m_port = nullptr;
    switch (subject.kind) {
    case Subject::nothing:
        break;
    case Subject::port:
        m_port = m_simulator.host.find(subject.wwpn, &m_adapter);
        break;
    case Subject::adapterHandle:
        m_adapter = m_simulator.adapter_of(subject.handle);
        break;
    case Subject::adapterPort:
        m_adapter = m_simulator.adapter_of(subject.handle);
        if (m_adapter && subject.portIndex < m_adapter->ports.size()) m_port = &m_adapter->ports[subject.portIndex];
        break;
    case Subject::adapterIndex:
        m_adapter = m_simulator.present(subject.handle);
        break;
    case Subject::adapterName:
        m_adapter = subject.name ? m_simulator.host.find(subject.name) : nullptr;
        break;
    case Subject::tagHandle:
        m_adapter = m_simulator.adapter_of(subject.handle, true);
        break;
    }
}

bool Call::matches(const Fault& fault, const char* name, const Subject& subject) const
{
    if (!fault.concerns(name)) return false;
    if (fault.number && *fault.number != subject.number) return false;
    if (!fault.ordinal && !fault.wwpn) return true;
    const auto isIt = [&](const Port& port) {
        return fault.ordinal ? port.ordinal == *fault.ordinal : port.current.wwpn == *fault.wwpn;
    };
    if (m_port) return isIt(*m_port);
    // A call about a whole adapter concerns each of its ports.
    return m_adapter && std::any_of(m_adapter->ports.begin(), m_adapter->ports.end(), isIt);
}

int64_t Call::status_for(int64_t own)
{
    if (!m_fault.status) return own;
    note_change(*m_fault.status != own);
    return *m_fault.status;
}

uint64_t Call::count(uint64_t own)
{
    note_gift(count_gift);
    if (!m_fault.value) return own;
    note_change(*m_fault.value != own);
    return *m_fault.value;
}

bool Call::keeps_handle()
{
    note_gift(place_gift);
    if (m_fault.damage != Damage::null) return false;
    note_change();
    return true;
}

void Call::bytes(void* target, const void* source, size_t size)
{
    if (!target || !size) return;
    note_gift(bytes_gift);
    damage(target, source, size);
    // What was not written is not looked at: the caller may have no room for it.
    const size_t written = m_fault.damage == Damage::null        ? 0
                           : m_fault.damage == Damage::truncated ? std::min<size_t>(size, m_fault.keep)
                                                                 : size;
    const auto* unwritten = static_cast<const unsigned char*>(source) + written;
    const bool has_lost =
        std::any_of(unwritten, unwritten + (size - written), [](unsigned char byte) { return byte != 0; });
    note_change(has_lost || std::memcmp(target, source, written) != 0);
}

void Call::damage(void* target, const void* source, size_t size)
{
    switch (m_fault.damage) {
    case Damage::none:
    case Damage::unterminated:
        std::memcpy(target, source, size);
        return;
    case Damage::truncated:
        std::memcpy(target, source, std::min<size_t>(size, m_fault.keep));
        return;
    case Damage::ones:
        std::memset(target, 0xFF, size);
        return;
    case Damage::zeros:
        std::memset(target, 0, size);
        return;
    case Damage::null:
        return;
    case Damage::garbage:
        for (size_t i = 0; i < size; ++i) {
            m_noise = m_noise * 1664525 + 1013904223;
            static_cast<unsigned char*>(target)[i] = static_cast<unsigned char>(m_noise >> 24);
        }
        return;
    }
}

void Call::fill(char* target, size_t capacity, const std::string& text, bool terminated)
{
    if (!capacity) return;
    if (terminated || text.size() < capacity) note_gift(text_gift);
    if (m_fault.damage == Damage::unterminated) {
        note_change(terminated || text.size() < capacity);
        for (size_t i = 0; i < capacity; ++i)
            target[i] = text.empty() ? 'X' : text[i % text.size()];
        return;
    }
    const size_t size = std::min(text.size(), terminated ? capacity - 1 : capacity);
    std::memcpy(target, text.data(), size);
    std::memset(target + size, 0, capacity - size);
}

void Call::text(char* target, size_t capacity, const std::string& text)
{
    if (!target || !capacity) return;
    std::string whole(capacity, '\0');
    fill(&whole[0], capacity, text);
    const size_t used = m_fault.damage == Damage::unterminated ? capacity : std::min(text.size() + 1, capacity);
    bytes(target, whole.data(), m_fault.damage == Damage::none ? used : capacity);
}

uint32_t Call::block(const Bytes& data, void* target, uint32_t* size)
{
    if (!size || !target) return RM_STATUS_ARGUMENT;
    uint32_t capacity;
    std::memcpy(&capacity, size, sizeof capacity);
    number(size, data.size());
    if (capacity < data.size()) return RM_STATUS_MORE_DATA;
    bytes(target, data.data(), data.size());
    return RM_STATUS_OK;
}

} // namespace nvrsim
