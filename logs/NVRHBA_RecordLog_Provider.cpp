#include "logs/NVRHBA_RecordLog_Provider.h"

#include <new>

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "agent/instance_table.h"
#include "agent/method_answer.h"
#include "foundation/CLogger.h"
#include "logs/driver_log.h"
#include "logs/record_logs.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

constexpr uint16 state_enabled = 2;
constexpr uint16 state_disabled = 3;

constexpr uint16 only_level = NVR_DBG; // all call sites log at this one
constexpr uint16 last_mode = 4;

/// What a method is invoked on.
struct Target {
    Target(const ProviderAgent& agent, const NVRHBA_RecordLog* self)
    {
        if (!isOfClass(self, NVRHBA_RecordLog::meta)) return;
        is_log = true;
        is_driver = self->InstanceID.value == recordLogID(agent, Record_Log::driver);
        instance = findRecordLog(agent, self->InstanceID.value);
    }

    /// The words of a target that is no log.
    uint32 refuse() const
    {
        NVR_LOG("Invalid instance of Record Log");
        return ANSWER_FOREIGN_INSTANCE;
    }

    bool is_log = false;
    bool is_driver = false;
    NVRHBA_RecordLog* instance = nullptr; ///< the map's; null if it has none of this key
};

bool usesTraceFile(uint16 mode)
{
    return mode == 2 || mode == 4;
}

uint32 setLogParams(ProviderAgent& agent, const Target& target, uint16 level, uint16 mode, const String& path)
{
    if (!target.is_log) return target.refuse();
    if (level != only_level) {
        NVR_LOG("Log level provided is out of range");
        return ANSWER_BAD_ARGUMENT;
    }
    if (mode < 1 || mode > last_mode) {
        NVR_LOG("Log mode provided is out of range");
        return ANSWER_BAD_ARGUMENT;
    }
    if (usesTraceFile(mode) && (path.empty() || agent.m_fileLogger.setPath(path.c_str()) == -1)) {
        NVR_LOG("Setting the trace path failed");
        return ANSWER_BAD_ARGUMENT;
    }
    NVR_LOG("Changing the record log parameters %d-%d-%s", level, mode, path.c_str());
    CLogger::instance()->setLevel(level);
    CLogger::instance()->setMode(mode);
    if (target.instance) {
        const String in_use = agent.m_fileLogger.getPath();
        if (!in_use.empty()) {
            NVR_LOG("Setting path as %s", in_use.c_str());
            set(target.instance->TracePath, in_use);
        }
        set(target.instance->LogLevel, level);
        set(target.instance->LogMode, mode);
    }
    CLogger::instance()->storeSettings();
    return ANSWER_DONE;
}

uint32 clearLog(ProviderAgent& agent, const Target& target)
{
    if (!target.is_log) return target.refuse();
    if (target.is_driver) {
        agent.m_driverLogStore.clear();
        if (target.instance) set(target.instance->CurrentNumberOfRecords, 0);
    } else {
        CLogger::instance()->clearAll();
        NVR_LOG("Cleared all the logs");
    }
    return ANSWER_DONE;
}

void showState(const Target& target, uint16 state)
{
    if (!target.instance) return;
    set(target.instance->EnabledState, state);
    set(target.instance->RequestedState, state);
}

void enableLog(ProviderAgent& agent, const Target& target)
{
    CLogger::instance()->enable();
    showState(target, state_enabled);
    if (target.is_driver) {
        const bool is_read = guarded([&] { refreshDriverLog(agent); });
        if (target.instance) set(target.instance->CurrentNumberOfRecords, agent.m_driverLogStore.lines.size());
        if (!is_read) throw std::bad_alloc(); // the client is told, and the log shows what has come
    } else {
        NVR_LOG("FC Record Logs enabled");
        CLogger::instance()->storeSettings();
    }
}

void disableLog(ProviderAgent& agent, const Target& target)
{
    NVR_LOG("Logs disabled");
    CLogger::instance()->disable();
    showState(target, state_disabled);
    if (target.is_driver)
        agent.m_driverLogStore.clear();
    else
        CLogger::instance()->storeSettings();
}

uint32 requestStateChange(ProviderAgent& agent, const Target& target, uint16 state)
{
    if (!target.is_log) return target.refuse();
    switch (state) {
    case state_enabled:
        enableLog(agent, target);
        return ANSWER_DONE;
    case state_disabled:
        disableLog(agent, target);
        return ANSWER_DONE;
    default:
        NVR_LOG("Invalid input");
        return ANSWER_BAD_ARGUMENT;
    }
}

} // namespace

Enum_Instances_Status NVRHBA_RecordLog_Provider::enum_instances(const NVRHBA_RecordLog*, const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_RecordLog_map, handler);
    NVR_LOG("NVRHBA_RecordLog_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status NVRHBA_RecordLog_Provider::SetLogParams(const NVRHBA_RecordLog* self,
                                                             const Property<uint16>& LogLevel,
                                                             const Property<uint16>& LogMode,
                                                             const Property<String>& TracePath,
                                                             Property<uint32>& return_value)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    const Target target(agent, self);
    if (target.is_driver) {
        NVR_LOG("SetLogParams is not supported for Driver Record Log Instance");
        return INVOKE_METHOD_UNSUPPORTED;
    }
    return answer(return_value, setLogParams(agent, target, given(LogLevel), given(LogMode), given(TracePath)));
}

Invoke_Method_Status NVRHBA_RecordLog_Provider::ClearLog(const NVRHBA_RecordLog* self, Property<uint32>& return_value)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    return answer(return_value, clearLog(agent, Target(agent, self)));
}

Invoke_Method_Status NVRHBA_RecordLog_Provider::RequestStateChange(const NVRHBA_RecordLog* self,
                                                                   const Property<uint16>& RequestedState,
                                                                   CIM_ConcreteJob*&, const Property<Datetime>&,
                                                                   Property<uint32>& return_value)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    return answer(return_value, requestStateChange(agent, Target(agent, self), given(RequestedState)));
}

} // namespace cimple
