#include "logs/NVRHBA_LogEntry_Provider.h"

#include "foundation/CLogger.h"
#include "logs/log_records.h"
#include "logs/record_walk.h"

namespace cimple {

Enum_Instances_Status NVRHBA_LogEntry_Provider::enum_instances(const NVRHBA_LogEntry*, const Enum_Handler& handler)
{
    static constexpr Record_Walk walk = {
        NVRHBA_LogEntry::meta,
        Record_Log::provider,
        "logs/NVRHBA_LogEntry_Provider.cpp",
        [](const Log_Records& records, std::size_t position, const NVRHBA_RecordLog* log) {
            return Ref<Instance>(makeLogEntry(records.entries[position], position, log).release());
        },
        [] { NVR_LOG("Entering NVRHBA_LogEntry::enum_instances"); },
        [](int position) { NVR_LOG("NVRHBA_LogEntry returned instance %d", position); },
        [] { NVR_LOG("Could not create NVRVCNA_LogEntry instance"); },
        [] { NVR_LOG("NVRVCNA_LogEntry_Provider::enum_instances()"); },
    };
    return walkRecords(walk, handler);
}

} // namespace cimple
