// One call into a simulated library, from counting it to its result. All that a call writes for its caller goes through
// this object, so that a fault can damage any of it, and so that no call writes more than the caller's buffer takes.
#ifndef _simulator_Call_h
#define _simulator_Call_h

#include "simulator/Simulator.h"

#include <cstring>
#include <mutex>
#include <new>
#include <type_traits>

namespace nvrsim {

/// What a call is about, as its arguments name it.
struct Subject {
    enum Kind { nothing, port, adapterHandle, adapterPort, adapterIndex, adapterName, tagHandle } kind = nothing;
    Wwn wwpn = 0;
    uint32_t handle = 0; // or index of an adapter
    uint32_t portIndex = 0;
    const char* name = nullptr;
    uint32_t number = 0; // attribute or page, for faults that name one

    static Subject of_port(const HBA_WWN& wwn) { return {port, to_number(wwn), 0, 0, nullptr, 0}; }
    static Subject of_handle(uint32_t handle) { return {adapterHandle, 0, handle, 0, nullptr, 0}; }
    static Subject of_adapter_port(uint32_t handle, uint32_t index)
    {
        return {adapterPort, 0, handle, index, nullptr, 0};
    }
    static Subject of_index(uint32_t index) { return {adapterIndex, 0, index, 0, nullptr, 0}; }
    static Subject of_name(const char* name) { return {adapterName, 0, 0, 0, name, 0}; }
    static Subject of_tags(uint32_t handle) { return {tagHandle, 0, handle, 0, nullptr, 0}; }
};

class Call {
public:
    /// Counts the call, finds the fault that hits it, waits as the fault says (without the lock), then takes the lock.
    Call(Call_Id id, const Subject& subject);
    ~Call();
    Call(const Call&) = delete;
    Call& operator=(const Call&) = delete;

    Simulator& simulator() { return m_simulator; }
    /// Null when the subject names none.
    Adapter* adapter() { return m_adapter; }
    Port* port() { return m_port; }

    bool throws() const { return m_fault.throws; }
    bool is_absent() const { return m_fault.absent; }
    /// True if the call shall answer its fault's status and do nothing else.
    bool is_refused() const { return m_fault.status && !m_fault.writes(); }
    int64_t status() const { return *m_fault.status; }
    /// The call's own status, or the fault's in its place.
    int64_t status_for(int64_t own);
    Damage damage() const { return m_fault.damage; }
    int64_t note(int64_t result) { return m_result = result; }
    /// The fault has made a difference to the caller.
    void note_change(bool is_one = true) { m_hasChanged |= is_one; }
    /// Remembers that the call hands such a thing out.
    void note_gift(Gift gift) { m_gifts |= gift; }

    /// A count that is the call's result, or the fault's in its place.
    uint64_t count(uint64_t own);
    /// True if the fault keeps back the handle that the call would hand out.
    bool keeps_handle();

    /// Writes bytes to the caller, damaged as the fault says. Null targets are passed over.
    void bytes(void* target, const void* source, size_t size);
    /// Writes a count or a size of what the call writes, which only `value` changes: bytes that are damaged are looked
    /// at by the callers that believe their size.
    template <class T>
    void number(T* target, uint64_t value)
    {
        static_assert(std::is_unsigned<T>::value, "numbers are unsigned");
        if (!target) return;
        note_gift(number_gift);
        const T own = static_cast<T>(value), word = static_cast<T>(m_fault.value ? *m_fault.value : value);
        if (m_fault.damage != Damage::null) std::memcpy(target, &word, sizeof word);
        note_change(std::memcmp(target, &own, sizeof own) != 0);
    }
    /// Writes a number that is an answer by itself: a code, a state, an identifier. Damage is done to it as to bytes.
    template <class T>
    void answer(T* target, uint64_t value)
    {
        if (!target) return;
        if (m_fault.value) return number(target, value);
        note_gift(number_gift);
        const T own = static_cast<T>(value);
        bytes(target, &own, sizeof own);
    }
    /// Fills a text field of a record that `bytes` will write.
    template <size_t size>
    void field(char (&target)[size], const std::string& text)
    {
        fill(target, size, text);
    }
    /// As `field`, but for fields that a full text may fill without terminator.
    template <size_t size>
    void open_field(char (&target)[size], const std::string& text)
    {
        fill(target, size, text, false);
    }
    /// Writes a text straight to the caller.
    void text(char* target, size_t capacity, const std::string& text);

    /// A block with its size by pointer: capacity in, size out, "more data" with the need if it does not fit.
    uint32_t block(const Bytes& data, void* target, uint32_t* size);

private:
    void damage(void* target, const void* source, size_t size);
    void fill(char* target, size_t capacity, const std::string& text, bool terminated = true);
    void resolve(const Subject& subject);
    bool matches(const Fault& fault, const char* name, const Subject& subject) const;

    // Counts a call of the management library for as long as it is under way; made and ended under the lock.
    class Under_Way {
    public:
        Under_Way(Simulator& simulator, Call_Id id);
        ~Under_Way();
        Under_Way(const Under_Way&) = delete;
        Under_Way& operator=(const Under_Way&) = delete;

    private:
        Simulator* m_simulator; // null: of another library
    };

    Simulator& m_simulator;
    std::unique_lock<std::mutex> m_lock;
    const Call_Id m_id;
    const Under_Way m_underWay;
    Fault m_fault; // a copy: the list may change during a delay
    Adapter* m_adapter = nullptr;
    Port* m_port = nullptr;
    Wwn m_wwpn = 0;
    int64_t m_result = 0;
    uint64_t m_start = 0; // 0: not timed
    size_t m_hit = 0;     // number of the fault, from 1; 0: none
    uint64_t m_clearings = 0;
    bool m_hasChanged = false;
    uint8_t m_gifts = 0;
    uint32_t m_noise = 0x9E3779B9;
};

/// What comes out of a function whose fault says so; of no class that a caller could know.
struct Library_Exception {};

/// Runs `work(call)` as the body of an operation; `missing` answers for an absent library. Nothing is thrown but what a
/// fault asks for.
template <class Result, class Work>
Result run(Call_Id id, const Subject& subject, Result missing, Work work)
{
    try {
        Call call(id, subject);
        if (call.throws()) throw Library_Exception();
        if (call.is_absent()) return missing;
        if (call.is_refused()) return static_cast<Result>(call.note(call.status()));
        const auto own = static_cast<Result>(work(call));
        return static_cast<Result>(call.note(call.status_for(static_cast<int64_t>(own))));
    } catch (const std::exception&) {
        return missing; // memory ran out
    }
}

/// As `run`, for calls about a local port. Unknown names, adapters that are gone and resetting ones are answered here.
template <class Work>
uint32_t run_on_port(Call_Id id, const HBA_WWN& wwn, Work work)
{
    return run<uint32_t>(id, Subject::of_port(wwn), 1, [&](Call& call) -> uint32_t {
        if (!call.port()) return RM_STATUS_ILLEGAL_WWN;
        if (call.port()->resettingUntil > monotonic_milliseconds()) return RM_STATUS_ADAPTER_BUSY;
        return work(call, *call.port());
    });
}

/// As `run`, for calls on an adapter handle.
template <class Work>
uint32_t run_on_adapter(Call_Id id, const Subject& subject, Work work)
{
    return run<uint32_t>(id, subject, 1, [&](Call& call) -> uint32_t {
        if (!call.adapter()) return HBA_STATUS_ERROR_INVALID_HANDLE;
        if (!call.adapter()->present) return HBA_STATUS_ERROR_UNAVAILABLE;
        return work(call, *call.adapter());
    });
}

} // namespace nvrsim

#endif // _simulator_Call_h
