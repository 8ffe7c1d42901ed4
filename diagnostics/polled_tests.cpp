// The tests that run inside the adapter: started by one call, asked for their result once a second.
#include "diagnostics/NVR_DiagTestFunc.h"

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <memory>

#include "agent/Clock.h"
#include "agent/library_name.h"
#include "classes/NVRHBA_ConcreteJob.h"
#include "classes/NVRHBA_FCHBADiagnosticSettingData.h"
#include "diagnostics/NVR_Diagnostics.h"
#include "diagnostics/Poll_Course.h"
#include "diagnostics/test_end.h"
#include "foundation/AttributeBlock.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"

namespace cimple {

namespace {

constexpr uint64 second = 1000000;
constexpr int cancel_passes = 122;
constexpr uint32 attributes_size = 4096;
constexpr uint32 port_disabled = 22;
constexpr uint32 first_loopback_link_state = 20;
constexpr uint32 last_loopback_link_state = 21;
constexpr uint32 status_wrong_type = 4;
constexpr uint32 status_bad_target = 1;
constexpr uint32 status_no_plug = 1;
constexpr std::size_t loopback_pattern_size = 20;
constexpr std::size_t echo_pattern_size = 50;

/// Where the library writes the number of a test: callers have always given it 8 bytes, of which the first 4 count.
struct Test_Number {
    alignas(8) uint32 words[2] = {};

    uint32* place() { return words; }
    uint32 value() const { return words[0]; }
};

/// What tells one polled test from another.
struct Poll_Style {
    bool countsPolls;        // in the log
    const char* failureText; // with the test's name and the result
    uint32 failedJobCode;
};
constexpr Poll_Style self_style = {true, "%s Resulted with Failure, Result - %s", JOB_COMPLETED};
constexpr Poll_Style loopback_style = {false, "%s Resulted with Failure, Result - %s", JOB_FAILED};
constexpr Poll_Style echo_style = {false, "%s Resulted with Failure, Result - %s ", JOB_COMPLETED};

uint32 leaveResult(Diagnostic_Run& run, const Test_Number& test, const Poll_Style& style, const RM_DIAGRESULT& result)
{
    const char* outcome = NVR_DiagTestFunc::MapDiagResultStatus(result.resultCode);
    const bool hasPassed = result.resultCode == 0;
    Result_Text text;
    if (hasPassed)
        text.format("%s Resulted with Success", name_of(run));
    else
        text.format(style.failureText, name_of(run), outcome);
    leaveRecords(run, {hasPassed ? JOB_COMPLETED : style.failedJobCode, hasPassed ? RECORD_PASSED : RECORD_FAILED,
                       test.value(), text.c_str(), &result});
    return RM_STATUS_OK;
}

uint32 pollForResult(Diagnostic_Run& run, const Test_Number& test, const Poll_Style& style)
{
    RM_DIAGRESULT result = {};
    Poll_Course course;
    for (;;) {
        agent_sleep.load()(second);
        const uint32 status = RM_DiagGetResults(run.port, test.value(), &result);
        if (style.countsPolls)
            NVR_LOG("Polling for the results.. %d", course.counter());
        else
            NVR_LOG("Polling for the results.. ");
        Poll_Course::Next next = course.answered(status, result.state);
        if (next == Poll_Course::Next::cancel)
            next = course.cancelled(NVR_DiagTestFunc::CancelTest(run.port, test.words, name_of(run)));
        if (next == Poll_Course::Next::finished) return leaveResult(run, test, style, result);
        if (next == Poll_Course::Next::failed) return leaveNothing(run, status);
    }
}

/// Reads the port's attributes. False, with the end of the test in `status`, if they cannot be read or the port is
/// disabled; `tail` ends the words for that.
bool portIsReady(Diagnostic_Run& run, const char* tail, uint32& status)
{
    Local_Attribute_Block<attributes_size> attributes;
    status = attributes.fill(RM_GetPortAttributes, run.port);
    if (status != RM_STATUS_OK) {
        NVR_LOG("RM_GetPortAttributes command failed. Exited with error code : %d", static_cast<int>(status));
        return false;
    }
    uint32 condition = 0;
    uint32 fault = 0;
    if (!attributes.number(RM_ATTR_PORT_CONDITION, condition, fault) || condition != port_disabled) return true;
    NVR_LOG("Source HBA port is disabled. Unable to start %s%s", name_of(run), tail);
    return false;
}

bool linkAllowsLoopback(AttributeBlock& attributes)
{
    uint32 state = 0;
    uint32 fault = 0;
    if (!attributes.number(RM_ATTR_LINK_STATE, state, fault)) return false;
    if (state < first_loopback_link_state || state > last_loopback_link_state) return false;
    HBA_WWN fabric = {};
    if (!attributes.wholeBytes(RM_ATTR_FABRIC_NAME, &fabric, sizeof fabric, fault)) return false;
    return std::all_of(std::begin(fabric.wwn), std::end(fabric.wwn), [](uint8 byte) { return byte == 0; });
}

struct Free {
    void operator()(void* memory) const { std::free(memory); }
};

/// Asks with room for one target. `status` takes what the library answers, if it is asked.
bool seesNoTarget(const HBA_WWN& port, uint32& status)
{
    static_assert(RM_FCPMAPPING_FIRST_SIZE >= sizeof(RM_TARGETLIST));
    const std::unique_ptr<void, Free> memory(std::calloc(1, RM_FCPMAPPING_FIRST_SIZE));
    if (!memory) return false;
    auto* targets = static_cast<RM_TARGETLIST*>(memory.get());
    targets->count = 1;
    status = RM_GetFcpTargetMapping(port, targets);
    return targets->count == 0;
}

/// A plug turns the port's own light back to it: there is a link, and nobody on it. A port that cannot be asked is
/// given the benefit of the doubt.
bool plugIsMissing(const HBA_WWN& port)
{
    Local_Attribute_Block<attributes_size> attributes;
    uint32 status = attributes.fill(RM_GetPortAttributes, port);
    if (status != RM_STATUS_OK) return false;
    return !(linkAllowsLoopback(attributes) && seesNoTarget(port, status)) && status == RM_STATUS_OK;
}

/// What a client can set of a test with a pattern, as the library takes it.
template <std::size_t size>
struct Pattern_Settings {
    explicit Pattern_Settings(const NVRHBA_FCHBADiagnosticSettingData& setting)
    {
        const Array<String>& parameters = setting.LoopControlParameter.value;
        if (!setting.LoopControlParameter.null && parameters.size() > 0)
            cycles = static_cast<uint32>(std::strtol(parameters[0].c_str(), nullptr, 10));
        halt = !setting.HaltOnError.null && setting.HaltOnError.value;
        const Array<uint8>& bytes = setting.BufferPattern.value;
        if (!setting.BufferPattern.null) std::memcpy(pattern, bytes.data(), std::min(bytes.size(), size - 1));
    }

    uint32 cycles = 0;
    uint32 halt = 0;
    char pattern[size] = {};
};

} // namespace

uint32 NVR_DiagTestFunc::CancelTest(const HBA_WWN& port, const uint32* testId, const char* name)
{
    if (!testId || !name) {
        NVR_LOG("Invalid Parameter");
        return RM_STATUS_ERROR;
    }
    RM_DIAGRESULT result = {};
    uint32 status = RM_STATUS_OK;
    for (int pass = 0; pass < cancel_passes; pass++) {
        status = RM_DiagCancelDiagnostic(port, *testId);
        NVR_LOG("Polling for the Cancel status .. ");
        agent_sleep.load()(second);
        if (status != RM_STATUS_OK) {
            NVR_LOG("Unknown error, Unable to cancel the test, Exited with the error code : %d",
                    static_cast<int>(status));
            continue;
        }
        status = RM_DiagGetResults(port, *testId, &result);
        NVR_LOG("Polling for the results.. ");
        if (status == RM_STATUS_OK && result.state == RM_DIAG_CANCELLED) {
            NVR_LOG("Canceled the %s", name);
            return RM_STATUS_OK;
        }
    }
    return status;
}

uint32 NVR_DiagTestFunc::SelfTest(Diagnostic_Run& run)
{
    NVR_LOG("NVR_DiagTestFunc::SelfTest");
    uint32 status = RM_STATUS_OK;
    if (!portIsReady(run, "", status)) return status;
    Test_Number test;
    status = RM_DiagRunPOST(run.port, test.place());
    if (status != RM_STATUS_OK) return leaveNothing(run, status);
    return pollForResult(run, test, self_style);
}

uint32 NVR_DiagTestFunc::LoopBackTest(Diagnostic_Run& run, uint32 type)
{
    NVR_LOG("NVR_Diagnostics::LoopBackTest");
    const Pattern_Settings<loopback_pattern_size> settings(run.setting);
    if (type != LOOPBACK_INTERNAL && type != LOOPBACK_HOST && type != LOOPBACK_EXTERNAL) {
        NVR_LOG("Error: Wrong Test type passed");
        return status_wrong_type;
    }
    uint32 status = RM_STATUS_OK;
    if (!portIsReady(run, " ", status)) return status;
    NVR_LOG("%s", name_of(run));
    NVR_LOG("Number of test cycles set to run : %d ", static_cast<int>(settings.cycles));
    NVR_LOG("HaltOnError value : %d ", static_cast<int>(settings.halt));
    NVR_LOG("The Input pattern used for testing %s", settings.pattern);
    if (type == LOOPBACK_EXTERNAL) {
        agent_sleep.load()(second);
        if (plugIsMissing(run.port)) {
            NVR_LOG("Loopback plug is not detected. Unabled to run test. Install loopback plug and make sure HBA Port "
                    "is Up/Ready.. ");
            return status_no_plug;
        }
    }
    Test_Number test;
    if (type == LOOPBACK_HOST)
        status = RM_DiagPciLoopBackTestV2(run.port, settings.cycles, settings.halt, test.place(), 0, settings.pattern);
    else
        status = RM_DiagLoopBackTestV3(run.port, type == LOOPBACK_INTERNAL, settings.cycles, settings.halt,
                                       test.place(), 0, settings.pattern);
    if (status != RM_STATUS_OK) return leaveNothing(run, status);
    return pollForResult(run, test, loopback_style);
}

uint32 NVR_DiagTestFunc::EchoTest(Diagnostic_Run& run)
{
    NVR_LOG("NVR_Diagnostics::EchoTest/Ping");
    const Pattern_Settings<echo_pattern_size> settings(run.setting);
    uint32 status = RM_STATUS_OK;
    if (!portIsReady(run, " ", status)) return status;
    const char* wwpn = run.setting.TargetDevice.value.c_str();
    HBA_WWN target = {};
    if (!library_name(target, wwpn, "NVR_Diagnostics::EchoTest::Id2HBAName failed",
                      "NVR_Diagnostics::EchoTest::str2HBAName failed"))
        return status_bad_target;
    NVR_LOG("Diagnostics Name : %s", name_of(run));
    NVR_LOG("Number of test cycles set to run : %d ", static_cast<int>(settings.cycles));
    NVR_LOG("HaltOnError value : %d ", static_cast<int>(settings.halt));
    NVR_LOG("Pattern used for testing %s", settings.pattern);
    NVR_LOG("TargetDevice WWPN to check : %s", wwpn);
    Test_Number test;
    status = RM_DiagEchoTestV2(run.port, target, settings.cycles, settings.halt, test.place(), 0, settings.pattern);
    if (status != RM_STATUS_OK) return leaveNothing(run, status);
    return pollForResult(run, test, echo_style);
}

} // namespace cimple
