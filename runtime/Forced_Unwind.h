/// How a handler of all exceptions tells a thread that is being ended from an exception.
///
/// A cancelled thread, and one that calls pthread_exit, unwinds its stack through `catch (...)`, and the process ends
/// if the handler does not rethrow. Catching abi::__forced_unwind instead would bind a reference to no object.
#pragma once

#include <exception>

namespace cimple {

/// Inside `catch (...)`: true if the thread is being ended, and the handler must go on with `throw;`.
inline bool is_forced_unwind()
{
    return !std::current_exception();
}

} // namespace cimple
