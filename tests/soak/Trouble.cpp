#include "tests/soak/Trouble.h"

#include <iterator>
#include <utility>

#include "simulator/nvrsim.h"
#include "tests/module/support/Test_Clock.h"
#include "tests/support/simulator.h"

namespace soak {

namespace {

constexpr std::size_t ports = 4;
constexpr std::uint32_t event_types[] = {256, 257, 258, 259, 513, 514, 515, 516, 0, 4294967295u};

// What the simulator does beside the failures that all tests share.
const char* const more_faults[] = {
    "damage = \"zeros\"",
    "damage = \"truncated\", keep = 3",
    "absent = true",
    "vanish = true",
};

std::vector<const char*> all_faults()
{
    std::vector<const char*> faults(std::begin(more_faults), std::end(more_faults));
    for (const nvrtest::Library_Failure& failure : nvrtest::library_failures())
        faults.push_back(failure.fault);
    return faults;
}

} // namespace

Trouble::Trouble(nvrtest::Rig& rig, nvrtest::Watch& watch, Counts& counts, const Season& season,
                 std::vector<std::string> calls)
    : m_rig(rig), m_watch(watch), m_counts(counts), m_season(season), m_calls(std::move(calls))
{
}

void Trouble::act(Random& random)
{
    const std::string port = std::to_string(random.below(ports));
    const nvrtest::Watch::Turn turn(m_watch, "trouble");
    switch (random.below(10)) {
    case 0:
    case 1:
        nvrsim_link(port.c_str(), random.chance(50));
        break;
    case 2:
        nvrsim_event(port.c_str(), random.pick(event_types), static_cast<std::uint32_t>(random.below(0xFFFFFF)));
        break;
    case 3:
    case 4:
        if (m_season.has_faults) add_fault(random);
        break;
    case 5:
        clear_faults();
        break;
    case 6:
        if (m_season.has_faults) nvrsim_set(port.c_str(), "present", random.chance(80));
        break;
    case 7:
        if (m_season.has_unloads) unload(random.chance(20));
        break;
    default:
        nvrtest::advance_clock(std::chrono::minutes(31));
        break;
    }
}

void Trouble::add_fault(Random& random)
{
    const std::string call = random.chance(10) ? "*" : random.pick(m_calls);
    const std::size_t times = 1 + random.below(50);
    std::string fault = "call = \"" + call + "\", times = " + std::to_string(times) + ", ";
    if (random.chance(20)) {
        const std::size_t delay = 1 + random.below(20);
        m_watch.allow(std::chrono::milliseconds(times * delay));
        fault += "delay_ms = " + std::to_string(delay);
    } else {
        static const std::vector<const char*> faults = all_faults();
        fault += random.pick(faults);
    }
    nvrtest::add_fault(fault);
}

// What an agent finds missing or broken when it is loaded, it goes without for its whole life.
void Trouble::unload(bool with_faults)
{
    if (with_faults)
        m_is_spoiled = true;
    else
        clear_faults();
    if (m_rig.server().unload_idle().closed > 0) m_counts.unloads++;
    (void)m_rig.names("NVRHBA_FCPort");
}

void Trouble::clear_faults()
{
    m_counts.faults += nvrtest::fault_hits();
    nvrtest::clear_faults();
}

bool Trouble::end()
{
    clear_faults();
    nvrsim_drain_events();
    nvrtest::load_scenario("typical");
    return std::exchange(m_is_spoiled, false);
}

} // namespace soak
