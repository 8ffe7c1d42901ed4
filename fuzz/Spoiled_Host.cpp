#include "fuzz/Spoiled_Host.h"

#include <algorithm>
#include <cstring>
#include <type_traits>

#include "foundation/management_binding.h"
#include "simulator/Calls.h"
#include "simulator/nvrsim.h"
#include "tests/foundation/fakes/fake_libraries.h"
#include "tests/support/private_host_setup.h"
#include "tests/support/simulator.h"

namespace fuzzing {

namespace {

Bytes* spoiler = nullptr;

enum class Spoilt { nothing, status, bytes, number };

Spoilt choose()
{
    if (!spoiler || spoiler->empty()) return Spoilt::nothing;
    const std::uint8_t choice = spoiler->byte() & 7;
    return choice < 4 ? Spoilt::nothing : choice < 5 ? Spoilt::status : choice < 7 ? Spoilt::bytes : Spoilt::number;
}

std::uint32_t status()
{
    constexpr std::uint32_t usual[] = {0, 1, 2, 7, 8, 9, 60, 97, 191, 0xFFFFFFFF};
    const std::uint8_t which = spoiler->byte();
    return which < std::size(usual) ? usual[which] : which;
}

/// A place that the library wrote to, and how much may be written there.
struct Place {
    void* at;
    std::size_t size;
};

/// A piece of the input at any place, or to the end.
void write_over(const Place& place)
{
    if (!place.at || place.size == 0) return;
    const std::size_t from = spoiler->word() % place.size;
    const std::uint8_t length = spoiler->byte();
    const std::size_t size = std::min(place.size - from, length == 255 ? place.size : length);
    spoiler->fill(static_cast<char*>(place.at) + from, size);
}

/// A count or a length that the library tells.
void lie(const Place& place)
{
    const std::uint64_t number = spoiler->byte() & 1 ? ~std::uint64_t{0} >> (spoiler->byte() & 63) : spoiler->number();
    std::memcpy(place.at, &number, std::min(place.size, sizeof number));
}

/// Spoils one answer: what was written to `answer`, and the number `told` beside it.
template <class Status>
Status spoil(Status good, Place answer, Place told = {})
{
    switch (choose()) {
    case Spoilt::status:
        return static_cast<Status>(status());
    case Spoilt::bytes:
        write_over(answer);
        return good;
    case Spoilt::number:
        if (told.at) lie(told);
        return good;
    default:
        return good;
    }
}

template <class Record>
Place whole(Record* record)
{
    return {record, record ? sizeof *record : 0};
}

/// A list behind a count; `room` is what the count said before the call.
template <class List>
Place entries(void* list, std::uint32_t room)
{
    auto* all = static_cast<List*>(list);
    return {all->entry, std::min<std::size_t>(room, 1 << 16) * sizeof all->entry[0]};
}

/// What a call writes to where only a pointer to one record is given: that record.
Place output()
{
    return {};
}
template <class First, class... Rest>
Place output(First first, Rest... rest)
{
    if constexpr (std::is_pointer_v<First>) {
        using Record = std::remove_pointer_t<First>;
        if constexpr (std::is_class_v<Record> && !std::is_const_v<Record>) return whole(first);
        if constexpr (std::is_same_v<Record, std::uint32_t> || std::is_same_v<Record, std::uint8_t>)
            return whole(first);
    }
    return output(rest...);
}

template <class Signature>
struct Plain;
template <class Result, class... Arguments>
struct Plain<Result(Arguments...)> {
    template <Result (*good)(Arguments...)>
    static Result call(Arguments... arguments)
    {
        if constexpr (!std::is_integral_v<Result>) {
            return good(arguments...);
        } else {
            const Result result = good(arguments...);
            return spoil(result, output(arguments...), output(arguments...));
        }
    }
};

std::uint32_t count_of(const void* list)
{
    std::uint32_t count;
    std::memcpy(&count, list, sizeof count);
    return count;
}

// Operations with a buffer whose size stands in another argument, or in the list itself.

template <auto good>
std::uint32_t block(HBA_WWN wwn, void* block, std::uint32_t* size)
{
    const std::uint32_t room = *size;
    const std::uint32_t result = good(wwn, block, size);
    return spoil(result, {block, room}, whole(size));
}

template <auto good>
std::uint32_t parameters(HBA_WWN wwn, void* records, std::uint32_t* count)
{
    const std::uint32_t room = *count;
    const std::uint32_t result = good(wwn, records, count);
    return spoil(result, {records, room * sizeof(RM_DRIVERPARAM)}, whole(count));
}

template <class List, auto good, class... Before>
std::uint32_t list(Before... before, void* list)
{
    const std::uint32_t room = count_of(list);
    const std::uint32_t result = good(before..., list);
    return spoil(result, entries<List>(list, room), {list, sizeof(std::uint32_t)});
}

void define_blocks(fake::Operations& library)
{
    library.RM_GetHBAAttributes = &block<&nvrsim_RM_GetHBAAttributes>;
    library.RM_GetPortAttributes = &block<&nvrsim_RM_GetPortAttributes>;
    library.RM_GetPortStatistics = &block<&nvrsim_RM_GetPortStatistics>;
    library.RM_GetVPD = &block<&nvrsim_RM_GetVPD>;
    library.RM_GetSffData = &block<&nvrsim_RM_GetSffData>;
    library.RM_GetDriverParams = &parameters<&nvrsim_RM_GetDriverParams>;
    library.RM_GetDriverParamsGlobal = &parameters<&nvrsim_RM_GetDriverParamsGlobal>;
    library.RM_GetLunAttributes = [](HBA_WWN host, HBA_WWN target, HBA_UINT64 lun, void* block, std::uint32_t* size) {
        const std::uint32_t room = *size;
        const std::uint32_t result = nvrsim_RM_GetLunAttributes(host, target, lun, block, size);
        return spoil(result, {block, room}, whole(size));
    };
    library.RM_GetAttributeValue = [](void* block, std::uint16_t number, std::uint16_t* length,
                                      std::uint32_t* status_of_value) -> void* {
        // The simulator vouches for its header by a check word, so that a spoilt one has no values; a library that does
        // not look at it may answer anything.
        void* value = nvrsim_RM_GetAttributeValue(block, number, length, status_of_value);
        switch (choose()) {
        case Spoilt::status:
            *status_of_value = status();
            return value;
        case Spoilt::bytes:
            *status_of_value = 0;
            return static_cast<char*>(block) + static_cast<std::int32_t>(spoiler->number());
        case Spoilt::number:
            *length = spoiler->word();
            return value;
        default:
            return value;
        }
    };
    library.RM_GetNextVpdEntry = [](const void* block, RM_VPDCURSOR* cursor, std::uint32_t cursor_size, char* value,
                                    std::uint32_t value_size) {
        const std::uint32_t result = nvrsim_RM_GetNextVpdEntry(block, cursor, cursor_size, value, value_size);
        return spoil(result, {value, value_size}, {cursor, cursor_size});
    };
}

void define_lists(fake::Operations& library)
{
    library.RM_VPList = &list<RM_VPORTLIST, &nvrsim_RM_VPList, HBA_WWN>;
    library.RM_VPListTargets = &list<RM_TARGETLIST, &nvrsim_RM_VPListTargets, HBA_WWN, HBA_WWN>;
    library.RM_GetVMFromVPort = &list<RM_VMLIST, &nvrsim_RM_GetVMFromVPort, HBA_WWN>;
    library.RM_GetDumpFileNames = &list<RM_DUMPLIST, &nvrsim_RM_GetDumpFileNames, HBA_WWN>;
    library.RM_GetFcpTargetMapping = &list<RM_TARGETLIST, &nvrsim_RM_GetFcpTargetMapping, HBA_WWN>;
    library.RM_GetLunList = &list<RM_LUNLIST, &nvrsim_RM_GetLunList, HBA_WWN, HBA_WWN, std::uint32_t>;
    library.HBA_GetFcpTargetMapping = [](HBA_HANDLE handle, HBA_FCPTARGETMAPPING* mapping) {
        const std::uint32_t room = mapping->NumberOfEntries;
        const HBA_STATUS result = nvrsim_HBA_GetFcpTargetMapping(handle, mapping);
        return spoil(result, entries<HBA_FCPTARGETMAPPING>(mapping, room), whole(&mapping->NumberOfEntries));
    };
    library.CPQFC_QoSGetConfig = [](std::uint32_t handle, CPQFC_QOSCONFIG* config) {
        const std::uint32_t room = config->count;
        const std::uint32_t result = nvrsim_CPQFC_QoSGetConfig(handle, config);
        return spoil(result, entries<CPQFC_QOSCONFIG>(config, room), whole(&config->count));
    };
}

template <auto good, class... Before>
std::uint32_t command(Before... before, void* response, std::uint32_t response_size, void* sense,
                      std::uint32_t sense_size)
{
    const std::uint32_t result = good(before..., response, response_size, sense, sense_size);
    return spoil(result, {response, response_size}, {sense, sense_size});
}

void define_texts_and_commands(fake::Operations& library)
{
    library.RM_ScsiInquiry = &command<&nvrsim_RM_ScsiInquiry, HBA_WWN, HBA_WWN, HBA_UINT64>;
    library.RM_ScsiReadCapacity = &command<&nvrsim_RM_ScsiReadCapacity, HBA_WWN, HBA_WWN, HBA_UINT64>;
    library.HBA_SendScsiInquiry =
        &command<&nvrsim_HBA_SendScsiInquiry, HBA_HANDLE, HBA_WWN, HBA_UINT64, HBA_UINT8, HBA_UINT32>;
    library.HBA_SendReadCapacity = &command<&nvrsim_HBA_SendReadCapacity, HBA_HANDLE, HBA_WWN, HBA_UINT64>;
    library.HBA_GetAdapterName = [](HBA_UINT32 index, char* name) {
        const HBA_STATUS result = nvrsim_HBA_GetAdapterName(index, name);
        return spoil(result, {name, 256});
    };
    library.RM_StatusString = [](std::uint32_t status, char* buffer, std::uint32_t size) {
        const std::uint32_t result = nvrsim_RM_StatusString(status, buffer, size);
        return spoil(result, {buffer, size});
    };
    library.RM_GetDumpDirectoryA = [](HBA_WWN wwn, char* buffer, std::uint32_t size) {
        const std::uint32_t result = nvrsim_RM_GetDumpDirectoryA(wwn, buffer, size);
        return spoil(result, {buffer, size});
    };
}

/// Gives a handle back that the caller does not get to know, since the simulator would keep it for ever.
template <class Handle, class Open, class Close>
auto opener(Open* open, Close* close)
{
    return [=](auto name) {
        const Handle good = open(name);
        const Handle answer = spoil(good, {});
        if (answer != good) close(good);
        return answer;
    };
}

void define_operations()
{
    fake::Operations& library = fake::operations();
#define NVR_PLAIN(result, name, missing, parameters, arguments) library.name = &Plain<name##_t>::call<&nvrsim_##name>;
    NVR_MANAGEMENT_OPERATIONS(NVR_PLAIN)
    NVR_PLAIN_MANAGEMENT_OPERATIONS(NVR_PLAIN)
    NVR_HBA_OPERATIONS(NVR_PLAIN)
    NVR_CPQFC_OPERATIONS(NVR_PLAIN)
#undef NVR_PLAIN
    define_blocks(library);
    define_lists(library);
    define_texts_and_commands(library);
    library.HBA_OpenAdapter = opener<HBA_HANDLE>(&nvrsim_HBA_OpenAdapter, &nvrsim_HBA_CloseAdapter);
    library.CPQFC_OpenAdapter = opener<std::uint32_t>(&nvrsim_CPQFC_OpenAdapter, &nvrsim_CPQFC_CloseAdapter);
}

} // namespace

void make_spoiled_host(char** argv, const std::string& scenario)
{
    nvrtest::enter_private_host(argv);
    nvrtest::load_scenario(scenario);
    fake::install({"HBAAPI", "lrmapi", "tssdm"});
    define_operations();
    cimple::loadLibraries();
}

void spoil_by(Bytes* bytes)
{
    spoiler = bytes;
    // What grew from input to input would look like a leak.
    fake::calls().clear();
    nvrsim_clear_log();
}

} // namespace fuzzing
