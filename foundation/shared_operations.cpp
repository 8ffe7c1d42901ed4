#include "foundation/shared_operations.h"

#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "foundation/management_binding.h"

namespace cimple {

int Validatewwpn(const HBA_WWN& port)
{
    NVR_LOG("Entering NVR_MethodWrapper::Validatewwpn()");
    uint32 local = 0;
    const uint32 status = RM_IsLocalHBA(port, &local);
    NVR_LOG("RM_IsLocalHBA: status=%d", static_cast<int>(status));
    if (status == RM_STATUS_OK && local != 0) return 0;
    NVR_LOG("HBA IS NOT LOCAL");
    return 1;
}

bool isLocal(const HBA_WWN& port)
{
    if (Validatewwpn(port) == 0) return true;
    NVR_LOG("INVALID wwpn");
    return false;
}

void logStatus(uint32 status)
{
    const StatusText text(status);
    if (*text.c_str())
        NVR_LOG("Status: <%d>:%s", static_cast<int>(status), text.c_str());
    else
        NVR_LOG("Status: <%d>", static_cast<int>(status));
}

uint32 nvrcimReset(const HBA_WWN& port)
{
    constexpr uint32 reset_now = 1;
    NVR_LOG("NVR_MethodWrapper::nvrcimReset");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    const uint32 status = RM_ResetHBA(port, reset_now);
    if (status == RM_STATUS_OK)
        NVR_LOG("WWN %s is reset", wwnColonText(port).c_str());
    else
        logStatus(status);
    return status;
}

} // namespace cimple
