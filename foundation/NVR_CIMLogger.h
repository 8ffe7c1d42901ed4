/// The ring of records that is published as a CIM record log: the latest 1024, ordered by slot, not by time.
///
/// Records levels up to 3, in modes 1 and 4. Every operation runs under the dispatch mutex, so any thread may call it.
#pragma once

#include <vector>

#include "foundation/NVR_LoggerInterface.h"
#include "runtime/Datetime.h"

namespace cimple {

struct NVR_CIMLogEntry {
    uint32 level = 0;
    Datetime timeStamp;
    char text[200] = {}; ///< the message in square brackets, cut to the field
};

class NVR_CIMLogger final : public NVR_LoggerInterface {
public:
    NVR_CIMLogger();
    ~NVR_CIMLogger() override;
    NVR_CIMLogger(const NVR_CIMLogger&) = delete;
    NVR_CIMLogger& operator=(const NVR_CIMLogger&) = delete;

    void logMessage(sint32 level, const char* file, uint32 line, const char* text) override;
    void open() override {}
    void close() override {}
    void clear() override;

    /// Replaces `entries` by a copy of the ring.
    void getEntries(std::vector<NVR_CIMLogEntry>& entries) const;

private:
    uint32 m_capacity = 1024;
    sint32 m_lastIndex = -1;
    [[maybe_unused]] sint32 m_flag = 1;
    std::vector<NVR_CIMLogEntry> m_entries;
};

} // namespace cimple
