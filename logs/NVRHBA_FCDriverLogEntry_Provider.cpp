#include "logs/NVRHBA_FCDriverLogEntry_Provider.h"

#include "foundation/CLogger.h"
#include "logs/log_records.h"
#include "logs/record_walk.h"

namespace cimple {

Enum_Instances_Status NVRHBA_FCDriverLogEntry_Provider::enum_instances(const NVRHBA_FCDriverLogEntry*,
                                                                       const Enum_Handler& handler)
{
    static constexpr Record_Walk walk = {
        NVRHBA_FCDriverLogEntry::meta,
        Record_Log::driver,
        "logs/NVRHBA_FCDriverLogEntry_Provider.cpp",
        [](const Log_Records& records, std::size_t position, const NVRHBA_RecordLog* log) {
            const String id = text("NVR:HBA FC Driver Record:%zu", position);
            return Ref<Instance>(makeDriverLogEntry((*records.lines)[position], position, id, log).release());
        },
        [] {
            NVR_LOG("Entering NVRHBA_FCDriverLogEntry::enum_instances");
            NVR_LOG("NVRHBA_FCDriverLogEntry Entry");
        },
        [](int position) { NVR_LOG("NVRHBA_LogEntry returned instance %d", position); },
        [] { NVR_LOG("Could not create NVRVCNA_LogEntry instance"); },
        [] { NVR_LOG("NVRHBA_FCDriverLogEntry Exit"); },
    };
    return walkRecords(walk, handler);
}

} // namespace cimple
