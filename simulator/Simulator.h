// The one state of the process behind all faces: host, faults, handles, counters and log, under one mutex. Created at
// first use and never destroyed, since any thread of the process may call until the very end.
#ifndef _simulator_Simulator_h
#define _simulator_Simulator_h

#include "simulator/Calls.h"
#include "simulator/Scenario.h"

#include <condition_variable>
#include <deque>
#include <mutex>
#include <string>
#include <unordered_map>
#include <vector>

namespace nvrsim {

enum class Call_Id : uint32_t {
#define NVRSIM_ID(result, name, missing, parameters, arguments) name,
    NVRSIM_ALL_OPERATIONS(NVRSIM_ID)
#undef NVRSIM_ID
        count
};

const char* to_text(Call_Id id);

/// What a call can hand out or be about, for faults to change; bits.
enum Gift : uint8_t {
    number_gift = 1, // a count, a size, a code
    bytes_gift = 2,
    text_gift = 4,
    place_gift = 8,    // a handle
    count_gift = 16,   // a count that is the result
    adapter_gift = 32, // is about one that is there
};

struct Log_Entry {
    Call_Id id;
    Wwn port; // 0: none
    int64_t result;
    uint8_t gifts;
};

/// Everything but `mutex` is touched with `mutex` held.
struct Simulator {
    static Simulator& instance();

    std::mutex mutex;
    Host host;
    std::vector<Fault> faults;
    uint64_t faultClearings = 0;
    std::condition_variable faultsCleared; // wakes the calls that faults hold up
    std::string error;                     // why the last load failed; empty: none
    std::string sourceText;                // of the scenario in force, for reset
    std::string sourceName;
    bool haveSource = false;

    std::unordered_map<uint32_t, std::pair<std::string, bool>> handles; // adapter's name; opened through CPQFC
    uint32_t nextHandle = 1;
    uint64_t counters[static_cast<size_t>(Call_Id::count)] = {};
    std::deque<Log_Entry> log; // the newest; bounded
    uint64_t refreshes = 0;
    size_t underWay = 0;   // calls of the management library
    size_t mostAtOnce = 0; // of them, since that was last asked
    bool timesCalls = false;
    uint64_t callNanoseconds = 0; // processor time of calls while they are timed

    /// Each replaces the whole state but registered callbacks; false with `error` set leaves a host without adapters.
    bool load_file(const std::string& path);
    bool load_text(const std::string& text, const std::string& name);
    bool reload();
    /// The calls that they hold up go on.
    void clear_faults();
    /// Whether the fault would change something of the call that it hits first, had it been there from the start of the
    /// log on. By what the call handed out: zeros in the place of zeros count as a change.
    bool would_change(const Fault& fault) const;

    /// 0 when there are too many.
    uint32_t open(const std::string& adapterName, bool tags);
    Adapter* adapter_of(uint32_t handle, bool tags = false);
    /// Adapters that are present, by the index that the library gives them.
    Adapter* present(uint32_t index);
    uint32_t count_present() const;

private:
    Simulator();
    void clear();
};

int64_t monotonic_milliseconds();

} // namespace nvrsim

#endif // _simulator_Simulator_h
