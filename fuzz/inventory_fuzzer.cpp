// The inventory of a host whose libraries lie: attributes, target mappings, and the answers of logical units.
#include "fuzz/Spoiled_Host.h"
#include "inventory/Adapter.h"
#include "inventory/NVR_Data.h"
#include "inventory/Port.h"
#include "inventory/PortStatistics.h"
#include "inventory/Target.h"

using namespace cimple;

extern "C" int LLVMFuzzerInitialize(int*, char*** argv)
{
    fuzzing::make_spoiled_host(*argv, "[[adapter]]\nports = 2\n[[target]]\nluns = 2\n");
    static fuzzing::Every_Line lines;
    return 0;
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size)
{
    fuzzing::Bytes bytes(data, size);
    fuzzing::spoil_by(&bytes);
    NVR_Data inventory;
    inventory.buildAdapterData();
    inventory.buildSANData();
    for (Port* port : inventory.getPorts()) {
        try {
            port->getStatistics();
        } catch (const std::exception&) { // the library has none
        }
    }
    inventory.buildSANData();
    fuzzing::spoil_by(nullptr);
    return 0;
}
