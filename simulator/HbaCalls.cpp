// The Common HBA API over the simulated host.
#include "simulator/Call.h"
#include "simulator/Defaults.h"
#include "simulator/Events.h"
#include "simulator/Mapping.h"
#include "simulator/Scsi.h"

#include <algorithm>
#include <cstring>

using namespace nvrsim;

namespace {

constexpr size_t adapterNameSize = 256;

void fill_port(Call& call, const Adapter&, const Port& port, HBA_PORTATTRIBUTES& record)
{
    std::memset(&record, 0, sizeof record);
    record.NodeWWN = to_wire(port.current.wwnn);
    record.PortWWN = to_wire(port.current.wwpn);
    record.PortFcId = port.link_is_up() ? port.fcId : 0;
    record.PortType = port.type;
    record.PortState = port.enabled ? port.state : static_cast<uint32_t>(HBA_PORTSTATE_OFFLINE);
    record.PortSupportedClassofService = port.classOfService;
    std::copy(port.supportedFc4.begin(), port.supportedFc4.end(), record.PortSupportedFc4Types.bits);
    std::copy(port.activeFc4.begin(), port.activeFc4.end(), record.PortActiveFc4Types.bits);
    call.field(record.PortSymbolicName, port.symbolicName);
    call.field(record.OSDeviceName, port.osDeviceName);
    record.PortSupportedSpeed = port.supportedSpeed;
    record.PortSpeed = port.link_is_up() ? port.speed : static_cast<uint32_t>(HBA_PORTSPEED_UNKNOWN);
    record.PortMaxFrameSize = port.maxFrameSize;
    record.FabricName = to_wire(port.link_is_up() ? port.fabricName : 0);
    record.NumberofDiscoveredPorts =
        port.discoveredPorts ? *port.discoveredPorts : static_cast<uint32_t>(visible_targets(port));
}

void fill_target_port(Call& call, const Port& port, const Target& target, HBA_PORTATTRIBUTES& record)
{
    std::memset(&record, 0, sizeof record);
    record.NodeWWN = to_wire(target.wwnn);
    record.PortWWN = to_wire(target.wwpn);
    record.PortFcId = target.fcId;
    record.PortType = HBA_PORTTYPE_NPORT;
    record.PortState = HBA_PORTSTATE_ONLINE;
    record.PortSupportedClassofService = port.classOfService;
    record.PortMaxFrameSize = port.maxFrameSize;
    record.FabricName = to_wire(port.fabricName);
    call.field(record.PortSymbolicName, target.name);
}

/// Response and sense, cut to the caller's buffers.
uint32_t reply(Call& call, const Scsi_Reply& answer, void* response, uint32_t* responseSize, void* sense,
               uint32_t* senseSize)
{
    const auto fits = [&call](const Bytes& data, void* target, uint32_t* size) {
        const uint32_t used = static_cast<uint32_t>(std::min<size_t>(data.size(), *size));
        call.bytes(target, data.data(), used);
        call.number(size, used);
    };
    fits(answer.data, response, responseSize);
    fits(answer.sense, sense, senseSize);
    return answer.status;
}

/// Finds the target that a command goes to; any port of the adapter may see it, since a handle stands for all of them.
uint32_t send(Call& call, Adapter& adapter, const HBA_WWN& through, const HBA_WWN& to, HBA_UINT64 lun,
              Scsi_Command command, bool vitalProductData, uint32_t page, void* response, uint32_t* responseSize,
              void* sense, uint32_t* senseSize)
{
    const Wwn from = to_number(through);
    for (const Port& port : adapter.ports) {
        if (from && port.current.wwpn != from) continue;
        if (!port.link_is_up()) continue;
        const Target* target = port.find_target(to_number(to));
        if (!target) continue;
        const Lun* unit = target->find(static_cast<uint64_t>(lun));
        return reply(
            call, command == Scsi_Command::inquiry ? scsi_inquiry(unit, vitalProductData, page) : scsi_capacity(unit),
            response, responseSize, sense, senseSize);
    }
    return HBA_STATUS_ERROR_ILLEGAL_WWN;
}

} // namespace

HBA_UINT32 nvrsim_HBA_GetVersion()
{
    return run<uint32_t>(Call_Id::HBA_GetVersion, {}, 0, [](Call&) { return 2u; });
}

HBA_STATUS nvrsim_HBA_LoadLibrary()
{
    return run<uint32_t>(Call_Id::HBA_LoadLibrary, {}, 1, [](Call&) { return HBA_STATUS_OK; });
}

HBA_STATUS nvrsim_HBA_FreeLibrary()
{
    return run<uint32_t>(Call_Id::HBA_FreeLibrary, {}, 1, [](Call&) { return HBA_STATUS_OK; });
}

HBA_UINT32 nvrsim_HBA_GetNumberOfAdapters()
{
    return run<uint32_t>(Call_Id::HBA_GetNumberOfAdapters, {}, 0,
                         [](Call& call) -> uint64_t { return call.count(call.simulator().count_present()); });
}

HBA_STATUS nvrsim_HBA_GetAdapterName(HBA_UINT32 index, char* name)
{
    return run<uint32_t>(Call_Id::HBA_GetAdapterName, Subject::of_index(index), 1, [&](Call& call) {
        if (!call.adapter()) return HBA_STATUS_ERROR_ILLEGAL_INDEX;
        if (!name) return HBA_STATUS_ERROR_ARG;
        call.text(name, adapterNameSize, call.adapter()->name);
        return HBA_STATUS_OK;
    });
}

HBA_HANDLE nvrsim_HBA_OpenAdapter(char* name)
{
    return run<uint32_t>(Call_Id::HBA_OpenAdapter, Subject::of_name(name), 1, [](Call& call) -> uint32_t {
        if (!call.adapter() || !call.adapter()->present || call.keeps_handle()) return HBA_HANDLE_INVALID;
        return call.simulator().open(call.adapter()->name, false);
    });
}

HBA_STATUS nvrsim_HBA_OpenAdapterByWWN(HBA_HANDLE* handle, HBA_WWN wwn)
{
    return run<uint32_t>(Call_Id::HBA_OpenAdapterByWWN, {}, 1, [&](Call& call) {
        if (!handle) return HBA_STATUS_ERROR_ARG;
        const Wwn wanted = to_number(wwn);
        for (Adapter& adapter : call.simulator().host.adapters) {
            if (!adapter.present) continue;
            bool found = adapter.nodeWwn == wanted;
            for (const Port& port : adapter.ports)
                found = found || port.current.wwpn == wanted || port.current.wwnn == wanted;
            if (!found) continue;
            call.answer(handle, call.simulator().open(adapter.name, false));
            return HBA_STATUS_OK;
        }
        return HBA_STATUS_ERROR_ILLEGAL_WWN;
    });
}

void nvrsim_HBA_CloseAdapter(HBA_HANDLE handle)
{
    run<uint32_t>(Call_Id::HBA_CloseAdapter, Subject::of_handle(handle), 0, [&](Call& call) {
        if (call.adapter()) call.simulator().handles.erase(handle);
        return HBA_STATUS_OK;
    });
}

HBA_STATUS nvrsim_HBA_GetAdapterAttributes(HBA_HANDLE handle, HBA_ADAPTERATTRIBUTES* attributes)
{
    return run_on_adapter(
        Call_Id::HBA_GetAdapterAttributes, Subject::of_handle(handle), [&](Call& call, Adapter& adapter) {
            HBA_ADAPTERATTRIBUTES record;
            std::memset(&record, 0, sizeof record);
            call.field(record.Manufacturer, adapter.manufacturer);
            call.field(record.SerialNumber, adapter.serialNumber);
            call.field(record.Model, adapter.model);
            call.field(record.ModelDescription, adapter.modelDescription);
            record.NodeWWN = to_wire(adapter.nodeWwn);
            call.field(record.NodeSymbolicName, adapter.nodeSymbolicName);
            call.field(record.HardwareVersion, adapter.hardwareVersion);
            call.field(record.DriverVersion, adapter.driverVersion);
            call.field(record.OptionROMVersion, adapter.optionRomVersion);
            call.field(record.FirmwareVersion, adapter.firmwareVersion);
            record.VendorSpecificID = adapter.vendorSpecificId;
            call.number(&record.NumberOfPorts, adapter.numberOfPorts ? *adapter.numberOfPorts : adapter.ports.size());
            call.field(record.DriverName, adapter.driverName);
            if (!attributes) return HBA_STATUS_ERROR_ARG;
            call.bytes(attributes, &record, sizeof record);
            return HBA_STATUS_OK;
        });
}

HBA_STATUS nvrsim_HBA_GetAdapterPortAttributes(HBA_HANDLE handle, HBA_UINT32 portIndex, HBA_PORTATTRIBUTES* attributes)
{
    return run_on_adapter(Call_Id::HBA_GetAdapterPortAttributes, Subject::of_adapter_port(handle, portIndex),
                          [&](Call& call, Adapter& adapter) {
                              if (!call.port()) return HBA_STATUS_ERROR_ILLEGAL_INDEX;
                              if (!attributes) return HBA_STATUS_ERROR_ARG;
                              HBA_PORTATTRIBUTES record;
                              fill_port(call, adapter, *call.port(), record);
                              call.bytes(attributes, &record, sizeof record);
                              return HBA_STATUS_OK;
                          });
}

HBA_STATUS nvrsim_HBA_GetPortAttributesByWWN(HBA_HANDLE handle, HBA_WWN portWwn, HBA_PORTATTRIBUTES* attributes)
{
    return run_on_adapter(Call_Id::HBA_GetPortAttributesByWWN, Subject::of_handle(handle),
                          [&](Call& call, Adapter& adapter) {
                              if (!attributes) return HBA_STATUS_ERROR_ARG;
                              HBA_PORTATTRIBUTES record;
                              const Wwn wanted = to_number(portWwn);
                              for (const Port& port : adapter.ports) {
                                  const Target* target = port.find_target(wanted);
                                  if (port.current.wwpn == wanted)
                                      fill_port(call, adapter, port, record);
                                  else if (target && port.link_is_up())
                                      fill_target_port(call, port, *target, record);
                                  else
                                      continue;
                                  call.bytes(attributes, &record, sizeof record);
                                  return HBA_STATUS_OK;
                              }
                              return HBA_STATUS_ERROR_ILLEGAL_WWN;
                          });
}

HBA_STATUS nvrsim_HBA_GetDiscoveredPortAttributes(HBA_HANDLE handle, HBA_UINT32 portIndex, HBA_UINT32 discovered,
                                                  HBA_PORTATTRIBUTES* attributes)
{
    return run_on_adapter(Call_Id::HBA_GetDiscoveredPortAttributes, Subject::of_adapter_port(handle, portIndex),
                          [&](Call& call, Adapter&) {
                              if (!call.port() || discovered >= visible_targets(*call.port()))
                                  return HBA_STATUS_ERROR_ILLEGAL_INDEX;
                              if (!attributes) return HBA_STATUS_ERROR_ARG;
                              HBA_PORTATTRIBUTES record;
                              fill_target_port(call, *call.port(), *call.port()->targets[discovered], record);
                              call.bytes(attributes, &record, sizeof record);
                              return HBA_STATUS_OK;
                          });
}

HBA_STATUS nvrsim_HBA_GetPortStatistics(HBA_HANDLE handle, HBA_UINT32 portIndex, HBA_PORTSTATISTICS* statistics)
{
    return run_on_adapter(
        Call_Id::HBA_GetPortStatistics, Subject::of_adapter_port(handle, portIndex), [&](Call& call, Adapter&) {
            if (!call.port()) return HBA_STATUS_ERROR_ILLEGAL_INDEX;
            if (!statistics) return HBA_STATUS_ERROR_ARG;
            const auto counter = [&](uint16_t number) -> HBA_INT64 {
                const auto found = call.port()->statistics.find(number);
                HBA_INT64 value = -1; // not counted
                if (found != call.port()->statistics.end() && found->second && found->second->size() == sizeof value)
                    std::memcpy(&value, found->second->data(), sizeof value);
                return value;
            };
            const HBA_PORTSTATISTICS record = {counter(RM_STAT_SECONDS_SINCE_RESET),
                                               counter(RM_STAT_TX_FRAMES),
                                               counter(RM_STAT_TX_WORDS),
                                               counter(RM_STAT_RX_FRAMES),
                                               counter(RM_STAT_RX_WORDS),
                                               counter(RM_STAT_LIP_COUNT),
                                               counter(RM_STAT_NOS_COUNT),
                                               counter(RM_STAT_ERROR_FRAMES),
                                               counter(RM_STAT_DUMPED_FRAMES),
                                               counter(RM_STAT_LINK_FAILURES),
                                               counter(RM_STAT_LOSS_OF_SYNC),
                                               counter(RM_STAT_LOSS_OF_SIGNAL),
                                               counter(RM_STAT_PRIMITIVE_SEQUENCE_ERRORS),
                                               counter(RM_STAT_INVALID_TX_WORDS),
                                               counter(RM_STAT_CRC_ERRORS)};
            call.bytes(statistics, &record, sizeof record);
            return HBA_STATUS_OK;
        });
}

void nvrsim_HBA_RefreshInformation(HBA_HANDLE handle)
{
    run<uint32_t>(Call_Id::HBA_RefreshInformation, Subject::of_handle(handle), 0, [](Call& call) {
        ++call.simulator().refreshes;
        return HBA_STATUS_OK;
    });
}

void nvrsim_HBA_RefreshAdapterConfiguration()
{
    run<uint32_t>(Call_Id::HBA_RefreshAdapterConfiguration, {}, 0, [](Call&) { return HBA_STATUS_OK; });
}

void nvrsim_HBA_ResetStatistics(HBA_HANDLE handle, HBA_UINT32 portIndex)
{
    run<uint32_t>(Call_Id::HBA_ResetStatistics, Subject::of_adapter_port(handle, portIndex), 0, [](Call& call) {
        if (call.port())
            for (auto& [number, value] : call.port()->statistics)
                if (value) value = encode64(0);
        return HBA_STATUS_OK;
    });
}

HBA_STATUS nvrsim_HBA_GetFcpTargetMapping(HBA_HANDLE handle, HBA_FCPTARGETMAPPING* mapping)
{
    return run_on_adapter(Call_Id::HBA_GetFcpTargetMapping, Subject::of_handle(handle),
                          [&](Call& call, Adapter& adapter) {
                              if (!mapping) return static_cast<uint32_t>(HBA_STATUS_ERROR_ARG);
                              Mapping_Writer writer(call, &mapping->NumberOfEntries, mapping->entry);
                              for (const Port& port : adapter.ports)
                                  writer.add(port);
                              return writer.finish();
                          });
}

HBA_STATUS nvrsim_HBA_GetFcpTargetMappingV2(HBA_HANDLE handle, HBA_WWN portWwn, HBA_FCPTARGETMAPPINGV2* mapping)
{
    return run_on_adapter(Call_Id::HBA_GetFcpTargetMappingV2, Subject::of_handle(handle),
                          [&](Call& call, Adapter& adapter) {
                              if (!mapping) return static_cast<uint32_t>(HBA_STATUS_ERROR_ARG);
                              for (const Port& port : adapter.ports) {
                                  if (port.current.wwpn != to_number(portWwn)) continue;
                                  Mapping_Writer writer(call, &mapping->NumberOfEntries, mapping->entry);
                                  writer.add(port);
                                  return writer.finish();
                              }
                              return static_cast<uint32_t>(HBA_STATUS_ERROR_ILLEGAL_WWN);
                          });
}

HBA_STATUS nvrsim_HBA_SendScsiInquiry(HBA_HANDLE handle, HBA_WWN portWwn, HBA_UINT64 lun, HBA_UINT8 evpd,
                                      HBA_UINT32 pageCode, void* response, HBA_UINT32 responseSize, void* sense,
                                      HBA_UINT32 senseSize)
{
    Subject subject = Subject::of_handle(handle);
    subject.number = pageCode;
    return run_on_adapter(Call_Id::HBA_SendScsiInquiry, subject, [&](Call& call, Adapter& adapter) {
        return send(call, adapter, HBA_WWN{}, portWwn, lun, Scsi_Command::inquiry, evpd != 0, pageCode, response,
                    &responseSize, sense, &senseSize);
    });
}

HBA_STATUS nvrsim_HBA_SendReadCapacity(HBA_HANDLE handle, HBA_WWN portWwn, HBA_UINT64 lun, void* response,
                                       HBA_UINT32 responseSize, void* sense, HBA_UINT32 senseSize)
{
    return run_on_adapter(Call_Id::HBA_SendReadCapacity, Subject::of_handle(handle), [&](Call& call, Adapter& adapter) {
        return send(call, adapter, HBA_WWN{}, portWwn, lun, Scsi_Command::capacity, false, 0, response, &responseSize,
                    sense, &senseSize);
    });
}

HBA_STATUS nvrsim_HBA_ScsiInquiryV2(HBA_HANDLE handle, HBA_WWN portWwn, HBA_WWN target, HBA_UINT64 lun, HBA_UINT8 cdb1,
                                    HBA_UINT8 cdb2, void* response, HBA_UINT32* responseSize, HBA_UINT8* scsiStatus,
                                    void* sense, HBA_UINT32* senseSize)
{
    Subject subject = Subject::of_handle(handle);
    subject.number = cdb2;
    return run_on_adapter(Call_Id::HBA_ScsiInquiryV2, subject, [&](Call& call, Adapter& adapter) -> uint32_t {
        if (!responseSize || !senseSize || !scsiStatus) return HBA_STATUS_ERROR_ARG;
        const uint32_t status = send(call, adapter, portWwn, target, lun, Scsi_Command::inquiry, cdb1 & 1, cdb2,
                                     response, responseSize, sense, senseSize);
        *scsiStatus = status == HBA_STATUS_SCSI_CHECK_CONDITION ? 2 : 0;
        return status;
    });
}

HBA_STATUS nvrsim_HBA_ScsiReadCapacityV2(HBA_HANDLE handle, HBA_WWN portWwn, HBA_WWN target, HBA_UINT64 lun,
                                         void* response, HBA_UINT32* responseSize, HBA_UINT8* scsiStatus, void* sense,
                                         HBA_UINT32* senseSize)
{
    return run_on_adapter(Call_Id::HBA_ScsiReadCapacityV2, Subject::of_handle(handle),
                          [&](Call& call, Adapter& adapter) -> uint32_t {
                              if (!responseSize || !senseSize || !scsiStatus) return HBA_STATUS_ERROR_ARG;
                              const uint32_t status = send(call, adapter, portWwn, target, lun, Scsi_Command::capacity,
                                                           false, 0, response, responseSize, sense, senseSize);
                              *scsiStatus = status == HBA_STATUS_SCSI_CHECK_CONDITION ? 2 : 0;
                              return status;
                          });
}

HBA_STATUS nvrsim_HBA_RegisterForAdapterPortEvents(NVR_PORT_EVENT_CALLBACK* callback, void* userData, HBA_HANDLE handle,
                                                   HBA_WWN portWwn, HBA_CALLBACKHANDLE* callbackHandle)
{
    return run_on_adapter(Call_Id::HBA_RegisterForAdapterPortEvents, Subject::of_handle(handle),
                          [&](Call&, Adapter& adapter) {
                              if (!callback || !callbackHandle) return HBA_STATUS_ERROR_ARG;
                              const Wwn wanted = to_number(portWwn);
                              for (const Port& port : adapter.ports)
                                  if (port.current.wwpn == wanted) {
                                      *callbackHandle = Events::instance().add(callback, userData, wanted);
                                      return HBA_STATUS_OK;
                                  }
                              return HBA_STATUS_ERROR_ILLEGAL_WWN;
                          });
}

HBA_STATUS nvrsim_HBA_RemoveCallback(HBA_CALLBACKHANDLE callbackHandle)
{
    // The wait for a running callback must not hold the simulator's lock: the callback may call in.
    const uint32_t status = run<uint32_t>(Call_Id::HBA_RemoveCallback, {}, 1, [&](Call&) {
        return Events::instance().knows(callbackHandle) ? HBA_STATUS_OK : HBA_STATUS_ERROR_INVALID_HANDLE;
    });
    if (status == HBA_STATUS_OK) Events::instance().remove(callbackHandle);
    return status;
}

HBA_UINT32 nvrsim_HBA_GetVendorLibraryAttributes(HBA_LIBRARYATTRIBUTES* attributes)
{
    return run<uint32_t>(Call_Id::HBA_GetVendorLibraryAttributes, {}, 0, [&](Call& call) {
        if (!attributes) return 0u;
        HBA_LIBRARYATTRIBUTES record;
        std::memset(&record, 0, sizeof record);
        call.field(record.VName, "Norvane Corporation simulated adapters");
        call.field(record.VVersion, "1.0");
        call.bytes(attributes, &record, sizeof record);
        return 2u;
    });
}
