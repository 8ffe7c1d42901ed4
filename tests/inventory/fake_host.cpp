#include "tests/inventory/fake_host.h"

#include <algorithm>
#include <cstring>

#include <gmock/gmock.h>

#include "foundation/management_binding.h"
#include "tests/foundation/fakes/fake_libraries.h"

namespace nvrtest {

namespace {

template <std::size_t N>
void set(char (&field)[N], const std::string& text)
{
    std::memset(field, 0, N);
    std::memcpy(field, text.data(), std::min(text.size(), N));
}

std::string make_block(const Values& values)
{
    std::string records;
    for (const auto& [number, value] : values) {
        const RM_ATTRIBUTE head = {number, static_cast<uint16>(value.size())};
        records.append(reinterpret_cast<const char*>(&head), sizeof head);
        records += value;
        records.resize((records.size() + 3) / 4 * 4);
    }
    RM_BLOCKHEADER header{RM_BLOCK_MAGIC, static_cast<uint32>(sizeof header + records.size()),
                          static_cast<uint32>(values.size()), 0};
    header.check = header.magic ^ header.length ^ header.count ^ RM_BLOCK_CHECK;
    return std::string(reinterpret_cast<const char*>(&header), sizeof header) + records;
}

uint32 fill_block(const Values& values, void* buffer, uint32* size)
{
    const std::string block = make_block(values);
    EXPECT_LE(block.size(), *size);
    std::memcpy(buffer, block.data(), std::min<std::size_t>(block.size(), *size));
    *size = static_cast<uint32>(block.size());
    return 0;
}

void* find_value(void* block, uint16 number, uint16* length, uint32* status)
{
    RM_BLOCKHEADER header;
    std::memcpy(&header, block, sizeof header);
    char* at = static_cast<char*>(block) + sizeof header;
    for (uint32 i = 0; i < header.count; i++) {
        RM_ATTRIBUTE head;
        std::memcpy(&head, at, sizeof head);
        at += sizeof head;
        if (head.number == number) {
            *length = head.length;
            *status = 0;
            return at;
        }
        at += (head.length + 3) / 4 * 4;
    }
    *status = 2;
    return nullptr;
}

Values make_adapter_block(uint8 adapter, uint8 port)
{
    Values values;
    values[RM_ATTR_BOARD_TEMPERATURE] = number_value(0x00504B2D);
    values[RM_ATTR_DEVICE_ID] = number_value(0xF180);
    values[RM_ATTR_MODEL_ID] = number_value(5);
    values[RM_ATTR_DIAG_VERSION] = number_value(3);
    values[RM_ATTR_FUNCTION_TYPE] = number_value(0);
    values[RM_ATTR_IEEE_ADDRESS] = std::string("\x00\x90\xFA\x01\x02\x03", 6);
    values[RM_ATTR_BOOT_BIOS_VERSION] = "bios 1";
    values[RM_ATTR_KERNEL_VERSION] = "kernel 2";
    values[RM_ATTR_INITIAL_FIRMWARE] = "initial 3";
    values[RM_ATTR_OPERATIONAL_FIRMWARE] = "operational 4";
    values[RM_ATTR_BOOT_CODE_ENABLED] = number_value(1);
    values[RM_ATTR_PORT_NUMBER] = number_value(port);
    values[RM_ATTR_SLI_MODE] = number_value(4);
    values[RM_ATTR_UNIVERSAL_VERSION] = "universal 5";
    values[RM_ATTR_X86_BIOS_VERSION] = "x86 6";
    values[RM_ATTR_EFI_VERSION] = "efi 7";
    values[RM_ATTR_FCODE_VERSION] = "fcode 8";
    values[RM_ATTR_ULP_FIRMWARE_VERSION] = "ulp 9";
    values[RM_ATTR_ULP_FIRMWARE_NAME] = "ulp name";
    values[RM_ATTR_SP_FIRMWARE_VERSION] = "sp 10";
    values[RM_ATTR_SP_FIRMWARE_NAME] = "sp name";
    values[RM_ATTR_PCI_FUNCTION_NUMBER] = number_value(1);
    values[RM_ATTR_PCI_BUS_NUMBER] = number_value(0x3Bu + adapter);
    return values;
}

Fake_Port make_port(uint8 adapter, uint8 index)
{
    Fake_Port port;
    port.record.PortWWN = make_wwn(0x10, adapter, index);
    port.record.NodeWWN = make_wwn(0x20, adapter, index);
    port.record.FabricName = make_wwn(0x30, adapter, index);
    port.record.PortFcId = 0x010200u + index;
    port.record.PortType = 5;
    port.record.PortState = 2;
    port.record.PortSupportedClassofService = 8;
    port.record.PortSupportedFc4Types.bits[2] = 1;
    port.record.PortActiveFc4Types.bits[31] = 0xFF;
    set(port.record.PortSymbolicName, "symbolic");
    set(port.record.OSDeviceName, "/dev/port");
    port.record.PortSupportedSpeed = 0x70;
    port.record.PortSpeed = 0x40;
    port.record.PortMaxFrameSize = 2048;
    port.record.NumberofDiscoveredPorts = 3;
    port.adapter_block = make_adapter_block(adapter, index);
    port.port_block[RM_ATTR_PORT_STATE] = number_value(20);
    for (uint16 number = RM_STAT_FIRST; number <= RM_STAT_LAST; number++)
        port.statistics[number] = wide_value(number * 0x100000000u + index);
    return port;
}

Fake_Adapter make_adapter(uint8 number)
{
    Fake_Adapter adapter;
    adapter.name = "nvr" + std::to_string(number);
    set(adapter.record.Manufacturer, "Norvane");
    set(adapter.record.SerialNumber, "SN000" + std::to_string(number));
    set(adapter.record.Model, "NV-32");
    set(adapter.record.ModelDescription, "A description");
    set(adapter.record.NodeSymbolicName, "node symbolic");
    set(adapter.record.HardwareVersion, "hw");
    set(adapter.record.DriverVersion, "driver 1.2");
    set(adapter.record.OptionROMVersion, "rom");
    set(adapter.record.FirmwareVersion, "1.23a4");
    set(adapter.record.DriverName, "nvrfc");
    adapter.record.NodeWWN = make_wwn(0x20, number, 0);
    adapter.record.VendorSpecificID = 0xF18010DF;
    adapter.record.NumberOfPorts = 2;
    for (uint8 port = 0; port < 2; port++)
        adapter.ports.push_back(make_port(number, port));
    for (uint8 entry = 0; entry < 2; entry++)
        adapter.mapping.push_back(make_entry(entry));
    return adapter;
}

} // namespace

std::string number_value(uint32 number)
{
    return std::string(reinterpret_cast<const char*>(&number), sizeof number);
}

std::string wide_value(uint64 number)
{
    return std::string(reinterpret_cast<const char*>(&number), sizeof number);
}

HBA_WWN make_wwn(uint8 kind, uint8 adapter, uint8 port)
{
    return {{kind, 0, 0, 0, 0xC9, 0xA0, adapter, port}};
}

HBA_FCPSCSIENTRY make_entry(uint8 number)
{
    HBA_FCPSCSIENTRY entry{};
    set(entry.ScsiId.OSDeviceName, "/dev/sd" + std::string(1, static_cast<char>('a' + number % 26)));
    entry.ScsiId.ScsiBusNumber = 1;
    entry.ScsiId.ScsiTargetNumber = 2;
    entry.ScsiId.ScsiOSLun = number;
    entry.FcpId.FcId = 0x020300u + number;
    entry.FcpId.NodeWWN = make_wwn(0x40, 0, number);
    entry.FcpId.PortWWN = make_wwn(0x50, 0, number);
    entry.FcpId.FcpLun = 0x0100 * number;
    return entry;
}

Fake_Host::Fake_Host()
{
    for (uint8 number = 0; number < 2; number++)
        adapters.push_back(make_adapter(number));
    inquiry.response = std::string("\xE0\0\0\0\0\0\0\0Vendor01Product name 016R001", 36);
    serial_page.response = std::string("\0\x80\0\x0ASERIAL0001\0behind", 22);
    identifier_page.response = std::string("\x20\x83\0\x0C\x01\xF3\0\x08\x60\x06\x01\x60\x11\x22\x33\x44", 16);
    capacity.response = std::string("\x00\xFF\xFF\xFF\x00\x00\x02\x00", 8);
    fake::install({"HBAAPI", "lrmapi"});
    cimple::loadLibraries();
    define_hba_operations();
    define_management_operations();
}

Fake_Host::~Fake_Host()
{
    cimple::unloadLibraries();
    fake::operations() = fake::Operations();
}

uint32 Fake_Host::fault(const char* operation, uint32 index)
{
    const int call = ++calls[operation];
    const auto found = faults.find(operation);
    return found == faults.end() ? 0 : found->second(call, index);
}

Fake_Adapter* Fake_Host::adapter(HBA_HANDLE handle)
{
    EXPECT_GE(handle, 100u);
    EXPECT_LT(handle - 100, adapters.size());
    return &adapters[handle - 100];
}

Fake_Port* Fake_Host::port(const HBA_WWN& wwn, uint32& index)
{
    for (Fake_Adapter& adapter : adapters)
        for (index = 0; index < adapter.ports.size(); index++)
            if (std::memcmp(&adapter.ports[index].record.PortWWN, &wwn, sizeof wwn) == 0) return &adapter.ports[index];
    return nullptr;
}

HBA_STATUS Fake_Host::answer(Fake_Answer& answer, void* response, uint32 response_size, void* sense, uint32 sense_size)
{
    EXPECT_EQ(response_size, 255u);
    EXPECT_EQ(sense_size, 128u);
    const std::size_t call = static_cast<std::size_t>(answer.calls++);
    std::memcpy(response, answer.response.data(), std::min<std::size_t>(answer.response.size(), response_size));
    std::memcpy(sense, answer.sense.data(), std::min<std::size_t>(answer.sense.size(), sense_size));
    return answer.statuses[std::min(call, answer.statuses.size() - 1)];
}

void Fake_Host::define_hba_operations()
{
    fake::Operations& library = fake::operations();
    library.HBA_GetNumberOfAdapters = [this] {
        calls["HBA_GetNumberOfAdapters"]++;
        return static_cast<HBA_UINT32>(adapters.size());
    };
    library.HBA_GetAdapterName = [this](HBA_UINT32 index, char* name) -> HBA_STATUS {
        if (const uint32 status = fault("HBA_GetAdapterName", index)) return status;
        const std::string& text = adapters[index].name;
        std::memcpy(name, text.c_str(), std::min<std::size_t>(text.size() + 1, 256));
        return 0;
    };
    library.HBA_OpenAdapter = [this](char* name) -> HBA_HANDLE {
        for (uint32 index = 0; index < adapters.size(); index++) {
            if (adapters[index].name.substr(0, 256) != name) continue;
            if (fault("HBA_OpenAdapter", index)) return 0;
            open_handles++;
            return 100 + index;
        }
        return 0;
    };
    library.HBA_CloseAdapter = [this](HBA_HANDLE handle) {
        adapter(handle);
        open_handles--;
    };
    library.HBA_RefreshInformation = [this](HBA_HANDLE) { calls["HBA_RefreshInformation"]++; };
    library.HBA_GetAdapterAttributes = [this](HBA_HANDLE handle, HBA_ADAPTERATTRIBUTES* record) -> HBA_STATUS {
        if (const uint32 status = fault("HBA_GetAdapterAttributes", handle - 100)) return status;
        *record = adapter(handle)->record;
        return 0;
    };
    library.HBA_GetAdapterPortAttributes = [this](HBA_HANDLE handle, HBA_UINT32 index,
                                                  HBA_PORTATTRIBUTES* record) -> HBA_STATUS {
        if (const uint32 status = fault("HBA_GetAdapterPortAttributes", index)) return status;
        const Fake_Adapter* fake = adapter(handle);
        if (index >= fake->ports.size()) return HBA_STATUS_ERROR_ILLEGAL_INDEX;
        *record = fake->ports[index].record;
        return 0;
    };
    library.HBA_GetFcpTargetMapping = [this](HBA_HANDLE handle, HBA_FCPTARGETMAPPING* mapping) -> HBA_STATUS {
        if (const uint32 status = fault("HBA_GetFcpTargetMapping", handle - 100)) return status;
        const std::vector<HBA_FCPSCSIENTRY>& entries = adapter(handle)->mapping;
        const uint32 room = mapping->NumberOfEntries;
        mapping->NumberOfEntries = static_cast<uint32>(entries.size());
        if (entries.size() > room) return HBA_STATUS_ERROR_MORE_DATA;
        std::copy(entries.begin(), entries.end(), static_cast<HBA_FCPSCSIENTRY*>(mapping->entry));
        return 0;
    };
    library.HBA_SendScsiInquiry = [this](HBA_HANDLE, HBA_WWN, HBA_UINT64, HBA_UINT8 evpd, HBA_UINT32 page,
                                         void* response, HBA_UINT32 response_size, void* sense,
                                         HBA_UINT32 sense_size) -> HBA_STATUS {
        if (const uint32 status = fault("HBA_SendScsiInquiry", page)) return status;
        EXPECT_EQ(evpd, page == 0 ? 0 : 1);
        Fake_Answer& page_answer = page == 0x80 ? serial_page : page == 0x83 ? identifier_page : inquiry;
        return answer(page_answer, response, response_size, sense, sense_size);
    };
    library.HBA_SendReadCapacity = [this](HBA_HANDLE, HBA_WWN, HBA_UINT64, void* response, HBA_UINT32 response_size,
                                          void* sense, HBA_UINT32 sense_size) -> HBA_STATUS {
        if (const uint32 status = fault("HBA_SendReadCapacity", 0)) return status;
        return answer(capacity, response, response_size, sense, sense_size);
    };
}

void Fake_Host::define_management_operations()
{
    fake::Operations& library = fake::operations();
    const auto filler = [this](const char* operation, Values Fake_Port::*values) {
        return [=](HBA_WWN wwn, void* block, uint32_t* size) -> uint32_t {
            uint32 index = 0;
            const Fake_Port* fake = port(wwn, index);
            if (const uint32 status = fault(operation, index)) return status;
            if (!fake) return RM_STATUS_ILLEGAL_WWN;
            return fill_block(fake->*values, block, size);
        };
    };
    library.RM_GetHBAAttributes = filler("RM_GetHBAAttributes", &Fake_Port::adapter_block);
    library.RM_GetPortAttributes = filler("RM_GetPortAttributes", &Fake_Port::port_block);
    library.RM_GetPortStatistics = filler("RM_GetPortStatistics", &Fake_Port::statistics);
    library.RM_GetDriverType = [this](HBA_WWN, uint32_t* type) -> uint32_t {
        if (const uint32 status = fault("RM_GetDriverType", 0)) return status;
        *type = driver_type;
        return 0;
    };
    library.RM_GetAttributeValue = [this](void* block, uint16_t number, uint16_t* length, uint32_t* status) -> void* {
        EXPECT_EQ(*status, 1u);
        if (const uint32 failure = fault("RM_GetAttributeValue", number)) {
            *status = failure;
            return nullptr;
        }
        return find_value(block, number, length, status);
    };
}

} // namespace nvrtest
