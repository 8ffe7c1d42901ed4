// Management calls that change the adapter: names, reset, firmware, boot code, parameters, port state.
#include "simulator/Call.h"
#include "simulator/Firmware.h"
#include "simulator/Names.h"

#include <algorithm>
#include <cerrno>
#include <cstdlib>
#include <cstring>

using namespace nvrsim;

namespace {

bool is_possible(const HBA_WWN& wwn)
{
    // Naming authorities 1, 2, 5 and 6 are what ports use; the all-zero and all-ones names are none of them.
    const unsigned authority = wwn.wwn[0] >> 4;
    if (authority != 1 && authority != 2 && authority != 5 && authority != 6 && authority != 0xC) return false;
    return !std::all_of(std::begin(wwn.wwn), std::end(wwn.wwn), [&](uint8_t byte) { return byte == wwn.wwn[0]; });
}

uint32_t activation(const Port& port, bool isVolatile)
{
    if (port.wwnCapability & RM_WWN_NEEDS_REBOOT)
        return isVolatile ? RM_ACTIVATION_VOLATILE_REBOOT : RM_ACTIVATION_NONVOLATILE_REBOOT;
    return isVolatile ? RM_ACTIVATION_VOLATILE_RESET : RM_ACTIVATION_NONVOLATILE_RESET;
}

bool same(const Names& a, const Names& b)
{
    return a.wwpn == b.wwpn && a.wwnn == b.wwnn;
}

Driver_Param* find_param(std::vector<Driver_Param>& params, const std::string& name)
{
    const auto found =
        std::find_if(params.begin(), params.end(), [&](const Driver_Param& param) { return param.name == name; });
    return found == params.end() ? nullptr : &*found;
}

uint32_t write_params(Call& call, const std::vector<Driver_Param>& params, void* records, uint32_t* count)
{
    if (!records || !count) return RM_STATUS_ARGUMENT;
    uint32_t capacity;
    std::memcpy(&capacity, count, sizeof capacity);
    call.number(count, params.size());
    if (capacity < params.size()) return RM_STATUS_MORE_DATA;
    std::vector<RM_DRIVERPARAM> list(params.size());
    for (size_t i = 0; i < params.size(); ++i) {
        call.open_field(list[i].name, params[i].name);
        call.open_field(list[i].help, params[i].help);
        list[i].lowLimit = params[i].low;
        list[i].highLimit = params[i].high;
        list[i].defaultValue = params[i].defaultValue;
        list[i].currentValue = params[i].current;
        list[i].exportFlag = params[i].exportFlag;
        list[i].dynamic = params[i].dynamic;
    }
    call.bytes(records, list.data(), list.size() * sizeof(RM_DRIVERPARAM));
    return RM_STATUS_OK;
}

} // namespace

uint32_t nvrsim_RM_ValidateWwn(const HBA_WWN* wwn)
{
    return run<uint32_t>(Call_Id::RM_ValidateWwn, {}, 1, [&](Call&) {
        if (!wwn) return RM_STATUS_ARGUMENT;
        return is_possible(*wwn) ? RM_STATUS_OK : RM_STATUS_ILLEGAL_WWN;
    });
}

uint32_t nvrsim_RM_GetWWNCapability(HBA_WWN wwn, uint32_t* capability)
{
    return run_on_port(Call_Id::RM_GetWWNCapability, wwn, [&](Call& call, Port& port) {
        call.answer(capability, port.wwnCapability);
        return capability ? RM_STATUS_OK : RM_STATUS_ARGUMENT;
    });
}

uint32_t nvrsim_RM_ReadWWN(HBA_WWN wwn, uint32_t type, HBA_WWN* wwpn, HBA_WWN* wwnn, uint32_t* status)
{
    return run_on_port(Call_Id::RM_ReadWWN, wwn, [&](Call& call, Port& port) {
        if (!wwpn || !wwnn || !status) return RM_STATUS_ARGUMENT;
        Names names;
        uint32_t word = 0;
        switch (type) {
        case RM_WWN_VOLATILE:
            if (!(port.wwnCapability & RM_WWN_CAN_VOLATILE)) return RM_STATUS_WWN_NOT_SUPPORTED;
            names = port.volatileNames.value_or(Names());
            word = port.volatileNames ? RM_WWN_STATUS_VOLATILE_ACTIVE : RM_WWN_STATUS_NONE;
            break;
        case RM_WWN_NONVOLATILE:
            names = lasting_names(port);
            break;
        case RM_WWN_FACTORY:
            names = port.factory;
            break;
        case RM_WWN_CURRENT:
            names = port.current;
            word = port.volatileNames ? RM_WWN_STATUS_CURRENT_VOLATILE : RM_WWN_STATUS_CURRENT_NONVOLATILE;
            break;
        case RM_WWN_CONFIGURED:
            if (port.pending) names = port.pending->names;
            word = port.pending ? port.pending->activation : static_cast<uint32_t>(RM_WWN_STATUS_NONE);
            break;
        default:
            return RM_STATUS_ARGUMENT;
        }
        const HBA_WWN portName = to_wire(names.wwpn), nodeName = to_wire(names.wwnn);
        call.bytes(wwpn, &portName, sizeof portName);
        call.bytes(wwnn, &nodeName, sizeof nodeName);
        call.answer(status, word);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_ChangeWWN(HBA_WWN wwn, HBA_WWN newWwpn, HBA_WWN newWwnn, uint32_t type, uint32_t* code)
{
    return run_on_port(Call_Id::RM_ChangeWWN, wwn, [&](Call& call, Port& port) {
        if (!code || type > RM_WWN_NONVOLATILE) return RM_STATUS_ARGUMENT;
        if (port.wwnCapability & RM_WWN_READ_ONLY) return RM_STATUS_WWN_NOT_AVAILABLE;
        const bool isVolatile = type == RM_WWN_VOLATILE;
        if (!(port.wwnCapability & (isVolatile ? RM_WWN_CAN_VOLATILE : RM_WWN_CAN_NONVOLATILE)))
            return RM_STATUS_WWN_NOT_SUPPORTED;
        if (!is_possible(newWwpn) || !is_possible(newWwnn)) return RM_STATUS_ILLEGAL_WWN;
        port.pending =
            Pending_Names{{to_number(newWwpn), to_number(newWwnn)}, isVolatile, false, activation(port, isVolatile)};
        call.answer(code, port.pending->activation);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_RestoreWWN(HBA_WWN wwn, uint32_t type, uint32_t* code)
{
    return run_on_port(Call_Id::RM_RestoreWWN, wwn, [&](Call& call, Port& port) {
        if (!code || type > 1) return RM_STATUS_ARGUMENT;
        if (port.wwnCapability & RM_WWN_READ_ONLY) return RM_STATUS_WWN_NOT_AVAILABLE;
        const Names names = type == 0 ? port.factory : lasting_names(port);
        if (same(names, port.current) && !port.pending) {
            call.answer(code, RM_ACTIVATION_ALREADY_ACTIVE);
            return RM_STATUS_OK;
        }
        port.pending = Pending_Names{names, false, true, activation(port, false)};
        call.answer(code, port.pending->activation);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_ResetHBA(HBA_WWN wwn, uint32_t)
{
    return run_on_port(Call_Id::RM_ResetHBA, wwn, [&](Call& call, Port& port) {
        ++port.resets;
        if (!(port.wwnCapability & RM_WWN_NEEDS_REBOOT)) {
            activate_names(*call.adapter(), port);
            call.simulator().host.reindex();
        }
        if (port.resetMilliseconds) port.resettingUntil = monotonic_milliseconds() + port.resetMilliseconds;
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_SetPortEnabled(HBA_WWN wwn, uint32_t enable, uint8_t* code)
{
    return run_on_port(Call_Id::RM_SetPortEnabled, wwn, [&](Call& call, Port& port) {
        if (!code) return RM_STATUS_ARGUMENT;
        if (port.bootCode) return RM_STATUS_BOOT_CODE_ENABLED;
        port.enabled = enable != 0;
        call.answer(code, port.enableNeedsReset ? RM_PORT_ACTIVATION_RESET : 0);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_SetBootBiosState(HBA_WWN wwn, uint32_t enable)
{
    return run_on_port(Call_Id::RM_SetBootBiosState, wwn, [&](Call&, Port& port) {
        if (enable > 1) return RM_STATUS_ARGUMENT;
        port.bootCode = enable;
        port.adapterAttributes[RM_ATTR_BOOT_CODE_ENABLED] = encode32(enable);
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_ImportHBAFileA(const char* path)
{
    return run<uint32_t>(Call_Id::RM_ImportHBAFileA, {}, 1, [&](Call& call) {
        if (!path) return RM_STATUS_ARGUMENT;
        Firmware_Image image;
        const Firmware_Check check = read_firmware(path, image);
        if (check == Firmware_Check::unreadable) return RM_STATUS_DIRECTORY_NOT_OPENED;
        call.simulator().host.importedFirmware = path;
        return RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_VerifyFirmwareA(HBA_WWN, HBA_WWN wwn, const char* path)
{
    return run_on_port(Call_Id::RM_VerifyFirmwareA, wwn, [&](Call&, Port&) {
        Firmware_Image image;
        if (!path) return RM_STATUS_ARGUMENT;
        return read_firmware(path, image) == Firmware_Check::good ? RM_STATUS_OK : RM_STATUS_ERROR;
    });
}

uint32_t nvrsim_RM_DownloadFirmware(HBA_WWN wwn, const char* path, uint32_t)
{
    return run_on_port(Call_Id::RM_DownloadFirmware, wwn, [&](Call& call, Port& port) {
        Firmware_Image image;
        if (!path) return RM_STATUS_ARGUMENT;
        if (read_firmware(path, image) != Firmware_Check::good) return RM_STATUS_MAILBOX_FAILED;
        call.adapter()->firmwareVersion = image.version;
        port.adapterAttributes[RM_ATTR_ULP_FIRMWARE_VERSION] = image.version;
        port.adapterAttributes[RM_ATTR_SP_FIRMWARE_VERSION] = image.version;
        if (!port.flash.empty()) port.flash[0].version = image.version;
        return port.firmwareNeedsReboot ? RM_STATUS_REBOOT_NEEDED : RM_STATUS_OK;
    });
}

uint32_t nvrsim_RM_GetDriverParams(HBA_WWN wwn, void* records, uint32_t* count)
{
    return run_on_port(Call_Id::RM_GetDriverParams, wwn,
                       [&](Call& call, Port& port) { return write_params(call, port.params, records, count); });
}

uint32_t nvrsim_RM_GetDriverParamsGlobal(HBA_WWN wwn, void* records, uint32_t* count)
{
    return run_on_port(Call_Id::RM_GetDriverParamsGlobal, wwn, [&](Call& call, Port&) {
        return write_params(call, call.simulator().host.globalParams, records, count);
    });
}

uint32_t nvrsim_RM_SetDriverParam(HBA_WWN wwn, const char* assignment, uint32_t code)
{
    return run_on_port(Call_Id::RM_SetDriverParam, wwn, [&](Call& call, Port& port) {
        const char* equals = assignment ? std::strchr(assignment, '=') : nullptr;
        if (!equals || code > (RM_PARAM_PERMANENT | RM_PARAM_GLOBAL)) return RM_STATUS_ARGUMENT;
        const std::string name(assignment, equals);
        char* end = nullptr;
        errno = 0;
        const unsigned long long value = std::strtoull(equals + 1, &end, 0);
        if (end == equals + 1 || *end || errno) return RM_STATUS_ARGUMENT;
        Host& host = call.simulator().host;
        const bool isGlobal = code & RM_PARAM_GLOBAL;
        Driver_Param* known = find_param(isGlobal ? host.globalParams : port.params, name);
        if (!known || value < known->low || value > known->high) return RM_STATUS_ARGUMENT;
        const auto set = [&](Driver_Param* param) {
            if (!param) return;
            // What the driver takes up only at its next start shows as its lasting value until then.
            if (param->dynamic) param->current = static_cast<uint32_t>(value);
            if (code & RM_PARAM_PERMANENT) param->defaultValue = static_cast<uint32_t>(value);
        };
        set(known);
        if (isGlobal)
            for (Adapter& adapter : host.adapters)
                for (Port& other : adapter.ports)
                    set(find_param(other.params, name));
        return RM_STATUS_OK;
    });
}
