#include "services/NVRHBA_FCHBAWWNService_Provider.h"

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "foundation/CLogger.h"
#include "services/NVR_MethodWrapper.h"
#include "services/service_method.h"

namespace cimple {

namespace {

constexpr char who[] = "NVRHBA_FCHBAWWNService_Provider";
constexpr uint32 answer_no_name = 32969;
/// What WWNOperationStatus says while there is no code to tell.
constexpr uint16 no_status = 65535;

/// What all methods check first: 0, or the answer of a refused call. `port` becomes the target's name.
uint32 checkCall(ProviderAgent& agent, const Instance* self, const Instance* target, HBA_WWN& port)
{
    if (!isFirstService(agent.m_NVRHBA_FCHBAWWNService_map, self)) {
        NVR_LOG("Invalid instance of HBA WWN Management Service");
        return ANSWER_FOREIGN_INSTANCE;
    }
    if (!isKnownFCPort(agent, target)) {
        NVR_LOG("NVRHBA_FCHBAWWNService_Provider invald port ...return");
        return ANSWER_BAD_ARGUMENT;
    }
    return portName(port, deviceID(target), who) ? ANSWER_DONE : ANSWER_BAD_ARGUMENT;
}

/// Reads a name that the client gave: 0, or the answer of a refused call.
uint32 readName(HBA_WWN& name, const Property<String>& text, const char* missing)
{
    if (given(text).empty()) {
        NVR_LOG("%s", missing);
        return answer_no_name;
    }
    return portName(name, text.value.c_str(), who) ? ANSWER_DONE : ANSWER_BAD_ARGUMENT;
}

/// The words for a type, by its number; others are refused with `refusal`, which prints it.
template <std::size_t N>
bool logType(const char* const (&words)[N], uint16 type, const char* method)
{
    if (type < N)
        NVR_LOG("%s", words[type]);
    else
        NVR_LOG("%s: Type %d not recognized...", method, type);
    return type < N;
}

constexpr const char* change_types[] = {"Writing Volatile World Wide Name.", "Writing Non-Volatile World Wide Name."};
constexpr const char* restore_types[] = {"Restoring Factory Default World Wide Name...",
                                         "Restoring Non-volatile World Wide Name..."};
constexpr const char* read_types[] = {"Reading Volatile WWNs.", "Reading Non-Volatile WWNs.",
                                      "Reading Factory Default WWNs.", "Reading current WWNs.",
                                      "Reading configured WWNs."};

/// The port's names will not be what the maps say.
void askForRefresh(ProviderAgent& agent)
{
    agent.m_bAdapterRefreshPending.ask();
    agent.BuildCimpleInfo();
}

} // namespace

Enum_Instances_Status NVRHBA_FCHBAWWNService_Provider::enum_instances(const NVRHBA_FCHBAWWNService*,
                                                                      const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_FCHBAWWNService_map, handler);
    NVR_LOG("NVRHBA_FCHBAWWNService_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status NVRHBA_FCHBAWWNService_Provider::ChangeWWN(
    const Instance* self, const Instance* Target, const Property<String>& NewWWPN, const Property<String>& NewWWNN,
    const Property<uint16>& Type, Property<uint16>& WWNOperationStatus, Property<uint32>& return_value)
{
    NVR_LOG("Entering ChangeWWN");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    WWNOperationStatus.set(no_status);
    HBA_WWN port = {};
    HBA_WWN newWWPN = {};
    HBA_WWN newWWNN = {};
    if (const uint32 refusal = checkCall(agent, self, Target, port)) return answer(return_value, refusal);
    if (const uint32 refusal = readName(newWWPN, NewWWPN, "New WWPN has a null pointer"))
        return answer(return_value, refusal);
    if (const uint32 refusal = readName(newWWNN, NewWWNN, "New WWNN has a null pointer"))
        return answer(return_value, refusal);
    if (!logType(change_types, given(Type), "ChangeWWN")) return answer(return_value, ANSWER_BAD_ARGUMENT);
    const uint32 result = NVR_MethodWrapper::ChangeWWN(port, newWWPN, newWWNN, given(Type), WWNOperationStatus);
    if (result == ANSWER_DONE) {
        NVR_LOG("ChangeWWN operation completed. Please restart the CIMOM to use Norvane CIM provider");
        askForRefresh(agent);
    }
    return answer(return_value, result);
}

Invoke_Method_Status NVRHBA_FCHBAWWNService_Provider::RestoreWWN(const Instance* self, const Instance* Target,
                                                                 const Property<uint16>& Type,
                                                                 Property<uint16>& WWNOperationStatus,
                                                                 Property<uint32>& return_value)
{
    NVR_LOG("Entering RestoreWWN");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    WWNOperationStatus.set(no_status);
    HBA_WWN port = {};
    if (const uint32 refusal = checkCall(agent, self, Target, port)) return answer(return_value, refusal);
    if (!logType(restore_types, given(Type), "RestoreWWN")) return answer(return_value, ANSWER_BAD_ARGUMENT);
    const uint32 result = NVR_MethodWrapper::RestoreWWN(port, given(Type), WWNOperationStatus);
    if (result == ANSWER_DONE) askForRefresh(agent);
    return answer(return_value, result);
}

Invoke_Method_Status NVRHBA_FCHBAWWNService_Provider::ReadWWN(const Instance* self, const Instance* Target,
                                                              const Property<uint16>& Type, Property<String>& WWPN,
                                                              Property<String>& WWNN,
                                                              Property<uint16>& WWNOperationStatus,
                                                              Property<uint32>& return_value)
{
    NVR_LOG("Entering ReadWWN");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    WWNOperationStatus.set(no_status);
    HBA_WWN port = {};
    if (const uint32 refusal = checkCall(agent, self, Target, port)) return answer(return_value, refusal);
    if (!logType(read_types, given(Type), "ReadWWN")) return answer(return_value, ANSWER_BAD_ARGUMENT);
    return answer(return_value, NVR_MethodWrapper::ReadWWN(port, given(Type), WWPN, WWNN, WWNOperationStatus));
}

Invoke_Method_Status NVRHBA_FCHBAWWNService_Provider::GetWWNCapability(const Instance* self, const Instance* Target,
                                                                       Property<uint32>& WWNCapability,
                                                                       Property<uint32>& return_value)
{
    NVR_LOG("Entering GetWWNCapability");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    HBA_WWN port = {};
    if (const uint32 refusal = checkCall(agent, self, Target, port)) return answer(return_value, refusal);
    return answer(return_value, NVR_MethodWrapper::GetWWNCapability(port, WWNCapability));
}

} // namespace cimple
