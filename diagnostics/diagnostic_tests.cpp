#include "diagnostics/diagnostic_tests.h"

#include "diagnostics/NVR_DiagTestFunc.h"
#include "runtime/String.h"

namespace cimple {

namespace {

// What no test offers is told by a number of its own.
constexpr uint16 no_loop_control = 32768;
constexpr uint16 no_execution_control = 32768;

uint32 external_loopback(Diagnostic_Run& run)
{
    return NVR_DiagTestFunc::LoopBackTest(run, LOOPBACK_EXTERNAL);
}
uint32 host_loopback(Diagnostic_Run& run)
{
    return NVR_DiagTestFunc::LoopBackTest(run, LOOPBACK_HOST);
}
uint32 internal_loopback(Diagnostic_Run& run)
{
    return NVR_DiagTestFunc::LoopBackTest(run, LOOPBACK_INTERNAL);
}

} // namespace

// clang-format off
const std::array<Diagnostic_Test, 9> diagnostic_tests = {{
    {Test_Id::beacon, "NVR:FCHBA Beacon Test",
     "Test causes a port's LEDs to flash on and off, allowing the port to be easily visually identified",
     2, {{2}}, {}, {{3}}, {{"5"}}, {{3, 4}}, {{no_execution_control}}, {}, 0, &NVR_DiagTestFunc::BeaconTest},
    {Test_Id::echo, "NVR:FCHBA Echo Test",
     "Test verifies the data path from host to target",
     3, {{3, 5}}, {{4, 10}}, {{3}}, {{"100"}}, {{3}}, {{1}}, {{"TargetDevice", "EchoMechanism", "LUN", "BufferSize", "BufferPattern"}}, 0, &NVR_DiagTestFunc::EchoTest},
    {Test_Id::externalLoopback, "NVR:FCHBA External Loopback Test",
     "Test verifies that the entire data path through an FCHBA is working properly",
     4, {{2, 5}}, {{4, 10}}, {{3}}, {{"100"}}, {{2, 3}}, {{1}}, {{"BufferSize", "BufferPattern"}}, 0, &external_loopback},
    {Test_Id::hostLoopback, "NVR:FCHBA Host Loopback Test",
     "Test verifies the FC HBA hostbus interface",
     5, {{2}}, {{4}}, {{3}}, {{"100"}}, {{2, 3}}, {{1}}, {{"BufferSize", "BufferPattern"}}, 0, &host_loopback},
    {Test_Id::internalLoopback, "NVR:FCHBA Internal Loopback Test",
     "Test verifies the integrity of internal data paths in the FCHBA",
     6, {{2}}, {{4}}, {{3}}, {{"100"}}, {{2, 3}}, {{1}}, {{"BufferSize", "BufferPattern"}}, 0, &internal_loopback},
    {Test_Id::ping, "NVR:FCHBA Ping Test",
     "Test verifies the existence and accessibility of devices on the SAN",
     7, {{5}}, {{4, 10}}, {{3}}, {{"100"}}, {{3}}, {{1}}, {{"TargetDevice", "PingMechanism", "LUN", "BufferSize", "BufferPattern"}}, 0, &NVR_DiagTestFunc::EchoTest},
    {Test_Id::status, "NVR:FCHBA Status Test",
     "Test checks the health of the FCHBA, not including the FC optics",
     10, {{4}}, {}, {}, {}, {{no_loop_control}}, {{no_execution_control}}, {}, 0, &NVR_DiagTestFunc::StatusTest},
    {Test_Id::reset, "NVR:FCHBA Reset Test",
     "Test causes the FCHBA to re-initialize itself",
     8, {{2}}, {{4}}, {}, {}, {{no_loop_control}}, {{no_execution_control}}, {}, 0, &NVR_DiagTestFunc::FCHBAResetTest},
    {Test_Id::self, "NVR:FCHBA Self Test",
     "Test allows all components of the FCHBA to be tested",
     9, {{2}}, {{4}}, {}, {}, {{no_loop_control}}, {{no_execution_control}}, {}, 0, &NVR_DiagTestFunc::SelfTest},
}};
// clang-format on

const Diagnostic_Test* find_diagnostic_test(const String& name)
{
    for (const Diagnostic_Test& test : diagnostic_tests)
        if (name == test.name) return &test;
    return nullptr;
}

} // namespace cimple
