#include "inventory/Port.h"

#include <cstddef>
#include <cstdlib>
#include <exception>
#include <memory>

#include "foundation/CLogger.h"
#include "inventory/Adapter.h"
#include "inventory/AdapterHandle.h"
#include "inventory/PortAttributes.h"
#include "inventory/PortStatistics.h"
#include "inventory/Target.h"
#include "inventory/attempt.h"

namespace cimple {

namespace {

using Mapping = std::unique_ptr<HBA_FCPTARGETMAPPING, decltype(&std::free)>;

} // namespace

Port::Port(Adapter* adapter) : m_adapter(adapter) {}

Port::~Port() noexcept(false)
{
    NVR_LOG("~Port");
    freeTargets();
}

void Port::freeTargets()
{
    for (Target*& target : m_targets) {
        NVR_LOG("Freeing Target: %s", target->PortName.c_str());
        deletePart(target, "Target deletion failed !!!");
    }
    m_targets.clear();
}

FCPort::FCPort(Adapter* adapter, uint32 index) : Port(adapter)
{
    NVR_LOG("FCPort: Entry");
    auto attributes = std::make_unique<FCPortAttributes>(*adapter, index);
    m_portName = attributes->PortWWN;
    m_nodeName = attributes->NodeWWN;
    m_attributes = attributes.release();
    m_portIndex = index;
}

FCPort::~FCPort() noexcept(false)
{
    NVR_LOG("~FCPort");
    deletePart(m_attributes, "FC Port attribute deletion failed!!!");
    deletePart(m_statistics, "FC Port statistics deletion failed!!!");
}

PortStatistics* FCPort::getStatistics()
{
    PortStatistics* fresh = nullptr;
    try {
        fresh = new FCPortStatistics(m_portName);
    } catch (...) {
        NVR_LOG("FC Port statistics error occurred,retain the old statistics !!!");
        throw;
    }
    PortStatistics* const old = m_statistics;
    m_statistics = fresh;
    delete old;
    return fresh;
}

Target* FCPort::getTarget(uint32 index)
{
    if (index >= m_targets.size()) throw std::exception();
    return m_targets[index];
}

// Every port takes all entries of its adapter's mapping: this hardware presents one port per adapter name.
void FCPort::rescanTargets(Adapter* adapter)
{
    NVR_LOG("FCPort::rescanTargets");
    freeTargets();
    const AdapterHandle handle(adapter->name());
    HBA_FCPTARGETMAPPING* mapping = nullptr;
    const uint32 status = getTargetMapping(handle, &mapping);
    if (!mapping) return;
    const Mapping owner(mapping, &std::free);
    if (mapping->NumberOfEntries == 0) {
        NVR_LOG("HBA_GetFcpTargetMapping_t() found no target mappings");
        return;
    }
    if (status != HBA_STATUS_OK) return;
    const HBA_FCPSCSIENTRY* entry = mapping->entry;
    for (uint32 left = mapping->NumberOfEntries; left > 0; left--, entry++) {
        attempt(
            [&] {
                auto target = std::make_unique<Target>(*adapter, *entry);
                m_targets.push_back(target.get());
                static_cast<void>(target.release()); // owned by the list now
            },
            [] { NVR_LOG("target creation failed - moving to the next target"); });
    }
}

uint32 FCPort::getTargetMapping(HBA_HANDLE handle, HBA_FCPTARGETMAPPING** mapping)
{
    constexpr uint32 max_capacity = 65536; // the library may name any number; for more there is no memory
    uint32 capacity = 256;
    uint32 status = HBA_STATUS_ERROR;
    Mapping buffer(nullptr, &std::free);
    *mapping = nullptr;
    for (int attempts = 0; attempts < 3; attempts++) {
        NVR_LOG("To retry the HBA_GetFcpTargetMapping command");
        if (buffer) {
            NVR_LOG("Deleting the allocated memory");
            buffer.reset();
        }
        if (capacity <= max_capacity)
            buffer.reset(static_cast<HBA_FCPTARGETMAPPING*>(
                std::calloc(1, offsetof(HBA_FCPTARGETMAPPING, entry) + capacity * sizeof(HBA_FCPSCSIENTRY))));
        if (!buffer) {
            NVR_LOG("Could not allocate memory..break ");
            return status;
        }
        buffer->NumberOfEntries = capacity;
        status = HBA_GetFcpTargetMapping(handle, buffer.get());
        if (status == HBA_STATUS_OK) {
            NVR_LOG("All Ok ...break ");
            if (buffer->NumberOfEntries > capacity) buffer->NumberOfEntries = capacity;
            break;
        }
        if (status == HBA_STATUS_ERROR_STALE_DATA) {
            HBA_RefreshInformation(handle);
            NVR_LOG("Refresh and retry ... ");
        } else if (status == HBA_STATUS_ERROR_MORE_DATA) {
            capacity = buffer->NumberOfEntries;
            NVR_LOG("Increasing the buffer to = %d", static_cast<int>(capacity));
        } else {
            buffer.reset();
            NVR_LOG("Error hbaStatus=%d", static_cast<int>(status));
            return status;
        }
    }
    *mapping = buffer.release();
    NVR_LOG("Successful target info fetched"); // also behind three attempts without success
    return status;
}

} // namespace cimple
