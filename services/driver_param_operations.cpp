// Setting a parameter of the driver.
#include "services/NVR_MethodWrapper.h"

#include <cstdio>

#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "foundation/shared_operations.h"

namespace cimple {

namespace {

constexpr std::size_t assignment_size = 256; // "name=value" with its terminator

uint32 refused(const char* words)
{
    NVR_LOG("%s", words);
    return RM_STATUS_ERROR;
}

} // namespace

uint32 NVR_MethodWrapper::nvrcimSetDriverParam(const char* deviceID, const HBA_WWN& port, uint32 CW1, uint32 CW2,
                                               const char* name, const char* value)
{
    NVR_LOG("NVR_MethodWrapper::nvrcimSetDriverParam()");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    if (CW1 > 1) return refused("INVALID CW1");
    if (CW2 > 1) return refused("INVALID CW2");
    if (!name) return refused("Null pointer assignment in argument pDriverParam");
    if (!value) return refused("Null pointer assignment in argument pVal");
    NVR_LOG("nvrcimSetDriverParam Parameters ::");
    NVR_LOG("CW1=%d CW2=%d pDriverParam=%s pVal=%s, deviceID=%s", static_cast<int>(CW1), static_cast<int>(CW2), name,
            value, deviceID);
    const uint32 code = CW1 * RM_PARAM_GLOBAL | CW2 * RM_PARAM_PERMANENT;
    char assignment[assignment_size];
    const int size = std::snprintf(assignment, sizeof assignment, "%s=%s", name, value);
    if (size < 0 || static_cast<std::size_t>(size) >= sizeof assignment) return refused("INVALID pParamStr");
    NVR_LOG("pParamStr:[%s], Ccw:[%d]", assignment, static_cast<int>(code));
    NVR_LOG("Calling RM_SetDriverParam");
    const uint32 status = RM_SetDriverParam(port, assignment, code);
    if (status != RM_STATUS_OK) NVR_LOG("RM_SetDriverParam fails with status : %d", static_cast<int>(status));
    return status;
}

} // namespace cimple
