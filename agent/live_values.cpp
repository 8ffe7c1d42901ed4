// Values that are read anew when a client enumerates: the counters and the status of the ports.
#include <cstring>

#include "agent/Clock.h"
#include "agent/ProviderAgent.h"
#include "agent/instance_table.h"
#include "agent/port_tables.h"
#include "agent/walk_ports.h"
#include "classes/NVRHBA_FCPort.h"
#include "classes/NVRHBA_FCPortStatistics.h"
#include "foundation/CLogger.h"
#include "inventory/NVR_Data.h"
#include "inventory/PortAttributes.h"
#include "inventory/PortStatistics.h"
#include "runtime/guarded.h"

namespace cimple {

namespace {

/// Counters of this size and above are the hardware's word for "not reported".
constexpr uint64 reported_below = 4294967295;

constexpr uint32 port_status_interval = 9999999; // microseconds

struct Counter_Row {
    uint64 FCPortStatistics::*from;
    Property<uint64> NVRHBA_FCPortStatistics::*to;
};

constexpr Counter_Row counters[] = {
    {&FCPortStatistics::PacketsTransmitted, &NVRHBA_FCPortStatistics::PacketsTransmitted},
    {&FCPortStatistics::PacketsReceived, &NVRHBA_FCPortStatistics::PacketsReceived},
    {&FCPortStatistics::LIPCount, &NVRHBA_FCPortStatistics::LIPCount},
    {&FCPortStatistics::ErrorFrames, &NVRHBA_FCPortStatistics::ErrorFrames},
    {&FCPortStatistics::LinkFailures, &NVRHBA_FCPortStatistics::LinkFailures},
    {&FCPortStatistics::LossOfSyncCounter, &NVRHBA_FCPortStatistics::LossOfSyncCounter},
    {&FCPortStatistics::LossOfSignalCounter, &NVRHBA_FCPortStatistics::LossOfSignalCounter},
    {&FCPortStatistics::PrimitiveSeqProtocolErrCount, &NVRHBA_FCPortStatistics::PrimitiveSeqProtocolErrCount},
    {&FCPortStatistics::InvalidTransmissionWords, &NVRHBA_FCPortStatistics::InvalidTransmissionWords},
    {&FCPortStatistics::CRCErrors, &NVRHBA_FCPortStatistics::CRCErrors},
    {&FCPortStatistics::TxSequences, &NVRHBA_FCPortStatistics::TxSequences},
    {&FCPortStatistics::RxSequences, &NVRHBA_FCPortStatistics::RxSequences},
    {&FCPortStatistics::ExCountOrig, &NVRHBA_FCPortStatistics::ExCountOrig},
    {&FCPortStatistics::ExCountResp, &NVRHBA_FCPortStatistics::ExCountResp},
    {&FCPortStatistics::ActiveXRIs, &NVRHBA_FCPortStatistics::ActiveXRIs},
    {&FCPortStatistics::ActiveRPIs, &NVRHBA_FCPortStatistics::ActiveRPIs},
    {&FCPortStatistics::ElasticBufOverruns, &NVRHBA_FCPortStatistics::ElasticBufOverruns},
    {&FCPortStatistics::LinkTransitions, &NVRHBA_FCPortStatistics::LinkTransitions},
    {&FCPortStatistics::PrimitiveSeqTimesouts, &NVRHBA_FCPortStatistics::PrimitiveSeqTimesouts},
    {&FCPortStatistics::ArbitrationTimeouts, &NVRHBA_FCPortStatistics::ArbitrationTimeouts},
};

void copyCounters(const FCPortStatistics& from, NVRHBA_FCPortStatistics& to)
{
    for (const Counter_Row& row : counters)
        set(to.*row.to, from.*row.from);
    set(to.BytesTransmitted, from.WordsTransmitted * 4);
    set(to.BytesReceived, from.WordsReceived * 4);
    if (from.NOSCount < reported_below) set(to.NOSCount, from.NOSCount);
    if (from.DumpedFrames < reported_below) set(to.DumpedFrames, from.DumpedFrames);
    set(to.StatisticTime, agent_now());
}

/// Finds the first instance of a map whose key property contains a WWPN text. Ports come in the order of their
/// instances, so it looks behind the last one found before it scans.
template <class T>
class Finder {
public:
    Finder(const Map<T>& map, Property<String> T::*key) : m_map(map), m_key(key) {}

    T* find(const std::string& wwpn)
    {
        if (m_next < m_map.size() && names(m_next, wwpn)) return m_map[m_next++];
        for (std::size_t i = 0; i < m_map.size(); i++) {
            if (!names(i, wwpn)) continue;
            m_next = i + 1;
            return m_map[i];
        }
        return nullptr;
    }

private:
    bool names(std::size_t index, const std::string& wwpn) const
    {
        return std::strstr((m_map[index]->*m_key).value.c_str(), wwpn.c_str()) != nullptr;
    }

    const Map<T>& m_map;
    Property<String> T::*m_key;
    std::size_t m_next = 0;
};

} // namespace

void ProviderAgent::GetFCPortStats()
{
    NVR_LOG("PERF: GetFCPortStats: Entry");
    if (!m_pData || !m_pData->haveAdapters()) return;
    Finder<NVRHBA_FCPortStatistics> instances(m_NVRHBA_FCPortStatistics_map, &NVRHBA_FCPortStatistics::InstanceID);
    const bool walked = guarded([&] {
        walkFCPorts(*m_pData, [&](FCAdapter&, FCPort& port) {
            auto* instance = instances.find(port.portName());
            if (!instance) return true;
            const bool read = guarded([&] {
                copyCounters(dynamic_cast<const FCPortStatistics&>(*port.getStatistics()), *instance);
                NVR_LOG("PERF: GetFCPortStats: cleanExit");
            });
            if (!read) NVR_LOG("Error occurred while retrieving FCPort Statistics...");
            return true;
        });
    });
    if (!walked) NVR_LOG("Error getting FC Port statistics");
}

void ProviderAgent::UpdateFCPortStatus()
{
    NVR_LOG("PERF: UpdateFCPortStatus: Entry");
    NVR_LOG("Checking driver TimeOut...");
    if (!rateLimitPassed(m_portStatusTime, port_status_interval)) return;
    if (!m_pData || !m_pData->haveAdapters()) return;
    Finder<NVRHBA_FCPort> instances(m_NVRHBA_FCPort_map, &NVRHBA_FCPort::DeviceID);
    // One port that cannot be read ends the walk: the rest keep the status they have until the next one.
    const bool walked = guarded([&] {
        walkFCPorts(*m_pData, [&](FCAdapter& adapter, FCPort& port) {
            auto* instance = instances.find(port.portName());
            if (!instance) return true;
            std::unique_ptr<FCPortAttributes> attributes;
            const bool read = guarded([&] { attributes.reset(new FCPortAttributes(adapter, port.portIndex())); });
            if (!read) {
                NVR_LOG("Error while retrieving fcPortAttributes");
                throw std::exception();
            }
            const Status_Row& row = port_status(attributes->PortState);
            set(instance->OperationalStatus, {row.status});
            set(instance->StatusDescriptions, {row.text});
            return true;
        });
    });
    if (!walked) NVR_LOG("Error while updating FC Port map");
}

} // namespace cimple
