// Conversion of one port each way between the module's instances and the server's.
#include <stdexcept>

#include <benchmark/benchmark.h>

#include "bench/Heap_Window.h"
#include "classes/NVRHBA_FCPort.h"
#include "cmpi/Converter.h"
#include "host/Host.h"
#include "tests/module/support/Rig.h"

namespace {

using namespace cimple;

constexpr char name_space[] = "root/norvane";
constexpr std::size_t batch = 100; // a request: what arrays hold is freed with it

void set(Property<String>& property, const char* text)
{
    property.set(text);
}

template <class T>
void set(Property<T>& property, T value)
{
    property.set(value);
}

void append(Property<Array<String>>& property, const char* text)
{
    property.value.append(String(text));
    property.null = 0;
}

/// A port with the properties that a sound one has.
NVRHBA_FCPort* make_port()
{
    constexpr char wwpn[] = "10000000C9A00001";
    auto* port = create_as<NVRHBA_FCPort>(true);
    port->__name_space = name_space;
    set(port->Description, "Norvane FC2162 16Gb Fibre Channel Host Bus Adapter");
    set(port->ElementName, "Norvane FC2162 FV2.01a4 DV8.3.7.18 HBA0");
    set(port->Name, wwpn);
    set(port->SystemCreationClassName, "CIM_ComputerSystem");
    set(port->SystemName, "storage1.norvane.test");
    set(port->CreationClassName, "NVRHBA_FCPort");
    set(port->DeviceID, wwpn);
    set(port->PermanentAddress, wwpn);
    set(port->FabricName, "1000000533A00001");
    set(port->OperationalFirmware, "SLI-3 Overlay:v2.01a4");
    set(port->AdapterName, "Norvane-FC2162-0");
    set<uint16>(port->PortNumber, 0);
    set<uint16>(port->LocationIndicator, 3);
    set<uint16>(port->UsageRestriction, 4);
    set<uint16>(port->LinkTechnology, 4);
    set<uint16>(port->PortType, 10);
    set<uint32>(port->FCID, 0x010100);
    set<uint32>(port->NumberOfDiscoveredPorts, 2);
    set<uint64>(port->Speed, 16000000000);
    set<uint64>(port->MaxSpeed, 16000000000);
    set<uint64>(port->SupportedMaximumTransmissionUnit, 2048);
    set<uint64>(port->ActiveMaximumTransmissionUnit, 2048);
    append(port->NetworkAddresses, wwpn);
    append(port->StatusDescriptions, "OK");
    for (const char* text : {"FC2162-M8", "NV216200001", "A-5681", "4E56", "/sys/class/fc_host/host0"}) {
        append(port->OtherIdentifyingInfo, text);
        append(port->IdentifyingDescriptions, text);
    }
    return port;
}

/// A new instance of the server's for the port, which the caller holds.
void convert(const CMPIBroker* broker, const Instance* port, Made<CMPIObjectPath>& path, Made<CMPIInstance>& instance)
{
    make_cmpi_object_path(broker, port, name_space, path);
    make_CMPI_instance(broker, port, name_space, path.get(), nullptr, instance);
    if (!instance.get()) throw std::runtime_error("no instance came out");
}

void to_server(benchmark::State& state)
{
    host::Host server(nvrtest::module_schema());
    const Instance* port = make_port();
    const auto once = [&](const CMPIBroker* broker) {
        Made<CMPIObjectPath> path;
        Made<CMPIInstance> instance;
        convert(broker, port, path, instance);
    };
    while (state.KeepRunningBatch(batch))
        server.on_request_thread([&](const CMPIBroker* broker, const CMPIContext*) {
            for (std::size_t i = 0; i < batch; i++)
                once(broker);
        });
    server.on_request_thread([&](const CMPIBroker* broker, const CMPIContext*) {
        state.counters["peak_kB"] = nvrbench::peak_kilobytes_of([&] { once(broker); });
    });
    unref(port);
}

void from_server(benchmark::State& state)
{
    host::Host server(nvrtest::module_schema());
    const Instance* port = make_port();
    const auto with_input = [&](auto work) {
        server.on_request_thread([&](const CMPIBroker* broker, const CMPIContext*) {
            Made<CMPIObjectPath> path;
            Made<CMPIInstance> instance;
            convert(broker, port, path, instance);
            work([&] {
                Instance* out = nullptr;
                make_cimple_instance(broker, &NVRHBA_FCPort::meta, path.get(), instance.get(), out);
                if (!out) throw std::runtime_error("no instance came out");
                unref(out);
            });
        });
    };
    while (state.KeepRunningBatch(batch))
        with_input([](auto once) {
            for (std::size_t i = 0; i < batch; i++)
                once();
        });
    with_input([&](auto once) { state.counters["peak_kB"] = nvrbench::peak_kilobytes_of(once); });
    unref(port);
}

BENCHMARK(to_server)->UseRealTime()->Unit(benchmark::kMicrosecond);
BENCHMARK(from_server)->UseRealTime()->Unit(benchmark::kMicrosecond);

} // namespace
