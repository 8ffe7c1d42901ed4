#include "bench/Bench_Host.h"

#include <stdexcept>

#include "simulator/nvrsim.h"
#include "tests/module/support/Rig.h"
#include "tests/support/private_host.h"
#include "tests/support/simulator.h"

namespace nvrbench {

void prepare_host(unsigned ports, unsigned targets, unsigned luns)
{
    nvrtest::compose_libraries({"HBAAPI", "lrmapi", "rmapi", "tssdm"});
    nvrtest::remove(nvrtest::dmp_path);
    // One side of the refresh at a time, so that its cost can be told.
    const bool has_san = targets != 0;
    nvrtest::write_file(nvrtest::conf_path,
                        has_san ? "NVR_PROVIDER_REFRESH_ADAPTERDATA = FALSE\nNVR_PROVIDER_REFRESH_SANDATA = TRUE\n"
                                : "NVR_PROVIDER_REFRESH_ADAPTERDATA = TRUE\nNVR_PROVIDER_REFRESH_SANDATA = FALSE\n");
    std::string scenario(nvrsim_generate(ports, targets, luns, nullptr, 0) + 1, '\0');
    scenario.resize(nvrsim_generate(ports, targets, luns, scenario.data(), scenario.size()));
    nvrtest::load_scenario(scenario);
}

Bench_Host::Bench_Host(unsigned ports, unsigned targets, unsigned luns)
    : m_server((prepare_host(ports, targets, luns), nvrtest::module_schema()))
{
    std::string error;
    if (m_server.add_module(NVR_MODULE, "root/norvane", &error) == 0) throw std::runtime_error(error);
}

host::Answer Bench_Host::enumerate(const std::string& class_name)
{
    host::Answer answer = m_server.enumerate("root/norvane", class_name);
    if (!answer.ok()) throw std::runtime_error(class_name + ": " + answer.status.message);
    return answer;
}

} // namespace nvrbench
