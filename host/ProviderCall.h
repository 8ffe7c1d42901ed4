/// Calls across the C boundary into a module, and what comes back of them.
#pragma once

#include "host/Broker.h"
#include "host/Host.h"

#include <cmpift.h>

#include <exception>
#include <string>

namespace host {

/// A module's status with its text, which becomes the server's and is freed here.
Status read_status(const CMPIStatus& status);

/// Runs a call into a module. A C++ exception that comes out of it is a broken rule and status 1; the forced unwinding
/// of a thread that ends goes on.
template <class Call>
Status guard(Broker& broker, const std::string& what, Call call)
{
    try {
        call();
        return {};
    } catch (...) {
        if (!std::current_exception()) throw; // the thread is being ended
        broker.violation("an exception came out of " + what);
        return {CMPI_RC_ERR_FAILED, "an exception came out of " + what, Fault::module};
    }
}

/// Entered for the time of a call into a module: objects that the module makes end with it.
class Call_Scope {
public:
    Call_Scope(Broker& broker, const std::string& what) : m_scope(broker, Scope::Sort::request, what)
    {
        m_scope.enter();
    }
    ~Call_Scope() { m_scope.leave(); }
    Call_Scope(const Call_Scope&) = delete;
    Call_Scope& operator=(const Call_Scope&) = delete;

private:
    Scope m_scope;
};

} // namespace host
