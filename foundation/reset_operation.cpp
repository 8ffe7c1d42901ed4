// The reset of an adapter, which the firmware service and the reset test share.
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "foundation/NVR_MethodWrapper.h"
#include "foundation/management_binding.h"

namespace cimple {

namespace {

constexpr uint32 status_not_local = 1;
constexpr uint32 reset_now = 1;

} // namespace

uint32 NVR_MethodWrapper::nvrcimReset(const HBA_WWN& port)
{
    NVR_LOG("NVR_MethodWrapper::nvrcimReset");
    if (!isLocal(port)) return status_not_local;
    const uint32 status = RM_ResetHBA(port, reset_now);
    if (status == RM_STATUS_OK)
        NVR_LOG("WWN %s is reset", wwnColonText(port).c_str());
    else
        logStatus(status);
    return status;
}

} // namespace cimple
