#include "logs/NVRHBA_DriverRecordLogManagesRecord_Provider.h"

#include "foundation/CLogger.h"
#include "logs/log_records.h"
#include "logs/record_walk.h"

namespace cimple {

Enum_Instances_Status
NVRHBA_DriverRecordLogManagesRecord_Provider::enum_instances(const NVRHBA_DriverRecordLogManagesRecord*,
                                                             const Enum_Handler& handler)
{
    static constexpr Record_Walk walk = {
        NVRHBA_DriverRecordLogManagesRecord::meta,
        Record_Log::driver,
        "logs/NVRHBA_DriverRecordLogManagesRecord_Provider.cpp",
        [](const Log_Records& records, std::size_t position, const NVRHBA_RecordLog* log) {
            // Another key than the line has as an instance of its own; clients know both.
            const String id = text("NVRHBA:FC Driver Record Log:%zu", position);
            return makeManagesRecord<NVRHBA_DriverRecordLogManagesRecord>(
                log, makeDriverLogEntry((*records.lines)[position], position, id, log));
        },
        [] {
            NVR_LOG("Enter -- NVRHBA_DriverRecordLogManagesRecord");
            NVR_LOG("Entering NVRHBA_DriverRecordLogManagesRecord::enum_instances");
        },
        [](int position) { NVR_LOG("NVRHBA_DriverRecordLogManagesRecord returned instance %d", position); },
        [] { NVR_LOG("Could not create NVRHBA_FCDriverLogEntry instance"); },
        [] { NVR_LOG("Exit -- NVRHBA_DriverRecordLogManagesRecord"); },
    };
    return walkRecords(walk, handler);
}

} // namespace cimple
