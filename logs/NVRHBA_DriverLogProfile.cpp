#include "logs/NVRHBA_DriverLogProfile.h"

#include "agent/ProviderAgent.h"
#include "agent/associations.h"
#include "agent/instance_table.h"
#include "classes/NVRHBA_EnabledRecordLogCapabilities.h"
#include "classes/NVRHBA_FCDriverLogEntry.h"
#include "classes/NVRHBA_RecordLog.h"
#include "classes/NVRHBA_SoftwareIdentity.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "inventory/Adapter.h"
#include "inventory/AdapterAttributes.h"
#include "inventory/NVR_Data.h"
#include "logs/record_logs.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

/// The attributes of the first FC adapter, or null.
const FCAdapterAttributes* firstAdapter(const NVR_Data& inventory)
{
    for (Adapter* adapter : inventory.getAdapters()) {
        if (adapter->type() == Adapter::type_fc)
            return dynamic_cast<const FCAdapterAttributes*>(adapter->getAttributes());
        NVR_LOG("Skippping Adapter [%s] since it is not an FC Adapter", adapter->name().c_str());
    }
    return nullptr;
}

Ref<NVRHBA_RecordLog> makeLog(const ProviderAgent& agent)
{
    const String id = recordLogID(agent, Record_Log::driver);
    auto log = make<NVRHBA_RecordLog>();
    set(log->InstanceID, id);
    set(log->ElementName, id);
    set(log->MaxNumberOfRecords, agent.m_driverLogStore.capacity);
    set(log->CurrentNumberOfRecords, 0);
    set(log->LogState, 4);
    set(log->OverwritePolicy, 2);
    set(log->OperationalStatus, {static_cast<uint16>(CLogger::instance()->isEnabled() ? 2 : 10)});
    set(log->RequestedState, 2);
    set(log->EnabledState, 3);
    set(log->HealthState, 5);
    set(log->Name, "Driver logs for Norvane FC Provider");
    return log;
}

Ref<NVRHBA_EnabledRecordLogCapabilities> makeCapabilities()
{
    auto able = make<NVRHBA_EnabledRecordLogCapabilities>();
    set(able->InstanceID, "NVR:FC Driver Record Log Capabilities");
    set(able->RequestedStatesSupported, {2, 3, 11});
    set(able->ElementNameEditSupported, false);
    set(able->MaxElementNameLen, 0);
    return able;
}

const Instance* addLog(ProviderAgent& agent)
{
    auto log = madeOrLog("Failed to allocate memory to create NVRHBA_RecordLog", [&] { return makeLog(agent); });
    return log ? insertOrLog(agent.m_NVRHBA_RecordLog_map, Ref<Instance>(log.release())) : nullptr;
}

const Instance* addCapabilities(ProviderAgent& agent)
{
    auto able = madeOrLog("Failed to allocate memory to create NVRHBA_EnabledRecordLogCapabilities", makeCapabilities);
    return able ? insertOrLog(agent.m_NVRHBA_EnabledRecordLogCapabilities_map, Ref<Instance>(able.release())) : nullptr;
}

/// The identity under which the refresh published the driver, or null.
const Instance* driverIdentity(const ProviderAgent& agent, const FCAdapterAttributes& adapter)
{
    auto key = make<NVRHBA_SoftwareIdentity>();
    set(key->InstanceID,
        text("NVR FC HBA: Driver %s v%s", adapter._DriverName.c_str(), adapter._DriverVersion.c_str()));
    return agent.m_NVRHBA_SoftwareIdentity_map.lookup(key.get());
}

uint32 createClasses(ProviderAgent& agent)
{
    const FCAdapterAttributes* adapter = agent.m_pData ? firstAdapter(*agent.m_pData) : nullptr;
    if (!adapter) return 0;
    const Instance* log = addLog(agent);
    if (!log || !addCapabilities(agent)) return NVR_FAILURE;
    const Instance* identity = driverIdentity(agent, *adapter);
    if (!identity) {
        NVR_LOG("Missing Provider Software Identity");
        return NVR_FAILURE;
    }
    associate(agent, Link::ProviderUseOfLog, log, identity,
              text("%s uses log : %s", string_property(identity, "ElementName").c_str(),
                   string_property(log, "InstanceID").c_str())
                  .c_str());
    return 0;
}

} // namespace

uint32 NVRHBA_DriverLogProfile::CreateFCDriverLogClasses(ProviderAgent& agent)
{
    NVR_LOG("Enter CreateFCDriverLogClasses");
    uint32 status = NVR_FAILURE; // without memory too: the rest of the refresh goes on
    guarded([&] { status = createClasses(agent); });
    if (status != 0) return status;
    NVR_LOG("Exit CreateFCDriverLogClasses");
    return 0;
}

void NVRHBA_DriverLogProfile::ClearFCDriverLogClasses(ProviderAgent& agent)
{
    agent.m_NVRHBA_FCDriverLogEntry_map.clear();
}

} // namespace cimple
