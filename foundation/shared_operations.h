/// The management operations that more than one room needs, and what all of them share: the test for a local port and
/// the line about a status. Those of the services stand in services/NVR_MethodWrapper.h.
///
/// They need a management session that lives (Management_Session.h). Callers serialise, by the agent's data mutex.
#pragma once

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace cimple {

/// 0 if the management library calls the port local, else 1.
int Validatewwpn(const HBA_WWN& port);
/// The same as the operations ask it, with their words for a port that is not.
bool isLocal(const HBA_WWN& port);

/// Logs a status with the library's words for it.
void logStatus(uint32 status);

/// Resets the adapter behind the port. Result the library's status, 1 for a port that is not local.
uint32 nvrcimReset(const HBA_WWN& port);

} // namespace cimple
