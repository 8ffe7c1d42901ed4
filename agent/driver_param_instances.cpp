#include "agent/driver_param_instances.h"

#include <new>

#include "agent/ProviderAgent.h"
#include "agent/associations.h"
#include "agent/instance_table.h"
#include "classes/NVRHBA_DriverParamGlobal.h"
#include "classes/NVRHBA_DriverParams.h"
#include "classes/NVRHBA_FCHBADriverParamService.h"
#include "classes/NVRHBA_FCPort.h"
#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"
#include "foundation/ask_again.h"
#include "foundation/management_binding.h"
#include "foundation/shared_operations.h"

namespace cimple {

namespace {

constexpr uint32 status_no_memory = 8;
constexpr uint32 most_records = 16 * 1024 * 1024 / sizeof(RM_DRIVERPARAM);

/// What both classes of parameters show of a record.
template <class T>
Ref<T> makeParam(const RM_DRIVERPARAM& record, std::size_t index, const String& id)
{
    auto param = make<T>();
    set(param->paramno, index);
    set(param->paramname, fieldText(record.name));
    set(param->lowRange, record.lowLimit);
    set(param->highRange, record.highLimit);
    set(param->current, record.currentValue);
    set(param->exportFlag, record.exportFlag);
    set(param->dynamic, record.dynamic);
    set(param->help, fieldText(record.help));
    set(param->InstanceID, id);
    return param;
}

Instance* portOf(const Map<NVRHBA_FCPort>& ports, const std::string& wwpn)
{
    for (std::size_t i = 0; i < ports.size(); i++)
        if (ports[i]->DeviceID.value == wwpn.c_str()) return ports[i];
    return nullptr;
}

void insertGlobal(ProviderAgent& agent, const RM_DRIVERPARAM& record, std::size_t index, const Instance* service)
{
    auto made = makeParam<NVRHBA_DriverParamGlobal>(record, index, text_of(fieldText(record.name)));
    set(made->glbl, record.defaultValue);
    const Instance* param = insert(agent.m_NVRHBA_DriverParamGlobal_map, made);
    if (service && !associate(agent, Link::GlobalDriverServiceElementSettingData, service, param)) throw Update_Ended();
}

void insertLocal(ProviderAgent& agent, const RM_DRIVERPARAM& record, std::size_t index, const Instance* service,
                 const Instance* port, const std::string& wwpn, const HBA_WWN& wwn)
{
    auto made = makeParam<NVRHBA_DriverParams>(record, index, driverParamID(wwpn, record));
    const HBA_UINT8* b = wwn.wwn;
    set(made->deviceID, text("%02x%02x%02x%02x%02x%02x%02x%02x", b[0], b[1], b[2], b[3], b[4], b[5], b[6], b[7]));
    set(made->def, record.defaultValue);
    const Instance* param = insert(agent.m_NVRHBA_DriverParams_map, made);
    if (service && !associate(agent, Link::DriverServiceElementSettingData, service, param)) throw Update_Ended();
    if (!port) {
        NVR_LOG("Data Structure is corrupted...");
        throw Update_Ended();
    }
    if (!associate(agent, Link::DriverParameterAffectsFCPort, port, param)) throw Update_Ended();
}

} // namespace

uint32 readDriverParams(const HBA_WWN& wwn, bool global, std::vector<RM_DRIVERPARAM>& records)
{
    bool first = true;
    const Asked asked =
        ask_again(records, RM_DRIVERPARAM_FIRST_COUNT, most_records, [&](RM_DRIVERPARAM* room, uint32* count) {
            const uint32 status =
                global ? RM_GetDriverParamsGlobal(wwn, room, count) : RM_GetDriverParams(wwn, room, count);
            if (first && global)
                NVR_LOG("RM_GetDriverParamsGlobal: status=%d", static_cast<int>(status));
            else if (first)
                NVR_LOG("RM_GetDriverParams: status=%d", static_cast<int>(status));
            first = false;
            return status;
        });
    if (asked.status == RM_STATUS_OK) return RM_STATUS_OK;
    const bool more = asked.status == RM_STATUS_MORE_DATA || asked.status == RM_STATUS_LIST_TOO_LONG;
    if (asked.calls == 0 || (asked.calls == 1 && more)) {
        NVR_LOG("ERROR: nvrcimGetDriverParamsGlobal: Unable to allocate buffer");
        return status_no_memory;
    }
    if (!global)
        NVR_LOG("RM_GetDriverParams:failed");
    else if (asked.calls == 1)
        NVR_LOG("ERROR: nvrcimGetDriverParamsGlobal: RM_GetDriverParamsGlobal call failed (b) (%d)",
                static_cast<int>(asked.status));
    else
        NVR_LOG("ERROR: nvrcimGetDriverParamsGlobal: RM_GetDriverParamsGlobal call failed (a) (%d)",
                static_cast<int>(asked.status));
    return asked.status;
}

String driverParamID(const std::string& wwpn, const RM_DRIVERPARAM& record)
{
    return text("%s:%s", wwpn.c_str(), fieldText(record.name).c_str());
}

uint32 nvrcimGetDriverParam(ProviderAgent& agent, const std::string& wwpn, bool global)
{
    NVR_LOG("NVR_MethodWrapper::nvrcimGetDriverParam()");
    HBA_WWN wwn = {};
    if (string2HBAName(&wwn, wwpn.c_str()) == 0) return RM_STATUS_ERROR;
    if (!isLocal(wwn)) return RM_STATUS_ERROR;
    std::vector<RM_DRIVERPARAM> records;
    if (const uint32 status = readDriverParams(wwn, global, records)) return status;
    if (global) NVR_LOG("number of driver parameters %d", static_cast<int>(records.size()));

    const auto& services = agent.m_NVRHBA_FCHBADriverParamService_map;
    const Instance* service = services.empty() ? nullptr : services[0];
    const Instance* port = global ? nullptr : portOf(agent.m_NVRHBA_FCPort_map, wwpn);
    try {
        for (std::size_t i = 0; i < records.size(); i++) {
            NVR_LOG("saving the values of driver parameter %d", static_cast<int>(i));
            try {
                if (global)
                    insertGlobal(agent, records[i], i, service);
                else
                    insertLocal(agent, records[i], i, service, port, wwpn, wwn);
            } catch (const std::bad_alloc&) {
                continue; // a record that cannot be made is left out
            }
        }
    } catch (const Update_Ended&) {
        return RM_STATUS_ERROR; // of this list alone: the update goes on
    }
    return RM_STATUS_OK;
}

} // namespace cimple
