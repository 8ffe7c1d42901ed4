// Management calls that read what the hardware is: attributes, statistics, product data, transceiver, registers, LUNs.
#include "simulator/Blocks.h"
#include "simulator/Call.h"
#include "simulator/Mapping.h"
#include "simulator/Scsi.h"

#include <algorithm>
#include <cstring>

using namespace nvrsim;

namespace {

constexpr uint32_t disabledState = 22;

uint32_t physical_state(const Port& port)
{
    return port.enabled ? port.state : disabledState;
}

const Target* target_of(const Port& port, const HBA_WWN& wwpn)
{
    return port.link_is_up() ? port.find_target(to_number(wwpn)) : nullptr;
}

uint32_t write_reply(Call& call, const Scsi_Reply& reply, void* response, uint32_t responseSize, void* sense,
                     uint32_t senseSize)
{
    call.bytes(response, reply.data.data(), std::min<size_t>(reply.data.size(), responseSize));
    call.bytes(sense, reply.sense.data(), std::min<size_t>(reply.sense.size(), senseSize));
    return reply.status;
}

struct Status_Text {
    uint32_t status;
    const char* text;
};

constexpr Status_Text statusTexts[] = {
    {RM_STATUS_OK, "Success"},
    {RM_STATUS_ERROR, "Error"},
    {RM_STATUS_NOT_SUPPORTED, "Not supported"},
    {3, "Invalid handle"},
    {RM_STATUS_ARGUMENT, "Invalid argument"},
    {RM_STATUS_ILLEGAL_WWN, "Unknown World Wide Name"},
    {RM_STATUS_MORE_DATA, "More data available"},
    {RM_STATUS_STALE_DATA, "Stale data"},
    {RM_STATUS_CHECK_CONDITION, "SCSI check condition"},
    {RM_STATUS_DIRECTORY_NOT_OPENED, "Directory cannot be opened"},
    {RM_STATUS_NO_RESULT_YET, "No result yet"},
    {RM_STATUS_TOO_MANY_REQUESTS, "Too many requests"},
    {RM_STATUS_DIAGNOSTICS_NOT_AVAILABLE, "Diagnostics not available"},
    {RM_STATUS_ADAPTER_BUSY, "Adapter busy"},
    {RM_STATUS_WWN_NOT_SUPPORTED, "World Wide Name type not supported"},
    {RM_STATUS_WWN_NOT_AVAILABLE, "World Wide Name management not available"},
    {RM_STATUS_WWN_BUSY, "World Wide Name management busy"},
    {RM_STATUS_HOST_NOT_SUPPORTED, "Not supported on this host"},
    {RM_STATUS_MAILBOX_FAILED, "Mailbox command failed"},
    {RM_STATUS_MAILBOX_TIMED_OUT, "Mailbox command timed out"},
    {RM_STATUS_MAILBOX_BUSY, "Mailbox busy"},
    {RM_STATUS_LIST_TOO_LONG, "Buffer too small for the list"},
    {RM_STATUS_BOOT_CODE_ENABLED, "Boot code is enabled"},
    {RM_STATUS_REBOOT_NEEDED, "Reboot needed to activate firmware"},
};

} // namespace

int32_t nvrsim_RM_InitLib()
{
    return run<int32_t>(Call_Id::RM_InitLib, {}, 1,
                        [](Call& call) { return call.simulator().error.empty() ? RM_STATUS_OK : RM_STATUS_ERROR; });
}

uint32_t nvrsim_RM_StatusString(uint32_t status, char* buffer, uint32_t size)
{
    return run<uint32_t>(Call_Id::RM_StatusString, {}, 1, [&](Call& call) {
        if (!buffer || !size) return RM_STATUS_ARGUMENT;
        const char* text = "";
        for (const Status_Text& row : statusTexts)
            if (row.status == status) text = row.text;
        call.text(buffer, size, text);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_GetHBAAttributes(HBA_WWN wwn, void* block, uint32_t* size)
{
    return run_on_port(Call_Id::RM_GetHBAAttributes, wwn, [&](Call& call, Port& port) {
        return call.block(build_block(port.adapterAttributes), block, size);
    });
}

uint32_t nvrsim_RM_GetPortAttributes(HBA_WWN wwn, void* block, uint32_t* size)
{
    return run_on_port(Call_Id::RM_GetPortAttributes, wwn, [&](Call& call, Port& port) {
        const HBA_WWN fabric = to_wire(port.link_is_up() && !port.loopbackPlug ? port.fabricName : 0);
        Attributes attributes = port.portAttributes; // the scenario's own stand
        attributes.emplace(RM_ATTR_PORT_STATE, encode32(physical_state(port)));
        attributes.emplace(RM_ATTR_PORT_CONDITION, encode32(physical_state(port)));
        attributes.emplace(RM_ATTR_LINK_STATE, encode32(port.loopbackPlug ? 20 : physical_state(port)));
        attributes.emplace(RM_ATTR_FABRIC_NAME, Bytes(reinterpret_cast<const char*>(fabric.wwn), sizeof fabric.wwn));
        return call.block(build_block(attributes), block, size);
    });
}

uint32_t nvrsim_RM_GetPortStatistics(HBA_WWN wwn, void* block, uint32_t* size)
{
    return run_on_port(Call_Id::RM_GetPortStatistics, wwn,
                       [&](Call& call, Port& port) { return call.block(build_block(port.statistics), block, size); });
}

void* nvrsim_RM_GetAttributeValue(void* block, uint16_t number, uint16_t* length, uint32_t* status)
{
    Subject subject;
    subject.number = number;
    try {
        Call call(Call_Id::RM_GetAttributeValue, subject);
        if (call.throws()) throw Library_Exception();
        if (call.is_absent()) return nullptr;
        uint32_t result = RM_STATUS_ERROR;
        uint16_t found = 0;
        void* value = nullptr;
        if (call.is_refused()) {
            result = static_cast<uint32_t>(call.status());
        } else if (block && length && status) {
            value = find_attribute(block, number, found);
            if (value) result = RM_STATUS_OK;
        }
        result = static_cast<uint32_t>(call.status_for(result));
        call.note_gift(bytes_gift);
        const void* const own = value;
        switch (call.damage()) {
        case Damage::null:
            value = nullptr;
            break;
        case Damage::ones:
            value = reinterpret_cast<void*>(UINTPTR_MAX);
            break;
        // Just outside: where a reader must not follow.
        case Damage::garbage:
            value = reinterpret_cast<void*>(reinterpret_cast<uintptr_t>(block) - 64);
            break;
        default:
            break;
        }
        call.note_change(value != own);
        if (length) {
            const auto told = static_cast<uint16_t>(call.count(found));
            std::memcpy(length, &told, sizeof told);
        }
        if (status) std::memcpy(status, &result, sizeof result);
        call.note(result);
        return value;
    } catch (const std::exception&) {
        return nullptr;
    }
}

uint32_t nvrsim_RM_GetDriverType(HBA_WWN wwn, uint32_t* type)
{
    return run_on_port(Call_Id::RM_GetDriverType, wwn, [&](Call& call, Port& port) {
        call.answer(type, port.driverType);
        return type ? RM_STATUS_OK : RM_STATUS_ARGUMENT;
    });
}

uint32_t nvrsim_RM_IsLocalHBA(HBA_WWN wwn, uint32_t* local)
{
    return run<uint32_t>(Call_Id::RM_IsLocalHBA, Subject::of_port(wwn), 1, [&](Call& call) {
        if (!local) return RM_STATUS_ARGUMENT;
        call.answer(local, call.port() && call.port()->local);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_GetNumberOfLocalAdapters()
{
    return run<uint32_t>(Call_Id::RM_GetNumberOfLocalAdapters, {}, 0, [](Call& call) -> uint64_t {
        uint64_t count = 0;
        for (const Adapter& adapter : call.simulator().host.adapters)
            if (adapter.present) count += adapter.ports.size();
        return call.count(count);
    });
}

uint32_t nvrsim_RM_GetLocalHBAInfo(const RM_LOCALINDEX* index, RM_LOCALHBAINFO* info)
{
    return run<uint32_t>(Call_Id::RM_GetLocalHBAInfo, {}, 1, [&](Call& call) -> uint32_t {
        if (!index || !info) return RM_STATUS_ARGUMENT;
        size_t wanted = index->index;
        for (const Adapter& adapter : call.simulator().host.adapters) {
            if (!adapter.present) continue;
            if (wanted >= adapter.ports.size()) {
                wanted -= adapter.ports.size();
                continue;
            }
            const Port& port = adapter.ports[wanted];
            RM_LOCALHBAINFO record{};
            record.wwpn = to_wire(port.current.wwpn);
            record.wwnn = to_wire(port.current.wwnn);
            call.field(record.adapterName, adapter.name);
            call.field(record.model, adapter.model);
            record.portIndex = port.index;
            call.bytes(info, &record, sizeof record);
            return RM_STATUS_OK;
        }
        return HBA_STATUS_ERROR_ILLEGAL_INDEX;
    });
}

uint32_t nvrsim_RM_GetVPD(HBA_WWN wwn, void* block, uint32_t* size)
{
    return run_on_port(Call_Id::RM_GetVPD, wwn, [&](Call& call, Port& port) -> uint32_t {
        if (!port.vpd) return RM_STATUS_NOT_SUPPORTED;
        return call.block(encode32(static_cast<uint32_t>(port.vpd->size())) + *port.vpd, block, size);
    });
}

uint32_t nvrsim_RM_GetNextVpdEntry(const void* block, RM_VPDCURSOR* cursor, uint32_t cursorSize, char* value,
                                   uint32_t valueSize)
{
    return run<uint32_t>(Call_Id::RM_GetNextVpdEntry, {}, 0, [&](Call& call) {
        if (!block || !cursor || cursorSize < RM_VPD_CURSOR_SIZE || !value || !valueSize) return 0u;
        uint32_t length;
        std::memcpy(&length, block, sizeof length);
        // A length that no block can have means damage; nothing behind the block is looked at.
        if (length > RM_VPD_SIZE - sizeof length || cursor->index >= RM_VPD_MAX_ENTRIES) return 0u;
        std::string tag, text;
        if (!vpd_entry(static_cast<const uint8_t*>(block) + sizeof length, length, cursor->index, tag, text)) return 0u;
        RM_VPDCURSOR next{{tag[0], tag[1]}, 0, static_cast<uint8_t>(cursor->index + 1)};
        call.bytes(cursor, &next, sizeof next);
        call.text(value, valueSize, text);
        return 1u;
    });
}

uint32_t nvrsim_RM_GetSffData(HBA_WWN wwn, void* data, uint32_t* size)
{
    return run_on_port(Call_Id::RM_GetSffData, wwn, [&](Call& call, Port& port) -> uint32_t {
        if (!port.sffA0) return RM_STATUS_NOT_SUPPORTED;
        return call.block(*port.sffA0 + port.sffA2.value_or(Bytes()), data, size);
    });
}

uint32_t nvrsim_RM_DiagReadPCIRegistersV2(HBA_WWN wwn, RM_PCIREGISTERS* registers)
{
    return run_on_port(Call_Id::RM_DiagReadPCIRegistersV2, wwn, [&](Call& call, Port& port) {
        if (!registers) return RM_STATUS_ARGUMENT;
        call.bytes(registers, port.pci.data(), std::min(port.pci.size(), sizeof *registers));
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_DiagGetLoadListParams(HBA_WWN wwn, RM_FLASHCONTENTS* contents)
{
    return run_on_port(Call_Id::RM_DiagGetLoadListParams, wwn, [&](Call& call, Port& port) {
        if (!contents) return RM_STATUS_ARGUMENT;
        auto record = std::make_unique<RM_FLASHCONTENTS>();
        std::memset(record.get(), 0, sizeof *record);
        size_t used = 0;
        for (const Flash_Image& image : port.flash) {
            RM_FLASHIMAGE& entry = record->image[used++];
            call.open_field(entry.name, image.name);
            call.open_field(entry.version, image.version);
            entry.type = image.type;
            entry.size = image.size;
        }
        record->image[used++].type = 0xFFFFFFFF;
        call.number(&record->count, used);
        call.bytes(contents, record.get(), sizeof *record);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_GetLunList(HBA_WWN host, HBA_WWN target, uint32_t, void* list)
{
    return run_on_port(Call_Id::RM_GetLunList, host, [&](Call& call, Port& port) {
        if (!list) return RM_STATUS_ARGUMENT;
        const Target* found = target_of(port, target);
        if (!found) return RM_STATUS_ILLEGAL_WWN;
        auto* lunList = static_cast<RM_LUNLIST*>(list);
        const uint32_t capacity = lunList->count;
        call.number(&lunList->count, found->luns.size());
        if (capacity < found->luns.size()) return RM_STATUS_MORE_DATA;
        Bytes entries;
        for (const Lun& lun : found->luns) {
            entries.append(lun.fcpLun.begin(), lun.fcpLun.end());
            entries += encode32(lun.number);
        }
        call.bytes(lunList->entry, entries.data(), entries.size());
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_GetLunAttributes(HBA_WWN host, HBA_WWN target, HBA_UINT64 lun, void* block, uint32_t* size)
{
    return run_on_port(Call_Id::RM_GetLunAttributes, host, [&](Call& call, Port& port) -> uint32_t {
        const Target* found = target_of(port, target);
        const Lun* unit = found ? found->find(static_cast<uint64_t>(lun)) : nullptr;
        if (!unit) return found ? HBA_STATUS_ERROR_INVALID_LUN : static_cast<uint32_t>(RM_STATUS_ILLEGAL_WWN);
        const Attributes attributes = {{RM_LUN_DEVICE_TYPE, encode32(unit->deviceType)},
                                       {RM_LUN_VENDOR, unit->vendor},
                                       {RM_LUN_PRODUCT, unit->product},
                                       {RM_LUN_REVISION, unit->revision},
                                       {RM_LUN_BLOCKS, encode64(unit->blocks)},
                                       {RM_LUN_BLOCK_SIZE, encode32(unit->blockSize)}};
        return call.block(build_block(attributes), block, size);
    });
}

uint32_t nvrsim_RM_ScsiInquiry(HBA_WWN host, HBA_WWN target, HBA_UINT64 lun, void* response, uint32_t responseSize,
                               void* sense, uint32_t senseSize)
{
    return run_on_port(Call_Id::RM_ScsiInquiry, host, [&](Call& call, Port& port) -> uint32_t {
        const Target* found = target_of(port, target);
        if (!found) return RM_STATUS_ILLEGAL_WWN;
        return write_reply(call, scsi_inquiry(found->find(static_cast<uint64_t>(lun)), false, 0), response,
                           responseSize, sense, senseSize);
    });
}

uint32_t nvrsim_RM_ScsiReadCapacity(HBA_WWN host, HBA_WWN target, HBA_UINT64 lun, void* response, uint32_t responseSize,
                                    void* sense, uint32_t senseSize)
{
    return run_on_port(Call_Id::RM_ScsiReadCapacity, host, [&](Call& call, Port& port) -> uint32_t {
        const Target* found = target_of(port, target);
        if (!found) return RM_STATUS_ILLEGAL_WWN;
        return write_reply(call, scsi_capacity(found->find(static_cast<uint64_t>(lun))), response, responseSize, sense,
                           senseSize);
    });
}

uint32_t nvrsim_RM_GetFcpTargetMapping(HBA_WWN wwn, void* list)
{
    return run_on_port(Call_Id::RM_GetFcpTargetMapping, wwn, [&](Call& call, Port& port) {
        if (!list) return static_cast<uint32_t>(RM_STATUS_ARGUMENT);
        auto* targets = static_cast<RM_TARGETLIST*>(list);
        Mapping_Writer writer(call, &targets->count, targets->entry);
        writer.add(port);
        return writer.finish();
    });
}
