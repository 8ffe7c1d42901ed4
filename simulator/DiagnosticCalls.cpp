// Beacons and the tests that run inside an adapter.
#include "simulator/Call.h"

using namespace nvrsim;

namespace {

enum Test_Type : uint32_t { post = 1, loopback = 5, pciLoopback = 6, externalLoopback = 11, echo = 12 };

uint32_t start(Call& call, Port& port, Test_Type type, const char* kind, uint32_t cycles, uint32_t* testId)
{
    Diagnostics& diagnostics = port.diagnostics;
    if (!testId) return RM_STATUS_ARGUMENT;
    if (!diagnostics.available) return RM_STATUS_DIAGNOSTICS_NOT_AVAILABLE;
    const auto configured = diagnostics.results.find(kind);
    uint32_t result = configured == diagnostics.results.end() ? 0 : configured->second;
    constexpr uint32_t linkDown = 2;
    if (result == 0 && type == echo && !port.link_is_up()) result = linkDown;
    const uint32_t id = diagnostics.nextId++;
    diagnostics.tests[id] = Diagnostic_Test{id, type, diagnostics.polls, result, cycles, false};
    call.number(testId, id);
    return RM_STATUS_OK;
}

} // namespace

uint32_t nvrsim_RM_DiagBeacon(HBA_WWN wwn, uint32_t state)
{
    return run_on_port(Call_Id::RM_DiagBeacon, wwn, [&](Call&, Port& port) -> uint32_t {
        if (port.beaconStatus) return port.beaconStatus;
        if (port.beacon == RM_BEACON_NOT_AVAILABLE) return RM_STATUS_DIAGNOSTICS_NOT_AVAILABLE;
        if (state != RM_BEACON_OFF && state != RM_BEACON_ON) return RM_STATUS_ARGUMENT;
        port.beacon = state;
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_DiagBeaconState(HBA_WWN wwn, uint32_t* state)
{
    return run_on_port(Call_Id::RM_DiagBeaconState, wwn, [&](Call& call, Port& port) -> uint32_t {
        if (port.beaconStatus) return port.beaconStatus;
        if (!state) return RM_STATUS_ARGUMENT;
        call.number(state, port.beacon);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_DiagRunPOST(HBA_WWN wwn, uint32_t* testId)
{
    return run_on_port(Call_Id::RM_DiagRunPOST, wwn,
                       [&](Call& call, Port& port) { return start(call, port, post, "post", 1, testId); });
}

uint32_t nvrsim_RM_DiagLoopBackTestV3(HBA_WWN wwn, uint32_t internal, uint32_t cycles, uint32_t, uint32_t* testId,
                                      uint32_t, const void*)
{
    return run_on_port(Call_Id::RM_DiagLoopBackTestV3, wwn, [&](Call& call, Port& port) {
        return internal ? start(call, port, loopback, "loopback", cycles, testId)
                        : start(call, port, externalLoopback, "external_loopback", cycles, testId);
    });
}

uint32_t nvrsim_RM_DiagPciLoopBackTestV2(HBA_WWN wwn, uint32_t cycles, uint32_t, uint32_t* testId, uint32_t,
                                         const void*)
{
    return run_on_port(Call_Id::RM_DiagPciLoopBackTestV2, wwn, [&](Call& call, Port& port) {
        return start(call, port, pciLoopback, "pci_loopback", cycles, testId);
    });
}

uint32_t nvrsim_RM_DiagEchoTestV2(HBA_WWN wwn, HBA_WWN target, uint32_t cycles, uint32_t, uint32_t* testId, uint32_t,
                                  const void*)
{
    return run_on_port(Call_Id::RM_DiagEchoTestV2, wwn, [&](Call& call, Port& port) {
        const uint32_t status = start(call, port, echo, "echo", cycles, testId);
        constexpr uint32_t unreachable = 10;
        if (status == RM_STATUS_OK && !port.find_target(to_number(target))) {
            Diagnostic_Test& test = port.diagnostics.tests.rbegin()->second;
            if (test.result == 0) test.result = unreachable;
        }
        return status;
    });
}

uint32_t nvrsim_RM_DiagGetResults(HBA_WWN wwn, uint32_t testId, RM_DIAGRESULT* result)
{
    return run_on_port(Call_Id::RM_DiagGetResults, wwn, [&](Call& call, Port& port) {
        const auto found = port.diagnostics.tests.find(testId);
        if (!result || found == port.diagnostics.tests.end()) return RM_STATUS_ARGUMENT;
        Diagnostic_Test& test = found->second;
        RM_DIAGRESULT record{};
        record.testId = testId;
        record.testType = test.type;
        record.loopsRequested = test.cycles;
        if (test.cancelled) {
            record.state = RM_DIAG_CANCELLED;
        } else if (test.polls) {
            --test.polls;
            record.state = RM_DIAG_RUNNING;
            call.bytes(result, &record, sizeof record);
            return RM_STATUS_NO_RESULT_YET;
        } else {
            record.state = RM_DIAG_COMPLETED;
            record.cyclesCompleted = test.cycles;
            record.executionTime = port.diagnostics.seconds;
            record.resultCode = test.result;
            record.loopsFailed = test.result ? 1 : 0;
        }
        call.bytes(result, &record, sizeof record);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_DiagCancelDiagnostic(HBA_WWN wwn, uint32_t testId)
{
    return run_on_port(Call_Id::RM_DiagCancelDiagnostic, wwn, [&](Call&, Port& port) {
        const auto found = port.diagnostics.tests.find(testId);
        if (found == port.diagnostics.tests.end()) return RM_STATUS_ARGUMENT;
        if (!port.diagnostics.canCancel) return RM_STATUS_ERROR;
        found->second.cancelled = true;
        return RM_STATUS_OK;
    });
}
