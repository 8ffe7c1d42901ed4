/// The frame that every CMPI call of an MI table runs in.
///
/// Finds the adapter, gives the thread its context, takes the adapter's lock, logs, and undoes it in reverse.
/// Exceptions end here as CMPI_RC_ERR_FAILED, since the server's C code must never see one; a thread that is being
/// cancelled unwinds on. A call that finds no adapter (a server may call once more after the last clean-up) fails and
/// touches nothing.
#pragma once

#include "cmpi/CMPI_Adapter.h"
#include "cmpi/CMPI_Thread_Context.h"
#include "cmpi/status.h"
#include "runtime/Forced_Unwind.h"
#include "runtime/log.h"

namespace cimple {

/// How an operation ended: the code for the server, a word for the log, the code for the log where it differs.
struct Outcome {
    CMPIrc code;
    const char* word;
    CMPIrc logged;

    Outcome(CMPIrc code, const char* word = nullptr) : Outcome(code, word, code) {}
    Outcome(CMPIrc code, const char* word, CMPIrc logged) : code(code), word(word), logged(logged) {}
};

void log_enter(const char* label);
void log_return(const char* label);
void log_return(const char* label, const Outcome& outcome);

inline CMPIStatus status_of(CMPIrc code)
{
    return {code, nullptr};
}

/// The table set behind an MI record, or null.
template <class MI>
MI_Table_Set* tables_of(const MI* mi)
{
    return mi ? static_cast<MI_Table_Set*>(const_cast<void*>(mi->hdl)) : nullptr;
}

/// `steps()` gives the code; what it throws becomes CMPI_RC_ERR_FAILED.
template <class Steps>
CMPIStatus guarded(Steps steps)
{
    try {
        return status_of(steps());
    } catch (...) {
        if (is_forced_unwind()) throw;
        return status_of(CMPI_RC_ERR_FAILED);
    }
}

/// The frame itself; `steps(adapter)` gives the Outcome.
template <class MI, class Steps>
CMPIStatus operate(const MI* mi, const CMPIContext* context, const char* label, Steps steps)
{
    return guarded([&] {
        Adapter_Use adapter(tables_of(mi));
        if (!adapter) return CMPI_RC_ERR_FAILED;
        CMPI_Thread_Context thread_context(adapter->broker, context, adapter.get());
        Pushed_Context pushed(thread_context);
        Running_Call running(*adapter);
        if (!running) return CMPI_RC_ERR_FAILED;
        Auto_Mutex locked(adapter->lock);
        log_enter(label);
        const Outcome outcome = steps(*adapter);
        log_return(label, outcome);
        return outcome.code;
    });
}

} // namespace cimple
