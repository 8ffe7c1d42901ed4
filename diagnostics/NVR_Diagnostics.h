/// The instances of the diagnostics: what is published of the nine tests, their settings, and the jobs and records that
/// runs leave.
///
/// All operations work on the agent's maps, under its data mutex and that of the adapter maps, and log their steps.
/// Instances that they answer are the maps' own.
#pragma once

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

class ProviderAgent;
class String;
struct Instance;
struct NVRHBA_ConcreteJob;
struct NVRHBA_FCHBADiagnosticSettingData;
struct NVRHBA_JobSettingData;
struct NVRHBA_PortController;

constexpr uint32 JOB_COMPLETED = 7; ///< code of a job that ended well; any other one has failed
constexpr uint32 JOB_FAILED = 32768;
constexpr uint32 RECORD_PASSED = 2; ///< CompletionState of a record
constexpr uint32 RECORD_FAILED = 5;
constexpr uint32 NO_TEST_ID = 65535; ///< of tests that the adapter does not number

class NVR_Diagnostics {
public:
    /// Makes the instances of the tests and their ties to each port controller; a test whose instances are refused is
    /// left out. Result 0; 33068 without port controllers; 40002 if no adapter tells its diagnostic version.
    static uint32 CreateFCHBADiagnosticClassFeature(ProviderAgent& agent);
    /// Kind 0 empties all maps of the diagnostics, those of jobs and records too; other kinds do nothing.
    static void ClearDiagnosticClassMaps(ProviderAgent& agent, int kind);
    /// Reads the version of the diagnostics in the adapter behind the port with this WWPN text. Result 0, or 32768.
    static uint32 GetDiagnosticVersion(const char* deviceId, uint32* version);

    // ------------------------------------------------------------------------------------------- settings of a run

    /// The settings of all jobs; null if there are none.
    static NVRHBA_JobSettingData* getDefaultNVRHBA_JobSettingDataInstance(ProviderAgent& agent);
    /// The same after a client's own have been written into them, for good. Null if `input` is null, of another class
    /// or has another InstanceID.
    static NVRHBA_JobSettingData* getNVRHBA_JobSettingDataInstance(ProviderAgent& agent, const Instance* input);
    /// The settings of a test; null if there are none.
    static NVRHBA_FCHBADiagnosticSettingData*
    getDefaultNVRHBA_FCHBADiagnosticSettingDataInstance(ProviderAgent& agent, const String& testName);
    /// The same after what is valid of a client's own has been written into them, for good. Null as above.
    static NVRHBA_FCHBADiagnosticSettingData*
    getNVRHBA_FCHBADiagnosticSettingDataInstance(ProviderAgent& agent, const Instance* input, const String& testName);

    // ---------------------------------------------------------------------------------------------- what a run leaves

    struct Job_Arguments {
        const String& testName;
        bool deleteOnCompletion;
        uint32 code;
        uint32 testId;
        const NVRHBA_PortController* controller; // null: there is none
    };
    /// The job and its ties to the test and the port controller. Null if there is no job.
    static NVRHBA_ConcreteJob* CreateConcreteJobInstantiateNonBlocking(ProviderAgent& agent,
                                                                       const Job_Arguments& arguments);
    /// Removes a job of the map, which destroys it, and its ties. Records stay.
    static void DeleteConcreteJob(ProviderAgent& agent, const NVRHBA_ConcreteJob* job);

    struct Record_Arguments {
        const String& testName;
        const char* resultText;
        const String& jobId;
        const RM_DIAGRESULT* result; // null: the adapter counted nothing
        uint32 status;
        const NVRHBA_PortController* controller; // null: there is none
        bool overridden;                         // the run used settings of a client's
    };
    static void CreateDiagnosticServiceRecord(ProviderAgent& agent, const Record_Arguments& arguments);
    /// Behind the service record, whose setting data record it ties itself to.
    static void CreateDiagnosticCompletionRecord(ProviderAgent& agent, const Record_Arguments& arguments);
};

} // namespace cimple
