// What a run leaves: its job, its records, and the associations that hang them on the test, the port and the log.
#include "diagnostics/NVR_Diagnostics.h"

#include <atomic>

#include "agent/Clock.h"
#include "agent/ProviderAgent.h"
#include "agent/associations.h"
#include "agent/instance_table.h"
#include "classes/NVRHBA_AffectedJobElement.h"
#include "classes/NVRHBA_ConcreteJob.h"
#include "classes/NVRHBA_DiagnosticCompletionRecord.h"
#include "classes/NVRHBA_DiagnosticServiceRecord.h"
#include "classes/NVRHBA_DiagnosticSettingDataRecord.h"
#include "classes/NVRHBA_DiagnosticsLog.h"
#include "classes/NVRHBA_FCHBADiagnosticTest.h"
#include "classes/NVRHBA_OwningJobElement.h"
#include "classes/NVRHBA_PortController.h"
#include "diagnostics/diagnostic_tests.h"
#include "foundation/CLogger.h"

namespace cimple {

namespace {

using Job_Arguments = NVR_Diagnostics::Job_Arguments;
using Record_Arguments = NVR_Diagnostics::Record_Arguments;

constexpr uint16 job_state_completed = 7;
constexpr uint16 job_state_exception = 10;
constexpr uint16 record_type_results = 2;

std::atomic<int> job_counter{0};

/// The last element of the map with this text in `property`; null without one.
template <class T>
T* find_last(const Map<T>& map, Property<String> T::*property, const String& value)
{
    for (std::size_t i = map.size(); i-- > 0;)
        if (!(map[i]->*property).null && (map[i]->*property).value == value) return map[i];
    return nullptr;
}

Ref<NVRHBA_ConcreteJob> makeJob(const Job_Arguments& arguments)
{
    auto job = make<NVRHBA_ConcreteJob>();
    const bool isCompleted = arguments.code == JOB_COMPLETED;
    set(job->InstanceID,
        text("%s:%d:%lu", arguments.testName.c_str(), ++job_counter, static_cast<unsigned long>(arguments.testId)));
    set(job->ElementName, "NVRHBA_ConcreteJob");
    set(job->Name, arguments.testName);
    set(job->DeleteOnCompletion, arguments.deleteOnCompletion);
    set(job->TimeSubmitted, agent_now());
    set(job->JobState, isCompleted ? job_state_completed : job_state_exception);
    set(job->PercentComplete, isCompleted ? 100 : 0);
    return job;
}

/// What the three kinds of record have in common.
template <class Record>
void setCommon(Record& record, const Record_Arguments& arguments)
{
    set(record.ServiceName, arguments.testName);
    set(record.ManagedElementName,
        arguments.controller ? arguments.controller->ElementName.value : String("NVRHBA_Adapter"));
    set(record.CreationTimeStamp, agent_now());
}

/// What the service record and the completion record have in common.
template <class Record>
void setResult(Record& record, const Record_Arguments& arguments)
{
    setCommon(record, arguments);
    set(record.RecordType, record_type_results);
    set(record.RecordData, arguments.resultText);
    const Diagnostic_Test* test = find_diagnostic_test(arguments.testName);
    const RM_DIAGRESULT* result = arguments.result;
    if (!result || !test || !test->isPolled()) return;
    set(record.LoopsFailed, result->loopsFailed);
    set(record.LoopsPassed, result->cyclesCompleted - result->loopsFailed);
    set(record.CompletedCycles, result->cyclesCompleted);
    set(record.TimeToExecute, result->executionTime);
}

Ref<NVRHBA_DiagnosticServiceRecord> makeServiceRecord(const Record_Arguments& arguments)
{
    auto record = make<NVRHBA_DiagnosticServiceRecord>();
    set(record->InstanceID, text("%s:Service Record", arguments.jobId.c_str()));
    set(record->Description, "This class holds the results(service) of the test");
    set(record->ElementName, text("%s Service Record", arguments.testName.c_str()));
    setResult(*record, arguments);
    return record;
}

Ref<NVRHBA_DiagnosticCompletionRecord> makeCompletionRecord(const Record_Arguments& arguments)
{
    auto record = make<NVRHBA_DiagnosticCompletionRecord>();
    set(record->InstanceID, arguments.jobId);
    set(record->Description, "This class holds the result of the test");
    set(record->ElementName, text("%s Completion Record", arguments.testName.c_str()));
    set(record->CompletionState, arguments.status);
    setResult(*record, arguments);
    return record;
}

Ref<NVRHBA_DiagnosticSettingDataRecord> makeSettingDataRecord(const Record_Arguments& arguments)
{
    auto record = make<NVRHBA_DiagnosticSettingDataRecord>();
    set(record->InstanceID, text("%s:SettingData Record", arguments.jobId.c_str()));
    set(record->Caption, arguments.jobId);
    set(record->Description, "This class holds the overrided setting data of the test");
    set(record->ElementName, text("%s SettingData Record", arguments.testName.c_str()));
    setCommon(*record, arguments);
    return record;
}

void putIntoLog(ProviderAgent& agent, const Record_Arguments& arguments, const Instance* record)
{
    const Instance* log =
        find_last(agent.m_NVRHBA_DiagnosticsLog_map, &NVRHBA_DiagnosticsLog::InstanceID, arguments.testName);
    associate(agent, Link::LogManagesRecord, log, record);
}

void tieToPort(ProviderAgent& agent, const Record_Arguments& arguments, const Instance* record)
{
    if (!arguments.controller) return;
    Ref<Instance> association = makeAssociationOrLog(agent, Link::RecordAppliesToElement, record, arguments.controller);
    if (!association) return;
    NVR_LOG("PortController : %s", arguments.controller->DeviceID.value.c_str());
    insertOrLog(agent.m_NVRHBA_RecordAppliesToElement_map, std::move(association),
                link_row(Link::RecordAppliesToElement).failure);
}

void leaveSettings(ProviderAgent& agent, const Record_Arguments& arguments, const Instance* serviceRecord)
{
    auto made = madeOrLog("Failed to create NVRHBA_DiagnosticSettingDataRecord",
                          [&] { return makeSettingDataRecord(arguments); });
    if (!made) return;
    const Instance* record = insertOrLog(agent.m_NVRHBA_DiagnosticSettingDataRecord_map, Ref<Instance>(made.release()),
                                         "Insert in NVRHBA_DiagnosticSettingDataRecord Failed");
    if (!record) return;
    Ref<Instance> association =
        makeAssociationOrLog(agent, Link::CorrespondingSettingDataRecord, serviceRecord, record);
    // The words are those of another association.
    if (association)
        insertOrLog(agent.m_NVRHBA_CorrespondingSettingDataRecord_map, std::move(association),
                    "Insert Failed : RecordAppliesToElement");
    putIntoLog(agent, arguments, record);
}

} // namespace

NVRHBA_ConcreteJob* NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking(ProviderAgent& agent,
                                                                             const Job_Arguments& arguments)
{
    NVR_LOG("NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking()");
    auto made = madeOrLog("Unable to create NVRHBA_ConcreteJob", [&] { return makeJob(arguments); });
    if (!made) return nullptr;
    auto* job = static_cast<NVRHBA_ConcreteJob*>(insertOrLog(
        agent.m_NVRHBA_ConcreteJob_map, Ref<Instance>(made.release()), "Insert Failed: NVRHBA_ConcreteJob"));
    if (!job) return nullptr;

    const Instance* test =
        find_last(agent.m_NVRHBA_FCHBADiagnosticTest_map, &NVRHBA_FCHBADiagnosticTest::Name, arguments.testName);
    Ref<Instance> owning = makeAssociationOrLog(agent, Link::OwningJobElement, test, job);
    if (!owning) return job;
    insertOrLog(agent.m_NVRHBA_OwningJobElement_map, std::move(owning), link_row(Link::OwningJobElement).failure);
    associate(agent, Link::AffectedJobElement, arguments.controller, job);
    return job;
}

void NVR_Diagnostics::DeleteConcreteJob(ProviderAgent& agent, const NVRHBA_ConcreteJob* job)
{
    NVR_LOG("NVRHBA_DiagTestFunc::DeleteConcreteJob()");
    if (!job) {
        NVR_LOG("Invalid Job ID");
        return;
    }
    const auto removeTie = [job](auto& map, auto end) {
        for (std::size_t i = map.size(); i-- > 0;) {
            if (!(map[i]->*end) || !key_eq(map[i]->*end, job)) continue;
            const Ref<Instance> removed(map[i]);
            map.remove_at(i);
            return;
        }
    };
    removeTie(agent.m_NVRHBA_OwningJobElement_map, &NVRHBA_OwningJobElement::OwnedElement);
    removeTie(agent.m_NVRHBA_AffectedJobElement_map, &NVRHBA_AffectedJobElement::AffectingElement);
    agent.m_NVRHBA_ConcreteJob_map.remove(job);
}

void NVR_Diagnostics::CreateDiagnosticServiceRecord(ProviderAgent& agent, const Record_Arguments& arguments)
{
    NVR_LOG("NVR_Diagnostics::CreateDiagnosticServiceRecord");
    if (!arguments.controller) NVR_LOG("Invalid managed element");
    auto made = madeOrLog("Failed to create DiagnosticServiceRecord", [&] { return makeServiceRecord(arguments); });
    if (!made) return;
    const Instance* record = insertOrLog(agent.m_NVRHBA_DiagnosticServiceRecord_map, Ref<Instance>(made.release()),
                                         "Insert Failed, DiagnosticServiceRecord");
    if (!record) return;
    putIntoLog(agent, arguments, record);
    if (arguments.overridden) leaveSettings(agent, arguments, record);
    tieToPort(agent, arguments, record);
}

void NVR_Diagnostics::CreateDiagnosticCompletionRecord(ProviderAgent& agent, const Record_Arguments& arguments)
{
    NVR_LOG("NVR_Diagnostics::CreateDiagnosticCompletionRecord");
    if (!arguments.controller) NVR_LOG("Invalid managed element");
    auto made = madeOrLog("Failed to create NVRHBA_DiagnosticCompletionRecord",
                          [&] { return makeCompletionRecord(arguments); });
    if (!made) return;
    const Instance* record = insertOrLog(agent.m_NVRHBA_DiagnosticCompletionRecord_map, Ref<Instance>(made.release()),
                                         "Insert in DiagnosticCompletionRecord Failed");
    if (!record) return;
    putIntoLog(agent, arguments, record);
    if (arguments.overridden) {
        const Instance* settings = find_last(agent.m_NVRHBA_DiagnosticSettingDataRecord_map,
                                             &NVRHBA_DiagnosticSettingDataRecord::Caption, arguments.jobId);
        associate(agent, Link::CorrespondingSettingDataRecord, record, settings);
    }
    tieToPort(agent, arguments, record);
}

} // namespace cimple
