#include "diagnostics/NVRHBA_FCHBADiagnosticTest_Provider.h"

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "agent/instance_table.h"
#include "agent/library_name.h"
#include "agent/method_answer.h"
#include "classes/NVRHBA_ConcreteJob.h"
#include "classes/NVRHBA_DiagnosticSettingDataRecord.h"
#include "classes/NVRHBA_FCHBADiagnosticSettingData.h"
#include "classes/NVRHBA_JobSettingData.h"
#include "classes/NVRHBA_PortController.h"
#include "diagnostics/NVR_DiagTestFunc.h"
#include "diagnostics/NVR_Diagnostics.h"
#include "diagnostics/diagnostic_tests.h"
#include "foundation/CLogger.h"

namespace cimple {

namespace {

constexpr std::size_t wwpn_size = 16;

/// The first port controller with this DeviceID; null, logged, if there is none.
const NVRHBA_PortController* findController(const ProviderAgent& agent, const String& deviceId)
{
    const auto& controllers = agent.m_NVRHBA_PortController_map;
    for (std::size_t i = 0; i < controllers.size(); i++)
        if (controllers[i]->DeviceID.value == deviceId) return controllers[i];
    NVR_LOG("Could not find the passed PORTController in the map");
    return nullptr;
}

NVRHBA_JobSettingData* jobSettingOf(ProviderAgent& agent, const Instance* given)
{
    if (given) {
        NVRHBA_JobSettingData* setting = NVR_Diagnostics::getNVRHBA_JobSettingDataInstance(agent, given);
        if (!setting) NVR_LOG("Invalid input instance: NVRHBA_JobSettingData");
        return setting;
    }
    NVRHBA_JobSettingData* setting = NVR_Diagnostics::getDefaultNVRHBA_JobSettingDataInstance(agent);
    if (setting) NVR_LOG("Using the default NVRHBA_JobSettingData Instance");
    return setting;
}

NVRHBA_FCHBADiagnosticSettingData* settingOf(ProviderAgent& agent, const Instance* given, const String& testName)
{
    if (given) {
        NVR_LOG("Entered embedded instance");
        auto* setting = NVR_Diagnostics::getNVRHBA_FCHBADiagnosticSettingDataInstance(agent, given, testName);
        if (!setting) NVR_LOG("Invalid input instance: NVRHBA_FCHBADiagnosticSettingData");
        return setting;
    }
    auto* setting = NVR_Diagnostics::getDefaultNVRHBA_FCHBADiagnosticSettingDataInstance(agent, testName);
    if (setting) NVR_LOG("Using default NVRHBA_FCHBADiagnosticSettingData Instance");
    return setting;
}

/// Keeps a copy of what a run was set to, beside its records.
void recordSettings(ProviderAgent& agent, const NVRHBA_FCHBADiagnosticSettingData& setting, const String& jobId)
{
    const auto& records = agent.m_NVRHBA_DiagnosticSettingDataRecord_map;
    for (std::size_t i = records.size(); i-- > 0;) {
        NVRHBA_DiagnosticSettingDataRecord& record = *records[i];
        if (!(record.Caption.value == jobId)) continue;
        NVR_LOG("Adding the embedded instance for Settingdatarecord : %s", record.InstanceID.value.c_str());
        auto* copy = static_cast<CIM_DiagnosticSettingData*>(clone(&setting));
        unref(record.Settings);
        record.Settings = copy;
        return;
    }
}

uint32 runTest(ProviderAgent& agent, const Instance* self, const Instance* element, const Instance* givenSetting,
               const Instance* givenJobSetting, Ref<NVRHBA_ConcreteJob>& job)
{
    const auto* invoked = agent.m_NVRHBA_FCHBADiagnosticTest_map.lookup_own(self);
    if (!invoked) {
        NVR_LOG("Invalid instance: NVRHBA_FCHBADiagnosticTest");
        return ANSWER_INVALID_PARAMETER;
    }
    const auto* named = agent.m_NVRHBA_PortController_map.lookup_own(element);
    if (!named) {
        NVR_LOG("Invalid instance: NVRHBA_PortController");
        return ANSWER_INVALID_PARAMETER;
    }
    const String deviceId = named->DeviceID.value;
    const NVRHBA_PortController* controller = findController(agent, deviceId);
    NVR_LOG("Device ID %s and the status %d", deviceId.c_str(), 0);
    HBA_WWN port = {};
    if (!library_name(port, deviceId.c_str(), "NVRHBA_FCHBADiagnosticTest_Provider::Id2HBAName failed",
                      "NVRHBA_FCHBADiagnosticTest_Provider::str2HBAName failed"))
        return ANSWER_INVALID_PARAMETER;

    const String name = invoked->Name.value;
    const NVRHBA_JobSettingData* jobSetting = jobSettingOf(agent, givenJobSetting);
    const NVRHBA_FCHBADiagnosticSettingData* setting = settingOf(agent, givenSetting, name);
    if (!jobSetting || !setting) {
        NVR_LOG("Unable to get the Job/Diagnostic SettingData, Not able to continue");
        return ANSWER_INVALID_PARAMETER;
    }
    const Diagnostic_Test* test = find_diagnostic_test(name);
    if (!test) {
        NVR_LOG("Invalid Test Name");
        return ANSWER_UNKNOWN;
    }
    if (test->takesTarget() && setting->TargetDevice.value.size() != wwpn_size) {
        NVR_LOG("Invalid TargetDevice, Enter Target WWPN");
        return ANSWER_INVALID_PARAMETER;
    }

    NVR_LOG("Started Diagnostic : %s", test->name);
    Diagnostic_Run run = {agent, port, *setting, *jobSetting, controller, {}};
    const uint32 status = test->run(run);
    if (status == 0)
        NVR_LOG("%s Launched/Completed Succesful", test->name);
    else
        NVR_LOG("%s Failed to Run", test->name);
    job = std::move(run.job);
    if (job && setting->OverridedSettingData.value == 1) recordSettings(agent, *setting, job->InstanceID.value);
    return status == 0 ? uint32{ANSWER_DONE} : libraryAnswer(status);
}

} // namespace

Enum_Instances_Status NVRHBA_FCHBADiagnosticTest_Provider::enum_instances(const NVRHBA_FCHBADiagnosticTest*,
                                                                          const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_FCHBADiagnosticTest_map, handler);
    NVR_LOG("NVRHBA_FCHBADiagnosticTest_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status NVRHBA_FCHBADiagnosticTest_Provider::RunDiagnosticService(
    const NVRHBA_FCHBADiagnosticTest* self, CIM_ManagedElement*& ManagedElement,
    CIM_DiagnosticSettingData*& DiagnosticSettings, CIM_JobSettingData*& JobSettings, CIM_ConcreteJob*& Job,
    Property<uint32>& return_value)
{
    NVR_LOG("NVRHBA_FCHBADiagnosticTest_Provider::RunDiagnosticService");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    Ref<NVRHBA_ConcreteJob> job;
    set(return_value, runTest(agent, self, ManagedElement, DiagnosticSettings, JobSettings, job));
    Job = static_cast<CIM_ConcreteJob*>(static_cast<Instance*>(job.release()));
    return INVOKE_METHOD_OK;
}

} // namespace cimple
