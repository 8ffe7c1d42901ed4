/// Records of the two logs as instances, and their ties to the log.
///
/// `log` is the instance of the records' log; without it the three texts that come from it stay null. `position` counts
/// from 0. Throw std::bad_alloc.
#pragma once

#include <string>

#include "agent/instance_table.h"
#include "classes/NVRHBA_FCDriverLogEntry.h"
#include "classes/NVRHBA_LogEntry.h"
#include "classes/NVRHBA_RecordLog.h"
#include "foundation/NVR_CIMLogger.h"
#include "runtime/Instance.h"

namespace cimple {

Ref<NVRHBA_LogEntry> makeLogEntry(const NVR_CIMLogEntry& entry, std::size_t position, const NVRHBA_RecordLog* log);

/// `id` becomes the key.
Ref<NVRHBA_FCDriverLogEntry> makeDriverLogEntry(const std::string& line, std::size_t position, const String& id,
                                                const NVRHBA_RecordLog* log);

/// The association of a clone of `log` and `record`; null without the log.
template <class Association, class Record>
Ref<Instance> makeManagesRecord(const NVRHBA_RecordLog* log, Ref<Record> record)
{
    if (!log) return Ref<Instance>();
    auto tie = make<Association>();
    tie->Log = clone_as(log);
    tie->Record = record.release();
    return Ref<Instance>(tie.release());
}

} // namespace cimple
