// The rebuild of the SAN-side maps.
#include "agent/ProviderAgent.h"
#include "foundation/CLogger.h"

namespace cimple {

uint32 ProviderAgent::updateSANMaps()
{
    NVR_LOG("PERF: updateSANMaps: Entry");
    clearSANMaps();
    NVR_LOG("PERF: updateSANMaps: cleanExit");
    return 0;
}

} // namespace cimple
