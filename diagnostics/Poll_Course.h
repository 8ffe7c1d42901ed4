/// The course of a test inside an adapter, from poll to poll: what comes next after each answer.
///
/// A test gets 121 polls; if it is still under way then, it is to be cancelled, and after a cancel that failed one more
/// poll decides. State alone: no clock, no call.
#pragma once

#include "runtime/Type.h"

namespace cimple {

class Poll_Course {
public:
    enum class Next {
        poll,     ///< again, a second later
        cancel,   ///< the test, and tell by `cancelled`
        finished, ///< there is a result
        failed    ///< there will be none
    };

    /// Polls left, as the log counts them.
    int counter() const { return m_counter; }

    /// A poll has brought this status, and this state of the test.
    Next answered(uint32 status, uint32 state);
    /// The cancel has ended with this status.
    Next cancelled(uint32 status);

private:
    int m_counter = 121;
};

} // namespace cimple
