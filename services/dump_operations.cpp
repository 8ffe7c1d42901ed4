// What the management library tells about a port's dumps.
#include "services/NVR_MethodWrapper.h"

#include <cstring>

#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "foundation/shared_operations.h"

namespace cimple {

// Both reads begin with the words of the second.
uint32 NVR_MethodWrapper::nvrcimGetDumpDirectory(const HBA_WWN& port, char (&directory)[RM_DUMP_DIRECTORY_SIZE])
{
    NVR_LOG("NVR_MethodWrapper::nvrcimGetRetentionCount");
    std::memset(directory, 0, sizeof directory);
    if (!isLocal(port)) return RM_STATUS_ERROR;
    const uint32 status = RM_GetDumpDirectoryA(port, directory, sizeof directory);
    if (status == RM_STATUS_OK) return status;
    std::memset(directory, 0, sizeof directory);
    NVR_LOG("Failed to get the Dump directory, returned with error code %d", static_cast<int>(status));
    logStatus(status);
    return status;
}

uint32 NVR_MethodWrapper::nvrcimGetRetentionCount(const HBA_WWN& port, uint32& count)
{
    NVR_LOG("NVR_MethodWrapper::nvrcimGetRetentionCount");
    count = 0;
    if (!isLocal(port)) return RM_STATUS_ERROR;
    const uint32 status = RM_GetDumpRetentionCount(port, &count);
    if (status == RM_STATUS_OK) return status;
    count = 0;
    NVR_LOG("Failed to get the retention count, returned with error code %d", static_cast<int>(status));
    logStatus(status);
    return status;
}

} // namespace cimple
