// Beacons and the tests that run inside an adapter.
#include "simulator/Call.h"

using namespace nvrsim;

namespace {

enum Test_Type : uint32_t { post = 1, loopback = 5, pciLoopback = 6, externalLoopback = 11, echo = 12 };

// Results that nobody asks for any more make room.
constexpr size_t resultsKept = 64;

/// What a caller asks of a test; `pattern` is a text, or null.
struct Request {
    uint32_t cycles = 1;
    uint32_t halt = 0;
    const void* pattern = nullptr;
    std::string more = {};
};

std::string describe(const char* kind, const Request& request)
{
    const char* pattern = static_cast<const char*>(request.pattern);
    return std::string(kind) + " cycles=" + std::to_string(request.cycles) + " halt=" + std::to_string(request.halt) +
           " pattern=" + (pattern ? std::string(pattern, strnlen(pattern, 64)) : "none") + request.more;
}

uint32_t start(Call& call, Port& port, Test_Type type, const char* kind, const Request& request, uint32_t* testId)
{
    Diagnostics& diagnostics = port.diagnostics;
    if (!testId) return RM_STATUS_ARGUMENT;
    if (!diagnostics.available) return RM_STATUS_DIAGNOSTICS_NOT_AVAILABLE;
    diagnostics.lastStart = describe(kind, request);
    const auto configured = diagnostics.results.find(kind);
    uint32_t result = configured == diagnostics.results.end() ? 0 : configured->second;
    constexpr uint32_t linkDown = 2;
    const bool needsLink = type == echo || type == externalLoopback;
    if (result == 0 && needsLink && !port.link_is_up()) result = linkDown;
    while (diagnostics.tests.size() >= resultsKept)
        diagnostics.tests.erase(diagnostics.tests.begin());
    const uint32_t id = diagnostics.nextId++;
    diagnostics.tests[id] =
        Diagnostic_Test{id, type, diagnostics.polls, result, request.cycles, diagnostics.cancelPolls, false};
    call.answer(testId, id);
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
        call.answer(state, port.beacon);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_DiagRunPOST(HBA_WWN wwn, uint32_t* testId)
{
    return run_on_port(Call_Id::RM_DiagRunPOST, wwn,
                       [&](Call& call, Port& port) { return start(call, port, post, "post", {}, testId); });
}

uint32_t nvrsim_RM_DiagLoopBackTestV3(HBA_WWN wwn, uint32_t internal, uint32_t cycles, uint32_t halt, uint32_t* testId,
                                      uint32_t, const void* pattern)
{
    return run_on_port(Call_Id::RM_DiagLoopBackTestV3, wwn, [&](Call& call, Port& port) {
        const Request request = {cycles, halt, pattern};
        return internal ? start(call, port, loopback, "loopback", request, testId)
                        : start(call, port, externalLoopback, "external_loopback", request, testId);
    });
}

uint32_t nvrsim_RM_DiagPciLoopBackTestV2(HBA_WWN wwn, uint32_t cycles, uint32_t halt, uint32_t* testId, uint32_t,
                                         const void* pattern)
{
    return run_on_port(Call_Id::RM_DiagPciLoopBackTestV2, wwn, [&](Call& call, Port& port) {
        return start(call, port, pciLoopback, "pci_loopback", {cycles, halt, pattern}, testId);
    });
}

uint32_t nvrsim_RM_DiagEchoTestV2(HBA_WWN wwn, HBA_WWN target, uint32_t cycles, uint32_t halt, uint32_t* testId,
                                  uint32_t, const void* pattern)
{
    return run_on_port(Call_Id::RM_DiagEchoTestV2, wwn, [&](Call& call, Port& port) {
        const Wwn name = to_number(target);
        const uint32_t status =
            start(call, port, echo, "echo", {cycles, halt, pattern, " target=" + to_text(name)}, testId);
        constexpr uint32_t unreachable = 10;
        if (status == RM_STATUS_OK && !port.find_target(name)) {
            Diagnostic_Test& test = port.diagnostics.tests.rbegin()->second;
            if (test.result == 0) test.result = unreachable;
        }
        return status;
    });
}

uint32_t nvrsim_RM_DiagGetResults(HBA_WWN wwn, uint32_t testId, RM_DIAGRESULT* result)
{
    return run_on_port(Call_Id::RM_DiagGetResults, wwn, [&](Call& call, Port& port) {
        const Diagnostics& diagnostics = port.diagnostics;
        const auto found = port.diagnostics.tests.find(testId);
        if (!result || found == port.diagnostics.tests.end()) return uint32_t{RM_STATUS_ARGUMENT};
        Diagnostic_Test& test = found->second;
        RM_DIAGRESULT record{};
        record.testId = testId;
        record.testType = test.type;
        record.loopsRequested = test.cycles;
        uint32_t status = RM_STATUS_OK;
        uint32_t& polls = test.cancelled ? test.cancelPolls : test.polls;
        if (polls) {
            --polls;
            record.state = diagnostics.runningState;
            status = diagnostics.runningStatus;
        } else if (test.cancelled) {
            record.state = RM_DIAG_CANCELLED;
        } else {
            record.state = diagnostics.state;
            record.cyclesCompleted = diagnostics.cycles.value_or(test.cycles);
            record.executionTime = diagnostics.seconds;
            record.resultCode = test.result;
            record.loopsFailed = diagnostics.loopsFailed.value_or(test.result ? 1 : 0);
        }
        call.bytes(result, &record, sizeof record);
        return status;
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
