/// The driver's parameter records, and the instances that are made of them.
#pragma once

#include <string>
#include <vector>

#include "foundation/management_api.h"
#include "runtime/String.h"

namespace cimple {

class ProviderAgent;

/// Reads the global list, or the port's own, with a second try for as many records as the library has. Result 0, 8 if
/// memory is short, or the library's status, logged.
uint32 readDriverParams(const HBA_WWN& wwn, bool global, std::vector<RM_DRIVERPARAM>& records);

/// InstanceID of a port's own parameter: "%s:%s" of its WWPN text and the record's name.
String driverParamID(const std::string& wwpn, const RM_DRIVERPARAM& record);

/// Creates the instances of the global list, or of a port's own, each tied to the first driver parameter service and a
/// port's own to its port. Result 0, 1 for a WWPN that is none or not local, 8, or the library's status. Under the
/// agent's data mutex.
uint32 nvrcimGetDriverParam(ProviderAgent& agent, const std::string& wwpn, bool global);

} // namespace cimple
