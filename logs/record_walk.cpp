#include "logs/record_walk.h"

#include "agent/Agent_Wait.h"
#include "foundation/CLogger.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

void makeAll(const Record_Walk& walk, const ProviderAgent& agent, Instance_Map& made)
{
    Log_Records records;
    if (walk.log == Record_Log::provider)
        agent.m_cimLogger.getEntries(records.entries);
    else
        records.lines = &agent.m_driverLogStore.lines;
    const NVRHBA_RecordLog* log = findRecordLog(agent, recordLogID(agent, walk.log));
    NVR_LOG("Log Size %d", static_cast<int>(records.size()));
    for (std::size_t position = 0; position < records.size(); position++) {
        Ref<Instance> instance = walk.make(records, position, log);
        if (!instance) continue;
        walk.made(static_cast<int>(position));
        if (made.insert(instance.get()) >= 0) instance.release();
    }
}

} // namespace

Enum_Instances_Status walkRecords(const Record_Walk& walk, const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    if (!agent.m_bLoaded) {
        NVR_LOG("RM Init failed for %s", walk.source);
        return ENUM_INSTANCES_OK;
    }
    walk.begins();
    Instance_Map made(&walk.meta_class);
    const bool done = guarded([&] {
        const Agent_Wait wait(agent);
        makeAll(walk, agent, made);
    });
    if (!done) {
        walk.failed();
        return ENUM_INSTANCES_OK;
    }
    made.hand_over(handler);
    walk.ends();
    return ENUM_INSTANCES_OK;
}

} // namespace cimple
