#include "agent/Clock.h"

#include "runtime/Time.h"

namespace cimple {

std::atomic<uint64 (*)()> agent_clock{&Time::now};
std::atomic<void (*)(uint64)> agent_sleep{&Time::sleep};

Datetime agent_now()
{
    return Datetime(agent_clock.load()(), Datetime::now().utc());
}

} // namespace cimple
