// FCP target mappings: one entry for each path from a port to a logical unit.
#ifndef _simulator_Mapping_h
#define _simulator_Mapping_h

#include "simulator/Call.h"

#include <type_traits>

namespace nvrsim {

/// Targets of a port whose link is up; 0 for one whose link is down or leads back to itself.
size_t visible_targets(const Port& port);

void fill_entry(Call& call, const Port& port, const Target& target, uint32_t targetNumber, const Lun& lun,
                uint32_t path, HBA_SCSIID& scsi, HBA_FCPID& fcp);

/// Writes the entries that fit and counts all of them. `Entry` is one of the mapping entries of the Common HBA API.
template <class Entry>
class Mapping_Writer {
public:
    /// `count` holds the capacity of `entries`.
    Mapping_Writer(Call& call, uint32_t* count, Entry* entries)
        : m_call(call), m_count(count), m_entries(entries), m_capacity(*count)
    {
    }

    void add(const Port& port)
    {
        for (uint32_t t = 0; t < visible_targets(port); ++t) {
            const Target& target = *port.targets[t];
            for (uint32_t l = 0; l < target.luns.size(); ++l, ++m_used) {
                if (m_used >= m_capacity) continue;
                Entry entry{};
                fill_entry(m_call, port, target, t, target.luns[l], port.firstPath[t] + l, entry.ScsiId, entry.FcpId);
                if constexpr (std::is_same<Entry, HBA_FCPSCSIENTRYV2>::value) {
                    const Bytes& id = target.luns[l].identifier;
                    std::memcpy(entry.LUID.buffer, id.data(), std::min(id.size(), sizeof entry.LUID.buffer));
                }
                m_call.bytes(m_entries + m_used, &entry, sizeof entry);
            }
        }
    }

    uint32_t finish()
    {
        m_call.number(m_count, m_used);
        return m_used > m_capacity ? HBA_STATUS_ERROR_MORE_DATA : HBA_STATUS_OK;
    }

private:
    Call& m_call;
    uint32_t* m_count;
    Entry* m_entries;
    const uint32_t m_capacity;
    uint32_t m_used = 0;
};

} // namespace nvrsim

#endif // _simulator_Mapping_h
