#include "services/NVRHBA_FCHBADriverParamService_Provider.h"

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "foundation/CLogger.h"
#include "services/NVR_MethodWrapper.h"
#include "services/service_method.h"

namespace cimple {

namespace {

constexpr const char* provider = "NVRHBA_FCHBADriverParamService_Provider";

const char* textOrNull(const Property<String>& property)
{
    return property.null ? nullptr : property.value.c_str();
}

} // namespace

Enum_Instances_Status NVRHBA_FCHBADriverParamService_Provider::enum_instances(const NVRHBA_FCHBADriverParamService*,
                                                                              const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_FCHBADriverParamService_map, handler);
    NVR_LOG("NVRHBA_FCHBADriverParamService_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status NVRHBA_FCHBADriverParamService_Provider::StartService(const NVRHBA_FCHBADriverParamService*,
                                                                           Property<uint32>& return_value)
{
    return answer(return_value, ANSWER_DONE);
}

Invoke_Method_Status NVRHBA_FCHBADriverParamService_Provider::SetDriverParameter(
    const NVRHBA_FCHBADriverParamService* self, NVRHBA_FCPort*& Target, Property<boolean>& bPermanent,
    Property<boolean>& bGlobal, Property<String>& strParam, Property<String>& strValue, Property<uint32>& return_value)
{
    NVR_LOG("NVRHBA_FCHBADriverParamService_Provider::SetDriverParameter()");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    if (!isFirstService(agent.m_NVRHBA_FCHBADriverParamService_map, self)) {
        NVR_LOG("Invalid instance of HBA Driver Parameter Service");
        return answer(return_value, ANSWER_FOREIGN_INSTANCE);
    }
    if (!Target) {
        NVR_LOG("NVRHBA_FCHBADriverParamService_Provider SetDriverParameter invald fc port ...return");
        return answer(return_value, ANSWER_BAD_ARGUMENT);
    }
    if (!isKnownFCPort(agent, Target)) {
        NVR_LOG("NVRHBA_FCHBADriverParamService_Provider invald fc port ...return");
        return answer(return_value, ANSWER_BAD_ARGUMENT);
    }
    const char* id = deviceID(Target);
    NVR_LOG("%s", id);
    HBA_WWN port = {};
    if (!portName(port, id, provider)) return answer(return_value, ANSWER_BAD_ARGUMENT);

    NVR_LOG("Entering NVRHBA_FCHBADriverParamService_Provider::SetDriverParam(): nvrcimSetDriverParam");
    const uint32 status = NVR_MethodWrapper::nvrcimSetDriverParam(id, port, given(bGlobal), given(bPermanent),
                                                                  textOrNull(strParam), textOrNull(strValue));
    if (status != RM_STATUS_OK) {
        NVR_LOG("NVRHBA_FCHBADriverParamService_Provider::nvrcimSetDriverParam failed");
        return answer(return_value, libraryAnswer(status));
    }
    NVR_LOG("NVRHBA_FCHBADriverParamService_Provider::nvrcimSetDriverParam Succeeded");
    return answer(return_value, ANSWER_DONE);
}

} // namespace cimple
