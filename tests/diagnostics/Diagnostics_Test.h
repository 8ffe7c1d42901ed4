/// The diagnostics over the simulated libraries: what the tests of this room stand on.
#pragma once

#include <string>
#include <vector>

#include "classes/NVRHBA_ConcreteJob.h"
#include "classes/NVRHBA_FCHBADiagnosticSettingData.h"
#include "classes/NVRHBA_JobSettingData.h"
#include "classes/NVRHBA_PortController.h"
#include "diagnostics/NVR_DiagTestFunc.h"
#include "diagnostics/NVR_Diagnostics.h"
#include "diagnostics/diagnostic_tests.h"
#include "tests/agent/expect_rows.h"

namespace nvrtest {

using Words = std::vector<std::string>;

constexpr char beacon_name[] = "NVR:FCHBA Beacon Test";
constexpr char echo_name[] = "NVR:FCHBA Echo Test";
constexpr char external_name[] = "NVR:FCHBA External Loopback Test";
constexpr char host_name[] = "NVR:FCHBA Host Loopback Test";
constexpr char internal_name[] = "NVR:FCHBA Internal Loopback Test";
constexpr char ping_name[] = "NVR:FCHBA Ping Test";
constexpr char status_name[] = "NVR:FCHBA Status Test";
constexpr char reset_name[] = "NVR:FCHBA Reset Test";
constexpr char self_name[] = "NVR:FCHBA Self Test";
constexpr char target_wwpn[] = "50060E8005A10000";

/// True: buffers of the C library's are refused.
extern bool no_more_buffers;

class Diagnostics : public SimulatedHost {
protected:
    Diagnostics();
    ~Diagnostics() override;

    /// Replaces the host by one with these keys of its one port, and reads it.
    void port(const std::string& keys);
    /// Reads a scenario.
    void host(const std::string& toml);

    cimple::NVRHBA_FCHBADiagnosticSettingData& setting(const char* test);
    cimple::NVRHBA_JobSettingData& job_setting();
    const cimple::NVRHBA_PortController* controller();
    /// All maps of the diagnostics, by their class.
    cimple::Instance_Map& map(const std::string& class_name);
    const Instance* first(const std::string& class_name) { return map(class_name)[0]; }

    struct Ran {
        cimple::uint32 status;
        Ref<cimple::NVRHBA_ConcreteJob> job;
        Words words;
        cimple::uint64 seconds; // slept
    };
    /// Runs a test on the first port, with its settings as they are.
    Ran run(const char* test);
    Ran run(const char* test, const cimple::NVRHBA_PortController* controller);
};

/// What the simulator tells of the newest test of the first port.
std::string newest_test();

/// The words of a job and its records, from first to last.
Words records_left();
Words joined(const std::vector<Words>& parts);
Words repeated(int times, const Words& words);

} // namespace nvrtest
