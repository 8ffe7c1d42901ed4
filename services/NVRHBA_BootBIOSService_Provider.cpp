#include "services/NVRHBA_BootBIOSService_Provider.h"

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "foundation/CLogger.h"
#include "services/NVR_MethodWrapper.h"
#include "services/service_method.h"

namespace cimple {

namespace {

/// What all methods check first: 0, or the answer of a refused call. `port` becomes the target's name; `no_target` is
/// logged where there is none.
uint32 checkCall(ProviderAgent& agent, const Instance* self, const Instance* target, const char* no_target,
                 HBA_WWN& port)
{
    if (!isFirstService(agent.m_NVRHBA_BootBIOSService_map, self)) {
        NVR_LOG("Invalid instance of Boot BIOS Service");
        return ANSWER_FOREIGN_INSTANCE;
    }
    if (!target) {
        NVR_LOG("%s", no_target);
        return ANSWER_BAD_ARGUMENT;
    }
    if (!agent.checkFCPort(deviceID(target))) {
        NVR_LOG("NVRHBA_BootBIOSService_Provider invald fc port ...return");
        return ANSWER_BAD_ARGUMENT;
    }
    return portName(port, deviceID(target), "NVRHBA_BootBIOSService_Provider") ? ANSWER_DONE : ANSWER_BAD_ARGUMENT;
}

/// What enabling and disabling differ in.
struct Switch {
    const char* entry;
    const char* no_target;
    const char* calling;
    const char* control;
};

constexpr Switch enabling = {"NVRHBA_BootBIOSService_Provider::EnableBootBIOS()",
                             "NVRHBA_BootBIOSService_Provider EnableBootBIOS invald fc port ...return",
                             "Entering NVRHBA_BootBIOSService_Provider::EnableBootBIOS(): nvrcimSetBootBiosState", "E"};
constexpr Switch disabling = {"NVRHBA_BootBIOSService_Provider::DisableBootBIOS()",
                              "NVRHBA_BootBIOSService_Provider DisableBooTBIOSinvald fc port ...return",
                              "Entering NVRHBA_BootBIOSService_Provider::DisableBootBIOS(): nvrcimSetBootBiosState",
                              "D"};

uint32 switchBootCode(const Switch& to, const Instance* self, const Instance* target)
{
    NVR_LOG("%s", to.entry);
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    HBA_WWN port = {};
    if (const uint32 refusal = checkCall(agent, self, target, to.no_target, port)) return refusal;
    NVR_LOG("%s", to.calling);
    if (const uint32 status = NVR_MethodWrapper::nvrcimSetBootBiosState(port, to.control)) {
        NVR_LOG("NVRHBA_BootBIOSService_Provider::nvrcimSetBootBiosState failed");
        return libraryAnswer(status);
    }
    NVR_LOG("NVRHBA_BootBIOSService_Provider::nvrcimSetBootBiosState O.K.");
    return ANSWER_DONE;
}

} // namespace

Enum_Instances_Status NVRHBA_BootBIOSService_Provider::enum_instances(const NVRHBA_BootBIOSService*,
                                                                      const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_BootBIOSService_map, handler);
    NVR_LOG("NVRHBA_BootBIOSService_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status NVRHBA_BootBIOSService_Provider::StartService(const Instance*, Property<uint32>& return_value)
{
    return answer(return_value, ANSWER_DONE);
}

Invoke_Method_Status NVRHBA_BootBIOSService_Provider::EnableBootBIOS(const Instance* self, const Instance* Target,
                                                                     Property<uint32>& return_value)
{
    return answer(return_value, switchBootCode(enabling, self, Target));
}

Invoke_Method_Status NVRHBA_BootBIOSService_Provider::DisableBootBIOS(const Instance* self, const Instance* Target,
                                                                      Property<uint32>& return_value)
{
    return answer(return_value, switchBootCode(disabling, self, Target));
}

Invoke_Method_Status NVRHBA_BootBIOSService_Provider::GetBootBIOSStatus(const Instance* self, const Instance* Target,
                                                                        Property<uint32>& nBootBIOSStatus,
                                                                        Property<uint32>& return_value)
{
    NVR_LOG("NVRHBA_BootBIOSService_Provider::GetBootBIOSStatus");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    HBA_WWN port = {};
    if (const uint32 refusal = checkCall(agent, self, Target,
                                         "NVRHBA_BootBIOSService_Provider GetBootBIOS invald fc port ...return", port))
        return answer(return_value, refusal);
    uint32 state = 0;
    if (const uint32 status = NVR_MethodWrapper::nvrcimGetBootBiosState(port, &state)) {
        NVR_LOG("NVRHBA_BootBIOSService_Provider::nvrcimGetBootBiosState failed");
        return answer(return_value, libraryAnswer(status));
    }
    nBootBIOSStatus.set(state);
    NVR_LOG("NVRHBA_BootBIOSService_Provider::GetBootBIOSStatus O.K.");
    return answer(return_value, ANSWER_DONE);
}

} // namespace cimple
