#include "inventory/NVR_Data.h"

#include <algorithm>
#include <cstring>
#include <memory>

#include "foundation/CLogger.h"
#include "foundation/management_binding.h"
#include "inventory/Adapter.h"
#include "inventory/Port.h"
#include "inventory/attempt.h"

namespace cimple {

namespace {

bool begins_with(const char* text, const char* start)
{
    return std::strncmp(text, start, std::strlen(start)) == 0;
}

bool is_converged_name(const char* name)
{
    return begins_with(name, "Norvane-O") || begins_with(name, "Norvane-N");
}

bool is_converged_function(uint32 functionType)
{
    return functionType >= 1 && functionType <= 3;
}

} // namespace

NVR_Data::NVR_Data()
{
    NVR_LOG("Data Pointer Constructed.");
}

NVR_Data::~NVR_Data()
{
    freeAllData();
    NVR_LOG("Data Pointer deleted.");
}

void NVR_Data::buildAdapterData()
{
    NVR_LOG("buildAdapterData");
    freeAllData();
    NVR_LOG("buildAdapterData - with hbaapi");
    const uint32 count = HBA_GetNumberOfAdapters();
    m_numberOfAdapters = static_cast<sint32>(count);
    NVR_LOG("Number of Adapters detected = %d", m_numberOfAdapters);
    if (count == 0) {
        NVR_LOG("HBAAPI reports that there are NO HBAs in the system.");
        return;
    }
    for (uint32 index = 0; index < std::min(count, max_adapters); index++) {
        attempt([&] { buildAdapter(index); },
                [&] {
                    NVR_LOG("Catch ALL error during creating adapter..., Skipping Adapter# %d",
                            static_cast<int>(index));
                    leaveOutAdapter();
                });
    }
}

void NVR_Data::buildAdapter(uint32 index)
{
    char name[256 + 1] = {}; // the library's name may fill its 256 bytes
    if (const HBA_STATUS status = HBA_GetAdapterName(index, name)) {
        NVR_LOG("Error hbaStatus=%d, Skipping Adapter# %d", static_cast<int>(status), static_cast<int>(index));
        leaveOutAdapter();
        return;
    }
    name[sizeof name - 1] = '\0';
    if (is_converged_name(name)) {
        leaveOutAdapter();
        NVR_LOG("Found VCNA Card, AdapterName = %s. skipping this card", name);
        return;
    }
    NVR_LOG("FC AdapterName : [%s]", name);
    auto adapter = std::make_unique<FCAdapter>(name, index);
    const uint32 functionType = *adapter->getFunctionType();
    NVR_LOG("Adapter Function type : %d", static_cast<int>(functionType));
    if (is_converged_function(functionType)) {
        leaveOutAdapter();
        NVR_LOG("Found VCNA Card, AdapterName = %s. skipping this card", name);
        return;
    }
    const std::vector<Port*>& ports = *adapter->getPorts();
    m_adapters.reserve(m_adapters.size() + 1);
    m_ports.insert(m_ports.end(), ports.begin(), ports.end());
    m_adapters.push_back(adapter.release());
    m_haveAdapters = 1;
}

void NVR_Data::leaveOutAdapter()
{
    m_numberOfAdapters = static_cast<sint32>(static_cast<uint32>(m_numberOfAdapters) - 1); // the library's count wraps
}

void NVR_Data::buildSANData()
{
    NVR_LOG("buildSANData");
    for (Adapter* adapter : m_adapters) {
        attempt(
            [&] {
                NVR_LOG("Target Scan from adapter: %s", adapter->name().c_str());
                adapter->rescanTargets();
            },
            [] { NVR_LOG("Issue with Target Rescan with Adapter- moving to the next adapter"); });
    }
}

void NVR_Data::freeAllData()
{
    NVR_LOG("freeAllData: Entry");
    m_ports.clear();
    if (!m_adapters.empty()) m_numberOfAdapters = 0;
    for (Adapter*& adapter : m_adapters) {
        NVR_LOG("Freeing adapter: %s", adapter->name().c_str());
        deletePart(adapter, "Error in freeAllData -- do nothing");
    }
    m_adapters.clear();
    m_haveAdapters = 0;
    NVR_LOG("freeAllData: cleanExit");
}

} // namespace cimple
