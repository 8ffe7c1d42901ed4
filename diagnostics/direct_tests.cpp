// The tests that are one management call, which is made again while the adapter is busy.
#include "diagnostics/NVR_DiagTestFunc.h"

#include "classes/NVRHBA_ConcreteJob.h"
#include "diagnostics/NVR_Diagnostics.h"
#include "diagnostics/test_end.h"
#include "foundation/AttributeBlock.h"
#include "foundation/CLogger.h"
#include "foundation/shared_operations.h"

namespace cimple {

namespace {

constexpr int attempts = 122;
constexpr uint32 status_table_size = 2048;
constexpr uint32 status_illegal_wwn = 5;
constexpr uint32 status_no_memory = 8;

uint32 leaveAll(Diagnostic_Run& run, uint32 status, uint32 jobCode, uint32 recordStatus, const Result_Text& text)
{
    leaveRecords(run, {jobCode, recordStatus, NO_TEST_ID, text.c_str()});
    NVR_LOG("%s Succesful", name_of(run));
    return status;
}

/// Makes the call until it is not busy any more, without a pause. What is refused at the first attempt leaves a job
/// that tells of it; later ones leave none.
template <class Attempt>
uint32 callWhileBusy(Diagnostic_Run& run, const char* successText, Attempt attempt)
{
    uint32 status = RM_STATUS_ADAPTER_BUSY;
    for (int number = 1; number <= attempts; number++) {
        status = attempt();
        Result_Text text;
        switch (status) {
        case RM_STATUS_OK:
            text.format(successText, name_of(run));
            return leaveAll(run, status, JOB_COMPLETED, RECORD_PASSED, text);
        case RM_STATUS_ADAPTER_BUSY:
            continue;
        case RM_STATUS_DIAGNOSTICS_NOT_AVAILABLE:
        case RM_STATUS_NOT_SUPPORTED:
        case RM_STATUS_RESET_REFUSED:
            return leaveNothing(run, status);
        default:
            if (number > 1) return leaveNothing(run, status);
            text.format("%s Resulted with Failure, Exited with error code %d", name_of(run), static_cast<int>(status));
            return leaveAll(run, status, JOB_FAILED, RECORD_FAILED, text);
        }
    }
    return leaveNothing(run, status);
}

bool portIsLocal(const Diagnostic_Run& run)
{
    if (Validatewwpn(run.port) == 0) return true;
    NVR_LOG("INVALID wwpn/Mac Address");
    return false;
}

} // namespace

uint32 NVR_DiagTestFunc::FCHBAResetTest(Diagnostic_Run& run)
{
    NVR_LOG("NVR_DiagTestFunc::FCHBAResetTest");
    if (!portIsLocal(run)) return status_illegal_wwn;
    return callWhileBusy(run, "%s Success", [&] { return nvrcimReset(run.port); });
}

uint32 NVR_DiagTestFunc::StatusTest(Diagnostic_Run& run)
{
    NVR_LOG("NVR_DiagTestFunc::StatusTest");
    if (!portIsLocal(run)) return status_illegal_wwn;
    AttributeBlock attributes(status_table_size);
    if (!attributes.valid()) {
        NVR_LOG("ERROR: GetPHYPortAttributeValues: Unable to allocate buffer");
        return status_no_memory;
    }
    return callWhileBusy(run, "%s Resulted with Success", [&] {
        const uint32 status = attributes.fill(RM_GetPortAttributes, run.port);
        NVR_LOG("RM_GetPortAttributes call result : %d", static_cast<int>(status));
        return status;
    });
}

} // namespace cimple
