#include "diagnostics/NVRHBA_DiagnosticsLog_Provider.h"

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "agent/instance_table.h"
#include "agent/method_answer.h"
#include "classes/CIM_RecordForLog.h"
#include "classes/NVRHBA_DiagnosticCompletionRecord.h"
#include "classes/NVRHBA_DiagnosticServiceRecord.h"
#include "classes/NVRHBA_LogManagesRecord.h"
#include "classes/NVRHBA_RecordAppliesToElement.h"
#include "diagnostics/diagnostic_tests.h"
#include "foundation/CLogger.h"

namespace cimple {

namespace {

/// Builds the map anew without the elements of which `belongs` is true; the others keep their order. False, after
/// `failure` was logged, for a map that cannot be built: it stays as it stands.
template <class T, class Belongs>
bool takeOut(Map<T>& map, const char* failure, Belongs belongs)
{
    Map<T> others;
    for (std::size_t i = 0; i < map.size(); i++) {
        if (belongs(*map[i])) continue;
        ref(map[i]);
        if (!insertOrLog(others, Ref<Instance>(map[i]), failure)) return false;
    }
    map.swap(others);
    return true;
}

bool clearRecords(ProviderAgent& agent, const String& test)
{
    const auto isOfTest = [&](const auto& record) { return record.ServiceName.value == test; };
    return takeOut(agent.m_NVRHBA_LogManagesRecord_map, "Insert Failed : temp_NVRHBA_LogManagesRecord_map",
                   [&](const NVRHBA_LogManagesRecord& tie) { return tie.Log && tie.Log->InstanceID.value == test; }) &&
           takeOut(agent.m_NVRHBA_RecordAppliesToElement_map, "Insert Failed : NVRHBA_RecordAppliesToElement_map",
                   [&](const NVRHBA_RecordAppliesToElement& tie) {
                       return tie.Antecedent && string_property(tie.Antecedent, "ServiceName") == test;
                   }) &&
           takeOut(agent.m_NVRHBA_DiagnosticCompletionRecord_map,
                   "Insert Failed : temp_NVRHBA_DiagnosticCompletionRecord_map", isOfTest) &&
           takeOut(agent.m_NVRHBA_DiagnosticServiceRecord_map,
                   "Insert Failed : temp_NVRHBA_DiagnosticServiceRecord_map", isOfTest);
}

uint32 clearLog(ProviderAgent& agent, const Instance* self)
{
    const auto* log = agent.m_NVRHBA_DiagnosticsLog_map.lookup_own(self);
    if (!log) {
        NVR_LOG("Invalid instance of Diagnostic Log");
        return ANSWER_INVALID_PARAMETER;
    }
    const String test = log->InstanceID.value;
    if (!find_diagnostic_test(test)) {
        NVR_LOG("Exiting the NVRHBA CDM Clear log");
        return ANSWER_DONE;
    }
    if (!clearRecords(agent, test)) return ANSWER_FAILED;
    NVR_LOG("Exiting NVRHBA_DiagnosticsLog_Provider::ClearLog");
    return ANSWER_DONE;
}

} // namespace

Enum_Instances_Status NVRHBA_DiagnosticsLog_Provider::enum_instances(const NVRHBA_DiagnosticsLog*,
                                                                     const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_DiagnosticsLog_map, handler);
    NVR_LOG("NVRHBA_DiagnosticsLog_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status NVRHBA_DiagnosticsLog_Provider::ClearLog(const NVRHBA_DiagnosticsLog* self,
                                                              Property<uint32>& return_value)
{
    NVR_LOG("NVRHBA_DiagnosticsLog_Provider::ClearLog");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    set(return_value, clearLog(agent, self));
    return INVOKE_METHOD_OK;
}

} // namespace cimple
