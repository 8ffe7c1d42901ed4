// Dumps of a port: where they are, how many are kept, and making, listing and deleting them.
#include "services/NVR_MethodWrapper.h"

#include <cstring>

#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "foundation/shared_operations.h"

namespace cimple {

namespace {

/// Logs a failure, with its own words (a format for the status) before the library's. Result the status.
uint32 logged(uint32 status, const char* words)
{
    if (status == RM_STATUS_OK) return status;
    NVR_LOG(words, static_cast<int>(status));
    logStatus(status);
    return status;
}

void logDirectoryFailure(uint32 status, const char* path)
{
    switch (status) {
    case RM_STATUS_DIRECTORY_NOT_OPENED:
        NVR_LOG("ERROR: nvrcimSetDumpDirectory: RM_SetDumpDirectory call failed. The specified directory "
                "[' / vmfs / volumes / %s'] cannot be opened",
                path);
        break;
    case RM_STATUS_CONFIG_NOT_OPENED:
    case RM_STATUS_CONFIG_NOT_WRITTEN:
        NVR_LOG("ERROR: nvrcimSetDumpDirectory: RM_SetDumpDirectory call failed. The configuration file could not be "
                "opened");
        break;
    default:
        NVR_LOG("ERROR: nvrcimSetDumpDirectory: RM_SetDumpDirectory call failed with error code : %d \n",
                static_cast<int>(status));
    }
}

} // namespace

// Both reads begin with the words of the second.
uint32 NVR_MethodWrapper::nvrcimGetDumpDirectory(const HBA_WWN& port, char (&directory)[RM_DUMP_DIRECTORY_SIZE])
{
    NVR_LOG("NVR_MethodWrapper::nvrcimGetRetentionCount");
    std::memset(directory, 0, sizeof directory);
    if (!isLocal(port)) return RM_STATUS_ERROR;
    const uint32 status = RM_GetDumpDirectoryA(port, directory, sizeof directory);
    if (status != RM_STATUS_OK) std::memset(directory, 0, sizeof directory);
    return logged(status, "Failed to get the Dump directory, returned with error code %d");
}

uint32 NVR_MethodWrapper::nvrcimGetRetentionCount(const HBA_WWN& port, uint32& count)
{
    NVR_LOG("NVR_MethodWrapper::nvrcimGetRetentionCount");
    count = 0;
    if (!isLocal(port)) return RM_STATUS_ERROR;
    const uint32 status = RM_GetDumpRetentionCount(port, &count);
    if (status != RM_STATUS_OK) count = 0;
    return logged(status, "Failed to get the retention count, returned with error code %d");
}

uint32 NVR_MethodWrapper::nvrcimSetRetentionCount(const HBA_WWN& port, uint32 count)
{
    NVR_LOG("NVR_MethodWrapper::nvrcimSetRetentionCount");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    if (count < RM_DUMP_RETENTION_MIN || count > RM_DUMP_RETENTION_MAX) {
        NVR_LOG("ERROR: RetentionCount value must be in-between %d and %d", static_cast<int>(RM_DUMP_RETENTION_MIN),
                static_cast<int>(RM_DUMP_RETENTION_MAX));
        return RM_STATUS_ERROR;
    }
    return logged(RM_SetDumpRetentionCount(port, count),
                  "Failed to set the retention count, exited with error code %d");
}

uint32 NVR_MethodWrapper::nvrcimDeleteDumpFiles(const HBA_WWN& port)
{
    NVR_LOG("NVR_MethodWrapper::nvrcimDeleteDumpFiles");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    return logged(RM_DeleteDumpFiles(port), "Failed to delete the Dump files, exited with error code %d");
}

uint32 NVR_MethodWrapper::nvrcimDumpDiagnostic(const HBA_WWN& port, sint32 kind)
{
    NVR_LOG("NVR_MethodWrapper::nvrcimDumpDiagnostic");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    const uint32 status =
        kind == -1 ? RM_GenerateDump(HBA_WWN(), port) : RM_GenerateEfdDump(port, static_cast<uint32>(kind), 0);
    return logged(status, "Failed to generate the dump file, exited with error code %d");
}

uint32 NVR_MethodWrapper::GetDumpFileNames(const HBA_WWN& port, RM_DUMPLIST* list)
{
    NVR_LOG("NVR_MethodWrapper::GetDumpFileNames");
    NVR_LOG("Entering the Get Dump filenames method");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    const uint32 status = RM_GetDumpFileNames(port, list);
    if (status != RM_STATUS_OK) logStatus(status);
    NVR_LOG("Exit the Get Dump filenames method");
    return status;
}

uint32 NVR_MethodWrapper::nvrcimSetDumpDirectory(const HBA_WWN& port, const char* path)
{
    NVR_LOG("NVR_MethodWrapper::nvrcimSetDumpDirectory");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    const uint32 status = RM_SetDumpDirectory(port, path);
    if (status == RM_STATUS_OK) {
        NVR_LOG("nvrcimSetDumpDirectory: Success");
        return status;
    }
    logDirectoryFailure(status, path);
    logStatus(status);
    return status;
}

} // namespace cimple
