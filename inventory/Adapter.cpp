#include "inventory/Adapter.h"

#include <algorithm>
#include <memory>
#include <stdexcept>

#include "foundation/CLogger.h"
#include "inventory/AdapterAttributes.h"
#include "inventory/Port.h"
#include "inventory/attempt.h"

namespace cimple {

Adapter::Adapter(const std::string& name, uint32 number, uint32 type)
    : m_adapterName(name), m_adapterNumber(number), m_adapterType(type)
{
    NVR_LOG("Adapter( adapterName[%s], adapterNumber[%d], adapterType[%d] )", m_adapterName.c_str(),
            static_cast<int>(number), static_cast<int>(type));
}

Adapter::~Adapter() noexcept(false)
{
    NVR_LOG("~Adapter");
}

FCAdapter::FCAdapter(const std::string& name, uint32 number) : Adapter(name, number, type_fc)
{
    auto attributes = std::make_unique<FCAdapterAttributes>(*this);
    auto statistics = std::make_unique<FCAdapterStatistics>();
    const uint32 ports = std::min(attributes->_NumberOfPorts, max_ports);
    m_functionType = attributes->_FunctionType;
    m_attributes = attributes.release();
    m_statistics = statistics.release();
    for (uint32 index = 0; index < ports; index++) {
        attempt(
            [&] {
                auto port = std::make_unique<FCPort>(this, index);
                m_ports.push_back(port.get());
                static_cast<void>(port.release()); // owned by the list now
            },
            [&] {
                NVR_LOG("Failed to fetch information for port: [%d] on adapter: [%s]", static_cast<int>(index),
                        m_adapterName.c_str());
            });
    }
}

FCAdapter::~FCAdapter() noexcept(false)
{
    NVR_LOG("~FCAdapter");
    deletePart(m_attributes, "Adapter attribute delete failed");
    deletePart(m_statistics, "Adapter statistics delete failed");
    for (Port*& port : m_ports) {
        NVR_LOG("Freeing Port: %s", port->portName().c_str());
        deletePart(port, "Error in port freeing");
    }
}

Port* FCAdapter::getPort(uint32 index)
{
    if (index >= m_ports.size()) throw std::out_of_range("vector::_M_range_check");
    return m_ports[index];
}

void FCAdapter::rescanTargets()
{
    NVR_LOG("FCAdapter::rescanTargets");
    for (Port* port : m_ports)
        attempt([&] { port->rescanTargets(this); },
                [] { NVR_LOG("Issue with Target Rescan - moving to the next Port"); });
}

} // namespace cimple
