#include "agent/NVRHBA_ProviderConfigSetting_Provider.h"

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "foundation/CLogger.h"

namespace cimple {

namespace {

/// The bridge hands over an instance of whatever class the client's path names.
bool isSetting(const Instance* instance)
{
    return is_subclass(&NVRHBA_ProviderConfigSetting::meta, instance->meta_class);
}

/// Puts a new value of the setting at `index` of the map into force; false, with its words, if it is out of range.
bool apply(ProviderAgent& agent, int index, uint32 value)
{
    switch (index) {
    case 0:
        if (agent.m_config.setCacheTimeout(value) != 0) {
            NVR_LOG("The value provided for cache time-out is out of range");
            return false;
        }
        agent.m_cacheTimeout = value;
        NVR_LOG("Cache time-out is modified successfully");
        return true;
    case 1:
        if (agent.m_config.setRefreshAdapterData(value) != 0) {
            NVR_LOG("The value provided for adapter refresh out is out of range");
            return false;
        }
        agent.m_bRefreshAdapterData = value != 0;
        NVR_LOG("Adapter refresh is modified successfully");
        return true;
    case 2:
        if (agent.m_config.setRefreshSANData(value) != 0) {
            NVR_LOG("The value provided for SAN refresh out is out of range");
            return false;
        }
        agent.m_bRefreshSANData = value != 0;
        NVR_LOG("SAN refresh is modified successfully");
        return true;
    default:
        return true;
    }
}

} // namespace

Enum_Instances_Status NVRHBA_ProviderConfigSetting_Provider::enum_instances(const NVRHBA_ProviderConfigSetting*,
                                                                            const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_ProviderConfigSetting_map, handler);
    NVR_LOG("NVRHBA_ProviderConfigSetting_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Modify_Instance_Status
NVRHBA_ProviderConfigSetting_Provider::modify_instance(const NVRHBA_ProviderConfigSetting* model,
                                                       const NVRHBA_ProviderConfigSetting* instance)
{
    NVR_LOG("NVRHBA_ProviderConfigSetting_Provider::modify_instance()");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    Agent_Wait wait(agent);
    if (!instance || !model) {
        NVR_LOG("NVRHBA_ProviderConfigSetting_Provider::modify_instance invalid parameter");
        return MODIFY_INSTANCE_INVALID_PARAMETER;
    }
    const bool given = isSetting(model) && isSetting(instance) && !model->current.null && !instance->current.null;
    const int index = given ? agent.m_NVRHBA_ProviderConfigSetting_map.find(instance) : -1;
    if (index < 0) {
        NVR_LOG("Instance does not exist");
        return MODIFY_INSTANCE_FAILED;
    }
    const uint32 value = instance->current.value;
    if (!apply(agent, index, value)) return MODIFY_INSTANCE_INVALID_PARAMETER;
    agent.m_NVRHBA_ProviderConfigSetting_map[static_cast<std::size_t>(index)]->current.set(value);
    return MODIFY_INSTANCE_OK;
}

} // namespace cimple
