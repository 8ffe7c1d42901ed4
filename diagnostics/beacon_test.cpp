// The beacon test: whether a port can blink, and twenty blinks of it.
#include "agent/Clock.h"
#include "agent/library_name.h"
#include "classes/NVRHBA_ConcreteJob.h"
#include "diagnostics/NVR_DiagTestFunc.h"
#include "diagnostics/NVR_Diagnostics.h"
#include "diagnostics/test_end.h"
#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "foundation/shared_operations.h"

namespace cimple {

namespace {

constexpr int blinks = 20;
constexpr uint64 half_blink = 1000000; // microseconds
constexpr uint32 status_not_local = 1;
constexpr uint32 not_supported = 32768;

void tellFailure(const Diagnostic_Run& run, uint32 status)
{
    NVR_LOG("%s Resulted with Failure, Exited with error code %d", name_of(run), static_cast<int>(status));
}

/// Result 0, or the status of the call that failed.
uint32 blink(const Diagnostic_Run& run)
{
    for (int number = 0; number < blinks; number++) {
        for (const uint32 state : {RM_BEACON_ON, RM_BEACON_OFF}) {
            if (const uint32 status = RM_DiagBeacon(run.port, state)) {
                tellFailure(run, status);
                return status;
            }
            NVR_LOG("%s Resulted with Success", name_of(run));
            agent_sleep.load()(half_blink);
        }
    }
    return RM_STATUS_OK;
}

} // namespace

uint32 NVR_DiagTestFunc::BeaconTest(Diagnostic_Run& run)
{
    NVR_LOG("NVR_DiagTestFunc::BeaconTest");
    if (Validatewwpn(run.port) != 0) {
        NVR_LOG("INVALID wwpn/Mac Address");
        return status_not_local;
    }
    uint32 before = RM_BEACON_NOT_AVAILABLE;
    uint32 status = RM_DiagBeaconState(run.port, &before);
    if (status != RM_STATUS_OK) {
        leaveRecords(run, {JOB_FAILED, RECORD_FAILED, NO_TEST_ID, ""});
        return status;
    }
    if (before == RM_BEACON_NOT_AVAILABLE) {
        NVR_LOG("Beacon state Not Available. Beaconing not set");
        tellFailure(run, status);
        return leaveNothing(run, status);
    }
    status = blink(run);
    if (RM_DiagBeacon(run.port, before) != RM_STATUS_OK) NVR_LOG("Unable to set the previous beacon state");
    if (status != RM_STATUS_OK) return leaveNothing(run, status);
    Result_Text text;
    text.format("%s Resulted with Success", name_of(run));
    leaveRecords(run, {JOB_COMPLETED, RECORD_PASSED, NO_TEST_ID, text.c_str()});
    NVR_LOG("%s Succesful", name_of(run));
    return RM_STATUS_OK;
}

uint32 NVR_DiagTestFunc::ISDiagTestSupported(const char* deviceId, uint32 mode)
{
    NVR_LOG("NVR_Diagnostics::ISDiagTestSupported");
    HBA_WWN port = {};
    if (!library_name(port, deviceId, "NVR_Diagnostics::Id2HBAName failed", "NVR_Diagnostics::str2HBAName failed"))
        return not_supported;
    if (mode != 0) return not_supported;
    uint32 state = RM_BEACON_NOT_AVAILABLE;
    const uint32 status = RM_DiagBeaconState(port, &state);
    NVR_LOG("Beacon Status for port %s returned value is : %d", deviceId, static_cast<int>(status));
    if (status != RM_STATUS_OK) return not_supported;
    if (state == RM_BEACON_NOT_AVAILABLE) {
        NVR_LOG("Beacon not avaialble for port : %s", deviceId);
        return not_supported;
    }
    return 0;
}

} // namespace cimple
