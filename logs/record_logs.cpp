#include "logs/record_logs.h"

#include "agent/ProviderAgent.h"
#include "agent/instance_table.h"
#include "classes/NVRHBA_RecordLog.h"

namespace cimple {

String recordLogID(const ProviderAgent& agent, Record_Log log)
{
    const Instance_Map& hosts = agent.m_CIM_ComputerSystem_map;
    const String host = hosts.empty() ? String() : string_property(hosts[0], "Name");
    return text(log == Record_Log::driver ? "NVR: FC Driver Record Log:%s" : "NVRHBA:ProviderLog:%s", host.c_str());
}

NVRHBA_RecordLog* findRecordLog(const ProviderAgent& agent, const String& id)
{
    auto key = make<NVRHBA_RecordLog>();
    set(key->InstanceID, id);
    return static_cast<NVRHBA_RecordLog*>(agent.m_NVRHBA_RecordLog_map.lookup(key.get()));
}

} // namespace cimple
