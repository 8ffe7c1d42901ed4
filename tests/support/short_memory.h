/// Memory that is short when a test says so. Replaces operator new for the whole program that links it.
#pragma once

#include <new>

namespace nvrtest {

/// Of this thread's allocations from now on, refuses the one of that number (the next one is 1) and no other.
void refuse_allocation(long number);
/// Refuses none any more. Result: whether one was refused.
bool forget_refusal();

/// Runs `act` with its first allocation refused, then with the one `step` further on, and so on, until none is;
/// `check(has_thrown)` is asked after each. Result: how many there were, or somewhat more with a step of more than 1.
template <class Act, class Check>
long refuse_each_allocation(Act act, Check check, long step = 1)
{
    for (long number = 1;; number += step) {
        bool has_thrown = false;
        refuse_allocation(number);
        try {
            act();
        } catch (const std::bad_alloc&) {
            has_thrown = true;
        }
        if (!forget_refusal()) return number - 1;
        check(has_thrown);
    }
}

} // namespace nvrtest
