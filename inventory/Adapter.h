/// An adapter of the host, with its ports.
///
/// An adapter owns its attributes, statistics and ports. No locks: readers and builders hold the agent's data mutex.
#pragma once

#include <string>
#include <vector>

#include "runtime/Type.h"

namespace cimple {

class AdapterAttributes;
class AdapterStatistics;
class Port;

class Adapter {
public:
    static constexpr uint32 type_fc = 1;

    Adapter(const std::string& name, uint32 number, uint32 type);
    virtual ~Adapter() noexcept(false);
    Adapter(const Adapter&) = delete;
    Adapter& operator=(const Adapter&) = delete;

    virtual const std::string* getAdapterName() = 0;
    virtual const uint32* getAdapterNumber() = 0;
    virtual const uint32* getFunctionType() = 0;
    virtual AdapterAttributes* getAttributes() = 0;
    virtual AdapterStatistics* getStatistics() = 0;
    virtual uint32 getNumberOfPorts() = 0;
    virtual std::vector<Port*>* getPorts() = 0;
    /// Throws std::out_of_range beyond the end.
    virtual Port* getPort(uint32 index) = 0;
    /// Has every port look for its targets anew; a port that fails is logged and costs only itself.
    virtual void rescanTargets() = 0;

    const std::string& name() const { return m_adapterName; }
    uint32 type() const { return m_adapterType; } ///< 1: Fibre Channel

protected:
    AdapterAttributes* m_attributes = nullptr;
    AdapterStatistics* m_statistics = nullptr;
    std::vector<Port*> m_ports;
    std::string m_adapterName;
    uint32 m_adapterNumber;
    uint32 m_functionType = 0;
    uint32 m_adapterType;
};

class FCAdapter : public Adapter {
public:
    /// No more ports are looked at, whatever the adapter reports.
    static constexpr uint32 max_ports = 4096;

    /// Reads the adapter and its ports. Throws what FCAdapterAttributes throws; a port that fails is logged and left
    /// out.
    FCAdapter(const std::string& name, uint32 number);
    ~FCAdapter() noexcept(false) override;

    const std::string* getAdapterName() override { return &m_adapterName; }
    const uint32* getAdapterNumber() override { return &m_adapterNumber; }
    const uint32* getFunctionType() override { return &m_functionType; }
    AdapterAttributes* getAttributes() override { return m_attributes; }
    AdapterStatistics* getStatistics() override { return m_statistics; }
    uint32 getNumberOfPorts() override { return static_cast<uint32>(m_ports.size()); }
    std::vector<Port*>* getPorts() override { return &m_ports; }
    Port* getPort(uint32 index) override;
    void rescanTargets() override;
};

} // namespace cimple
