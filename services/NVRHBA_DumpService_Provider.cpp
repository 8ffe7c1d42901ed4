#include "services/NVRHBA_DumpService_Provider.h"

#include <optional>
#include <string>

#include "agent/Agent_Wait.h"
#include "agent/enumerate.h"
#include "agent/instance_table.h"
#include "foundation/CLogger.h"
#include "foundation/Library_List.h"
#include "foundation/NVR_Common.h"
#include "services/NVR_MethodWrapper.h"
#include "services/service_method.h"

namespace cimple {

namespace {

constexpr sint32 whole_adapter = -1; // kind of dump

/// Why a method goes no further than its service and its Target; 0, and the port's name, if it does.
uint32 refusal(ProviderAgent& agent, const Instance* self, const Instance* target, HBA_WWN& port)
{
    if (!isAnyService(agent.m_NVRHBA_DumpService_map, self)) {
        NVR_LOG("Invalid instance of NVRHBA_DumpService");
        return ANSWER_FOREIGN_INSTANCE;
    }
    if (!target) {
        NVR_LOG("NVRHBA_DumpService invald port ...return");
        return ANSWER_BAD_ARGUMENT;
    }
    if (!isKnownFCPort(agent, target)) {
        NVR_LOG("NVRHBA_DumpService::Id2HBAName failed");
        return ANSWER_BAD_ARGUMENT;
    }
    return portName(port, deviceID(target), "NVRHBA_DumpService") ? ANSWER_DONE : ANSWER_BAD_ARGUMENT;
}

using Dump_List = Library_List<RM_DUMPLIST>;

uint32 askForNames(const HBA_WWN& port, Dump_List& list)
{
    NVR_LOG("Calling the Get Dump filenames method");
    return NVR_MethodWrapper::GetDumpFileNames(port, list.get());
}

/// Result 0, or the library's status; of a list that the library says is too long for memory, 191.
uint32 readNames(const HBA_WWN& port, Dump_List& list)
{
    const uint32 status = askForNames(port, list);
    if (status != RM_STATUS_LIST_TOO_LONG) return status;
    try {
        list = Dump_List(list.get()->count); // its count stays 0: the library knows its own answer
    } catch (const std::bad_alloc&) {
        return status;
    }
    return askForNames(port, list);
}

} // namespace

Enum_Instances_Status NVRHBA_DumpService_Provider::enum_instances(const NVRHBA_DumpService*,
                                                                  const Enum_Handler& handler)
{
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    enumeratePlain(agent, agent.m_NVRHBA_DumpService_map, handler);
    NVR_LOG("NVRHBA_DumpService_Provider::enum_instances()");
    return ENUM_INSTANCES_OK;
}

Invoke_Method_Status NVRHBA_DumpService_Provider::GenerateDump(const NVRHBA_DumpService* self, NVRHBA_FCPort*& Target,
                                                               Property<uint32>& return_value)
{
    NVR_LOG("Entering GenerateDump");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    HBA_WWN port = {};
    if (const uint32 refused = refusal(agent, self, Target, port)) return answer(return_value, refused);
    if (const uint32 status = NVR_MethodWrapper::nvrcimDumpDiagnostic(port, whole_adapter)) {
        NVR_LOG("NVRHBA_DumpService::nvrcimDumpDiagnostic failed");
        return answer(return_value, libraryAnswer(status));
    }
    NVR_LOG("NVRHBA_DumpService::nvrcimDumpDiagnostic Succesful");
    NVR_LOG("returning from NVRHBA_DumpService::GenerateDump");
    return answer(return_value, ANSWER_DONE);
}

Invoke_Method_Status NVRHBA_DumpService_Provider::GetDumpFileNames(const NVRHBA_DumpService* self,
                                                                   NVRHBA_FCPort*& Target,
                                                                   Property<Array<String>>& DumpFiles,
                                                                   Property<uint32>& return_value)
{
    NVR_LOG("Entering GetDumpFileNames");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    HBA_WWN port = {};
    if (const uint32 refused = refusal(agent, self, Target, port)) return answer(return_value, refused);
    std::optional<Dump_List> list;
    try {
        list.emplace(RM_DUMP_FIRST_COUNT);
    } catch (const std::bad_alloc&) {
        return answer(return_value, ANSWER_BAD_ARGUMENT);
    }
    list->get()->count = RM_DUMP_FIRST_COUNT;
    if (const uint32 status = readNames(port, *list)) {
        NVR_LOG("NVRHBA_DumpService::nvrcimGetDumpFileNames failed");
        return answer(return_value, libraryAnswer(status));
    }
    NVR_LOG("NVRHBA_DumpService::nvrcimGetDumpFileNames Succesful");
    NVR_LOG(" NumberOfEntries = %d", static_cast<int>(list->get()->count));
    Array<String> names;
    for (uint32 i = 0; i < list->size(); i++) {
        const std::string name = fieldText((*list)[i].name);
        names.append(text_of(name));
        NVR_LOG("Filenames = %s", name.c_str());
    }
    DumpFiles.set(names);
    NVR_LOG("NVRHBA GetDumpFileNames Succesful");
    return answer(return_value, ANSWER_DONE);
}

Invoke_Method_Status NVRHBA_DumpService_Provider::DeleteDump(const NVRHBA_DumpService* self, NVRHBA_FCPort*& Target,
                                                             Property<uint32>& return_value)
{
    NVR_LOG("Entering DeleteDump");
    ProviderAgent& agent = *ProviderAgent::GetInstance();
    const Agent_Wait wait(agent);
    HBA_WWN port = {};
    if (const uint32 refused = refusal(agent, self, Target, port)) return answer(return_value, refused);
    if (const uint32 status = NVR_MethodWrapper::nvrcimDeleteDumpFiles(port)) {
        NVR_LOG("NVRHBA_DumpService::nvrcimDeleteDumpFiles failed");
        return answer(return_value, libraryAnswer(status));
    }
    NVR_LOG("NVRHBA_DumpService::nvrcimDeleteDumpFiles Succesful");
    NVR_LOG("returning from NVRHBA_DumpService::DeleteDump");
    return answer(return_value, ANSWER_DONE);
}

} // namespace cimple
