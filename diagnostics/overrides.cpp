// The settings of a run: the defaults of the maps, and what a client may write over them.
#include "diagnostics/NVR_Diagnostics.h"

#include <cstdlib>

#include "agent/ProviderAgent.h"
#include "agent/instance_table.h"
#include "classes/NVRHBA_FCHBADiagnosticSettingData.h"
#include "classes/NVRHBA_JobSettingData.h"
#include "diagnostics/diagnostic_tests.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"

namespace cimple {

namespace {

using Setting = NVRHBA_FCHBADiagnosticSettingData;

constexpr uint16 count_loops = 3;
constexpr std::size_t loop_text_size = 4;
constexpr long max_loops = 4000;
constexpr uint32 max_buffer_size = 8;
constexpr std::size_t wwpn_size = 16;

/// The client's instance as one of this class; null for another.
template <class T>
const T* input_as(const Instance* input)
{
    return input && is_subclass(&T::meta, input->meta_class) ? static_cast<const T*>(input) : nullptr;
}

/// Does the client speak of these settings?
template <class T>
bool names(const T& input, const T& setting)
{
    return !input.InstanceID.null && input.InstanceID.value == setting.InstanceID.value;
}

/// The first element of an array; null for none.
template <class T>
const T* first_of(const Property<Array<T>>& property)
{
    return property.null || property.value.size() == 0 ? nullptr : &property.value[0];
}

void overrideLoopControl(Setting& setting, const Setting& input)
{
    const uint16* control = first_of(input.LoopControl);
    if (!control) return;
    NVR_LOG("Input LoopControl : %d", *control);
    if (*control == count_loops)
        set(setting.LoopControl, {*control});
    else
        NVR_LOG("Invalid LoopControl, Valid value is '3'. Using the default value");
}

bool isLoopCount(const String& text)
{
    if (text.size() == 0 || text.size() > loop_text_size) return false;
    const long count = std::strtol(text.c_str(), nullptr, 10);
    return count >= 1 && count <= max_loops;
}

void overrideLoopControlParameter(Setting& setting, const Setting& input)
{
    const String* parameter = first_of(input.LoopControlParameter);
    if (!parameter) return;
    NVR_LOG("Input LoopControlParam : %s", parameter->c_str());
    if (isLoopCount(*parameter))
        set(setting.LoopControlParameter, {*parameter});
    else
        NVR_LOG("Invalid LoopControlParam, Valid value range[1-4000]. Using the default value");
}

void overrideBufferSizes(Setting& setting, const Setting& input)
{
    const uint32* size = first_of(input.BufferSizes);
    if (!size) return;
    NVR_LOG("Input Buffer Size : %d", static_cast<int>(*size));
    if (*size <= max_buffer_size)
        set(setting.BufferSizes, {*size});
    else
        NVR_LOG("Invalid BufferSizes, Valid value is '<8'. Using the default value");
}

bool isHexDigit(uint8 byte)
{
    return (byte >= '0' && byte <= '9') || (byte >= 'a' && byte <= 'f') || (byte >= 'A' && byte <= 'F');
}

bool areHexDigits(const Array<uint8>& bytes)
{
    for (const uint8 byte : bytes)
        if (!isHexDigit(byte)) return false;
    return true;
}

void overrideBufferPattern(Setting& setting, const Setting& input, bool tellsSuccess)
{
    if (input.BufferPattern.null) return;
    const Array<uint8>& given = input.BufferPattern.value;
    const uint32* size = first_of(setting.BufferSizes);
    if (!size || *size == 0 || !areHexDigits(given)) {
        NVR_LOG("Invalid BufferPattern, Use hex values. Using the default value");
        return;
    }
    Array<uint8> pattern;
    for (uint32 i = 0; i < *size; i++)
        pattern.append(i < given.size() ? given[i] : uint8{'0'});
    set(setting.BufferPattern, pattern);
    if (tellsSuccess) NVR_LOG("Valid Pattern entered");
}

/// Clients have always read each line of this twice, and the second reading changes nothing.
void overridePatternSettings(Setting& setting, const Setting& input)
{
    overrideLoopControl(setting, input);
    overrideLoopControlParameter(setting, input);
    if (!input.HaltOnError.null) set(setting.HaltOnError, input.HaltOnError.value);
    overrideBufferSizes(setting, input);
    overrideBufferPattern(setting, input, true);

    overrideLoopControl(setting, input);
    overrideLoopControlParameter(setting, input);
    overrideBufferSizes(setting, input);
    overrideBufferPattern(setting, input, false);
}

void overrideTarget(Setting& setting, const Setting& input)
{
    NVR_LOG("Checking the Echo test targetdevice");
    if (input.LUN.null)
        NVR_LOG("Invalid LUN, Using the default value '0' ");
    else
        set(setting.LUN, input.LUN.value);
    if (input.TargetDevice.null) return;
    const String& target = input.TargetDevice.value;
    NVR_LOG("Input TargetDevice : %s", target.c_str());
    if (target.size() != wwpn_size) return;
    char name[hba_name_size] = {};
    if (Id2HBAName(name, target.c_str()) == 0) {
        set(setting.TargetDevice, target);
    } else {
        NVR_LOG("getNVRHBA_FCHBADiagnosticSettingDataInstance::Id2HBAName failed");
        set(setting.TargetDevice, "");
    }
}

} // namespace

NVRHBA_JobSettingData* NVR_Diagnostics::getDefaultNVRHBA_JobSettingDataInstance(ProviderAgent& agent)
{
    const auto& settings = agent.m_NVRHBA_JobSettingData_map;
    return settings.empty() ? nullptr : settings[0];
}

NVRHBA_JobSettingData* NVR_Diagnostics::getNVRHBA_JobSettingDataInstance(ProviderAgent& agent, const Instance* input)
{
    NVRHBA_JobSettingData* setting = getDefaultNVRHBA_JobSettingDataInstance(agent);
    const auto* given = input_as<NVRHBA_JobSettingData>(input);
    if (!setting || !given || !names(*given, *setting)) return nullptr;
    NVR_LOG("Using the overrided values if valid, else default settings values are used");
    if (given->DeleteOnCompletion.null)
        NVR_LOG("Missing DeleteOnCompletion parameter, Valid values are 1 or 0. Using the default value");
    else
        set(setting->DeleteOnCompletion, given->DeleteOnCompletion.value);
    return setting;
}

Setting* NVR_Diagnostics::getDefaultNVRHBA_FCHBADiagnosticSettingDataInstance(ProviderAgent& agent,
                                                                              const String& testName)
{
    const auto& settings = agent.m_NVRHBA_FCHBADiagnosticSettingData_map;
    for (std::size_t i = 0; i < settings.size(); i++)
        if (settings[i]->InstanceID.value == testName) return settings[i];
    NVR_LOG("Could not find the default setting data");
    return nullptr;
}

Setting* NVR_Diagnostics::getNVRHBA_FCHBADiagnosticSettingDataInstance(ProviderAgent& agent, const Instance* input,
                                                                       const String& testName)
{
    Setting* setting = getDefaultNVRHBA_FCHBADiagnosticSettingDataInstance(agent, testName);
    const auto* given = input_as<Setting>(input);
    if (!given) {
        NVR_LOG("Invalid overrided Diagsetting param, default settings values are used");
        return nullptr;
    }
    if (setting && !names(*given, *setting)) return nullptr;
    NVR_LOG("Using the overrided values if valid, else default settings values are used");
    const Diagnostic_Test* test = find_diagnostic_test(given->InstanceID.value);
    if (!test) return setting;
    if (!test->takesOverrides()) {
        NVR_LOG("No Override Setting Supported for test : %s", test->name);
        return setting;
    }
    if (!setting) return nullptr;
    if (test->takesPattern()) overridePatternSettings(*setting, *given);
    if (test->takesTarget()) overrideTarget(*setting, *given);
    set(setting->OverridedSettingData, 1);
    return setting;
}

} // namespace cimple
