// What the management library tells about the virtual ports of a port.
#include "services/NVR_MethodWrapper.h"

#include <cstdio>

#include "foundation/AttributeBlock.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "foundation/management_binding.h"
#include "foundation/shared_operations.h"
#include "services/Counted_List.h"

namespace cimple {

namespace {

constexpr int status_null = 4;

void logVPortFailure(uint32 status)
{
    if (status == RM_STATUS_HOST_NOT_SUPPORTED) {
        NVR_LOG("FMCMD does not support listing virtual ports on this host.");
        return;
    }
    logStatus(status);
    NVR_LOG("Unable to list virtual ports!!");
}

RM_VMINFO machineInfo(const RM_VMNAME& name)
{
    RM_VMINFO info = {};
    if (RM_GetVMInfo(&name, &info) != RM_STATUS_OK) info = {};
    NVR_LOG("VM Details: %s, %s", fieldText(info.identity).c_str(), fieldText(info.virtualPort).c_str());
    NVR_LOG("Server Name:  %s", fieldText(info.serverName).c_str());
    NVR_LOG("Virtual Machine Name:  %s", fieldText(info.machineName).c_str());
    NVR_LOG("Guest OS Name:  %s", fieldText(info.guestOsName).c_str());
    NVR_LOG("Memory Size:  %d", static_cast<int>(info.memorySize));
    return info;
}

} // namespace

int NVR_MethodWrapper::ListVPorts(const HBA_WWN& port, VPort_List* list)
{
    NVR_LOG("NVR_MethodWrapper::ListVPorts");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    if (!list) {
        NVR_LOG("Invalid input pointer");
        return status_null;
    }
    Counted_List<RM_VPORTLIST> found;
    if (!found.fill([&](void* room) { return RM_VPList(port, room); })) {
        NVR_LOG("FMCMD_ListVPorts: Unable to allocate buffer");
        return RM_STATUS_ERROR;
    }
    if (found.status != RM_STATUS_OK) {
        logVPortFailure(found.status);
        return RM_STATUS_ERROR;
    }
    list->count = found.count();
    list->entries = found.entries();
    NVR_LOG("Exit the ListVPorts method");
    return 0;
}

int NVR_MethodWrapper::ListVPortAttributes(const HBA_WWN& port, const HBA_WWN& vport, RM_VPORTATTRIBUTES* attributes)
{
    NVR_LOG("NVR_MethodWrapper::ListVPortAttributes");
    if (!isLocal(port)) return RM_STATUS_ERROR;
    if (!attributes) {
        NVR_LOG("Invalid input vp attributes pointer");
        return status_null;
    }
    RM_VPORTATTRIBUTES found = {};
    found.version = RM_VPORT_VERSION;
    if (const uint32 status = RM_VPGetAttributes(port, vport, &found)) {
        logVPortFailure(status);
        return RM_STATUS_ERROR;
    }
    NVR_LOG("VPort details");
    NVR_LOG("VPort Name %s ", fieldText(found.name).c_str());
    NVR_LOG("Exit the ListVPortattributes method");
    *attributes = found;
    return 0;
}

int NVR_MethodWrapper::ListVPortTargets(const HBA_WWN& port, const HBA_WWN& vport)
{
    if (!isLocal(port) || !isLocal(vport)) return RM_STATUS_ERROR;
    Counted_List<RM_TARGETLIST> found;
    if (!found.fill([&](void* room) { return RM_VPListTargets(port, vport, room); })) {
        NVR_LOG("FMCMD_VportTargets: Unable to allocate buffer");
        return RM_STATUS_ERROR;
    }
    if (found.status == RM_STATUS_OK) {
        NVR_LOG("Exit the ListVPortTargets method");
        return 0;
    }
    if (found.status == RM_STATUS_HOST_NOT_SUPPORTED)
        NVR_LOG("FMCMD does not support listing virtual port targets on this host.");
    else
        NVR_LOG("Unable to list virtual port's targets!");
    return RM_STATUS_ERROR;
}

int NVR_MethodWrapper::ListVMfromVPort(const HBA_WWN& port, const RM_VPORTENTRY& vport,
                                       std::vector<RM_VMINFO>* machines)
{
    NVR_LOG("NVR_MethodWrapper::ListVMfromVPort %s", wwnText(vport.wwpn).c_str());
    if (!isLocal(port)) return RM_STATUS_ERROR;
    if (!machines) {
        NVR_LOG("Invalid input pointer");
        return status_null;
    }
    machines->clear();
    uint32 mapping = 0;
    uint32 status = 0;
    AttributeBlock block(RM_HBA_BLOCK_SIZE);
    if (block.valid() && block.fill(RM_GetHBAAttributes, port) == RM_STATUS_OK)
        block.number(RM_ATTR_VPORT_MAPPING, mapping, status);
    if (mapping != 1 && mapping != 2) {
        std::fputs("This physical WWPN does not support virtual port mappings.\n", stdout);
        return 0;
    }
    Counted_List<RM_VMLIST> found;
    bool again = false;
    const bool asked = found.fill([&](void* room) {
        const uint32 answer = RM_GetVMFromVPort(vport.wwpn, room);
        again = answer == RM_STATUS_MORE_DATA;
        return answer;
    });
    if (!asked) {
        if (again)
            NVR_LOG("FMCMD_ListVMS: Unable to allocate buffer\n");
        else
            NVR_LOG("FMCMD_ListVMS: Unable to allocate buffer.");
        return RM_STATUS_ERROR;
    }
    NVR_LOG("FMCMD_ListVMS: Status: %d", static_cast<int>(found.status));
    if (found.status != RM_STATUS_OK) return RM_STATUS_ERROR;
    for (uint32 i = 0; i < found.size(); i++)
        machines->push_back(machineInfo(found[i]));
    NVR_LOG("Exit the ListVMs method");
    return 0;
}

} // namespace cimple
