/// A host of fake adapters, ports and targets, whose every record a test can change and whose every call it can fail.
///
/// Steers the fake libraries (tests/foundation/fakes) and has them loaded while it lives.
#pragma once

#include <functional>
#include <map>
#include <string>
#include <vector>

#include "foundation/management_api.h"
#include "runtime/Type.h"

namespace nvrtest {

using cimple::uint16;
using cimple::uint32;
using cimple::uint64;
using cimple::uint8;

using Values = std::map<uint16, std::string>; ///< attribute number to the bytes of its value

std::string number_value(uint32 number);
std::string wide_value(uint64 number);

struct Fake_Port {
    HBA_PORTATTRIBUTES record{};
    Values adapter_block;
    Values port_block;
    Values statistics;
};

struct Fake_Adapter {
    std::string name;
    HBA_ADAPTERATTRIBUTES record{};
    std::vector<Fake_Port> ports;
    std::vector<HBA_FCPSCSIENTRY> mapping;
};

/// What a device answers to one command; `status` of the n-th call is the n-th of the list, or its last.
struct Fake_Answer {
    std::string response;
    std::vector<uint32> statuses = {HBA_STATUS_OK};
    std::string sense;
    int calls = 0;
};

class Fake_Host {
public:
    /// Two adapters, "nvr0" and "nvr1", of two ports and two targets each.
    Fake_Host();
    ~Fake_Host();
    Fake_Host(const Fake_Host&) = delete;
    Fake_Host& operator=(const Fake_Host&) = delete;

    std::vector<Fake_Adapter> adapters;
    Fake_Answer inquiry;
    Fake_Answer serial_page;
    Fake_Answer identifier_page;
    Fake_Answer capacity;
    uint32 driver_type = 17;

    /// Consulted at each call of the operation, with the number of the call from 1 and the port's index (or the
    /// adapter's, for operations on adapters): what is not 0 is answered in its stead.
    using Fault = std::function<uint32(int call, uint32 index)>;
    std::map<std::string, Fault> faults;
    void fail(const std::string& operation, uint32 status)
    {
        faults[operation] = [=](int, uint32) { return status; };
    }

    std::map<std::string, int> calls;
    int open_handles = 0;

private:
    uint32 fault(const char* operation, uint32 index);
    Fake_Adapter* adapter(HBA_HANDLE handle);
    Fake_Port* port(const HBA_WWN& wwn, uint32& index);
    HBA_STATUS answer(Fake_Answer& answer, void* response, uint32 response_size, void* sense, uint32 sense_size);
    void define_hba_operations();
    void define_management_operations();
};

HBA_WWN make_wwn(uint8 kind, uint8 adapter, uint8 port);
HBA_FCPSCSIENTRY make_entry(uint8 number);

} // namespace nvrtest
