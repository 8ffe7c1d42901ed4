/// What a port's hardware tells of itself beyond its attributes: its module, its vital product data, its flash.
///
/// Each reads the library and fills the maps at once, under the agent's data mutex. Failures are logged and answered;
/// none ends the refresh. `wwpn` is the port's WWPN text; one that is none fails with its words.
#pragma once

#include "runtime/Instance.h"

namespace cimple {

class FCAdapterAttributes;
class ProviderAgent;

/// The port's NVRHBA_Transceiver, the map's own; or null.
Instance* createTransceiver(ProviderAgent& agent, const char* wwpn);

/// Result 0 with the port's NVRHBA_VitalProductData, the map's own, in `made`; 1, or the library's status.
uint32 CreateVPD(ProviderAgent& agent, const char* wwpn, Instance*& made);

/// The images in the port's flash, each tied to the port's controller. Result 0, 1 if one was refused (those behind it
/// are left out), or the library's status.
uint32 createFlashImages(ProviderAgent& agent, const char* wwpn, const FCAdapterAttributes& adapter,
                         const Instance* controller);

} // namespace cimple
