#include "diagnostics/test_end.h"

#include <cstdarg>
#include <cstdio>

#include "classes/NVRHBA_ConcreteJob.h"
#include "classes/NVRHBA_FCHBADiagnosticSettingData.h"
#include "classes/NVRHBA_JobSettingData.h"
#include "diagnostics/NVR_DiagTestFunc.h"
#include "diagnostics/NVR_Diagnostics.h"
#include "foundation/CLogger.h"

namespace cimple {

namespace {

struct Text_Row {
    uint32 number;
    const char* text;
};

constexpr Text_Row result_texts[] = {
    {0, "Success"},
    {1, "General Error"},
    {2, "Link Down"},
    {3, "I/O Error"},
    {4, "Timeout"},
    {5, "Transmit Error"},
    {6, "Receive Error"},
    {7, "Mailbox Error"},
    {8, "Error: Echo test not supported"},
    {9, "Error: Echo Failed"},
    {10, "Error: Target Unreachable"},
    {11, "Error: HBA temperature exceeded operational range. Adapter stopped.\n\nPlease see the product documentation"},
    {12, "Error: Failed to allocate resource"},
    {13, "Error: Another diagnostic test is running. Please try again"},
    {14, "Error: Sequence Timeout"},
    {15, "Error: Bus reset received during test"},
    {16, "Error: Read-Write test is running"},
    {17, "Error: Driver busy. Please try again"},
    {18, "Error: Mailbox not ready"},
    {19, "Error: Port not ready"},
};

constexpr Text_Row status_texts[] = {
    {RM_STATUS_OK, "Successful"},
    {RM_STATUS_ERROR, "An unspecified error occurred"},
    {RM_STATUS_TOO_MANY_REQUESTS, "There are too many pending/running requests in diag. results table"},
    {RM_STATUS_DIAGNOSTICS_NOT_AVAILABLE, "Diagnostics not available/Port not supported"},
    {RM_STATUS_ADAPTER_BUSY, "Adapter Busy: Another critical application may be running"},
};

template <std::size_t size>
const char* find_text(const Text_Row (&rows)[size], uint32 number)
{
    for (const Text_Row& row : rows)
        if (row.number == number) return row.text;
    return "Unknown";
}

} // namespace

const char* NVR_DiagTestFunc::MapDiagResultStatus(uint32 code)
{
    return find_text(result_texts, code);
}

const char* NVR_DiagTestFunc::MapDiagStatus(uint32 status)
{
    return find_text(status_texts, status);
}

void Result_Text::format(const char* format, ...)
{
    va_list arguments;
    va_start(arguments, format);
    std::vsnprintf(m_text, sizeof m_text, format, arguments);
    va_end(arguments);
}

const char* name_of(const Diagnostic_Run& run)
{
    return run.setting.InstanceID.value.c_str();
}

void leaveRecords(Diagnostic_Run& run, const Test_Outcome& outcome)
{
    run.job.reset();
    const String& name = run.setting.InstanceID.value;
    const bool isToGo = !run.jobSetting.DeleteOnCompletion.null && run.jobSetting.DeleteOnCompletion.value;
    const NVRHBA_ConcreteJob* job = NVR_Diagnostics::CreateConcreteJobInstantiateNonBlocking(
        run.agent, {name, isToGo, outcome.jobCode, outcome.testId, run.controller});
    if (!job) return;
    const NVR_Diagnostics::Record_Arguments record = {name,
                                                      outcome.text,
                                                      job->InstanceID.value,
                                                      outcome.result,
                                                      outcome.recordStatus,
                                                      run.controller,
                                                      run.setting.OverridedSettingData.value == 1};
    NVR_Diagnostics::CreateDiagnosticServiceRecord(run.agent, record);
    NVR_Diagnostics::CreateDiagnosticCompletionRecord(run.agent, record);
    if (isToGo)
        NVR_Diagnostics::DeleteConcreteJob(run.agent, job);
    else
        run.job.reset(clone_as(job));
}

uint32 leaveNothing(Diagnostic_Run& run, uint32 status)
{
    run.job.reset();
    NVR_LOG("%s , Exited with error code : %d", NVR_DiagTestFunc::MapDiagStatus(status), static_cast<int>(status));
    return status;
}

} // namespace cimple
