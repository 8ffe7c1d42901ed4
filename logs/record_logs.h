/// The two record logs of the host, of the provider and of the driver, as the agent's maps hold them.
///
/// All run under the agent's locks.
#pragma once

#include "runtime/String.h"

namespace cimple {

class ProviderAgent;
struct NVRHBA_RecordLog;

enum class Record_Log { provider, driver };

/// The key of a log's instance, with the name of the host; without a host that name is empty.
String recordLogID(const ProviderAgent& agent, Record_Log log);

/// The map's own instance with this key, or null.
NVRHBA_RecordLog* findRecordLog(const ProviderAgent& agent, const String& id);

} // namespace cimple
