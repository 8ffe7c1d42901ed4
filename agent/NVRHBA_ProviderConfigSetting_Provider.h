/// Serves the three settings of the agent's cache, and lets a client change them.
#pragma once

#include "agent/Read_Only_Provider.h"
#include "classes/NVRHBA_ProviderConfigSetting.h"

namespace cimple {

class NVRHBA_ProviderConfigSetting_Provider : public Read_Only_Provider<NVRHBA_ProviderConfigSetting> {
public:
    Enum_Instances_Status enum_instances(const NVRHBA_ProviderConfigSetting* model, const Enum_Handler& handler);
    /// Changes `current` of the setting with `instance`'s keys, if it is not null in `model`; it takes effect at the
    /// next refresh gate and is written to the settings file when the agent goes. Results: 0; 102 for a null argument
    /// or a value out of range; 104 for no such setting.
    Modify_Instance_Status modify_instance(const NVRHBA_ProviderConfigSetting* model,
                                           const NVRHBA_ProviderConfigSetting* instance);
};

} // namespace cimple
