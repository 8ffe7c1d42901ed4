// The boot code of an adapter: switched and read.
#include "services/NVR_MethodWrapper.h"

#include "foundation/AttributeBlock.h"
#include "foundation/CLogger.h"
#include "foundation/shared_operations.h"
#include "runtime/String.h"

namespace cimple {

uint32 NVR_MethodWrapper::nvrcimGetBootBiosState(const HBA_WWN& port, uint32* state)
{
    constexpr uint32 block_size = 2048;
    NVR_LOG("entering NVR_MethodWrapper::nvrcimGetBootBiosState");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    if (!state) {
        NVR_LOG("Null Pointer Assignment to argument biosState");
        return RM_STATUS_ERROR;
    }
    AttributeBlock block(block_size);
    if (!block.valid()) {
        NVR_LOG("ERROR: GetHBAAttributes: Unable to allocate buffer");
        return RM_STATUS_ERROR;
    }
    if (const uint32 status = block.fill(RM_GetHBAAttributes, port)) {
        NVR_LOG("ERROR: RM_GetHBAAttributes call failed (%d)", static_cast<int>(status));
        return RM_STATUS_ERROR;
    }
    block.number(RM_ATTR_BOOT_CODE_ENABLED, "_BootCodeEnabled", *state);
    NVR_LOG("********* biosState Value: %d", static_cast<int>(*state));
    return RM_STATUS_OK;
}

uint32 NVR_MethodWrapper::nvrcimSetBootBiosState(const HBA_WWN& port, const char* control)
{
    NVR_LOG("entering NVR_MethodWrapper::nvrcimSetBootBiosState");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    if (!control) {
        NVR_LOG("Null Pointer Assignment to argument CtrlWord");
        return RM_STATUS_ERROR;
    }
    NVR_LOG("CtrlWord is %2c", *control);
    switch (lower_case[static_cast<uint8>(*control)]) {
    case 'e':
        return RM_SetBootBiosState(port, 1);
    case 'd':
        return RM_SetBootBiosState(port, 0);
    default:
        return RM_STATUS_ERROR;
    }
}

} // namespace cimple
