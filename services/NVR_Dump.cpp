#include "services/NVR_Dump.h"

#include <new>

#include "agent/ProviderAgent.h"
#include "agent/associations.h"
#include "agent/instance_table.h"
#include "agent/library_name.h"
#include "classes/NVRHBA_DumpData.h"
#include "classes/NVRHBA_DumpService.h"
#include "classes/NVRHBA_ElementDumpData.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_PortController.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "services/NVR_MethodWrapper.h"

namespace cimple {

namespace {

constexpr uint32 status_not_made = 40008;

/// Associates two instances. Result 0, and the association, or why it came to nothing.
uint32 tie(ProviderAgent& agent, Link link, const Instance* first, const Instance* second, Instance** made = nullptr)
{
    const Link_Row& row = link_row(link);
    Ref<Instance> association = makeAssociationOrLog(agent, link, first, second);
    if (!association) return status_not_made;
    Instance* inserted = insertOrLog(row.map(agent), std::move(association), row.failure);
    if (made) *made = inserted;
    return inserted ? 0 : NVR_FAILURE;
}

/// The port's controller, which has its keys but for the class's name; or null.
const Instance* controllerOf(const ProviderAgent& agent, const NVRHBA_FCPort& port)
{
    auto key = make<NVRHBA_PortController>();
    key->SystemCreationClassName = port.SystemCreationClassName;
    key->SystemName = port.SystemName;
    set(key->CreationClassName, "NVRHBA_PortController");
    key->DeviceID = port.DeviceID;
    return agent.m_NVRHBA_PortController_map.lookup(key.get());
}

Ref<NVRHBA_DumpData> makeData(const NVRHBA_FCPort& port, const HBA_WWN& wwn)
{
    char directory[RM_DUMP_DIRECTORY_SIZE] = {};
    if (NVR_MethodWrapper::nvrcimGetDumpDirectory(wwn, directory) == 0)
        NVR_LOG("NVR_Dump::nvrcimGetDumpDirectory Succesful");
    else
        NVR_LOG("NVR_Dump::nvrcimGetDumpDirectory failed");
    uint32 count = 0;
    NVR_LOG("Calling NVR_Dump::nvrcimGetRetentionCount");
    const uint32 status = NVR_MethodWrapper::nvrcimGetRetentionCount(wwn, count);
    NVR_LOG("returned nvrcimGetRetentionCount call from wrapper");
    if (status == 0)
        NVR_LOG("NVR_Dump::nvrcimGetRetentionCount Succesful");
    else
        NVR_LOG("NVR_Dump::nvrcimGetRetentionCount failed");

    auto data = makeOrLog<NVRHBA_DumpData>("Failed to create NVRHBA_DumpData for fc port");
    if (!data) return data;
    set(data->InstanceID, text("NVRHBA_DumpData::%s", port.DeviceID.value.c_str()));
    set(data->ElementName, port.DeviceID.value);
    set(data->RetentionCount, count);
    set(data->DumpDirectory, fieldText(directory));
    return data;
}

uint32 createForPort(ProviderAgent& agent, const NVRHBA_FCPort& port, const Instance* service)
{
    const Instance* controller = controllerOf(agent, port);
    if (const uint32 status = tie(agent, Link::DumpServiceAffectsElement, controller, service)) return status;

    HBA_WWN wwn = {};
    if (!library_name(wwn, port.DeviceID.value.c_str(), "NVR_Dump::Id2HBAName failed", "NVR_Dump::str2HBAName failed"))
        return NVR_FAILURE;
    auto made = makeData(port, wwn);
    if (!made) return status_not_made;
    const Instance* data = insertOrLog(agent.m_NVRHBA_DumpData_map, Ref<Instance>(made.release()));
    if (!data) return NVR_FAILURE;

    Instance* link = nullptr;
    if (const uint32 status = tie(agent, Link::ElementDumpData, service, data, &link)) return status;
    set(static_cast<NVRHBA_ElementDumpData*>(link)->IsDefault, 1);
    return 0;
}

uint32 createClasses(ProviderAgent& agent)
{
    const auto& hosts = agent.m_CIM_ComputerSystem_map;
    const Instance* host = hosts.empty() ? nullptr : static_cast<const Instance_Map&>(hosts)[0];

    auto made = makeOrLog<NVRHBA_DumpService>("Failed to create NVRHBA_DumpService");
    if (!made) return status_not_made;
    if (host) {
        set(made->SystemCreationClassName, string_property(host, "CreationClassName"));
        set(made->SystemName, string_property(host, "Name"));
    }
    set(made->Name, "NVRHBA_DumpService");
    set(made->CreationClassName, "NVRHBA_DumpService");
    const Instance* service = insertOrLog(agent.m_NVRHBA_DumpService_map, Ref<Instance>(made.release()));
    if (!service) return NVR_FAILURE;

    if (const uint32 status = tie(agent, Link::HostedDumpService, host, service)) return status;

    const auto& ports = agent.m_NVRHBA_FCPort_map;
    for (std::size_t i = 0; i < ports.size(); i++)
        if (const uint32 status = createForPort(agent, *ports[i], service)) return status;
    return 0;
}

} // namespace

uint32 NVR_Dump::FC_CreateDumpClasses(ProviderAgent& agent)
{
    NVR_LOG("Entered FC_CreateDumpClasses");
    try {
        return createClasses(agent);
    } catch (const std::bad_alloc&) {
        return status_not_made;
    }
}

uint32 NVR_Dump::FC_ClearDumpClasses(ProviderAgent& agent)
{
    NVR_LOG("Entered FC_ClearDumpClasses");
    agent.m_NVRHBA_DumpService_map.clear();
    agent.m_NVRHBA_HostedDumpService_map.clear();
    agent.m_NVRHBA_DumpServiceAffectsElement_map.clear();
    agent.m_NVRHBA_DumpData_map.clear();
    agent.m_NVRHBA_ElementDumpData_map.clear();
    return 0;
}

} // namespace cimple
