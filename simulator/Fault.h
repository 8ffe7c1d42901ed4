// Faults: what a call shall do wrong, which calls it concerns, and when. Values; the list of faults lives in Simulator.
#ifndef _simulator_Fault_h
#define _simulator_Fault_h

#include "simulator/Model.h"

#include <optional>
#include <string>

namespace nvrsim {

enum class Damage {
    none,
    garbage,      // bytes written are pseudo-random
    truncated,    // only the first `keep` bytes are written
    ones,         // every byte written is 0xFF
    zeros,        // every byte written is 0
    null,         // nothing is written; a returned pointer or handle is null
    unterminated, // texts fill their whole field
};

struct Fault {
    std::string call;                // "RM_GetVPD"; with a "*" at its end all that begin so
    std::optional<uint32_t> ordinal; // only for this port, by number over the host
    std::optional<Wwn> wwpn;         // only for this port, by name
    std::optional<uint32_t> number;  // only for this attribute of RM_GetAttributeValue, or page of an inquiry
    uint64_t from = 1;               // first matching call that is hit
    uint64_t times = UINT64_MAX;     // calls hit from there
    std::optional<int64_t> status;   // what the call answers
    uint32_t delay = 0;              // milliseconds before it does anything, unless faults are cleared meanwhile
    std::optional<uint64_t> value;   // stands in every count, size and number handed back
    Damage damage = Damage::none;
    uint32_t keep = 0;
    bool absent = false; // as if neither library nor symbol were there
    bool throws = false; // an exception instead of an answer
    bool vanish = false; // before the call does anything, the adapter that it is about leaves the host

    uint64_t seen = 0; // matching calls so far
    uint64_t hits = 0;
    uint64_t changed = 0; // hits that made a difference to the caller

    bool concerns(const char* name) const;
    /// True if the fault changes what is written, so that the call must run although it answers a status.
    bool writes() const { return value || damage != Damage::none; }
};

const char* to_text(Damage damage);

} // namespace nvrsim

#endif // _simulator_Fault_h
