// Virtual ports and the virtual machines behind them.
#include "simulator/Call.h"
#include "simulator/Mapping.h"

using namespace nvrsim;

namespace {

const Virtual_Port* find(const Port& port, const HBA_WWN& name)
{
    for (const Virtual_Port& vport : port.vports)
        if (vport.wwpn == to_number(name)) return &vport;
    return nullptr;
}

template <class Match>
const Virtual_Port* find_anywhere(const Host& host, Match match)
{
    for (const Adapter& adapter : host.adapters)
        for (const Port& port : adapter.ports)
            for (const Virtual_Port& vport : port.vports)
                if (adapter.present && match(vport)) return &vport;
    return nullptr;
}

} // namespace

uint32_t nvrsim_RM_VPList(HBA_WWN wwn, void* list)
{
    return run_on_port(Call_Id::RM_VPList, wwn, [&](Call& call, Port& port) {
        if (!list) return RM_STATUS_ARGUMENT;
        auto* vports = static_cast<RM_VPORTLIST*>(list);
        const uint32_t capacity = vports->count;
        call.number(&vports->count, port.vports.size());
        if (capacity < port.vports.size()) return RM_STATUS_MORE_DATA;
        for (size_t i = 0; i < port.vports.size(); ++i) {
            const Virtual_Port& vport = port.vports[i];
            const RM_VPORTENTRY entry{to_wire(vport.wwpn), to_wire(vport.wwnn), vport.fcId, 0};
            call.bytes(vports->entry + i, &entry, sizeof entry);
        }
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_VPGetAttributes(HBA_WWN wwn, HBA_WWN vport, RM_VPORTATTRIBUTES* attributes)
{
    return run_on_port(Call_Id::RM_VPGetAttributes, wwn, [&](Call& call, Port& port) {
        if (!attributes || attributes->version != RM_VPORT_VERSION) return RM_STATUS_ARGUMENT;
        const Virtual_Port* found = find(port, vport);
        if (!found) return RM_STATUS_ILLEGAL_WWN;
        RM_VPORTATTRIBUTES record{};
        record.version = RM_VPORT_VERSION;
        record.wwpn = to_wire(found->wwpn);
        record.wwnn = to_wire(found->wwnn);
        call.field(record.name, found->name);
        record.portFcId = found->fcId;
        record.state = found->state;
        call.bytes(attributes, &record, sizeof record);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_VPListTargets(HBA_WWN wwn, HBA_WWN vport, void* list)
{
    return run_on_port(Call_Id::RM_VPListTargets, wwn, [&](Call& call, Port& port) -> uint32_t {
        if (!list) return RM_STATUS_ARGUMENT;
        if (!find(port, vport)) return RM_STATUS_ILLEGAL_WWN;
        auto* targets = static_cast<RM_TARGETLIST*>(list);
        Mapping_Writer writer(call, &targets->count, targets->entry);
        writer.add(port); // a virtual port sees what its physical port sees
        return writer.finish();
    });
}

uint32_t nvrsim_RM_GetVMFromVPort(HBA_WWN vport, void* list)
{
    return run<uint32_t>(Call_Id::RM_GetVMFromVPort, {}, 1, [&](Call& call) {
        if (!list) return RM_STATUS_ARGUMENT;
        const Virtual_Port* found =
            find_anywhere(call.simulator().host, [&](const Virtual_Port& one) { return one.wwpn == to_number(vport); });
        if (!found) return RM_STATUS_ILLEGAL_WWN;
        auto* machines = static_cast<RM_VMLIST*>(list);
        const uint32_t capacity = machines->count;
        call.number(&machines->count, found->machines.size());
        if (capacity < found->machines.size()) return RM_STATUS_MORE_DATA;
        for (size_t i = 0; i < found->machines.size(); ++i) {
            RM_VMNAME entry;
            call.field(entry.name, found->machines[i].identity);
            call.bytes(machines->entry + i, &entry, sizeof entry);
        }
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_GetVMInfo(const RM_VMNAME* name, RM_VMINFO* info)
{
    return run<uint32_t>(Call_Id::RM_GetVMInfo, {}, 1, [&](Call& call) {
        if (!name || !info) return RM_STATUS_ARGUMENT;
        const std::string wanted(name->name, ::strnlen(name->name, sizeof name->name));
        const Virtual_Machine* machine = nullptr;
        const Virtual_Port* owner = find_anywhere(call.simulator().host, [&](const Virtual_Port& vport) {
            for (const Virtual_Machine& one : vport.machines)
                if (one.identity == wanted) machine = &one;
            return machine != nullptr;
        });
        if (!owner) return RM_STATUS_ARGUMENT;
        RM_VMINFO record{};
        call.field(record.identity, machine->identity);
        call.field(record.virtualPort, to_text(owner->wwpn));
        call.field(record.serverName, machine->server);
        call.field(record.machineName, machine->name);
        call.field(record.guestOsName, machine->guestOs);
        record.memorySize = machine->memory;
        call.bytes(info, &record, sizeof record);
        return RM_STATUS_OK;
    });
}
