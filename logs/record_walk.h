/// The walk that enumerates a log's records, or the ties between a log and its records: one instance is made of each
/// record, under the agent's locks, and all are handed out when no lock is held any more.
#pragma once

#include <string>
#include <vector>

#include "foundation/NVR_CIMLogger.h"
#include "logs/record_logs.h"
#include "runtime/Instance.h"
#include "runtime/Registration.h"

namespace cimple {

/// What is recorded, of one of the logs.
struct Log_Records {
    std::vector<NVR_CIMLogEntry> entries; ///< of the provider's log: a copy, since logging goes on
    const std::vector<std::string>* lines =
        nullptr; ///< of the driver's: those of the store, which the locks keep still

    std::size_t size() const { return lines ? lines->size() : entries.size(); }
};

/// What is different from one provider of records to the other.
struct Record_Walk {
    const Meta_Class& meta_class; ///< of what is handed out
    Record_Log log;               ///< whose records
    const char* source;           ///< the provider's source file, named where the agent failed to load

    /// The instance for the record at a position, from 0; null: none. `log` is the log's own instance, null if it is
    /// not there. May throw std::bad_alloc.
    Ref<Instance> (*make)(const Log_Records& records, std::size_t position, const NVRHBA_RecordLog* log);

    // The provider's words in the log.
    void (*begins)();           ///< before anything is looked at
    void (*made)(int position); ///< behind each instance
    void (*failed)();           ///< memory ran out: nothing is handed out
    void (*ends)();             ///< behind the last one
};

/// Result 0, always: what goes wrong is told by the log and an empty answer.
Enum_Instances_Status walkRecords(const Record_Walk& walk, const Enum_Handler& handler);

} // namespace cimple
