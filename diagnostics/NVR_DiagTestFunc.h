/// The functions that carry the nine tests out.
///
/// Each blocks until its test has ended, by minutes for some. All run under the agent's locks and log their steps.
/// Result 0 if the test was carried out, whatever it found; else a status of the management library or one of their
/// own. A run that leaves a job leaves its records too, and gives a copy of the job; a job of settings with
/// DeleteOnCompletion is gone at the end.
#pragma once

#include "foundation/management_api.h"
#include "runtime/Instance.h"

namespace cimple {

class ProviderAgent;
struct NVRHBA_ConcreteJob;
struct NVRHBA_FCHBADiagnosticSettingData;
struct NVRHBA_JobSettingData;
struct NVRHBA_PortController;

/// What a test works on, and the job that it leaves.
struct Diagnostic_Run {
    ProviderAgent& agent;
    HBA_WWN port;
    const NVRHBA_FCHBADiagnosticSettingData& setting; // its InstanceID is the test's name
    const NVRHBA_JobSettingData& jobSetting;
    const NVRHBA_PortController* controller; // null: there is none
    Ref<NVRHBA_ConcreteJob> job;             // a copy; null: there is none
};

/// The types of loopback, as the library numbers them.
enum Loopback : uint32 { LOOPBACK_INTERNAL = 5, LOOPBACK_HOST = 6, LOOPBACK_EXTERNAL = 11 };

class NVR_DiagTestFunc {
public:
    static uint32 BeaconTest(Diagnostic_Run& run);
    static uint32 StatusTest(Diagnostic_Run& run);
    static uint32 FCHBAResetTest(Diagnostic_Run& run);
    static uint32 SelfTest(Diagnostic_Run& run);
    static uint32 LoopBackTest(Diagnostic_Run& run, uint32 type);
    /// The ping test too.
    static uint32 EchoTest(Diagnostic_Run& run);

    /// Ends a test inside the adapter: 0 when it is cancelled; else the status of the last call made, or 1 for a null
    /// argument.
    static uint32 CancelTest(const HBA_WWN& port, const uint32* testId, const char* name);

    /// 0 if the port with this WWPN text can blink, else 32768; a mode other than 0 is no question that it knows.
    static uint32 ISDiagTestSupported(const char* deviceId, uint32 mode);

    /// Texts that are never freed; "Unknown" for a number without one.
    static const char* MapDiagResultStatus(uint32 code);
    static const char* MapDiagStatus(uint32 status);
};

} // namespace cimple
