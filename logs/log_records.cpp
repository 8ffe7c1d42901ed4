#include "logs/log_records.h"

namespace cimple {

namespace {

/// What entries of both logs have.
template <class Entry>
Ref<Entry> makeEntry(const String& id, std::size_t position, const NVRHBA_RecordLog* log, const char* format)
{
    auto made = make<Entry>();
    set(made->InstanceID, id);
    set(made->RecordID, text("%zu", position));
    if (log) {
        set(made->LogInstanceID, log->InstanceID.value);
        set(made->LogName, log->ElementName.value);
        set(made->ElementName, log->ElementName.value);
    }
    set(made->RecordFormat, format);
    return made;
}

} // namespace

Ref<NVRHBA_LogEntry> makeLogEntry(const NVR_CIMLogEntry& entry, std::size_t position, const NVRHBA_RecordLog* log)
{
    auto made = makeEntry<NVRHBA_LogEntry>(text("NVRHBA:ProviderLog:%zu", position), position, log,
                                           "[string fileName][uint32 lineNumber]:[string record]");
    set(made->CreationTimeStamp, entry.timeStamp);
    set(made->RecordData, entry.text);
    set(made->LogLevel, text("%d", static_cast<int>(entry.level)));
    return made;
}

Ref<NVRHBA_FCDriverLogEntry> makeDriverLogEntry(const std::string& line, std::size_t position, const String& id,
                                                const NVRHBA_RecordLog* log)
{
    auto made = makeEntry<NVRHBA_FCDriverLogEntry>(id, position, log, "[string record]");
    set(made->RecordData, line);
    return made;
}

} // namespace cimple
