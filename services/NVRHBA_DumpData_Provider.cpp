#include "services/NVRHBA_DumpData_Provider.h"

#include <cstring>

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "agent/library_name.h"
#include "foundation/CLogger.h"
#include "services/NVR_Dump.h"
#include "services/NVR_MethodWrapper.h"
#include "services/service_method.h"

namespace cimple {

namespace {

/// The element that a client means, or null.
NVRHBA_DumpData* found(const ProviderAgent& agent, const NVRHBA_DumpData* model, const NVRHBA_DumpData* instance)
{
    if (!isOfClass(model, NVRHBA_DumpData::meta) || !isOfClass(instance, NVRHBA_DumpData::meta)) return nullptr;
    return static_cast<NVRHBA_DumpData*>(agent.m_NVRHBA_DumpData_map.lookup(instance));
}

void rebuild(ProviderAgent& agent)
{
    if (const uint32 nvrstatus = NVR_Dump::FC_ClearDumpClasses(agent)) {
        NVR_LOG("FC_ClearDumpClasses failed");
        NVR_LOG("nvrstatus = %d", static_cast<int>(nvrstatus));
    }
    if (const uint32 nvrstatus = NVR_Dump::FC_CreateDumpClasses(agent)) {
        NVR_LOG("FC_CreateDumpClasses failed");
        NVR_LOG("nvrstatus = %d", static_cast<int>(nvrstatus));
    }
}

} // namespace

Enum_Instances_Status NVRHBA_DumpData_Provider::enum_instances(const NVRHBA_DumpData*, const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_DumpData_map, handler);
    NVR_LOG("NVRHBA_DumpData_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Modify_Instance_Status NVRHBA_DumpData_Provider::modify_instance(const NVRHBA_DumpData* model,
                                                                 const NVRHBA_DumpData* instance)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    if (!model || !instance) {
        NVR_LOG("NVRHBA_DumpData_Provider::modify_instance invalid parameter");
        return MODIFY_INSTANCE_INVALID_PARAMETER;
    }
    const NVRHBA_DumpData* data = found(agent, model, instance);
    if (!data) {
        NVR_LOG("Invalid instance of NVRHBA_DumpData_Provider Data");
        return MODIFY_INSTANCE_FAILED;
    }
    HBA_WWN port = {};
    if (!library_name(port, data->ElementName.value.c_str(),
                      "NVRHBA_DumpData_Provider::modify_instance::Id2HBAName failed",
                      "NVRHBA_DumpData_Provider::modify_instance::str2HBAName failed"))
        return MODIFY_INSTANCE_FAILED;
    NVR_LOG("found the key match for instance.");

    const bool directory_given = !model->DumpDirectory.null && !instance->DumpDirectory.null;
    if (directory_given && *instance->DumpDirectory.value.c_str()) {
        if (std::strcmp(instance->DumpDirectory.value.c_str(), data->DumpDirectory.value.c_str()) != 0) {
            NVR_LOG("nvrcimSetDumpDirectory is not supported");
            return MODIFY_INSTANCE_UNSUPPORTED;
        }
        NVR_LOG(" For Non VMWARE");
    }
    const bool count_given = !model->RetentionCount.null && !instance->RetentionCount.null;
    if (!count_given || instance->RetentionCount.value == data->RetentionCount.value) return MODIFY_INSTANCE_OK;
    if (NVR_MethodWrapper::nvrcimSetRetentionCount(port, instance->RetentionCount.value) != RM_STATUS_OK) {
        NVR_LOG("NVR_MethodWrapper::nvrcimSetRetentionCount failed");
        return MODIFY_INSTANCE_FAILED;
    }
    NVR_LOG("NVR_MethodWrapper::nvrcimSetRetentionCount succeded");
    rebuild(agent);
    return MODIFY_INSTANCE_OK;
}

} // namespace cimple
