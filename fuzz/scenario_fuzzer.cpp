// Scenarios of the simulator, and its faults.
#include "fuzz/fuzzing.h"
#include "simulator/Scenario.h"

extern "C" int LLVMFuzzerInitialize(int*, char***)
{
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    const std::string text(reinterpret_cast<const char*>(data), size);
    try {
        nvrsim::parse_scenario(text, "input.toml");
    } catch (const nvrsim::Scenario_Error&) {
    }
    try {
        nvrsim::parse_fault(text);
    } catch (const nvrsim::Scenario_Error&) {
    }
    return 0;
}
