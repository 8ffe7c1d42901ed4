// What the firmware service does to an adapter: a new image, a port switched on and off.
#include <cerrno>

#include "agent/library_name.h"
#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "foundation/open_file.h"
#include "foundation/shared_operations.h"
#include "services/NVR_MethodWrapper.h"

namespace cimple {

namespace {

// The library opens the file by itself, and would wait for the other end of a FIFO.
bool fileIsThere(const char* path)
{
    const int fault = fault_of_file(path);
    if (fault == ENOENT) NVR_LOG("\nERROR: nvrcimDownloadFW: FW file not found");
    if (fault && fault != ENOENT) NVR_LOG("\nERROR: nvrcimDownloadFW: Can't stat FW file");
    return fault == 0;
}

uint32 importImage(const char* path)
{
    const uint32 status = RM_ImportHBAFileA(path);
    NVR_LOG("\n: RM_ImportHBAFile: status = %d", static_cast<int>(status));
    return status;
}

uint32 verifyImage(const HBA_WWN& port, const char* path)
{
    const HBA_UINT8(&byte)[8] = port.wwn;
    NVR_LOG("wwpn %2x %2x %2x %2x %2x %2x %2x %2x", byte[0], byte[1], byte[2], byte[3], byte[4], byte[5], byte[6],
            byte[7]);
    const uint32 status = RM_VerifyFirmwareA(HBA_WWN(), port, path);
    NVR_LOG("\n: RM_VerifyFirmware: status = %d", static_cast<int>(status));
    return status;
}

uint32 writeImage(const HBA_WWN& port, const char* path)
{
    NVR_LOG("Starting Firmware download");
    const uint32 status = RM_DownloadFirmware(port, path, 0);
    NVR_LOG("Checking Firmware download status");
    switch (status) {
    case RM_STATUS_MAILBOX_TIMED_OUT:
        NVR_LOG("\nERROR: RM_DownloadFirmware: Mailbox timed out.\n");
        break;
    case RM_STATUS_MAILBOX_BUSY:
        NVR_LOG("\nERROR: RM_DownloadFirmware: Mailbox busy; retry.\n");
        break;
    case RM_STATUS_MAILBOX_FAILED:
        NVR_LOG("\nERROR: RM_DownloadFirmware: Mailbox failed; Internal Driver Error.\n");
        break;
    default: // a success is told in these words too
        NVR_LOG("\nERROR: RM_DownloadFirmware: status = %d", static_cast<int>(status));
    }
    return status;
}

} // namespace

uint32 NVR_MethodWrapper::nvrcimDownloadFW(const HBA_WWN& port, const char* path)
{
    NVR_LOG("entering the nvrcimDownloadFW function");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    NVR_LOG("\n firmware file name \"%s\"\n", path);
    if (!fileIsThere(path)) return RM_STATUS_ERROR;
    uint32 status = importImage(path);
    if (status == RM_STATUS_OK) status = verifyImage(port, path);
    if (status == RM_STATUS_OK) status = writeImage(port, path);
    logStatus(status);
    return status;
}

uint32 NVR_MethodWrapper::SetPortEnabled(const char* deviceID, boolean enabled)
{
    NVR_LOG("Inside SetPortEnabled %s %d", deviceID, enabled);
    HBA_WWN port;
    if (!library_name(port, deviceID, "Id2HBAName failed", "str2HBAName failed")) return RM_STATUS_ERROR;
    NVR_LOG("Invoking RM_SetPortEnabled API ");
    uint8 activation = 0;
    const uint32 status = RM_SetPortEnabled(port, enabled, &activation);
    if (status == RM_STATUS_BOOT_CODE_ENABLED) {
        NVR_LOG("\nERROR: FMCMD_SetPortEnabled ");
        NVR_LOG("One or more Port Functions have Boot Code enabled. Enable through EnableBootCode");
        NVR_LOG("Please disable Boot Code and try again.\n");
    } else if (status != RM_STATUS_OK) {
        NVR_LOG("\nERROR: FMCMD_SetPortEnabled: %d", static_cast<int>(status));
        NVR_LOG("RM_SetPortEnabled() Failed.\n");
    } else {
        if (activation == RM_PORT_ACTIVATION_RESET) NVR_LOG("Please reset the HBA to activate the new setting\n");
        NVR_LOG("Exiting SetPortEnabled in SetPortEnabled \n");
    }
    return status;
}

} // namespace cimple
