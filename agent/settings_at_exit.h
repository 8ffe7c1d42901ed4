/// What the agent's end leaves on disk, for a process that ends without it.
///
/// CIM servers of one kind never balance factories with clean-ups: their processes just exit. The two settings files
/// are then written and the session's name is taken away all the same. Threads of the module may still run, so that
/// nothing is destroyed, nothing is waited for without end, and no library is called. A child that a fork made has only
/// a copy of its parent's agent, and does nothing.
#pragma once

namespace cimple {

class NvrConfigFile;

/// Once both settings files are read: an exit from now on writes them. `config` stays until saveAtEnd.
void saveAtExit(NvrConfigFile& config);
/// The agent's end writes them itself, both in one hold, so that an exit meanwhile finds them either not yet written or
/// whole; it waits for an exit that is writing them, and leaves alone what that one wrote. May be called in vain, and
/// again after it threw.
void saveAtEnd();

} // namespace cimple
